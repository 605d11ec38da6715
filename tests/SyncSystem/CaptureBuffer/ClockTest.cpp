#include "SyncSystem/Clock.h"
#include "SyncSystem/SourceSyncSession.h"
#include "tests/SyncSystem/CaptureBuffer/SourceClocks.h"

#include <gtest/gtest.h>

namespace
{

using namespace KVZ;

TEST( Clock, OrderIsTypeThenUnsignedSourceThenIndex )
{
  const IClock Ascending[] = { { IClock::GlobalTime, 9, 9 }, { IClock::Timecode, -1, 0 }, { IClock::Timecode, 2, 0 }, { IClock::Timecode, 0, 1 },
    { IClock::Timecode, 0, 0xFFFFFFFFFFFFFFFF }, { IClock::FrameNumber, 0, 0 }, Counter };
  for( size_t Index = 1; Index < std::size( Ascending ); ++Index )
  {
    EXPECT_TRUE( Ascending[Index - 1] < Ascending[Index] && !( Ascending[Index] < Ascending[Index - 1] ) ) << Index;
  }
  EXPECT_STREQ( ClockName( static_cast<IClock::EType>( 2 ) ), "InvalidClockType" );
}

TEST( Clock, AbsentClockReadsInvalid )
{
  ITickInClocks Ticks;
  EXPECT_FALSE( Ticks.Find( Counter ).IsValid() );
  Ticks.Set( Counter, VTick( 0 ) );
  Ticks.Set( Timecode, VTick( 10 ) );
  EXPECT_EQ( Ticks.Find( Counter ), VTick( 0 ) );
  EXPECT_FALSE( Ticks.Find( FrameNumber ).IsValid() );
  EXPECT_EQ( Ticks.m_TickByClock.rbegin()->first, Counter );
  EXPECT_EQ( Shifted( Ticks, VTick( -3 ) ).Find( Timecode ), VTick( 7 ) );
}

ISourceSyncSession ValidSession()
{
  ISourceSyncSession Session;
  Session.m_Id = 4;
  Session.m_StartTime.Set( Counter, VTick( 0 ) );
  Session.m_StartTime.Set( Timecode, VTick( 12345 ) );
  Session.m_ContinuousSince = { { Counter, 4 }, { Timecode, 2 } };
  Session.m_Period = VTick( 1 );
  return Session;
}

TEST( SourceSyncSession, SaysWhichRuleFailsFirst )
{
  using VChange = void ( * )( ISourceSyncSession& );
  const std::pair<VChange, const char*> Cases[] = {
    { []( ISourceSyncSession& ) {}, "" },
    { []( ISourceSyncSession& io_r ) { io_r.m_BeatOffset = VTick( -5 ); }, "" },
    { []( ISourceSyncSession& io_r )
      {
        io_r.m_Id = 0;
        io_r.m_Period = VTick( 0 );
      },
      "Invalid Id" },
    { []( ISourceSyncSession& io_r )
      {
        io_r.m_Period = VTick( 0 );
        io_r.m_BeatPeriod = VTick( -1 );
      },
      "Period must be a positive number of ticks" },
    { []( ISourceSyncSession& io_r )
      {
        io_r.m_BeatPeriod = VTick( -1 );
        io_r.m_NoticePeriod = VTick( -1 );
      },
      "Beat period cannot be a negative number of ticks" },
    { []( ISourceSyncSession& io_r )
      {
        io_r.m_NoticePeriod = VTick( -1 );
        io_r.m_StartTime = {};
      },
      "Notice period for starting new global sync session cannot be a negative number of ticks" },
    { []( ISourceSyncSession& io_r ) { io_r.m_StartTime = {}; }, "No clocks specified" },
    { []( ISourceSyncSession& io_r ) { io_r.m_StartTime.Set( FrameNumber, VTick( 1 ) ); },
      "Clock continuity information does not correspond to clock start times" },
    { []( ISourceSyncSession& io_r ) {
       io_r.m_ContinuousSince = { { Counter, 4 }, { FrameNumber, 2 } };
     },
      "Clock continuity information does not correspond to clock start times" },
    { []( ISourceSyncSession& io_r )
      {
        const IClock Global( IClock::GlobalTime, 0, 0 );
        io_r.m_StartTime.Set( Global, VTick( 1 ) );
        io_r.m_ContinuousSince[Global] = 4;
        io_r.m_StartTime.Set( Counter, VTick( 9 ) );
      },
      "Source sync sessions cannot refer to the global time clocks" },
    { []( ISourceSyncSession& io_r )
      {
        const IClock Second( IClock::CounterFromSessionStart, 0, 78 );
        io_r.m_StartTime.Set( Second, VTick( 7 ) );
        io_r.m_ContinuousSince[Second] = 4;
      },
      "Multiple counter from session start clocks are not permitted" },
    { []( ISourceSyncSession& io_r )
      {
        io_r.m_StartTime.Set( Counter, VTick( 1 ) );
        io_r.m_ContinuousSince[Counter] = 3;
      },
      "Counter from session start clock should always have a start tick of zero" },
    { []( ISourceSyncSession& io_r ) { io_r.m_ContinuousSince[Counter] = 3; },
      "Counter from session start clocks should never be continuous from a previous source sync session" },
    { []( ISourceSyncSession& io_r )
      {
        io_r.m_StartTime.m_TickByClock.erase( Counter );
        io_r.m_ContinuousSince.erase( Counter );
      },
      "A counter from session start clock must be provided" },
  };
  for( const auto& [Change, pText] : Cases )
  {
    ISourceSyncSession Session = ValidSession();
    Change( Session );
    EXPECT_EQ( Session.Validate(), pText );
  }
}

}
