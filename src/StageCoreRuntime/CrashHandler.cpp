#include "StageCoreRuntime/DebugServices.h"
#include "StageCoreRuntime/SanitizerBuild.h"

#include <array>
#include <atomic>
#include <cstring>

#include <csignal>
#include <execinfo.h>
#include <sys/prctl.h>
#include <sys/syscall.h>
#include <unistd.h>

// Everything that runs inside the signal handler uses async-signal-safe calls alone: no heap, no locks, no streams.

namespace DebugServices
{
namespace
{
struct VFatalSignal
{
  int m_Number;
  const char* m_pName;
};

constexpr std::array FatalSignals = {
  VFatalSignal{ SIGSEGV, "SIGSEGV" },
  VFatalSignal{ SIGABRT, "SIGABRT" },
  VFatalSignal{ SIGBUS, "SIGBUS" },
  VFatalSignal{ SIGFPE, "SIGFPE" },
  VFatalSignal{ SIGILL, "SIGILL" },
};

constexpr size_t SignalStackSize = 128 * 1024;
constexpr int MaxFrames = 64;

std::array<struct sigaction, FatalSignals.size()> g_FormerActions{};
std::atomic<long> g_ReportingThread{ 0 };
static_assert( std::atomic<long>::is_always_lock_free );

void WriteText( const char* i_pText )
{
  size_t Left = std::strlen( i_pText );
  while( Left > 0 )
  {
    const ssize_t Written = write( STDERR_FILENO, i_pText, Left );
    if( Written <= 0 )
    {
      return;
    }
    i_pText += Written;
    Left -= static_cast<size_t>( Written );
  }
}

void WriteReport( const char* i_pSignalName )
{
  std::array<char, 17> Name{};
  prctl( PR_GET_NAME, Name.data() );
  WriteText( "\nCrash: " );
  WriteText( i_pSignalName );
  WriteText( " in thread \"" );
  WriteText( Name.data() );
  WriteText( "\"\n" );
  std::array<void*, MaxFrames> Frames{};
  backtrace_symbols_fd( Frames.data(), backtrace( Frames.data(), MaxFrames ), STDERR_FILENO );
}

void OnFatalSignal( int i_Signal )
{
  const long Thread = syscall( SYS_gettid );
  long Expected = 0;
  const bool bFirst = g_ReportingThread.compare_exchange_strong( Expected, Thread );
  while( g_ReportingThread.load() != Thread )
  {
    pause();   // another thread reports and ends the process
  }
  for( size_t Index = 0; Index < FatalSignals.size(); ++Index )
  {
    if( FatalSignals[Index].m_Number == i_Signal )
    {
      if( bFirst )
      {
        WriteReport( FatalSignals[Index].m_pName );
      }
      sigaction( i_Signal, &g_FormerActions[Index], nullptr );
      raise( i_Signal );   // blocked until this handler returns, then it takes its usual course
    }
  }
}

bool InstallForAllSignals()
{
  void* pFrame = nullptr;
  backtrace( &pFrame, 1 );   // loads the unwinder now: in the handler that would allocate
  struct sigaction Action = {};
  Action.sa_handler = OnFatalSignal;
  Action.sa_flags = SA_ONSTACK;
  sigemptyset( &Action.sa_mask );
  for( size_t Index = 0; Index < FatalSignals.size(); ++Index )
  {
    sigaction( FatalSignals[Index].m_Number, &Action, &g_FormerActions[Index] );
  }
  return true;
}
}

void InstallCrashHandler()
{
  if constexpr( !IsSanitizerBuild )
  {
    [[maybe_unused]] static const bool s_bInstalled = InstallForAllSignals();
  }
}

VCrashHandlerForThread::VCrashHandlerForThread()
{
  stack_t Present = {};
  if( IsSanitizerBuild || sigaltstack( nullptr, &Present ) != 0 || !( Present.ss_flags & SS_DISABLE ) )
  {
    return;
  }
  m_pStack.reset( new std::byte[SignalStackSize] );
  stack_t Stack = {};
  Stack.ss_sp = m_pStack.get();
  Stack.ss_size = SignalStackSize;
  if( sigaltstack( &Stack, nullptr ) != 0 )
  {
    m_pStack.reset();
  }
}

VCrashHandlerForThread::~VCrashHandlerForThread()
{
  if( m_pStack )
  {
    stack_t Stack = {};
    Stack.ss_flags = SS_DISABLE;
    sigaltstack( &Stack, nullptr );
  }
}
}
