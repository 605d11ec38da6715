#include "host/Timeline.h"

#include "tests/host/Engine/SourceTimes.h"

#include <gtest/gtest.h>

using namespace StageHost;
using KVZ::IClock;
using KVZ::VTick;

namespace
{

VTimelineSource MakeSource( VTick i_Timecode, double i_StartTime, bool i_bTimed = true )
{
  VTimelineSource Source;
  Source.m_Session.m_Id = 1;
  Source.m_Session.m_Period = VTick( 5400000 );
  Source.m_Session.m_StartTime.Set( IClock( IClock::FrameNumber, 0, 7 ), VTick( 0 ) );
  if( i_Timecode.IsValid() )
  {
    Source.m_Session.m_StartTime.Set( IClock( IClock::Timecode, 3, 0 ), i_Timecode );
  }
  Source.m_Session.m_StartTime.Set( IClock( IClock::CounterFromSessionStart, 0, 7 ), VTick( 0 ) );
  if( i_bTimed )
  {
    Source.m_Timing.emplace();
    Source.m_Timing->m_SessionId = 1;
    Source.m_Timing->m_StartTime = i_StartTime;
  }
  return Source;
}

}

TEST( Timeline, OneSourceWithTimecodeNeedsNoDeliveryTimes )
{
  const auto Timeline = LaySources( { MakeSource( OneHour, 0.0, false ) } );
  ASSERT_TRUE( Timeline );
  EXPECT_TRUE( Timeline->m_bByTimecode );
  EXPECT_EQ( OneHour, Timeline->m_Sources[0].m_CounterStart );
}

TEST( Timeline, WaitsForDeliveryTimesWhereTheyDecide )
{
  EXPECT_FALSE( LaySources( { MakeSource( VTick::Invalid(), 0.0, false ) } ) );
  EXPECT_FALSE( LaySources( { MakeSource( OneHour, 10.0 ), MakeSource( VTick::Invalid(), 0.0, false ) } ) );
}

TEST( Timeline, SharedTimecodeBeatsLateDelivery )
{
  // The second source is delivered 100 ms late; its timecode says that it began one second after the first.
  const auto Timeline = LaySources( { MakeSource( OneHour, 10.0 ), MakeSource( OneHour + KVZ::SecondsToTick135( 1 ), 11.1 ) } );
  ASSERT_TRUE( Timeline );
  EXPECT_TRUE( Timeline->m_Sources[1].m_bByTimecode );
  EXPECT_EQ( KVZ::SecondsToTick135( 1 ), Timeline->m_Sources[1].m_CounterStart - Timeline->m_Sources[0].m_CounterStart );
}

TEST( Timeline, AForeignTimecodeIsLaidByDelivery )
{
  // Ten hours apart on paper, a quarter of a second apart in the room.
  const auto Timeline = LaySources( { MakeSource( OneHour, 10.0 ), MakeSource( OneHour * 11, 10.25 ) } );
  ASSERT_TRUE( Timeline );
  EXPECT_FALSE( Timeline->m_Sources[1].m_bByTimecode );
  EXPECT_EQ( KVZ::MillisecondsToTick135( 250 ), Timeline->m_Sources[1].m_CounterStart - Timeline->m_Sources[0].m_CounterStart );
}

TEST( Timeline, SourcesWithoutTimecodeFollowTheReferenceOrTheHostsClock )
{
  const auto Mixed = LaySources( { MakeSource( VTick::Invalid(), 12.0 ), MakeSource( OneHour, 10.0 ) } );
  ASSERT_TRUE( Mixed );
  EXPECT_EQ( OneHour + KVZ::SecondsToTick135( 2 ), Mixed->m_Sources[0].m_CounterStart );
  EXPECT_EQ( OneHour, Mixed->m_Sources[1].m_CounterStart );

  const auto Plain = LaySources( { MakeSource( VTick::Invalid(), 12.0 ), MakeSource( VTick::Invalid(), 10.0 ) } );
  ASSERT_TRUE( Plain );
  EXPECT_FALSE( Plain->m_bByTimecode );
  EXPECT_EQ( KVZ::SecondsToTick135( 12 ), Plain->m_Sources[0].m_CounterStart );
  EXPECT_EQ( KVZ::SecondsToTick135( 10 ), Plain->m_Sources[1].m_CounterStart );
}
