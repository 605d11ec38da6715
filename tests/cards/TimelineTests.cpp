// The signal as a sequence: labels, samples and events, frame by frame.
#include "cards/common/CardRunner.h"
#include "cards/common/CardSpec.h"
#include "cards/common/EventScript.h"
#include "cards/common/SampleCadence.h"
#include "cards/common/SignalTimeline.h"

#include <gtest/gtest.h>

using namespace VirtualCards;
using KVZ::IVideoStandard;

namespace
{

// A clock as a person would count: one label up at a time.
void CountUp( VTimecodeLabel& io_rLabel, int i_Nominal )
{
  if( ++io_rLabel.m_Frames < i_Nominal )
  {
    return;
  }
  io_rLabel.m_Frames = 0;
  if( ++io_rLabel.m_Seconds < 60 )
  {
    return;
  }
  io_rLabel.m_Seconds = 0;
  if( ++io_rLabel.m_Minutes == 60 )
  {
    io_rLabel.m_Minutes = 0;
    io_rLabel.m_Hours = ( io_rLabel.m_Hours + 1 ) % 24;
  }
  if( io_rLabel.m_bDropFrame && io_rLabel.m_Minutes % 10 != 0 )
  {
    io_rLabel.m_Frames = 2;
  }
}

bool Carries( const VSignalFrame& i_rFrame, const VTimecodeLabel& i_rLabel )
{
  const KVZ::ITimecode& rCarried = i_rFrame.m_Timecode->m_Label;
  return rCarried.m_Days == 0 && rCarried.m_Hours == i_rLabel.m_Hours && rCarried.m_Minutes == i_rLabel.m_Minutes &&
    rCarried.m_Seconds == i_rLabel.m_Seconds && rCarried.m_Frames == i_rLabel.m_Frames;
}

std::vector<VCardEvent> Events( const std::string& i_rScript )
{
  std::string Error;
  const auto Events = ParseEvents( *FindCardKind( "decklink" ), DefaultStandard, i_rScript, Error );
  EXPECT_TRUE( Events ) << Error;
  return Events.value_or( std::vector<VCardEvent>() );
}

}

TEST( SignalTimeline, LabelsCountAsAPersonWouldThroughMidnight )
{
  const struct
  {
    IVideoStandard::Enum m_Standard;
    int m_Nominal;
    int m_FramesPerLabel;
    bool m_bDropFrame = false;
  } Rates[] = { { IVideoStandard::EHD_1920_1080P_2398, 24, 1 }, { IVideoStandard::EHD_1920_1080P_2400, 24, 1 },
    { IVideoStandard::EHD_1920_1080P_2500, 25, 1 }, { IVideoStandard::EHD_1920_1080P_2997, 30, 1 },
    { IVideoStandard::EHD_1920_1080P_2997, 30, 1, true }, { IVideoStandard::EHD_1920_1080P_3000, 30, 1 },
    { IVideoStandard::EHD_1920_1080P_4800, 24, 2 }, { IVideoStandard::EHD_1920_1080P_5000, 25, 2 }, { IVideoStandard::EHD_1920_1080P_5994, 30, 2 },
    { IVideoStandard::EHD_1920_1080P_5994, 30, 2, true }, { IVideoStandard::EHD_1920_1080P_6000, 30, 2 } };
  for( const auto& rRate : Rates )
  {
    SCOPED_TRACE( KVZ::ToName( rRate.m_Standard ) + ( rRate.m_bDropFrame ? " drop-frame" : "" ) );
    VTimecodeLabel Expected{ 23, 48, 58, 20, rRate.m_bDropFrame };
    VSignalTimeline Signal( rRate.m_Standard, Expected, {} );
    for( int Label = 0; Label < 20 * 60 * rRate.m_Nominal; ++Label )
    {
      for( int Field = 0; Field < rRate.m_FramesPerLabel; ++Field )
      {
        const VSignalFrame Frame = Signal.Next();
        ASSERT_TRUE( Frame.m_Timecode );
        ASSERT_TRUE( Carries( Frame, Expected ) ) << KVZ::ToText( Frame.m_Timecode->m_Label ) << " as label " << Label;
        ASSERT_EQ( Frame.m_Timecode->m_bFieldMark, Field == 1 );
      }
      CountUp( Expected, rRate.m_Nominal );
    }
    EXPECT_EQ( Expected.m_Hours, 0 );
  }
}

