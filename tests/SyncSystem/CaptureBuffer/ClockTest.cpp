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

// Every fault at once; they are taken away, and the last ones put in, in the order in which they are told.
TEST( SourceSyncSession, SaysWhichRuleFailsFirst )
{
  const char* const NotContinuous = "Clock continuity information does not correspond to clock start times";
  ISourceSyncSession Session;
  Session.m_BeatPeriod = Session.m_NoticePeriod = VTick( -1 );
  Session.m_BeatOffset = VTick( -5 );   // any will do
  EXPECT_EQ( Session.Validate(), "Invalid Id" );
  Session.m_Id = 4;
  EXPECT_EQ( Session.Validate(), "Period must be a positive number of ticks" );
  Session.m_Period = VTick( 1 );
  EXPECT_EQ( Session.Validate(), "Beat period cannot be a negative number of ticks" );
  Session.m_BeatPeriod = VTick( 0 );
  EXPECT_EQ( Session.Validate(), "Notice period for starting new global sync session cannot be a negative number of ticks" );
  Session.m_NoticePeriod = VTick( 0 );
  EXPECT_EQ( Session.Validate(), "No clocks specified" );
  Session.m_StartTime.Set( Counter, VTick( 1 ) );
  EXPECT_EQ( Session.Validate(), NotContinuous );
  Session.m_ContinuousSince = { { FrameNumber, 2 } };
  EXPECT_EQ( Session.Validate(), NotContinuous );
  Session.m_ContinuousSince = { { Counter, 3 } };
  EXPECT_EQ( Session.Validate(), "Counter from session start clock should always have a start tick of zero" );
  Session.m_StartTime.Set( Counter, VTick( 0 ) );
  EXPECT_EQ( Session.Validate(), "Counter from session start clocks should never be continuous from a previous source sync session" );
  Session.m_ContinuousSince[Counter] = 4;
  EXPECT_EQ( Session.Validate(), "" );

  const auto Add = [&Session]( const IClock& i_rClock )
  {
    Session.m_StartTime.Set( i_rClock, VTick( 7 ) );
    Session.m_ContinuousSince[i_rClock] = 2;
  };
  Add( Timecode );
  EXPECT_EQ( Session.Validate(), "" );
  Add( { IClock::CounterFromSessionStart, 0, 78 } );
  EXPECT_EQ( Session.Validate(), "Multiple counter from session start clocks are not permitted" );
  Add( { IClock::GlobalTime, 0, 0 } );
  EXPECT_EQ( Session.Validate(), "Source sync sessions cannot refer to the global time clocks" );
  Session.m_StartTime = {};
  Session.m_ContinuousSince = {};
  Add( Timecode );
  EXPECT_EQ( Session.Validate(), "A counter from session start clock must be provided" );
}

}
