#include "StageCoreRuntime/DebugServices.h"
#include "StageCoreRuntime/SanitizerBuild.h"
#include "tests/support/LogCapture.h"

#include <gtest/gtest.h>

#include <boost/thread/thread.hpp>

#include <csignal>
#include <pthread.h>

namespace
{
TEST( Assert, IsEvaluatedOnceAndAFailureGoesToTheLogByDefault )
{
  const TestSupport::VLogCapture Capture( "DebugServices" );
  int Calls = 0;
  EXPECT_TRUE( KVZ_ASSERT( ++Calls % 7 == 1 ) );
  EXPECT_FALSE( KVZ_ASSERT( ++Calls % 7 == 1 ) );
  const int Line = __LINE__ - 1;
  EXPECT_EQ( Calls, 2 );
  const auto Lines = Capture.Lines();
  ASSERT_EQ( Lines.size(), 1u );
  EXPECT_EQ( Lines[0].m_Text, "Assertion failed: ++Calls % 7 == 1" );
  EXPECT_EQ( Lines[0].m_Level, 2 );
  EXPECT_EQ( Lines[0].m_File, __FILE__ );
  EXPECT_EQ( Lines[0].m_Line, Line );
}

std::string SystemNameOfAThreadNamed( const std::string& i_Name )
{
  std::string SystemName;
  boost::thread(
    [&]
    {
      DebugServices::SetThreadName( i_Name );
      EXPECT_EQ( DebugServices::GetThreadName(), i_Name );
      char Name[16] = {};
      pthread_getname_np( pthread_self(), Name, sizeof( Name ) );
      SystemName = Name;
    } )
    .join();
  return SystemName;
}

TEST( ThreadName, KeepsTheWorkersIndexWhenTheSystemCutsTheName )
{
  EXPECT_EQ( SystemNameOfAThreadNamed( "Engine0" ), "Engine0" );
  EXPECT_EQ( SystemNameOfAThreadNamed( "Video Input En0" ), "Video Input En0" );
  EXPECT_EQ( SystemNameOfAThreadNamed( "Video Input Engine12" ), "Video Input E12" );
  EXPECT_EQ( SystemNameOfAThreadNamed( "VVideoInputBufferClient" ), "VVideoInputBuff" );
  EXPECT_EQ( SystemNameOfAThreadNamed( "12345678901234567890" ), "123456789012345" );
}

// Fills the thread's stack until the guard page is hit.
[[maybe_unused]] int Overflow( int i_Depth )
{
  volatile char Block[4096] = {};
  Block[i_Depth % 4096] = 1;
  return i_Depth < 0 ? 0 : Overflow( i_Depth + 1 ) + Block[0];
}

[[maybe_unused]] void CrashInNamedThread( void ( *i_pCrash )() )
{
  DebugServices::InstallCrashHandler();
  boost::thread(
    [i_pCrash]
    {
      const DebugServices::VCrashHandlerForThread CrashHandler;
      DebugServices::SetThreadName( "Doomed3" );
      i_pCrash();
    } )
    .join();
}

TEST( CrashHandlerDeathTest, ReportsTheThreadAndDiesOfTheSignal )
{
  if constexpr( DebugServices::IsSanitizerBuild )
  {
    struct sigaction Before = {};
    struct sigaction After = {};
    sigaction( SIGSEGV, nullptr, &Before );
    DebugServices::InstallCrashHandler();
    sigaction( SIGSEGV, nullptr, &After );
    EXPECT_EQ( Before.sa_handler, After.sa_handler );
  }
  else
  {
    GTEST_FLAG_SET( death_test_style, "threadsafe" );
    EXPECT_EXIT( CrashInNamedThread( [] { raise( SIGSEGV ); } ), testing::KilledBySignal( SIGSEGV ), "Crash: SIGSEGV in thread \"Doomed3\"" );
    EXPECT_EXIT( CrashInNamedThread( [] { std::abort(); } ), testing::KilledBySignal( SIGABRT ), "Crash: SIGABRT in thread \"Doomed3\"" );
    EXPECT_EXIT( CrashInNamedThread( [] { exit( Overflow( 0 ) ); } ), testing::KilledBySignal( SIGSEGV ), "Crash: SIGSEGV in thread \"Doomed3\"" );
  }
}
}
