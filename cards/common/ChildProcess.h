// A program started without a shell, whose outputs are read through pipes.
#pragma once

#include <memory>
#include <string>
#include <sys/types.h>
#include <vector>

namespace VirtualCards
{

// One owner, one thread at a time. The child runs in a process group of its own, so that a key press at the terminal that ends this
// program first lets it finish its files. It reads nothing; when this end of its pipes is closed, its next write ends it.
class VChildProcess
{
public:
  // Looks for the program on the PATH. Makes one pipe for each of the child's descriptors. Null, with one line of reason, on failure.
  static std::unique_ptr<VChildProcess> Start( const std::vector<std::string>& i_rCommand, const std::vector<int>& i_rDescriptors,
    std::string& o_rError );

  // Kills what still runs, and waits for its end.
  ~VChildProcess();

  VChildProcess( const VChildProcess& ) = delete;
  VChildProcess& operator=( const VChildProcess& ) = delete;

  // This end of a pipe, in the order of the descriptors given; never blocks. Owned by this object.
  int Pipe( size_t i_Index ) const { return m_Pipes[i_Index]; }

  // Waits for the end; true for exit status 0.
  bool Wait();

private:
  VChildProcess() = default;

  pid_t m_Process = -1;
  bool m_bSucceeded = false;
  std::vector<int> m_Pipes;
};

struct VProgramOutput
{
  bool m_bSucceeded = false;   // ran, and gave exit status 0
  std::string m_Output;
  std::string m_Errors;
};

// Runs a program to its end and collects what it writes; kills it after this many seconds.
VProgramOutput RunProgram( const std::vector<std::string>& i_rCommand, int i_Seconds );

// The last line that is not blank.
std::string LastLine( const std::string& i_rText );

}
