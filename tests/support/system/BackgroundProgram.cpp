#include "tests/support/system/BackgroundProgram.h"

#include "tests/support/ProgramRun.h"

#include <fcntl.h>
#include <poll.h>
#include <unistd.h>

#include <cerrno>
#include <chrono>
#include <csignal>
#include <stdexcept>
#include <utility>

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
  m_Child = TestSupport::StartProgram( i_rArguments, { .m_Environment = i_rEnvironment }, Ends[1], Ends[1] );
  close( Ends[1] );
  m_Output = Ends[0];
}

VBackgroundProgram::~VBackgroundProgram()
{
  close( m_Output );
  if( m_Child > 0 )
  {
    kill( m_Child, SIGKILL );
    WaitForEnd();
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

int VBackgroundProgram::WaitForEnd()
{
  TestSupport::VRunResult Result;
  TestSupport::WaitForProgram( std::exchange( m_Child, -1 ), Result );
  return Result.m_ExitCode;
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
  return WaitForEnd();
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
