// What was asked for is what the file holds: that many frames, one after another, with their sound, at the place in time that the host tells.
#include "tests/support/TemporaryFolder.h"
#include "tests/support/TvidParser.h"
#include "tests/support/system/CounterFile.h"
#include "tests/support/system/Rates.h"
#include "tests/support/system/StageHost.h"

#include <gtest/gtest.h>

using namespace SystemTests;

namespace
{

struct VRangeCase
{
  const char* m_pName;
  VSignalRate m_Rate;
  const char* m_pStartLabel;
};

// Each start lies so that the recording has passed a place where counting is odd: a second, a drop-frame minute, midnight.
const VRangeCase RangeCases[] = {
  { "2398", Rate2398, "01:00:00:23" },
  { "25", Rate25, "23:59:59:24" },
  { "2997Drop", Rate2997Drop, "00:00:59;29" },
  { "2997DropTenthMinute", Rate2997Drop, "00:09:59;29" },
  { "50", Rate50, "09:59:59:24" },
  { "5994", Rate5994, "01:00:00:00" },
  { "5994Drop", Rate5994Drop, "00:00:59;29" },
  { "60", Rate60, "10:00:00:00" },
  { "Bluefish2398", Bluefish2398, "01:00:00:23" },
  { "Bluefish24", Bluefish24, "01:00:00:23" },
  { "Bluefish25", Bluefish25, "23:59:59:24" },
  { "Bluefish2997Drop", Bluefish2997Drop, "00:00:59;29" },
  { "Bluefish30", Bluefish30, "00:00:59:29" },
  { "Bluefish50", Bluefish50, "09:59:59:24" },
  { "Bluefish5994Drop", Bluefish5994Drop, "00:09:59;29" },
  { "Bluefish60", Bluefish60, "10:00:00:00" },
};

VArguments Card( const VRangeCase& i_rCase, const std::string& i_rSpeed )
{
  return CounterCard( i_rCase.m_Rate, std::string( "timecode=" ) + i_rCase.m_pStartLabel + ",speed=" + i_rSpeed );
}

void ExpectAllWritten( const VHostResult& i_rRecord, uint64_t i_Frames )
{
  const nlohmann::json& rDevice = i_rRecord.Device();
  EXPECT_EQ( 0, i_rRecord.m_Run.m_ExitCode ) << Describe( i_rRecord.m_Run );
  for( const char* pKey : { "frames_requested", "frames_captured", "frames_written" } )
  {
    EXPECT_EQ( i_Frames, rDevice.value( pKey, 0u ) ) << pKey;
  }
  EXPECT_EQ( "Complete", rDevice.value( "state", "" ) );
  EXPECT_EQ( 0, rDevice.value( "failure", -1 ) );
  EXPECT_EQ( nlohmann::json::array(), rDevice.value( "errors", nlohmann::json() ) );
  const nlohmann::json Lost = rDevice.value( "lost", nlohmann::json::object() );
  for( const auto& rCause : Lost.items() )
  {
    EXPECT_EQ( 0, rCause.value().get<int>() ) << rCause.key();
  }
}

}

class RangeTest : public testing::TestWithParam<VRangeCase>
{
protected:
  const TestSupport::VTemporaryFolder m_Folder;
};

