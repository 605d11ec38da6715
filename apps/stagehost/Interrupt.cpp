#include "apps/stagehost/Interrupt.h"

#include <atomic>
#include <cerrno>
#include <csignal>
#include <ctime>
#include <fcntl.h>
#include <poll.h>
#include <unistd.h>

namespace
{

constexpr int ExitSecondSignal = 130;

// Touched by the handler on any thread.
std::atomic<int> s_SignalCount{ 0 };
static_assert( std::atomic<int>::is_always_lock_free );
int s_Pipe[2] = { -1, -1 };   // readable once the first signal has come

extern "C" void OnSignal( int )
{
  const int SavedError = errno;
  if( ++s_SignalCount > 1 )
  {
    _exit( ExitSecondSignal );
  }
  [[maybe_unused]] const ssize_t Written = write( s_Pipe[1], "!", 1 );
  errno = SavedError;
}

}

void InstallInterrupt()
{
  if( pipe2( s_Pipe, O_CLOEXEC | O_NONBLOCK ) != 0 )
  {
    return;
  }
  struct sigaction Action = {};
  Action.sa_handler = &OnSignal;
  sigaction( SIGINT, &Action, nullptr );
  sigaction( SIGTERM, &Action, nullptr );
}

bool IsInterrupted() { return s_SignalCount > 0; }

bool WaitUninterrupted( double i_Seconds )
{
  timespec Deadline = {};
  clock_gettime( CLOCK_MONOTONIC, &Deadline );
  const double Until = static_cast<double>( Deadline.tv_sec ) + static_cast<double>( Deadline.tv_nsec ) * 1e-9 + i_Seconds;
  while( !IsInterrupted() )
  {
    timespec Now = {};
    clock_gettime( CLOCK_MONOTONIC, &Now );
    const double Left = Until - static_cast<double>( Now.tv_sec ) - static_cast<double>( Now.tv_nsec ) * 1e-9;
    if( Left <= 0.0 )
    {
      return true;
    }
    pollfd Wait = { s_Pipe[0], POLLIN, 0 };
    poll( &Wait, 1, static_cast<int>( Left * 1000.0 ) + 1 );
  }
  return false;
}

void WaitAfterInterrupt( double i_Seconds ) { poll( nullptr, 0, static_cast<int>( i_Seconds * 1000.0 ) ); }
