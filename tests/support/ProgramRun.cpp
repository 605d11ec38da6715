#include "tests/support/ProgramRun.h"

#include "tests/support/TemporaryFolder.h"

#include <fcntl.h>
#include <poll.h>
#include <sys/resource.h>
#include <sys/wait.h>
#include <unistd.h>

#include <cerrno>
#include <csignal>
#include <cstdlib>
#include <stdexcept>
#include <utility>

namespace TestSupport
{

namespace
{

std::chrono::steady_clock::time_point DeadlineIn( double i_Seconds )
{
  return std::chrono::steady_clock::now() +
    std::chrono::duration_cast<std::chrono::steady_clock::duration>( std::chrono::duration<double>( i_Seconds ) );
}

// The end to write into; the other one is set.
int MakePipe( int& o_rReadEnd )
{
  int Ends[2] = { -1, -1 };
  if( pipe2( Ends, O_CLOEXEC ) != 0 )
  {
    throw std::runtime_error( "no pipe" );
  }
  o_rReadEnd = Ends[0];
  return Ends[1];
}

// Closes at its end.
void Drain( int& io_rEnd, std::string& io_rText )
{
  char Bytes[65536];
  const ssize_t Count = read( io_rEnd, Bytes, sizeof( Bytes ) );
  if( Count > 0 )
  {
    io_rText.append( Bytes, static_cast<size_t>( Count ) );
  }
  else if( Count == 0 || errno != EINTR )
  {
    close( std::exchange( io_rEnd, -1 ) );
  }
}

[[noreturn]] void Become( const std::vector<std::string>& i_rArguments, const VRunOptions& i_rOptions, int i_Output, int i_Error )
{
  dup2( open( "/dev/null", O_RDONLY ), STDIN_FILENO );
  dup2( i_Output, STDOUT_FILENO );
  dup2( i_Error, STDERR_FILENO );
  if( i_rOptions.m_FileSizeLimit )
  {
    const rlimit Limit = { *i_rOptions.m_FileSizeLimit, *i_rOptions.m_FileSizeLimit };
    setrlimit( RLIMIT_FSIZE, &Limit );
    std::signal( SIGXFSZ, SIG_IGN );
  }
  for( const std::string& rVariable : i_rOptions.m_Environment )
  {
    putenv( const_cast<char*>( rVariable.c_str() ) );
  }
  std::vector<char*> Arguments;
  for( const std::string& rArgument : i_rArguments )
  {
    Arguments.push_back( const_cast<char*>( rArgument.c_str() ) );
  }
  Arguments.push_back( nullptr );
  execvp( Arguments.front(), Arguments.data() );
  _exit( 127 );
}

}

VProgram::VProgram( const std::vector<std::string>& i_rArguments, VRunOptions i_Options ) : m_Options( std::move( i_Options ) )
{
  const int Output = MakePipe( m_Output );
  const int Error = MakePipe( m_Error );
  m_Child = fork();
  if( m_Child == 0 )
  {
    Become( i_rArguments, m_Options, Output, Error );
  }
  close( Output );
  close( Error );
}

VProgram::~VProgram()
{
  close( m_Output );
  close( m_Error );
  if( m_Child > 0 )
  {
    kill( m_Child, SIGKILL );
    Wait();
  }
}

bool VProgram::ReadMore( std::chrono::steady_clock::time_point i_Deadline )
{
  const auto Left = std::chrono::duration_cast<std::chrono::milliseconds>( i_Deadline - std::chrono::steady_clock::now() ).count();
  pollfd Ends[2] = { { m_Output, POLLIN, 0 }, { m_Error, POLLIN, 0 } };
  if( !IsOpen() || Left <= 0 || poll( Ends, 2, static_cast<int>( Left ) ) == 0 )
  {
    return false;
  }
  if( Ends[0].revents != 0 )
  {
    Drain( m_Output, m_Result.m_Output );
  }
  if( Ends[1].revents != 0 )
  {
    Drain( m_Error, m_Result.m_Error );
    m_Options.m_OnErrorText( m_Child, m_Result.m_Error );
  }
  return true;
}

bool VProgram::WaitFor( const std::string& i_rText, double i_Seconds )
{
  const auto Deadline = DeadlineIn( i_Seconds );
  while( m_Result.m_Output.find( i_rText ) == std::string::npos && m_Result.m_Error.find( i_rText ) == std::string::npos )
  {
    if( !ReadMore( Deadline ) )
    {
      return false;
    }
  }
  return true;
}

void VProgram::Interrupt() const { kill( m_Child, SIGINT ); }

const VRunResult& VProgram::WaitForEnd( double i_Seconds )
{
  const auto Deadline = DeadlineIn( i_Seconds );
  while( ReadMore( Deadline ) )
  {
  }
  m_Result.m_bTimedOut = IsOpen();
  if( m_Result.m_bTimedOut )
  {
    kill( m_Child, SIGKILL );
  }
  Wait();
  return m_Result;
}

void VProgram::Wait()
{
  int Status = 0;
  rusage Usage = {};
  while( wait4( m_Child, &Status, 0, &Usage ) < 0 && errno == EINTR )
  {
  }
  m_Child = -1;
  m_Result.m_ExitCode = WIFEXITED( Status ) ? WEXITSTATUS( Status ) : -1;
  m_Result.m_Signal = WIFSIGNALED( Status ) ? WTERMSIG( Status ) : 0;
  m_Result.m_PeakResidentKiB = Usage.ru_maxrss;
  m_Result.m_ProcessorSeconds = static_cast<double>( Usage.ru_utime.tv_sec + Usage.ru_stime.tv_sec ) +
    static_cast<double>( Usage.ru_utime.tv_usec + Usage.ru_stime.tv_usec ) * 1e-6;
}

VRunResult RunProgram( const std::vector<std::string>& i_rArguments, const VRunOptions& i_rOptions )
{
  return VProgram( i_rArguments, i_rOptions ).WaitForEnd( i_rOptions.m_Seconds );
}

VRunResult RunStageHost( std::vector<std::string> i_Arguments, const VRunOptions& i_rOptions )
{
  const char* const pFolder = std::getenv( "STAGECORE_BIN" );
  if( !pFolder )
  {
    throw std::runtime_error( "STAGECORE_BIN must name the folder of the programs" );
  }
  i_Arguments.insert( i_Arguments.begin(), std::string( pFolder ) + "/stagehost" );
  const VTemporaryFolder Settings;
  VRunOptions Options = i_rOptions;
  Options.m_Environment.insert( Options.m_Environment.begin(), "XDG_CONFIG_HOME=" + Settings.File( "config" ) );
  return RunProgram( i_Arguments, Options );
}

}
