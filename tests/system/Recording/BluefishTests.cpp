// The second kind of card goes the same road: exact ranges at each rate, events, the two kinds beside each other, a killed program.
#include "tests/support/TemporaryFolder.h"
#include "tests/support/TvidParser.h"
#include "tests/support/system/CounterFile.h"
#include "tests/support/system/StageHost.h"

#include <boost/filesystem/operations.hpp>
#include <gtest/gtest.h>

#include <csignal>

using namespace SystemTests;

namespace
{

// The sound of a frame has a fixed number of samples at each rate. Where that is less than the signal has on average, some are left out.
struct VBluefishCase
{
  const char* m_pName;
  VSignalRate m_Rate;
  const char* m_pStartLabel;
  bool m_bWholeSound;
};

const VSignalRate Bluefish25{ "SD_720_576I_5000", 5400000, 25, 1, false, { 1920 } };

const VBluefishCase Cases[] = {
  { "2398", { "HD_1280_720P_2398", 5630625, 24, 1, false, { 2002 } }, "01:00:00:23", true },
  { "24", { "HD_1280_720P_2400", 5625000, 24, 1, false, { 2000 } }, "01:00:00:23", true },
  { "25", Bluefish25, "23:59:59:24", true },
  { "2997Drop", { "SD_720_486I_5994", 4504500, 30, 1, true, { 1601 } }, "00:00:59;29", false },
  { "30", { "HD_1280_720P_3000", 4500000, 30, 1, false, { 1600 } }, "00:00:59:29", true },
  { "50", { "HD_1280_720P_5000", 2700000, 25, 2, false, { 960 } }, "09:59:59:24", true },
  { "5994Drop", { "HD_1280_720P_5994", 2252250, 30, 2, true, { 800 } }, "00:09:59;29", false },
  { "60", { "HD_1280_720P_6000", 2250000, 30, 2, false, { 800 } }, "10:00:00:00", true },
};

std::string CardText( const VSignalRate& i_rRate, const std::string& i_rMore )
{
  return std::string( "bluefish444:pattern=counter,audio=ramp,standard=" ) + i_rRate.m_pStandard + i_rMore;
}

// By itself a card of this kind delivers luma alone: the first of its formats.
const VArguments InUYVY = { "--pixel-format", "U8Y8V8Y8" };

void ExpectWhole( const std::vector<VCounterFrame>& i_rFrames, const VBluefishCase& i_rCase )
{
  if( i_rCase.m_bWholeSound )
  {
    ExpectUnbroken( i_rFrames, i_rCase.m_Rate );
    return;
  }
  for( size_t Index = 0; Index < i_rFrames.size(); ++Index )
  {
    ASSERT_EQ( i_rFrames.front().m_Counter + Index, i_rFrames[Index].m_Counter );
    ASSERT_EQ( i_rCase.m_Rate.m_SampleCadence.front(), i_rFrames[Index].m_Samples );
  }
}

class BluefishRangeTest : public testing::TestWithParam<VBluefishCase>
{
protected:
  const TestSupport::VTemporaryFolder m_Folder;
};

class BluefishTest : public testing::Test
{
protected:
  // Events come again every so many frames, so that a recording meets them wherever it began.
  static constexpr uint32_t Every = 100;

  VRecordResult RecordEvents( const nlohmann::json& i_rEvents, uint64_t i_Frames )
  {
    const std::string Script = WriteScript( m_Folder.File( "script.json" ), i_rEvents );
    return Record( m_Folder.File( "out" ),
      VArguments{ "--card", CardText( Bluefish25, ",speed=8,script=" + Script ), "--frames", std::to_string( i_Frames ) } + InUYVY );
  }

  const TestSupport::VTemporaryFolder m_Folder;
};

}