TEST_P( RangeTest, HoldsTheFramesAskedForWithTheirSoundAndTimecode )
{
  constexpr uint64_t FrameCount = 67;
  const VRangeCase& rCase = GetParam();
  const VHostResult Result = Record( m_Folder.File( "out" ), Card( rCase, "2" ) + VArguments{ "--frames", std::to_string( FrameCount ) } );
  ExpectAllWritten( Result, FrameCount );

  const std::vector<VCounterFrame> Frames = ReadUnbroken( Result.Path(), rCase.m_Rate );
  ASSERT_EQ( FrameCount, Frames.size() );

  const uint32_t First = Frames.front().m_Counter;
  const std::string StartLabel = LabelOfFrame( rCase.m_pStartLabel, rCase.m_Rate, First );
  const nlohmann::json& rDevice = Result.Device();
  EXPECT_EQ( StartLabel, rDevice.value( "start_timecode", "" ) ) << "the card's frame " << First;
  EXPECT_EQ( rCase.m_Rate.m_Period, rDevice.value( "period", 0 ) );

  const TestSupport::VTvidParser File( Result.Path() );
  EXPECT_EQ( rCase.m_Rate.m_Period, File.Number( "FramePeriodInTicks" ) );
  EXPECT_EQ( 135000000, File.Number( "TicksPerSecond" ) );
  EXPECT_EQ( rDevice.value( "start_tick", int64_t{ -1 } ), File.Number( "StartOffsetInTicks" ) );
  EXPECT_EQ( std::stoi( StartLabel.substr( 0, 2 ) ), File.Number( "Timecode.Hours" ) );
  EXPECT_EQ( std::stoi( StartLabel.substr( 6, 2 ) ), File.Number( "Timecode.Seconds" ) );
  EXPECT_EQ( std::stoi( StartLabel.substr( 9, 2 ) ), File.Number( "Timecode.Frames" ) );
  EXPECT_EQ( First % rCase.m_Rate.m_FramesPerLabel * rCase.m_Rate.m_Period, File.Number( "Timecode.TickRemainder" ) );
}

INSTANTIATE_TEST_SUITE_P( Rates, RangeTest, testing::ValuesIn( RangeCases ),
  []( const auto& i_rInfo ) { return std::string( i_rInfo.param.m_pName ); } );

class PreRollTest : public RangeTest
{
};

// The request's moment is the newest tick that the source tells when the capture is asked for; a request into the past is checked against
// it, and then, by the timeline of the timecode, against what is in the picture.
TEST_P( PreRollTest, BeginsThatLongBeforeTheRequest )
{
  constexpr int64_t PreRollSeconds = 3;
  constexpr int64_t PreRoll = PreRollSeconds * 135000000;
  const VRangeCase& rCase = GetParam();
  const int64_t Period = rCase.m_Rate.m_Period;
  const int64_t FrameCount = PreRoll / Period + 40;   // the file reaches from before the request to after it
  const VHostResult Result = Record( m_Folder.File( "out" ),
    Card( rCase, "4" ) + VArguments{ "--frames", std::to_string( FrameCount ), "--pre-roll", std::to_string( PreRollSeconds ), "--verbose" } );
  ExpectAllWritten( Result, static_cast<uint64_t>( FrameCount ) );

  const std::vector<int64_t> Starts = NumbersBehind( "StartCapture: Local Start Tick is ", Result.m_Run.m_Error );
  const std::vector<int64_t> Newest = NumbersBehind( "(Lastest tick is ", Result.m_Run.m_Error );
  ASSERT_EQ( 1u, Starts.size() ) << Describe( Result.m_Run );
  ASSERT_EQ( 1u, Newest.size() );
  // Frames that arrive between the host's request and the source's answer make the distance larger, at most by what fits in some seconds
  EXPECT_GE( Newest[0] - Starts[0], PreRoll - Period );
  EXPECT_LT( Newest[0] - Starts[0], PreRoll + 20 * int64_t{ 135000000 } );

  const std::vector<VCounterFrame> Frames = ReadUnbroken( Result.Path(), rCase.m_Rate );
  ASSERT_EQ( static_cast<size_t>( FrameCount ), Frames.size() );
  const uint32_t First = Frames.front().m_Counter;
  EXPECT_EQ( LabelOfFrame( rCase.m_pStartLabel, rCase.m_Rate, First ), Result.Device().value( "start_timecode", "" ) );
  EXPECT_EQ( TickOfFrame( rCase.m_pStartLabel, rCase.m_Rate, First ), Result.Device().value( "start_tick", int64_t{ -1 } ) );
}

INSTANTIATE_TEST_SUITE_P( Rates, PreRollTest,
  testing::Values( VRangeCase{ "2398", Rate2398, "01:00:00:00" }, VRangeCase{ "25", Rate25, "10:00:00:00" },
    VRangeCase{ "2997Drop", Rate2997Drop, "00:00:59;00" }, VRangeCase{ "50", Rate50, "10:00:00:00" }, VRangeCase{ "5994", Rate5994, "01:00:00:00" },
    VRangeCase{ "Bluefish25", Bluefish25, "10:00:00:00" }, VRangeCase{ "Bluefish5994Drop", Bluefish5994Drop, "00:00:59;00" } ),
  []( const auto& i_rInfo ) { return std::string( i_rInfo.param.m_pName ); } );

