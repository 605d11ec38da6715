// Runs a program as a person would and keeps what it printed. The folder of our programs comes from the environment variable STAGECORE_BIN.
#pragma once

#include <boost/optional.hpp>

#include <sys/types.h>

#include <chrono>
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
  double m_ProcessorSeconds = 0.0;   // user and system
};

// A program that runs beside the test, until the test lets go of it.
class VProgram
{
public:
  // The first argument is the program: a path, or a name that is looked up. Throws where there are no pipes.
  explicit VProgram( const std::vector<std::string>& i_rArguments, VRunOptions i_Options = {} );
  // Ends it and waits for its end.
  ~VProgram();
  VProgram( const VProgram& ) = delete;
  VProgram& operator=( const VProgram& ) = delete;

  // Until it has printed this text. False when it ends or so many seconds pass before that.
  bool WaitFor( const std::string& i_rText, double i_Seconds );
  // Sends INT.
  void Interrupt() const;
  // Until it has ended and everything that it printed is here. Killed when so many seconds pass before that.
  const VRunResult& WaitForEnd( double i_Seconds );
  // So far; how it ended is not known before WaitForEnd.
  const VRunResult& Result() const { return m_Result; }
  std::string Printed() const { return m_Result.m_Output + m_Result.m_Error; }

private:
  bool IsOpen() const { return m_Output >= 0 || m_Error >= 0; }
  // False at the end of all output or at the deadline.
  bool ReadMore( std::chrono::steady_clock::time_point i_Deadline );
  void Wait();

  const VRunOptions m_Options;
  VRunResult m_Result;
  pid_t m_Child = -1;
  int m_Output = -1;
  int m_Error = -1;
};

VRunResult RunProgram( const std::vector<std::string>& i_rArguments, const VRunOptions& i_rOptions = {} );

// The same with stagehost. Unless the environment says where settings are kept, the run keeps its own in a folder that goes with it.
VRunResult RunStageHost( std::vector<std::string> i_Arguments, const VRunOptions& i_rOptions = {} );

}
