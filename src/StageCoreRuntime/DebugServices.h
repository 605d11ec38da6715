// Assertions, thread names and the crash report: what a developer needs to see when something went wrong.
// Every operation may be called from any thread.
#pragma once

#include <cstddef>
#include <functional>
#include <memory>
#include <string>

namespace DebugServices
{
using VAssertFailHandler = std::function<void( const char* i_pExpression, const char* i_pFile, int i_Line )>;

// Reports a programming error to the handler in force. Returns where the handler returns, and the caller goes on.
void CallAssertFailHandler( const char* i_pExpression, const char* i_pFile, int i_Line );

// Replaces the handler and returns the former one; an empty function restores the default, which logs at level 2.
// A handler that is running on another thread may still run to its end after this returns.
VAssertFailHandler SetAssertFailHandler( VAssertFailHandler i_Handler );

// Names the calling thread for debuggers and crash reports. The system keeps 15 characters: a longer name keeps its
// beginning and the decimal index at its end, so that the workers of one service stay apart.
void SetThreadName( const std::string& i_Name );

// The whole name that SetThreadName gave the calling thread; empty if none.
const std::string& GetThreadName();

// Process-wide, by the host, once: a fatal signal (SEGV, ABRT, BUS, FPE, ILL) writes the thread's name and a backtrace to
// standard error and then takes its usual course. Does nothing in sanitizer builds, which bring their own report.
void InstallCrashHandler();

// Held at the top of a thread's entry function for the thread's whole life, made and destroyed on that thread: it provides the
// stack on which the crash report can still run when the thread's own stack has overflowed.
class VCrashHandlerForThread
{
public:
  VCrashHandlerForThread();
  ~VCrashHandlerForThread();
  VCrashHandlerForThread( const VCrashHandlerForThread& ) = delete;
  VCrashHandlerForThread& operator=( const VCrashHandlerForThread& ) = delete;

private:
  std::unique_ptr<std::byte[]> m_pStack;   // empty if the thread had an alternate stack already
};

namespace Detail
{
inline bool Check( bool i_bHolds, const char* i_pExpression, const char* i_pFile, int i_Line )
{
  if( !i_bHolds )
  {
    CallAssertFailHandler( i_pExpression, i_pFile, i_Line );
  }
  return i_bHolds;
}
}
}

// Evaluates the expression once, in every build, and reports it if it is false. Its value is the expression's as a bool:
//   if( !KVZ_ASSERT( m_pEngine != nullptr ) ) return false;
#define KVZ_ASSERT( Expression ) ::DebugServices::Detail::Check( static_cast<bool>( Expression ), #Expression, __FILE__, __LINE__ )