TEST_P( BluefishRangeTest, HoldsTheFramesAskedForWithTheirSoundAndTimecode )
{
  constexpr uint64_t FrameCount = 47;
  const VBluefishCase& rCase = GetParam();
  const VRecordResult Result = Record( m_Folder.File( "out" ),
    VArguments{ "--card", CardText( rCase.m_Rate, std::string( ",speed=2,timecode=" ) + rCase.m_pStartLabel ), "--frames",
      std::to_string( FrameCount ) } +
      InUYVY );
  EXPECT_EQ( 0, Result.m_Run.m_ExitCode ) << Describe( Result.m_Run );
  const std::vector<VCounterFrame> Frames = ReadCounterFile( Result.Path() );
  ASSERT_EQ( FrameCount, Frames.size() );
  ExpectWhole( Frames, rCase );
  const uint32_t First = Frames.front().m_Counter;
  EXPECT_EQ( LabelOfFrame( rCase.m_pStartLabel, rCase.m_Rate, First ), Result.Device().value( "start_timecode", "" ) )
    << "the card's frame " << First;
  EXPECT_EQ( rCase.m_Rate.m_Period, Result.Device().value( "period", 0 ) );
  const TestSupport::VTvidParser File( Result.Path() );
  EXPECT_EQ( First % rCase.m_Rate.m_FramesPerLabel * rCase.m_Rate.m_Period, File.Number( "Timecode.TickRemainder" ) );
}

INSTANTIATE_TEST_SUITE_P( Rates, BluefishRangeTest, testing::ValuesIn( Cases ),
  []( const auto& i_rInfo ) { return std::string( i_rInfo.param.m_pName ); } );

TEST_F( BluefishTest, PreRollReachesBeforeTheRequest )
{
  const VRecordResult Result = Record( m_Folder.File( "out" ),
    VArguments{ "--card", CardText( Bluefish25, ",speed=4" ), "--frames", "60", "--pre-roll", "2", "--verbose" } + InUYVY );
  EXPECT_EQ( 0, Result.m_Run.m_ExitCode ) << Describe( Result.m_Run );
  const std::vector<VCounterFrame> Frames = ReadCounterFile( Result.Path() );
  ASSERT_EQ( 60u, Frames.size() );
  ExpectUnbroken( Frames, Bluefish25 );
  const std::vector<int64_t> Starts = NumbersBehind( "StartCapture: Local Start Tick is ", Result.m_Run.m_Error );
  const std::vector<int64_t> Newest = NumbersBehind( "(Lastest tick is ", Result.m_Run.m_Error );
  ASSERT_TRUE( !Starts.empty() && !Newest.empty() ) << Describe( Result.m_Run );
  EXPECT_LE( Starts.back(), Newest.back() - 2 * int64_t{ 135000000 } + Bluefish25.m_Period );
}

TEST_F( BluefishTest, DroppedFramesAreCountedAndTheRecordingGoesOn )
{
  const VRecordResult Result = RecordEvents( EveryFrames( Every, { { "do", "drop" }, { "frames", 3 } } ), 250 );
  EXPECT_EQ( 3, Result.m_Run.m_ExitCode ) << Describe( Result.m_Run );
  const std::vector<VCounterFrame> Frames = ReadCounterFile( Result.Path() );
  ASSERT_EQ( 250u, Frames.size() );
  uint32_t Missing = 0;
  for( size_t Index = 1; Index < Frames.size(); ++Index )
  {
    const uint32_t Gap = Frames[Index].m_Counter - Frames[Index - 1].m_Counter - 1;
    EXPECT_TRUE( Gap == 0 || ( Gap == 3 && ( Frames[Index - 1].m_Counter + 1 ) % Every == 0 ) ) << Gap << " after " << Frames[Index - 1].m_Counter;
    Missing += Gap;
  }
  EXPECT_GE( Missing, 6u );
  EXPECT_EQ( Missing, Result.Device().value( "lost", nlohmann::json::object() ).value( "card", 0u ) );
}

TEST_F( BluefishTest, TimecodeJumpsAndLateFramesLeaveTheFileWhole )
{
  nlohmann::json Events = EveryFrames( Every, { { "do", "late" }, { "milliseconds", 400 } } );
  Events.push_back( { { "frame", 150 }, { "do", "timecode-jump" }, { "to", "23:59:58:00" } } );
  const VRecordResult Result = RecordEvents( Events, 250 );
  EXPECT_EQ( 0, Result.m_Run.m_ExitCode ) << Describe( Result.m_Run );
  const std::vector<VCounterFrame> Frames = ReadCounterFile( Result.Path() );
  EXPECT_EQ( 250u, Frames.size() );
  ExpectUnbroken( Frames, Bluefish25 );
}

