// The signal as a sequence: labels, samples and events, frame by frame.
#include "cards/common/CardRunner.h"
#include "cards/common/SampleCadence.h"
#include "cards/common/SignalTimeline.h"

#include <gtest/gtest.h>

using namespace VirtualCards;
using KVZ::IVideoStandard;

namespace
{

struct VLabel
{
  int m_Hours;
  int m_Minutes;
  int m_Seconds;
  int m_Frames;
  bool operator==( const VLabel& ) const = default;
};

std::ostream& operator<<( std::ostream& io_rStream, const VLabel& i_rLabel )
{
  return io_rStream << i_rLabel.m_Hours << ':' << i_rLabel.m_Minutes << ':' << i_rLabel.m_Seconds << ':' << i_rLabel.m_Frames;
}

// A clock as a person would count: one label up at a time.
void CountUp( VLabel& io_rLabel, int i_Nominal, bool i_bDropFrame )
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
  if( i_bDropFrame && io_rLabel.m_Minutes % 10 != 0 )
  {
    io_rLabel.m_Frames = 2;
  }
}

VLabel LabelOf( const VSignalFrame& i_rFrame )
{
  const KVZ::ITimecode& rLabel = i_rFrame.m_Timecode->m_Label;
  return { rLabel.m_Hours, rLabel.m_Minutes, rLabel.m_Seconds, rLabel.m_Frames };
}

VSignalTimeline Timeline( IVideoStandard::Enum i_Standard, std::vector<VCardEvent> i_Events = {} )
{
  return VSignalTimeline( i_Standard, VTimecodeLabel(), std::move( i_Events ) );
}

VCardEvent Event( uint64_t i_Frame, EEvent i_Do, uint64_t i_Frames = 0 )
{
  VCardEvent Event;
  Event.m_Frame = i_Frame;
  Event.m_Do = i_Do;
  Event.m_Frames = i_Frames;
  return Event;
}

struct VRateCase
{
  IVideoStandard::Enum m_Standard;
  int m_Nominal;
  int m_FramesPerLabel;
  bool m_bDropFrame;
};

class TimecodeAtRate : public testing::TestWithParam<VRateCase>
{
};

}

TEST_P( TimecodeAtRate, CountsAsAPersonWouldThroughMidnight )
{
  const VRateCase& rCase = GetParam();
  VSignalTimeline Signal( rCase.m_Standard, VTimecodeLabel{ 23, 48, 58, 20, rCase.m_bDropFrame }, {} );
  VLabel Expected{ 23, 48, 58, 20 };
  const int Labels = 20 * 60 * rCase.m_Nominal;
  for( int i = 0; i < Labels; ++i )
  {
    for( int Field = 0; Field < rCase.m_FramesPerLabel; ++Field )
    {
      const VSignalFrame Frame = Signal.Next();
      ASSERT_TRUE( Frame.m_Timecode );
      ASSERT_EQ( LabelOf( Frame ), Expected );
      ASSERT_EQ( Frame.m_Timecode->m_bFieldMark, Field == 1 );
      ASSERT_EQ( Frame.m_Timecode->m_Label.m_Days, 0 );
    }
    CountUp( Expected, rCase.m_Nominal, rCase.m_bDropFrame );
  }
  EXPECT_EQ( Expected.m_Hours, 0 );
}

INSTANTIATE_TEST_SUITE_P( Rates, TimecodeAtRate,
  testing::Values( VRateCase{ IVideoStandard::EHD_1920_1080P_2398, 24, 1, false }, VRateCase{ IVideoStandard::EHD_1920_1080P_2400, 24, 1, false },
    VRateCase{ IVideoStandard::EHD_1920_1080P_2500, 25, 1, false }, VRateCase{ IVideoStandard::EHD_1920_1080P_2997, 30, 1, false },
    VRateCase{ IVideoStandard::EHD_1920_1080P_2997, 30, 1, true }, VRateCase{ IVideoStandard::EHD_1920_1080P_3000, 30, 1, false },
    VRateCase{ IVideoStandard::EHD_1920_1080P_4800, 24, 2, false }, VRateCase{ IVideoStandard::EHD_1920_1080P_5000, 25, 2, false },
    VRateCase{ IVideoStandard::EHD_1920_1080P_5994, 30, 2, false }, VRateCase{ IVideoStandard::EHD_1920_1080P_5994, 30, 2, true },
    VRateCase{ IVideoStandard::EHD_1920_1080P_6000, 30, 2, false } ) );

