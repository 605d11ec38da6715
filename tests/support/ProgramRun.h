// Runs a program as a person would and keeps what it printed. The folder of our programs comes from the environment variable STAGECORE_BIN.
#pragma once

#include <boost/optional.hpp>

#include <sys/types.h>

#include <cstdint>
#include <functional>
#include <string>
#include <vector>

namespace TestSupport
{

struct VRunOptions
{
  double m_Seconds = 60.0;                       // killed after that
  boost::optional<uint64_t> m_FileSizeLimit{};   // RLIMIT_FSIZE, bytes, with SIGXFSZ ignored
  std::vector<std::string> m_Environment{};      // "NAME=value" beside what is inherited
  // Called with the child's id whenever new text has come, with all its standard error so far; may send signals.
  std::function<void( pid_t, const std::string& )> m_OnErrorText = []( pid_t, const std::string& ) {};
};

struct VRunResult
{
  int m_ExitCode = -1;   // -1 when a signal ended it
  int m_Signal = 0;
  bool m_bTimedOut = false;
  std::string m_Output;
  std::string m_Error;
  int64_t m_PeakResidentKiB = 0;
};

// Starts a program with its environment and limit; what it prints goes to these descriptors.
pid_t StartProgram( const std::vector<std::string>& i_rArguments, const VRunOptions& i_rOptions, int i_Output, int i_Error );
// Waits for its end, and sets how it ended.
void WaitForProgram( pid_t i_Child, VRunResult& o_rResult );

// The first argument is the program: a path, or a name that is looked up.
VRunResult RunProgram( const std::vector<std::string>& i_rArguments, const VRunOptions& i_rOptions = {} );

// The same with stagehost. Unless the environment says where settings are kept, the run keeps its own in a folder that goes with it.
VRunResult RunStageHost( std::vector<std::string> i_Arguments, const VRunOptions& i_rOptions = {} );

}
