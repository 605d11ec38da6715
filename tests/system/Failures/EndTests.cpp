// Ends that were not planned: signals from outside, and a program that dies.
#include "StageCoreRuntime/SanitizerBuild.h"
#include "tests/support/TemporaryFolder.h"
#include "tests/support/TvidParser.h"
#include "tests/support/system/CounterFile.h"
#include "tests/support/system/Rates.h"
#include "tests/support/system/StageHost.h"

#include <gtest/gtest.h>

#include <csignal>

using namespace SystemTests;

namespace
{

constexpr int64_t EnoughFrames = 30;

}

class EndTest : public testing::TestWithParam<VSignalRate>
{
protected:
  VHostResult RecordUntil( const std::vector<int>& i_rSignals ) const
  {
    return Record( m_Folder.File( "out" ), CounterCard( GetParam(), "speed=4" ) + VArguments{ "--frames", "100000", "--progress" },
      SignalAfterFrames( i_rSignals, EnoughFrames ) );
  }

  const TestSupport::VTemporaryFolder m_Folder;
};

TEST_P( EndTest, OneSignalFinishesTheFile )
{
  const VHostResult Result = RecordUntil( { std::string( "decklink" ) == GetParam().m_pKind ? SIGINT : SIGTERM } );
  EXPECT_EQ( 0, Result.m_Run.m_ExitCode ) << Describe( Result.m_Run );
  const std::vector<VCounterFrame> Frames = ReadUnbroken( Result.Path(), GetParam() );
  EXPECT_GE( Frames.size(), static_cast<size_t>( EnoughFrames ) );
  EXPECT_TRUE( TestSupport::VTvidParser( Result.Path() ).IsFinished() );
  EXPECT_EQ( Frames.size(), Result.Device().value( "frames_written", 0u ) );
  EXPECT_EQ( Frames.size(), Result.Device().value( "frames_requested", 0u ) );
  EXPECT_EQ( "Complete", Result.Device().value( "state", "" ) );
}

// A sanitizer hands signals to their handler when it sees fit, which may be after the program's own end.
#if !defined( STAGECORE_SANITIZER_BUILD )
TEST_P( EndTest, TwoSignalsEndTheProgramAtOnce )
{
  const VHostResult Result = RecordUntil( { SIGINT, SIGTERM } );
  EXPECT_EQ( 130, Result.m_Run.m_ExitCode ) << Describe( Result.m_Run );
  EXPECT_EQ( "", Result.m_Run.m_Output );
}
#endif

TEST_P( EndTest, AKilledRecordingCanBeRead )
{
  const VHostResult Result = RecordUntil( { SIGKILL } );
  EXPECT_EQ( SIGKILL, Result.m_Run.m_Signal ) << Describe( Result.m_Run );
  const std::string Path = m_Folder.File( "out" ) + "/take_vi0.tvid";
  const nlohmann::json Told = Inspect( Path, true );
  EXPECT_EQ( false, Told.value( "finished", true ) ) << Told;
  const std::vector<VCounterFrame> Frames = ReadUnbroken( Path, GetParam() );
  EXPECT_FALSE( Frames.empty() );
  EXPECT_EQ( Frames.size(), Told.value( "frame_count", 0u ) );
  EXPECT_EQ( Frames.size(), Told.value( "frames", nlohmann::json::array() ).size() );
  const VRunResult Text = TestSupport::RunStageHost( { "inspect", Path } );
  EXPECT_EQ( 0, Text.m_ExitCode );
  EXPECT_NE( std::string::npos, Text.m_Output.find( "never closed" ) ) << Describe( Text );
}

// A signal before there is anything to finish.
TEST_P( EndTest, AnEndBeforeTheBeginning )
{
  // A card with no signal for a long time: the program waits.
  const std::string Script = WriteScript( m_Folder.File( "script.json" ), { { { "frame", 0 }, { "do", "signal-loss" }, { "frames", 100000 } } } );
  const VHostResult Result = Record( m_Folder.File( "out" ),
    CounterCard( GetParam(), "script=" + Script ) + VArguments{ "--frames", "10", "--verbose" },
    SignalOnce( { SIGINT }, []( const std::string& i_rText ) { return i_rText.find( "SetSourceEnabled" ) != std::string::npos; } ) );
  EXPECT_EQ( 1, Result.m_Run.m_ExitCode ) << Describe( Result.m_Run );
  EXPECT_EQ( "", Result.m_Run.m_Output );
  EXPECT_NE( std::string::npos, Result.m_Run.m_Error.find( "stagehost: Interrupted " ) ) << Describe( Result.m_Run );
}

INSTANTIATE_TEST_SUITE_P( Kinds, EndTest, BothKinds, KindName );
