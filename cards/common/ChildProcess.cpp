#include "cards/common/ChildProcess.h"

#include <array>
#include <cerrno>
#include <chrono>
#include <csignal>
#include <cstring>
#include <fcntl.h>
#include <poll.h>
#include <spawn.h>
#include <sys/wait.h>
#include <unistd.h>

extern char** environ;

namespace VirtualCards
{

namespace
{

constexpr int PipeBytes = 1 << 20;        // fewer wake-ups for a stream of pictures; what the system allows anyone
constexpr int FirstFreeDescriptor = 16;   // our ends lie above every descriptor that a child is given

// Closes the child's ends in this process whatever happens.
struct VPipeEnds
{
  ~VPipeEnds()
  {
    for( const int Descriptor : m_Write )
    {
      close( Descriptor );
    }
  }
  std::vector<int> m_Write;
};

bool MakePipe( int& o_rRead, int& o_rWrite )
{
  int Ends[2];
  if( pipe2( Ends, O_CLOEXEC ) != 0 )
  {
    return false;
  }
  o_rRead = Ends[0];
  o_rWrite = fcntl( Ends[1], F_DUPFD_CLOEXEC, FirstFreeDescriptor );
  close( Ends[1] );
  fcntl( o_rRead, F_SETFL, O_NONBLOCK );
  fcntl( o_rRead, F_SETPIPE_SZ, PipeBytes );
  return o_rWrite >= 0;
}

struct VSpawnSettings
{
  VSpawnSettings()
  {
    posix_spawn_file_actions_init( &m_Actions );
    posix_spawnattr_init( &m_Attributes );
    posix_spawn_file_actions_addopen( &m_Actions, STDIN_FILENO, "/dev/null", O_RDONLY, 0 );
    sigset_t Signals;
    sigemptyset( &Signals );
    posix_spawnattr_setsigmask( &m_Attributes, &Signals );
    sigaddset( &Signals, SIGPIPE );
    sigaddset( &Signals, SIGINT );
    sigaddset( &Signals, SIGTERM );
    posix_spawnattr_setsigdefault( &m_Attributes, &Signals );
    posix_spawnattr_setpgroup( &m_Attributes, 0 );
    posix_spawnattr_setflags( &m_Attributes, POSIX_SPAWN_SETSIGMASK | POSIX_SPAWN_SETSIGDEF | POSIX_SPAWN_SETPGROUP );
  }
  ~VSpawnSettings()
  {
    posix_spawn_file_actions_destroy( &m_Actions );
    posix_spawnattr_destroy( &m_Attributes );
  }

  posix_spawn_file_actions_t m_Actions;
  posix_spawnattr_t m_Attributes;
};

// False at the end of the stream.
bool ReadSome( int i_Pipe, std::string& io_rText )
{
  std::array<char, 65536> Buffer;
  const ssize_t Count = read( i_Pipe, Buffer.data(), Buffer.size() );
  if( Count > 0 )
  {
    io_rText.append( Buffer.data(), static_cast<size_t>( Count ) );
  }
  return Count > 0 || ( Count < 0 && ( errno == EAGAIN || errno == EINTR ) );
}

}

std::unique_ptr<VChildProcess> VChildProcess::Start( const std::vector<std::string>& i_rCommand, const std::vector<int>& i_rDescriptors,
  std::string& o_rError )
{
  std::unique_ptr<VChildProcess> pChild( new VChildProcess );
  VPipeEnds Ends;
  VSpawnSettings Settings;
  for( const int Descriptor : i_rDescriptors )
  {
    int Read = -1;
    int Write = -1;
    const bool bMade = MakePipe( Read, Write );
    if( Read >= 0 )
    {
      pChild->m_Pipes.push_back( Read );
    }
    if( !bMade )
    {
      o_rError = std::string( "no pipe to " ) + i_rCommand.front() + ": " + std::strerror( errno );
      return nullptr;
    }
    Ends.m_Write.push_back( Write );
    posix_spawn_file_actions_adddup2( &Settings.m_Actions, Write, Descriptor );
  }

  std::vector<char*> Arguments;
  for( const std::string& rArgument : i_rCommand )
  {
    Arguments.push_back( const_cast<char*>( rArgument.c_str() ) );
  }
  Arguments.push_back( nullptr );
  const int Error = posix_spawnp( &pChild->m_Process, Arguments.front(), &Settings.m_Actions, &Settings.m_Attributes, Arguments.data(), environ );
  if( Error != 0 )
  {
    pChild->m_Process = -1;
    o_rError = i_rCommand.front() + " cannot be started: " + std::strerror( Error );
    return nullptr;
  }
  return pChild;
}

VChildProcess::~VChildProcess()
{
  for( const int Descriptor : m_Pipes )
  {
    close( Descriptor );
  }
  if( m_Process > 0 )
  {
    kill( m_Process, SIGKILL );
    Wait();
  }
}

bool VChildProcess::Wait()
{
  int Status = 0;
  while( m_Process > 0 )
  {
    const pid_t Ended = waitpid( m_Process, &Status, 0 );
    if( Ended == m_Process || ( Ended < 0 && errno != EINTR ) )
    {
      m_bSucceeded = Ended == m_Process && WIFEXITED( Status ) && WEXITSTATUS( Status ) == 0;
      m_Process = -1;
    }
  }
  return m_bSucceeded;
}

VProgramOutput RunProgram( const std::vector<std::string>& i_rCommand, int i_Seconds )
{
  using VClock = std::chrono::steady_clock;
  const VClock::time_point End = VClock::now() + std::chrono::seconds( i_Seconds );
  VProgramOutput Output;
  const std::unique_ptr<VChildProcess> pChild = VChildProcess::Start( i_rCommand, { STDOUT_FILENO, STDERR_FILENO }, Output.m_Errors );
  if( !pChild )
  {
    return Output;
  }
  std::array<pollfd, 2> Polls = { pollfd{ pChild->Pipe( 0 ), POLLIN, 0 }, pollfd{ pChild->Pipe( 1 ), POLLIN, 0 } };
  std::string* const Texts[2] = { &Output.m_Output, &Output.m_Errors };
  while( Polls[0].fd >= 0 || Polls[1].fd >= 0 )
  {
    const auto Left = std::chrono::duration_cast<std::chrono::milliseconds>( End - VClock::now() ).count();
    if( Left <= 0 )
    {
      Output.m_Errors += "\n" + i_rCommand.front() + " did not answer within " + std::to_string( i_Seconds ) + " seconds";
      return Output;
    }
    poll( Polls.data(), Polls.size(), static_cast<int>( Left ) );
    for( size_t i = 0; i < Polls.size(); ++i )
    {
      if( Polls[i].fd >= 0 && Polls[i].revents != 0 && !ReadSome( Polls[i].fd, *Texts[i] ) )
      {
        Polls[i].fd = -1;
      }
    }
  }
  Output.m_bSucceeded = pChild->Wait();
  return Output;
}

std::string LastLine( const std::string& i_rText )
{
  const size_t End = i_rText.find_last_not_of( " \t\r\n" );
  if( End == std::string::npos )
  {
    return {};
  }
  const size_t Start = i_rText.find_last_of( "\r\n", End );
  return i_rText.substr( Start == std::string::npos ? 0 : Start + 1, End - ( Start == std::string::npos ? 0 : Start + 1 ) + 1 );
}

}