class RangeFormTest : public testing::TestWithParam<VSignalRate>
{
protected:
  const TestSupport::VTemporaryFolder m_Folder;
};

// Seconds become whole frames: 1.5 s hold 90 frame starts at 59.94 and 37 or 38 at 25, whichever way the range lies on the grid.
TEST_P( RangeFormTest, SecondsHoldAllFramesThatBeginInTheSpan )
{
  const VHostResult Result = Record( m_Folder.File( "out" ),
    CounterCard( GetParam(), "speed=4" ) + VArguments{ "--card", CounterCardText( Rate5994, "speed=4" ), "--seconds", "1.5" } );
  EXPECT_EQ( 0, Result.m_Run.m_ExitCode ) << Describe( Result.m_Run );
  const size_t Slow = ReadCounterFile( Result.Path( 0 ) ).size();
  const size_t Fast = ReadCounterFile( Result.Path( 1 ) ).size();
  EXPECT_TRUE( Slow == 37 || Slow == 38 ) << Slow;
  EXPECT_TRUE( Fast == 89 || Fast == 90 ) << Fast;
  EXPECT_EQ( Slow, Result.Device( 0 ).value( "frames_requested", 0u ) );
  EXPECT_EQ( Fast, Result.Device( 1 ).value( "frames_requested", 0u ) );
}

// Other forms of a frame go the same road: 10 bit, fewer channels, 32 bit sound, none at all.
TEST_P( RangeFormTest, FormatsAskedForAreInTheFile )
{
  const std::string Kind = GetParam().m_pKind;
  const VArguments Card = { "--card", Kind + ":pattern=counter,audio=ramp,standard=SD_720_486I_5994,speed=4", "--frames", "10" };
  const VHostResult Wide = Record( m_Folder.File( "wide" ),
    Card + VArguments{ "--pixel-format", "U10Y10V10Y10", "--audio-format", "Int32", "--audio-channels", "8" } );
  EXPECT_EQ( 0, Wide.m_Run.m_ExitCode ) << Describe( Wide.m_Run );
  const TestSupport::VTvidParser WideFile( Wide.Path() );
  EXPECT_EQ( "U10Y10V10Y10", WideFile.Text( "VideoFrameInfo.PixelFormat" ) );
  EXPECT_EQ( "Int32", WideFile.Text( "AudioFrameInfo.SampleFormat" ) );
  EXPECT_EQ( 8, WideFile.Number( "AudioFrameInfo.Channels" ) );
  ASSERT_EQ( 10u, WideFile.Frames().size() );
  EXPECT_EQ( 720u / 48 * 128 * 486, WideFile.Frames().front().m_VideoSize );
  const uint64_t Samples = WideFile.Frames().front().m_AudioSize / 8 / 4;
  EXPECT_TRUE( Samples == 1601 || Samples == 1602 ) << Samples;

  const VHostResult Silent = Record( m_Folder.File( "silent" ), Card + VArguments{ "--audio", "none", "--pixel-format", "U8Y8V8Y8" } );
  EXPECT_EQ( 0, Silent.m_Run.m_ExitCode ) << Describe( Silent.m_Run );
  EXPECT_EQ( 0u, TestSupport::VTvidParser( Silent.Path() ).Channels() );
  EXPECT_EQ( 10u, ReadCounterFile( Silent.Path() ).size() );

  // A format that the container does not take gives way, and that is said.
  const VHostResult Movie = Record( m_Folder.File( "movie" ), Card + VArguments{ "--container", "mov" } );
  EXPECT_EQ( 0, Movie.m_Run.m_ExitCode ) << Describe( Movie.m_Run );
  EXPECT_EQ( Kind != "decklink", Movie.m_Run.m_Error.find( "does not take Luminance8; U8Y8V8Y8 is captured" ) != std::string::npos )
    << Describe( Movie.m_Run );
}

INSTANTIATE_TEST_SUITE_P( Kinds, RangeFormTest, BothKinds, KindName );