// The file ends with the last frame before the event, whole.
TEST_F( BluefishTest, WhatEndsASignalEndsTheRecordingAtItsLastFrame )
{
  const nlohmann::json Ends[] = { { { "do", "remove" } }, { { "do", "format" }, { "standard", "SD_720_486I_5994" } },
    { { "do", "signal-loss" }, { "frames", 20 } } };
  for( nlohmann::json Event : Ends )
  {
    SCOPED_TRACE( Event.dump() );
    Event["frame"] = 3 * Every;
    const VRecordResult Result = RecordEvents( nlohmann::json::array( { Event } ), 1000 );
    EXPECT_EQ( 3, Result.m_Run.m_ExitCode ) << Describe( Result.m_Run );
    const std::vector<VCounterFrame> Frames = ReadCounterFile( Result.Path() );
    ASSERT_FALSE( Frames.empty() );
    ExpectUnbroken( Frames, Bluefish25 );
    EXPECT_EQ( 3 * Every - 1, Frames.back().m_Counter );
    EXPECT_EQ( "Complete", Result.Device().value( "state", "" ) );
    EXPECT_EQ( Frames.size(), Result.Device().value( "frames_written", 0u ) );
    EXPECT_TRUE( TestSupport::VTvidParser( Result.Path() ).IsFinished() );
    boost::filesystem::remove_all( m_Folder.File( "out" ) );
  }
}

// Cards of this kind come first, whatever the order on the command line.
TEST_F( BluefishTest, BothKindsRecordBesideEachOther )
{
  const VRecordResult Result = Record( m_Folder.File( "out" ),
    VArguments{ "--card", "decklink:pattern=counter,audio=ramp,standard=SD_720_576I_5000,speed=2", "--card",
      CardText( Bluefish25, ",speed=2,inputs=2" ), "--frames", "40" } +
      InUYVY );
  EXPECT_EQ( 0, Result.m_Run.m_ExitCode ) << Describe( Result.m_Run );
  ASSERT_EQ( 3u, Result.m_Devices.size() );
  const char* const Names[] = { "Super Nova C1:ChA", "Super Nova C1:ChB", "DeckLink C1" };
  for( size_t Device = 0; Device < 3; ++Device )
  {
    EXPECT_EQ( Names[Device], Result.Device( Device ).value( "name", "" ) );
    const std::vector<VCounterFrame> Frames = ReadCounterFile( Result.Path( Device ) );
    EXPECT_EQ( 40u, Frames.size() );
    ExpectUnbroken( Frames, Bluefish25 );
  }
}

TEST_F( BluefishTest, CardsWithoutUsableInputsGiveNoDevice )
{
  const VRecordResult Result = Record( m_Folder.File( "out" ), { "--card", "bluefish444:inputs=0,outputs=2", "--frames", "5" } );
  EXPECT_EQ( 4, Result.m_Run.m_ExitCode ) << Describe( Result.m_Run );
  EXPECT_NE( Result.m_Run.m_Error.find( "Card has output channels but no inputs." ), std::string::npos ) << Describe( Result.m_Run );
}

TEST_F( BluefishTest, AKilledRecordingIsReadUpToItsLastWholeFrame )
{
  VRunOptions Options;
  Options.m_OnErrorText = []( pid_t i_Child, const std::string& i_rText )
  {
    const std::vector<int64_t> Captured = NumbersBehind( "frames_captured=", i_rText );
    if( !Captured.empty() && Captured.back() >= 40 )
    {
      kill( i_Child, SIGKILL );
    }
  };
  const VRecordResult Result = Record( m_Folder.File( "out" ),
    VArguments{ "--card", CardText( Bluefish25, ",speed=4" ), "--frames", "100000", "--progress" } + InUYVY, Options );
  ASSERT_EQ( SIGKILL, Result.m_Run.m_Signal ) << Describe( Result.m_Run );
  const std::vector<VCounterFrame> Frames = ReadCounterFile( m_Folder.File( "out" ) + "/take_vi0.tvid" );
  EXPECT_GE( Frames.size(), 20u );
  ExpectUnbroken( Frames, Bluefish25 );
}
