#include "tests/support/ProgramRun.h"

#include "tests/support/TemporaryFolder.h"

#include <fcntl.h>
#include <poll.h>
#include <sys/resource.h>
#include <sys/wait.h>
#include <unistd.h>

#include <chrono>
#include <csignal>
#include <cstdlib>
#include <stdexcept>

namespace TestSupport
{

namespace
{

struct VPipe
{
  VPipe()
  {
    if( pipe2( m_Ends, O_CLOEXEC ) != 0 )
    {
      throw std::runtime_error( "no pipe" );
    }
  }
  ~VPipe()
  {
    CloseEnd( 0 );
    CloseEnd( 1 );
  }
  void CloseEnd( int i_End )
  {
    if( m_Ends[i_End] >= 0 )
    {
      close( m_Ends[i_End] );
      m_Ends[i_End] = -1;
    }
  }

  int m_Ends[2];
};

// True while the end is open.
bool Drain( int i_End, std::string& io_rText )
{
  char Bytes[65536];
  const ssize_t Count = read( i_End, Bytes, sizeof( Bytes ) );
  if( Count > 0 )
  {
    io_rText.append( Bytes, static_cast<size_t>( Count ) );
  }
  return Count > 0 || ( Count < 0 && errno == EINTR );
}

void Collect( pid_t i_Child, VPipe& i_rOutput, VPipe& i_rError, const VRunOptions& i_rOptions, VRunResult& o_rResult )
{
  const auto Deadline = std::chrono::steady_clock::now() + std::chrono::duration<double>( i_rOptions.m_Seconds );
  while( i_rOutput.m_Ends[0] >= 0 || i_rError.m_Ends[0] >= 0 )
  {
    pollfd Ends[2] = { { i_rOutput.m_Ends[0], POLLIN, 0 }, { i_rError.m_Ends[0], POLLIN, 0 } };
    const auto Left = std::chrono::duration_cast<std::chrono::milliseconds>( Deadline - std::chrono::steady_clock::now() ).count();
    if( Left <= 0 && !o_rResult.m_bTimedOut )
    {
      o_rResult.m_bTimedOut = true;
      kill( i_Child, SIGKILL );
    }
    poll( Ends, 2, Left > 0 ? static_cast<int>( Left ) : 1000 );
    if( Ends[0].revents != 0 && !Drain( i_rOutput.m_Ends[0], o_rResult.m_Output ) )
    {
      i_rOutput.CloseEnd( 0 );
    }
    if( Ends[1].revents != 0 )
    {
      if( !Drain( i_rError.m_Ends[0], o_rResult.m_Error ) )
      {
        i_rError.CloseEnd( 0 );
      }
      i_rOptions.m_OnErrorText( i_Child, o_rResult.m_Error );
    }
  }
}

}

pid_t StartProgram( const std::vector<std::string>& i_rArguments, const VRunOptions& i_rOptions, int i_Output, int i_Error )
{
  const pid_t Child = fork();
  if( Child != 0 )
  {
    return Child;
  }
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

void WaitForProgram( pid_t i_Child, VRunResult& o_rResult )
{
  int Status = 0;
  rusage Usage = {};
  while( wait4( i_Child, &Status, 0, &Usage ) < 0 && errno == EINTR )
  {
  }
  o_rResult.m_ExitCode = WIFEXITED( Status ) ? WEXITSTATUS( Status ) : -1;
  o_rResult.m_Signal = WIFSIGNALED( Status ) ? WTERMSIG( Status ) : 0;
  o_rResult.m_PeakResidentKiB = Usage.ru_maxrss;
}

VRunResult RunProgram( const std::vector<std::string>& i_rArguments, const VRunOptions& i_rOptions )
{
  VPipe Output;
  VPipe Error;
  const pid_t Child = StartProgram( i_rArguments, i_rOptions, Output.m_Ends[1], Error.m_Ends[1] );
  Output.CloseEnd( 1 );
  Error.CloseEnd( 1 );
  VRunResult Result;
  Collect( Child, Output, Error, i_rOptions, Result );
  WaitForProgram( Child, Result );
  return Result;
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