TEST( SignalTimeline, SamplesFollowTheCadence )
{
  const auto Cadence = []( IVideoStandard::Enum i_Standard )
  {
    VSignalTimeline Signal = Timeline( i_Standard );
    std::vector<uint32_t> Samples;
    uint64_t Next = 0;
    for( int i = 0; i < 5; ++i )
    {
      const VSignalFrame Frame = Signal.Next();
      EXPECT_EQ( Frame.m_FirstSample, Next );
      Next += Frame.m_Samples;
      Samples.push_back( Frame.m_Samples );
    }
    return Samples;
  };
  using VSamples = std::vector<uint32_t>;
  EXPECT_EQ( Cadence( IVideoStandard::EHD_1920_1080P_2997 ), VSamples( { 1602, 1601, 1602, 1601, 1602 } ) );
  EXPECT_EQ( Cadence( IVideoStandard::EHD_1920_1080P_5994 ), VSamples( { 801, 801, 800, 801, 801 } ) );
  EXPECT_EQ( Cadence( IVideoStandard::EHD_1920_1080P_2398 ), VSamples( 5, 2002 ) );
  EXPECT_EQ( Cadence( IVideoStandard::EHD_1920_1080P_2400 ), VSamples( 5, 2000 ) );
  EXPECT_EQ( Cadence( IVideoStandard::EHD_1920_1080P_2500 ), VSamples( 5, 1920 ) );
  EXPECT_EQ( Cadence( IVideoStandard::EHD_1920_1080P_3000 ), VSamples( 5, 1600 ) );
  EXPECT_EQ( Cadence( IVideoStandard::EHD_1920_1080P_4800 ), VSamples( 5, 1000 ) );
  EXPECT_EQ( Cadence( IVideoStandard::EHD_1920_1080P_5000 ), VSamples( 5, 960 ) );
  EXPECT_EQ( Cadence( IVideoStandard::EHD_1920_1080P_6000 ), VSamples( 5, 800 ) );
  // An hour at 29.97: 107892.1 frames, and no sample is lost
  EXPECT_EQ( SamplesUntil( 5 * 107892, 4504500 ), uint64_t{ 8008 } * 107892 );
}

TEST( SignalTimeline, EventsHappenAtTheirFramesAndTheClockGoesOn )
{
  VCardEvent Late = Event( 8, EEvent::Late );
  Late.m_Milliseconds = 40;
  VCardEvent Jump = Event( 10, EEvent::TimecodeJump );
  Jump.m_To = { 5, 0, 0, 0, false };
  VSignalTimeline Signal = Timeline( IVideoStandard::EHD_1920_1080P_2500,
    { Jump, Late, Event( 2, EEvent::SignalLoss, 2 ), Event( 5, EEvent::Drop, 2 ), Event( 12, EEvent::TimecodeLoss, 2 ),
      Event( 15, EEvent::TimecodeLoss ), Event( 17, EEvent::Remove ), Event( 19, EEvent::Arrive ) } );
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
      EXPECT_EQ( LabelOf( Frame ), ( i < 10 ? VLabel{ 1, 0, 0, static_cast<int>( i ) } : VLabel{ 5, 0, 0, static_cast<int>( i ) - 10 } ) );
    }
  }
}

TEST( SignalTimeline, AFormatChangeKeepsNumberSamplesAndLabelGoing )
{
  VCardEvent Format = Event( 7, EEvent::Format );
  Format.m_Standard = IVideoStandard::EHD_1280_720P_5994;
  VSignalTimeline Signal( IVideoStandard::EHD_1920_1080P_2997, VTimecodeLabel{ 1, 0, 59, 25, true }, { Format } );
  VSignalFrame Frame;
  uint64_t Samples = 0;
  for( int i = 0; i < 7; ++i )
  {
    Frame = Signal.Next();
    EXPECT_EQ( Frame.m_FirstSample, Samples );
    Samples += Frame.m_Samples;
  }
  EXPECT_EQ( LabelOf( Frame ), ( VLabel{ 1, 1, 0, 3 } ) );
  Frame = Signal.Next();
  EXPECT_EQ( Frame.m_Number, 7u );
  EXPECT_EQ( Frame.m_pStandard->m_Standard, IVideoStandard::EHD_1280_720P_5994 );
  EXPECT_EQ( Frame.m_Time, 7 * 4504500 );
  EXPECT_EQ( Frame.m_FirstSample, Samples );
  EXPECT_EQ( Frame.m_Samples, 801u );
  EXPECT_EQ( LabelOf( Frame ), ( VLabel{ 1, 1, 0, 4 } ) );
  EXPECT_FALSE( Frame.m_Timecode->m_bFieldMark );
  EXPECT_EQ( Frame.m_Timecode->m_Label.m_Standard, KVZ::ITimecodeStandard::ETimecode30Drop );
  Frame = Signal.Next();
  EXPECT_EQ( Frame.m_Time, 7 * 4504500 + 2252250 );
  EXPECT_TRUE( Frame.m_Timecode->m_bFieldMark );
}

TEST( SignalTimeline, ACardWhoseFirstNewsIsItsArrivalIsAbsentUntilThen )
{
  VSignalTimeline Signal = Timeline( IVideoStandard::EHD_1920_1080P_2500, { Event( 2, EEvent::Arrive ) } );
  EXPECT_FALSE( Signal.Next().m_bPresent );
  EXPECT_FALSE( Signal.Next().m_bPresent );
  EXPECT_TRUE( Signal.Next().m_bPresent );
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
