#include "tests/support/system/BackgroundProgram.h"

#include <fcntl.h>
#include <poll.h>
#include <sys/wait.h>
#include <unistd.h>

#include <cerrno>
#include <chrono>
#include <csignal>
#include <cstdlib>
#include <stdexcept>

namespace SystemTests
{

namespace
{

std::chrono::steady_clock::time_point DeadlineIn( double i_Seconds )
{
  return std::chrono::steady_clock::now() +
    std::chrono::duration_cast<std::chrono::steady_clock::duration>( std::chrono::duration<double>( i_Seconds ) );
}

}

VBackgroundProgram::VBackgroundProgram( const std::vector<std::string>& i_rArguments, const std::vector<std::string>& i_rEnvironment )
{
  int Ends[2] = { -1, -1 };
  if( pipe2( Ends, O_CLOEXEC ) != 0 )
  {
    throw std::runtime_error( "no pipe" );
  }
  std::vector<char*> Arguments;
  for( const std::string& rArgument : i_rArguments )
  {
    Arguments.push_back( const_cast<char*>( rArgument.c_str() ) );
  }
  Arguments.push_back( nullptr );
  m_Child = fork();
  if( m_Child == 0 )
  {
    dup2( open( "/dev/null", O_RDONLY ), STDIN_FILENO );
    dup2( Ends[1], STDOUT_FILENO );
    dup2( Ends[1], STDERR_FILENO );
    for( const std::string& rVariable : i_rEnvironment )
    {
      putenv( const_cast<char*>( rVariable.c_str() ) );
    }
    execvp( Arguments.front(), Arguments.data() );
    _exit( 127 );
  }
  close( Ends[1] );
  m_Output = Ends[0];
}

VBackgroundProgram::~VBackgroundProgram()
{
  close( m_Output );
  if( m_Child > 0 )
  {
    kill( m_Child, SIGKILL );
    while( waitpid( m_Child, nullptr, 0 ) < 0 && errno == EINTR )
    {
    }
  }
}

bool VBackgroundProgram::ReadMore( std::chrono::steady_clock::time_point i_Deadline )
{
  const auto Left = std::chrono::duration_cast<std::chrono::milliseconds>( i_Deadline - std::chrono::steady_clock::now() ).count();
  pollfd End = { m_Output, POLLIN, 0 };
  if( Left <= 0 || poll( &End, 1, static_cast<int>( Left ) ) == 0 )
  {
    return false;
  }
  char Bytes[4096];
  const ssize_t Count = read( m_Output, Bytes, sizeof( Bytes ) );
  m_Printed.append( Bytes, static_cast<size_t>( Count > 0 ? Count : 0 ) );
  return Count > 0 || ( Count < 0 && errno == EINTR );
}

bool VBackgroundProgram::WaitFor( const std::string& i_rText, double i_Seconds )
{
  const auto Deadline = DeadlineIn( i_Seconds );
  while( m_Printed.find( i_rText ) == std::string::npos )
  {
    if( !ReadMore( Deadline ) )
    {
      return false;
    }
  }
  return true;
}

void VBackgroundProgram::Interrupt() const { kill( m_Child, SIGINT ); }

int VBackgroundProgram::WaitForEnd( double i_Seconds )
{
  const auto Deadline = DeadlineIn( i_Seconds );
  while( ReadMore( Deadline ) )
  {
  }
  if( std::chrono::steady_clock::now() >= Deadline )
  {
    return -1;
  }
  int Status = 0;
  while( waitpid( m_Child, &Status, 0 ) < 0 && errno == EINTR )
  {
  }
  m_Child = -1;
  return WIFEXITED( Status ) ? WEXITSTATUS( Status ) : -1;
}

VPrivateDisplay::VPrivateDisplay() : VBackgroundProgram( { "Xvfb", "-displayfd", "1", "-screen", "0", "720x576x24", "-nolisten", "tcp" } )
{
  // The display's number is the last line that it prints.
  constexpr double PatienceSeconds = 30.0;
  if( !WaitFor( "\n", PatienceSeconds ) )
  {
    throw std::runtime_error( "no X server: " + Printed() );
  }
  const size_t End = Printed().find_last_of( "0123456789" );
  const size_t Before = Printed().find_last_not_of( "0123456789", End );
  m_Name = ":" + Printed().substr( Before + 1, End - Before );
}

}
