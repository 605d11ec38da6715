#include "SyncSystem/TimeBasedCaptureBuffer.h"

#include "tests/SyncSystem/CaptureBuffer/SourceClocks.h"
#include "tests/support/FrameMemory.h"
#include "tests/support/LogCapture.h"

#include <gtest/gtest.h>

#include <memory>
#include <string>

namespace
{

using namespace SyncSystem;
using KVZ::IClock;
using KVZ::VTick;

const IClock OtherCounter( IClock::CounterFromSessionStart, 0, 78 );
constexpr VTick Period( 5400000 );

class TimeBasedCaptureBuffer : public testing::Test
{
protected:
  // A frame with the time that is set up; the clocks then move on by a period.
  VToken Add()
  {
    VFrameTiming Timing = m_Timing;
    ++m_Timing.m_Payload;
    m_Timing.m_Clocks = KVZ::Shifted( m_Timing.m_Clocks, m_Timing.m_Period );
    VFrameEntry* pEntry = m_pBuffer->NewEntry( 16 );
    if( !pEntry ) return {};
    const VToken Token = m_pBuffer->AddFrame( pEntry, Timing, m_Id );
    m_Reading = Timing.m_Clocks.Find( Timing.m_CounterClock );
    return Token;
  }
  void Add( int i_Frames )
  {
    for( int Frame = 0; Frame < i_Frames; ++Frame ) Add();
  }
  void Jump( const IClock& i_rClock, VTick i_By ) { m_Timing.m_Clocks.Set( i_rClock, m_Timing.m_Clocks.Find( i_rClock ) + i_By ); }
  VSyncSessionRecord Record( uint32_t i_Id ) const
  {
    VSyncSessionRecord Record;
    EXPECT_TRUE( m_pBuffer->FindRecord( i_Id, Record ) ) << i_Id;
    return Record;
  }
  uint32_t BufferSession() const { return m_pBuffer->GetCurrentBufferSession().Value(); }
  // The next frame opens this sync session in this buffer session, and the log says why.
  void ExpectOpens( uint32_t i_Session, uint32_t i_BufferSession, const std::string& i_rReason )
  {
    m_Log.Clear();
    Add();
    EXPECT_EQ( m_Id, i_Session ) << i_rReason;
    EXPECT_EQ( BufferSession(), i_BufferSession ) << i_rReason;
    EXPECT_EQ( m_Reading, VTick( 0 ) );
    EXPECT_TRUE( m_Log.Has( i_rReason ) ) << testing::PrintToString( m_Log.Texts() );
  }

