#include "host/Timeline.h"

#include "tests/host/Engine/SyncEngineFixture.h"

#include <optional>

using namespace StageHost;
using KVZ::IClock;
using KVZ::VTick;

namespace
{

constexpr VTick NoTimecode = VTick::Invalid();

// Not delivered yet where it has no start time.
VTimelineSource MakeSource( VTick i_Timecode, std::optional<double> i_StartTime )
{
  VTimelineSource Source;
  Source.m_Session.m_Id = 1;
  Source.m_Session.m_Period = VTick( Period25 );
  Source.m_Session.m_StartTime.Set( IClock( IClock::FrameNumber, 0, 7 ), VTick( 0 ) );
  if( i_Timecode.IsValid() )
  {
    Source.m_Session.m_StartTime.Set( IClock( IClock::Timecode, 3, 0 ), i_Timecode );
  }
  if( i_StartTime )
  {
    Source.m_Timing.emplace();
    Source.m_Timing->m_SessionId = 1;
    Source.m_Timing->m_StartTime = *i_StartTime;
  }
  return Source;
}

}

TEST( Timeline, OnlyASingleSourceWithTimecodeNeedsNoDeliveryTimes )
{
  const auto Timeline = LaySources( { MakeSource( OneHour, {} ) } );
  ASSERT_TRUE( Timeline );
  EXPECT_TRUE( Timeline->m_bByTimecode );
  EXPECT_EQ( OneHour, Timeline->m_Sources[0].m_CounterStart );
  EXPECT_FALSE( LaySources( { MakeSource( NoTimecode, {} ) } ) );
  EXPECT_FALSE( LaySources( { MakeSource( NoTimecode, 10.0 ) } )->m_bByTimecode );
  EXPECT_FALSE( LaySources( { MakeSource( OneHour, 10.0 ), MakeSource( NoTimecode, {} ) } ) );
}

TEST( Timeline, SourcesAreLaidByTheirTimecodeWhereDeliveryDoesNotContradictIt )
{
  struct VCase
  {
    const char* m_pName;
    VTimelineSource m_First;
    VTimelineSource m_Second;
    bool m_bByTimecode;   // the second
    VTick m_Starts[2];
  };
  const VTick Second = KVZ::SecondsToTick135( 1 );
  for( const VCase& rCase : {
         VCase{ "delivered 100 ms late", MakeSource( OneHour, 10.0 ), MakeSource( OneHour + Second, 11.1 ), true, { OneHour, OneHour + Second } },
         VCase{ "ten hours apart on paper, a quarter of a second in the room", MakeSource( OneHour, 10.0 ), MakeSource( OneHour * 11, 10.25 ), false,
           { OneHour, OneHour + KVZ::MillisecondsToTick135( 250 ) } },
         VCase{ "without timecode beside one with it", MakeSource( NoTimecode, 12.0 ), MakeSource( OneHour, 10.0 ), true,
           { OneHour + Second * 2, OneHour } },
         VCase{ "by the host's clock", MakeSource( NoTimecode, 12.0 ), MakeSource( NoTimecode, 10.0 ), false, { Second * 12, Second * 10 } },
       } )
  {
    SCOPED_TRACE( rCase.m_pName );
    const auto Timeline = LaySources( { rCase.m_First, rCase.m_Second } );
    ASSERT_TRUE( Timeline );
    EXPECT_EQ( rCase.m_bByTimecode, Timeline->m_Sources[1].m_bByTimecode );
    EXPECT_EQ( rCase.m_Starts[0], Timeline->m_Sources[0].m_CounterStart );
    EXPECT_EQ( rCase.m_Starts[1], Timeline->m_Sources[1].m_CounterStart );
  }
}