// 29.97 frames a second: five hold 8008 samples.
TEST( SignalTimeline, SamplesFollowTheCadence )
{
  constexpr uint64_t Cadence[] = { 1602, 1601, 1602, 1601, 1602 };
  VSignalTimeline Signal( IVideoStandard::EHD_1920_1080P_2997, {}, {} );
  uint64_t Next = 0;
  for( uint64_t Number = 0; Number < 10; ++Number )
  {
    const VSignalFrame Frame = Signal.Next();
    EXPECT_EQ( Frame.m_Samples, Cadence[Number % 5] ) << Number;
    EXPECT_EQ( Frame.m_FirstSample, Next );
    Next += Frame.m_Samples;
  }
  // An hour has 107892.1 frames, and no sample is lost in five of them
  EXPECT_EQ( SamplesUntil( 5 * 107892, 4504500 ), uint64_t{ 8008 } * 107892 );
}

TEST( SignalTimeline, EventsHappenAtTheirFramesAndTheClockGoesOn )
{
  VSignalTimeline Signal( DefaultStandard, VTimecodeLabel(), Events( R"([
    { "frame": 10, "do": "timecode-jump", "to": "05:00:00:00" },
    { "frame": 8, "do": "late", "milliseconds": 40 },
    { "frame": 2, "do": "signal-loss", "frames": 2 },
    { "frame": 5, "do": "drop", "frames": 2 },
    { "frame": 12, "do": "timecode-loss", "frames": 2 },
    { "frame": 15, "do": "timecode-loss" },
    { "frame": 17, "do": "remove" },
    { "frame": 19, "do": "arrive" } ])" ) );
  for( uint64_t i = 0; i < 22; ++i )
  {
    SCOPED_TRACE( i );
    const VSignalFrame Frame = Signal.Next();
    EXPECT_EQ( Frame.m_Number, i );
    EXPECT_EQ( Frame.m_Time, static_cast<int64_t>( i ) * 5400000 );
    EXPECT_EQ( Frame.m_FirstSample, i * 1920 );
    EXPECT_EQ( Frame.m_bSignal, i != 2 && i != 3 );
    EXPECT_EQ( Frame.m_bDropped, i == 5 || i == 6 );
    EXPECT_EQ( Frame.m_LateMilliseconds, i == 8 ? 40u : 0u );
    EXPECT_EQ( Frame.m_bPresent, i != 17 && i != 18 );
    EXPECT_EQ( Frame.m_Timecode.has_value(), Frame.m_bSignal && i != 12 && i != 13 && i < 15 );
    if( Frame.m_Timecode )
    {
      EXPECT_EQ( KVZ::ToText( Frame.m_Timecode->m_Label ),
        ( i < 10 ? "01:00:00:0" + std::to_string( i ) : "05:00:00:0" + std::to_string( i - 10 ) ) );
    }
  }
}

TEST( SignalTimeline, AFormatChangeKeepsNumberSamplesAndLabelGoing )
{
  VSignalTimeline Signal( IVideoStandard::EHD_1920_1080P_2997, VTimecodeLabel{ 1, 0, 59, 25, true },
    Events( R"([{ "frame": 7, "do": "format", "standard": "HD_1280_720P_5994" }])" ) );
  VSignalFrame Before;
  for( int i = 0; i < 7; ++i )
  {
    Before = Signal.Next();
  }
  EXPECT_EQ( KVZ::ToText( Before.m_Timecode->m_Label ), "01:01:00;03" );
  const VSignalFrame First = Signal.Next();
  EXPECT_EQ( First.m_Number, 7u );
  EXPECT_EQ( First.m_pStandard->m_Standard, IVideoStandard::EHD_1280_720P_5994 );
  EXPECT_EQ( First.m_Time, 7 * 4504500 );
  EXPECT_EQ( First.m_FirstSample, Before.m_FirstSample + Before.m_Samples );
  EXPECT_EQ( First.m_Samples, 801u );
  EXPECT_EQ( KVZ::ToText( First.m_Timecode->m_Label ), "01:01:00;04" );
  EXPECT_FALSE( First.m_Timecode->m_bFieldMark );
  const VSignalFrame Second = Signal.Next();
  EXPECT_EQ( Second.m_Time, 7 * 4504500 + 2252250 );
  EXPECT_TRUE( Second.m_Timecode->m_bFieldMark );
}

TEST( CardRunner, DueTimesDoNotDrift )
{
  const VPaceClock::time_point Start( std::chrono::nanoseconds( 12345 ) );
  EXPECT_EQ( DueTime( Start, 135000000, 1.0 ) - Start, std::chrono::seconds( 1 ) );
  EXPECT_EQ( DueTime( Start, 135000000, 2.0 ) - Start, std::chrono::milliseconds( 500 ) );
  // 30 days of 59.94 frames a second: 1001 / 60000 s each
  const int64_t Frames = 30ll * 86400 * 60;
  EXPECT_EQ( DueTime( Start, Frames * 2252250, 1.0 ) - Start, std::chrono::microseconds( Frames / 60 * 1001000 ) );
}