  TestSupport::VLogCapture m_Log{ "CaptureBuffer" };
  TestSupport::VFrameMemory m_Memory{ 6, 4, 16 };
  std::shared_ptr<VTimeBasedCaptureBuffer> m_pBuffer = VTimeBasedCaptureBuffer::Make( TestSupport::VNumberedCaptureBuffer::Settings( m_Memory ) );
  VFrameTiming m_Timing{ []
    {
      KVZ::ITickInClocks Clocks;
      Clocks.Set( FrameNumber, VTick( 0 ) );
      Clocks.Set( Timecode, VTick( 1000 ) );
      return Clocks;
    }(),
    Period, Counter, 100, VTick( 0 ), VTick( 0 ) };
  uint32_t m_Id = 0;
  VTick m_Reading;
};

TEST_F( TimeBasedCaptureBuffer, FirstFrameOpensTheFirstSessions )
{
  EXPECT_EQ( m_pBuffer->NewestSessionId(), 0u );
  EXPECT_EQ( m_pBuffer->OldestSessionId(), 0u );
  ExpectOpens( 1, 1, "Test Buffer: Starting first Buffer Session" );
  const auto First = Record( 1 );
  EXPECT_TRUE( First.m_First.IsSamePosition( First.m_Last ) );
  EXPECT_FALSE( First.m_End.IsValid() );
  m_Log.Clear();
  Add( 3 );
  EXPECT_EQ( m_Id, 1u );
  EXPECT_EQ( m_Reading, Period * 3 );
  EXPECT_EQ( Record( 1 ).m_LatestClocks.m_TickByClock.size(), 2u );
  EXPECT_TRUE( m_Log.Lines().empty() );
  int64_t Payload = 0;
  EXPECT_TRUE( m_pBuffer->LastPayload( 1, Payload ) );
  EXPECT_EQ( Payload, 103 );
  KVZ::ISourceSyncSession Session;
  ASSERT_TRUE( m_pBuffer->GetSourceSyncSession( 1, Session ) );
  EXPECT_EQ( Session.Validate(), "" );
  EXPECT_EQ( Session.m_StartTime.Find( Timecode ), VTick( 1000 ) );
}

TEST_F( TimeBasedCaptureBuffer, OneTickOffIsADiscontinuity )
{
  Add( 5 );
  Jump( Timecode, VTick( 1 ) );
  ExpectOpens( 2, 1, "Buffer Test: New Sync Session. Clock Changes: Timecode Discontinuity (21601000 -> 27001001), (1 continuous)" );
  EXPECT_EQ( Record( 1 ).m_End.m_FrameNumber, 5 );
  EXPECT_TRUE( Record( 1 ).m_End.IsSamePosition( Record( 1 ).m_Last ) );
  const std::map<IClock, uint32_t> Continuity = { { Timecode, 2 }, { FrameNumber, 1 }, { Counter, 2 } };
  EXPECT_EQ( Record( 2 ).m_ContinuousSince, Continuity );
  EXPECT_EQ( Record( 2 ).m_StartTime.Find( FrameNumber ), Period * 5 );
  KVZ::ISourceSyncSession Session;
  ASSERT_TRUE( m_pBuffer->GetSourceSyncSession( 2, Session ) );
  EXPECT_EQ( Session.Validate(), "" );
  // All clocks at once: nothing ties the frames together any more.
  Jump( Timecode, VTick( -7 ) );
  Jump( FrameNumber, Period );
  ExpectOpens( 3, 2,
    "Buffer Test: New Buffer Session. Clock Changes: Timecode Discontinuity (27001001 -> 32400994), "
    "FrameNumber Discontinuity (27000000 -> 37800000), (None continuous)" );
  EXPECT_EQ( Record( 3 ).m_ContinuousSince.at( FrameNumber ), 3u );
}

TEST_F( TimeBasedCaptureBuffer, ClocksComeAndGo )
{
  Add( 2 );
  m_Timing.m_Clocks.m_TickByClock.erase( Timecode );
  ExpectOpens( 2, 1, "Buffer Test: New Sync Session. Clock Changes: Timecode Removed, (1 continuous)" );
  m_Timing.m_Clocks.Set( Timecode, VTick( 9 ) );
  ExpectOpens( 3, 1, "Buffer Test: New Sync Session. Clock Changes: Timecode Added, (1 continuous)" );
  EXPECT_EQ( Record( 3 ).m_ContinuousSince.at( Timecode ), 3u );
  EXPECT_EQ( Record( 3 ).m_ContinuousSince.at( FrameNumber ), 1u );
  m_Timing.m_Clocks = {};
  ExpectOpens( 4, 2, "Buffer Test: New Buffer Session. Clock Changes: Timecode Removed, FrameNumber Removed, (None continuous)" );
  Add( 3 );   // without any clock the counter alone carries it
  EXPECT_EQ( m_Id, 4u );
  m_Timing.m_Clocks.Set( Timecode, VTick( 9 ) );
  ExpectOpens( 5, 3, "Buffer Test: New Buffer Session. Clock Changes: Timecode Added, (None continuous)" );
}

TEST_F( TimeBasedCaptureBuffer, PeriodBeatCounterClockAndRequestsFromOutside )
{
  Add( 2 );
  m_Timing.m_BeatPeriod = Period;
  m_Timing.m_BeatOffset = VTick( 1 );
  ExpectOpens( 2, 1, "Buffer Test: New Sync Session due to change in beat (Beat [Period:Offset] 0:0 -> 5400000:1)" );
  EXPECT_TRUE( m_Log.Has( "Buffer Test: New Sync Session Created: Id = 2. Period = 5400000 (25Hz), Beat = 5400000:1" ) );
  EXPECT_EQ( Record( 2 ).m_ContinuousSince.at( Timecode ), 1u );
  m_Timing.m_BeatOffset = VTick( 2 );
  ExpectOpens( 3, 1, "Buffer Test: New Sync Session due to change in beat (Beat [Period:Offset] 5400000:1 -> 5400000:2)" );
  m_Timing.m_Period = VTick( 2700000 );
  ExpectOpens( 4, 2, "Test Buffer: New Buffer Session due to period changing from 5400000 to 2700000" );
  m_Timing.m_CounterClock = OtherCounter;
  ExpectOpens( 5, 3, "Buffer Test: New Buffer Session due change in counter clock type" );
  EXPECT_TRUE( Record( 5 ).m_StartTime.Find( OtherCounter ) == VTick( 0 ) && !Record( 5 ).m_StartTime.Find( Counter ).IsValid() );

  m_pBuffer->StartNewBufferSession();
  ExpectOpens( 6, 4, "Test Buffer: New Sync Session has been forced by external request" );
  m_pBuffer->RequestNewBufferSession();
  EXPECT_EQ( BufferSession(), 4u );   // only at the next frame
  ExpectOpens( 7, 5, "Test Buffer: Forcing new Buffer Session" );
  Add();
  EXPECT_EQ( m_Id, 7u );
}

TEST_F( TimeBasedCaptureBuffer, ForcedSessionIsContinuedByAFrameWithItsReadings )
{
  for( const bool bEmpty : { true, false } )
  {
    uint32_t Id = 99;
    VFrameTiming Bad = m_Timing;
    Bad.m_Period = VTick( 0 );
    EXPECT_FALSE( m_pBuffer->ForceNewSyncSession( Bad, Id ) );
    Bad = m_Timing;
    Bad.m_CounterClock = Timecode;
    EXPECT_FALSE( m_pBuffer->ForceNewSyncSession( Bad, Id ) );
    const uint32_t Former = m_pBuffer->NewestSessionId();
    EXPECT_EQ( Id, 99u );
    ASSERT_TRUE( m_pBuffer->ForceNewSyncSession( m_Timing, Id ) );
    EXPECT_EQ( Id, Former + 1 );
    EXPECT_EQ( BufferSession(), 1u );
    VToken Position;
    KVZ::ITickInClocks Clocks;
    EXPECT_TRUE( m_pBuffer->FirstPosition( Id, Position, Clocks ) );
    EXPECT_TRUE( Position.IsSamePosition( m_pBuffer->GetNextToken() ) );
    EXPECT_FALSE( m_pBuffer->LastPosition( Id, Position, Clocks ) );
    int64_t Payload = 0;
    EXPECT_FALSE( m_pBuffer->LastPayload( Id, Payload ) );
    m_Log.Clear();
    Add();
    EXPECT_EQ( m_Id, Id );
    EXPECT_EQ( m_Reading, VTick( 0 ) );
    EXPECT_TRUE( m_Log.Lines().empty() );
    Add( 2 );
    EXPECT_EQ( m_Reading, Period * 2 );
    EXPECT_EQ( Record( Id ).m_ContinuousSince.at( Timecode ), 1u ) << bEmpty;   // also across the forced session
  }
  m_pBuffer->RequestNewBufferSession();
  uint32_t Id = 0;
  ASSERT_TRUE( m_pBuffer->ForceNewSyncSession( m_Timing, Id ) );
  EXPECT_EQ( BufferSession(), 2u ) << "one that was asked for begins here";
  Add();
  EXPECT_EQ( m_Id, Id );
  EXPECT_EQ( BufferSession(), 2u ) << "and not once more";
}

TEST_F( TimeBasedCaptureBuffer, PositionsAndTicks )
{
  Add( 3 );
  Jump( Timecode, Period );
  Add( 4 );   // session 2: frames 4 to 7
  VToken First, Last;
  KVZ::ITickInClocks Clocks;
  ASSERT_TRUE( m_pBuffer->FirstPosition( 2, First, Clocks ) );
  EXPECT_EQ( First.m_FrameNumber, 4 );
  ASSERT_TRUE( m_pBuffer->LastPosition( 2, Last, Clocks ) );
  EXPECT_EQ( Last.m_FrameNumber, 7 );
  EXPECT_EQ( Clocks.Find( Counter ), Period * 3 );
  EXPECT_EQ( Clocks.Find( FrameNumber ), Period * 6 );
  EXPECT_EQ( Clocks.Find( Timecode ), VTick( 1000 ) + Period * 7 );
  VTick Tick;
  ASSERT_TRUE( m_pBuffer->TickForToken( 2, Last, Tick ) );
  EXPECT_EQ( Tick, Period * 3 );
  struct VCase
  {
    VTick m_Counter;
    int64_t m_Frame;
    VTick m_Remainder;
  };
  const VTick One( 1 );
  const VCase Cases[] = { { VTick( 0 ), 4, VTick( 0 ) }, { Period * 3, 7, VTick( 0 ) }, { Period - One, 4, One }, { Period + One, 5, Period - One },
    { -One, 3, One }, { -Period, 3, VTick( 0 ) }, { -Period - One, 2, One }, { Period * 4000000000, 4000000004, VTick( 0 ) },
    { Period * 4000000000 - One, 4000000003, One } };
  for( const VCase& rCase : Cases )
  {
    VToken Token;
    VTick Remainder;
    ASSERT_TRUE( m_pBuffer->TokenForTick( 2, rCase.m_Counter, Token, Remainder ) );
    EXPECT_EQ( Token.m_FrameNumber, rCase.m_Frame ) << rCase.m_Counter.Count();
    EXPECT_EQ( Remainder, rCase.m_Remainder ) << rCase.m_Counter.Count();
    EXPECT_EQ( Token.m_BufferSession.Value(), 1u );
  }
  uint32_t Id = 0;
  for( const auto& [Frame, Expected] : { std::pair<int64_t, uint32_t>{ 3, 1 }, { 4, 2 }, { 90, 2 } } )
  {
    EXPECT_TRUE( m_pBuffer->SessionForToken( { KVZ::VBufferSessionId( 1 ), Frame, nullptr }, Id ) );
    EXPECT_EQ( Id, Expected );
  }
  EXPECT_FALSE( m_pBuffer->SessionForToken( { KVZ::VBufferSessionId( 2 ), 4, nullptr }, Id ) );
  EXPECT_FALSE( m_pBuffer->FirstPosition( 3, First, Clocks ) );
  EXPECT_FALSE( m_pBuffer->TickForToken( 2, { KVZ::VBufferSessionId( 2 ), 4, nullptr }, Tick ) );
}

TEST_F( TimeBasedCaptureBuffer, RecordsLeaveWithTheirFrames )
{
  Add( 2 );
  m_pBuffer->RequestNewBufferSession();
  Add( 30 );   // memory holds 24
  EXPECT_EQ( m_pBuffer->OldestSessionId(), 2u );
  EXPECT_TRUE( m_Log.Has( "Test Buffer:Session 1 has been removed from buffer. There are 1 sessions remaining" ) );
  VToken Token;
  KVZ::ITickInClocks Clocks;
  EXPECT_FALSE( m_pBuffer->FirstPosition( 1, Token, Clocks ) );
  EXPECT_TRUE( m_pBuffer->FirstPosition( 2, Token, Clocks ) );   // its first frame has gone, the session runs on
  // A clock that breaks at every frame opens a session each; only those that have frames left are kept.
  for( int Frame = 0; Frame < 200; ++Frame )
  {
    Jump( Timecode, VTick( 17 ) );
    Add();
  }
  EXPECT_EQ( BufferSession(), 2u );
  EXPECT_EQ( m_Id, 202u );
  EXPECT_GE( m_pBuffer->OldestSessionId(), 202u - 25 );
  EXPECT_LE( m_pBuffer->OldestSessionId(), 202u - 19 );
}

}
