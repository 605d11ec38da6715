#include "tests/SyncSystem/DataSource/TestSource.h"

#include "tests/support/LogCapture.h"

#include <numeric>
#include <utility>

namespace
{

using SyncSystem::CaptureSessionType;
using SyncSystem::ECaptureFailure;
using SyncSystem::ECaptureState;
using SyncSystem::EClientResult;

const VTick CounterStart( 123456789 );

// The global tick of frame i_Index of the first session.
VTick At( int64_t i_Index ) { return CounterStart + Period * i_Index; }

class DataSourceCaptures : public ::testing::Test
{
protected:
  void SetUp() override
  {
    m_Client = m_Rig.m_pSource->Buffer()->RegisterClient( [] {} );
    m_Rig.m_pSource->AddMany( 10 );
    m_Rig.Join( 1, CounterStart );
  }

  bool Start( uint32_t i_Id, VTick i_Start, VTick i_End, bool i_bReserve = false, uint32_t i_Session = 1 )
  {
    bool bResult = false;
    const KVZ::ICaptureHeader Header{ KVZ::VCaptureSessionId( i_Id ), "Take", 5, KVZ::VGlobalSyncSessionId( i_Session ) };
    m_Rig.OnStrand( [&] { bResult = m_Rig.m_pSource->StartCapture( Header, i_Start, i_End, i_bReserve, 0 ); } );
    return bResult;
  }
  KVZ::ICaptureStatus Status()
  {
    const KVZ::ICaptureStatus Status = m_Rig.m_pSource->GetCaptureStatus();
    m_Rig.m_pService->RunAll();
    return Status;
  }
  void EndAt( VTick i_End )
  {
    m_Rig.OnStrand( [&] { m_Rig.m_pSource->EndCapture( i_End ); } );
  }

  // Of the 50 blocks that there are.
  void TakeMemory( int i_Blocks )
  {
    for( int Block = 0; Block < i_Blocks; ++Block )
    {
      m_Taken.push_back( m_Rig.m_Memory.m_pAllocator->Allocate( m_Rig.m_Memory.m_pAllocator->MaxAllocation() ) );
    }
  }

  // The client reads what it can just now.
  void Drain()
  {
    SyncSystem::VRefCountedToken Frame;
    SyncSystem::VClientRead Read;
    do {
      m_Rig.m_pSource->Buffer()->ClientNextFrame( m_Client, Frame, Read );
      if( Frame )
      {
        m_Frames.push_back( IndexOf( Frame ) );
      }
    } while( Read.m_Result == EClientResult::MoreToCome || Read.m_Result == EClientResult::Finished );
  }

  // The capture is over, and the client has read these frames of it.
  void ExpectComplete( int64_t i_First, int64_t i_Behind, uint32_t i_Failure = ECaptureFailure::None )
  {
    Drain();
    std::vector<int64_t> Expected( static_cast<size_t>( i_Behind - i_First ) );
    std::iota( Expected.begin(), Expected.end(), i_First );
    EXPECT_EQ( std::exchange( m_Frames, {} ), Expected );
    EXPECT_EQ( Status().m_State, ECaptureState::Complete );
    EXPECT_EQ( Status().m_Failure, i_Failure );
    EXPECT_EQ( Status().m_Start, At( i_First - m_FirstOfSession ) );
    EXPECT_EQ( Status().m_CapturedDuration, Period * ( i_Behind - i_First ) );
  }

  void GiveMemoryBack()
  {
    for( void* pBlock : std::exchange( m_Taken, {} ) )
    {
      m_Rig.m_Memory.m_pAllocator->Free( pBlock );
    }
  }
  void TearDown() override { GiveMemoryBack(); }

  VSourceRig m_Rig;
  uint32_t m_Client = 0;
  std::vector<int64_t> m_Frames;   // what the client has read
  int64_t m_FirstOfSession = 0;
  std::vector<void*> m_Taken;
};

TEST_F( DataSourceCaptures, TakesPastAndFutureFramesFromStartToBeforeEnd )
{
  const TestSupport::VLogCapture Log( "Hal.Test" );
  const VTick One( 1 );
  const struct
  {
    VTick m_Start;
    VTick m_End;
    ECaptureState::Enum m_State;   // before the next ten frames
    int64_t m_First;
    int64_t m_Behind;
  } Cases[] = { { At( 2 ), At( 7 ), ECaptureState::Captured, 2, 7 }, { At( 12 ) + One, At( 16 ) + One, ECaptureState::Captured, 13, 17 },
    { At( 23 ) - One, At( 27 ) - One, ECaptureState::Captured, 23, 27 }, { At( 35 ), At( 45 ), ECaptureState::Capturing, 35, 45 },
    { At( 52 ), At( 55 ), ECaptureState::WaitingForStart, 52, 55 } };
  for( uint32_t Id = 1; const auto& rCase : Cases )
  {
    SCOPED_TRACE( Id );
    ASSERT_TRUE( Start( Id++, rCase.m_Start, rCase.m_End ) );
    EXPECT_EQ( Status().m_State, rCase.m_State );
    EXPECT_EQ( Status().m_RequestedStart, rCase.m_Start );
    if( rCase.m_State == ECaptureState::Captured )
    {
      EXPECT_EQ( Status().m_AvailableDuration, Period * ( rCase.m_Behind - rCase.m_First ) );
      EXPECT_TRUE( m_Rig.m_pSource->m_Busy.back() );
    }
    Drain();
    m_Rig.m_pSource->AddMany( 10 );
    ExpectComplete( rCase.m_First, rCase.m_Behind );
    EXPECT_FALSE( m_Rig.m_pSource->m_Busy.back() );
  }
  EXPECT_TRUE( Log.Has( "StartCapture: Local Start Tick is " + std::to_string( Period.Count() * 2 ) + ". (Lastest tick is " +
    std::to_string( Period.Count() * 9 ) + ")" ) );
}

TEST_F( DataSourceCaptures, AnOpenEndIsClosedAtTheNewestFrameOrAtATick )
{
  ASSERT_TRUE( Start( 1, At( 8 ), VTick::Open() ) );
  m_Rig.m_pSource->AddMany( 3 );
  EXPECT_EQ( Status().m_CapturedDuration, VTick::Open() ) << "not known yet";
  EndAt( VTick::Open() );
  EXPECT_EQ( m_Rig.m_pSource->m_Ends, ( std::vector<VTick>{ Period * 12 } ) );
  m_Rig.m_pSource->AddMany( 3 );
  ExpectComplete( 8, 13 );

  ASSERT_TRUE( Start( 2, At( 14 ), VTick::Open() ) );
  EndAt( At( 18 ) );
  m_Rig.m_pSource->AddMany( 5 );
  ExpectComplete( 14, 18 );
}

TEST_F( DataSourceCaptures, AStartBeforeTheOldestFrameIsClipped )
{
  m_Rig.m_pSource->AddMany( 300 );
  SyncSystem::VToken Oldest;
  ASSERT_TRUE( m_Rig.m_pSource->Buffer()->GetFirstToken( m_Rig.m_pSource->Buffer()->GetCurrentBufferSession(), Oldest ) );
  const int64_t First = Oldest.m_FrameNumber - 1;
  ASSERT_GT( First, 50 );
  ASSERT_TRUE( Start( 1, At( 20 ), At( 305 ) ) );
  ExpectComplete( First, 305 );
  EXPECT_EQ( Status().m_RequestedStart, At( 20 ) );
}

// The counter of the present sync session began in the middle of the buffer session.
TEST_F( DataSourceCaptures, ReachesBackAcrossSyncSessionsOfTheSameRun )
{
  m_Rig.m_pSource->m_Timecode = Period * 5000;   // appears, while the frame number goes on: a new sync session
  m_Rig.m_pSource->AddMany( 10 );
  m_Rig.Join( 2, CounterStart );
  m_FirstOfSession = 10;
  EXPECT_EQ( m_Rig.m_pSource->Buffer()->GetCurrentBufferSession(), KVZ::VBufferSessionId( 1 ) );
  ASSERT_TRUE( Start( 1, At( -6 ) + VTick( 5 ), At( 3 ), false, 2 ) );
  ExpectComplete( 5, 13 );
}

TEST_F( DataSourceCaptures, AStatusStaysTrueAfterLaterSessionsAndEviction )
{
  ASSERT_TRUE( Start( 1, At( 4 ), At( 8 ) ) );
  Drain();
  m_Rig.m_pSource->Miss( 3 );
  m_Rig.m_pSource->AddMany( 400 );
  m_Rig.Join( 2, VTick( 5 ) );
  ExpectComplete( 4, 8 );
}

TEST_F( DataSourceCaptures, AReservationBecomesAStreamedCaptureOfTheSameId )
{
  const TestSupport::VLogCapture Log( "Hal.Test" );
  ASSERT_TRUE( Start( 1, At( 3 ), VTick::Open(), true ) );
  EXPECT_TRUE( Log.Has( "Attempting to reserve capture from buffer entry 4 (First entry is 1)" ) );
  EXPECT_TRUE( Log.Has( "Reserved capture from tick " + std::to_string( At( 3 ).Count() ) + " (buffer entry 4)" ) );
  EXPECT_TRUE( m_Rig.m_pSource->m_Begun.empty() );
  Drain();
  EXPECT_TRUE( m_Frames.empty() );
  m_Rig.m_pSource->AddMany( 5 );
  ASSERT_TRUE( Start( 1, At( 3 ), At( 13 ) ) );
  EXPECT_EQ( m_Rig.m_pSource->m_Begun, ( std::vector<uint32_t>{ 1 } ) );
  ExpectComplete( 3, 13 );
}

TEST_F( DataSourceCaptures, RefusesAnotherWhileOneIsRunning )
{
  EXPECT_FALSE( Start( 0, At( 2 ), At( 4 ) ) );
  ASSERT_TRUE( Start( 1, At( 2 ), At( 20 ) ) );
  EXPECT_FALSE( Start( 2, At( 2 ), At( 20 ) ) );
  EXPECT_FALSE( Start( 1, At( 2 ), At( 20 ) ) );
  EXPECT_EQ( m_Rig.m_pSource->m_Begun, ( std::vector<uint32_t>{ 1 } ) ) << "the running capture's preparation is not disturbed";
  EXPECT_EQ( Status().m_State, ECaptureState::Capturing );
}

// The readers have passed every frame, so that memory which is needed elsewhere takes the newest one too.
TEST_F( DataSourceCaptures, EndsAtANewestFrameThatHasBeenEvicted )
{
  ASSERT_TRUE( Start( 1, At( 4 ), VTick::Open() ) );
  Drain();
  TakeMemory( 50 );
  SyncSystem::VToken Newest;
  ASSERT_FALSE( m_Rig.m_pSource->Buffer()->GetNewestToken( Newest ) );
  EndAt( VTick::Open() );
  EXPECT_EQ( m_Rig.m_pSource->m_Ends, ( std::vector<VTick>{ Period * 9 } ) );
  ExpectComplete( 4, 10 );
}

TEST_F( DataSourceCaptures, RunsOutOfMemoryWithoutAFrameLeft )
{
  ASSERT_TRUE( Start( 1, At( 4 ), At( 20 ) ) );
  Drain();
  TakeMemory( 51 );
  ExpectComplete( 4, 10, ECaptureFailure::MemoryExhausted );
}

TEST_F( DataSourceCaptures, ARangeThatCannotBeHadFailsWithItsFlag )
{
  for( const auto& [Id, StartTick, EndTick, Session] :
    { std::tuple( 1u, At( 2 ), At( 5 ), 99u ), std::tuple( 2u, VTick::Open(), VTick::Open(), 1u ), std::tuple( 3u, At( 5 ), At( 4 ), 1u ) } )
  {
    ASSERT_TRUE( Start( Id, StartTick, EndTick, false, Session ) ) << Id;
    EXPECT_EQ( Status().m_State, ECaptureState::Idle ) << Id;
    EXPECT_EQ( Status().m_Failure, ECaptureFailure::StartLost ) << Id;
    EXPECT_EQ( Status().m_Start, VTick::Open() ) << Id;
  }
}

TEST_F( DataSourceCaptures, ExhaustionEndsTheCaptureAndRefusesFramesUntilItIsDrained )
{
  VTestSource& rSource = *m_Rig.m_pSource;
  ASSERT_TRUE( Start( 1, At( 0 ), VTick::Open() ) );
  int64_t Stored = 10;
  while( rSource.Add() )
  {
    ASSERT_LT( ++Stored, 300 );
  }
  EXPECT_EQ( Status().m_State, ECaptureState::Captured );
  EXPECT_EQ( Status().m_Failure, ECaptureFailure::MemoryExhausted );
  EXPECT_EQ( Status().m_CapturedDuration, Period * Stored );
  EXPECT_GT( Status().m_BufferFill, 0.9 );

  SyncSystem::VRefCountedToken Frame;
  SyncSystem::VClientRead Read;
  for( int64_t Index = 0; Index < Stored; ++Index )
  {
    EXPECT_FALSE( rSource.Add() ) << "not before the last frame is written, though there is room";
    ASSERT_TRUE( rSource.Buffer()->ClientNextFrame( m_Client, Frame, Read ) );
    ASSERT_EQ( IndexOf( Frame ), Index );
  }
  Drain();
  EXPECT_EQ( Status().m_State, ECaptureState::Complete );
  EXPECT_TRUE( rSource.Add() );
  const auto SyncStatus = m_Rig.SyncStatus();
  EXPECT_EQ( SyncStatus.m_RefusedFrames, static_cast<uint64_t>( Stored ) + 1 );
  EXPECT_EQ( SyncStatus.m_Session.m_Id, 2u ) << "what follows the gap is another session";
}

// A device that finds no memory delivers nothing, and its frame count goes on as if nothing had been lost.
TEST_F( DataSourceCaptures, AFrameThatFoundNoMemoryBreaksTheRun )
{
  SyncSystem::VToken Token;
  ASSERT_TRUE( m_Rig.m_pSource->Buffer()->GetFirstToken( KVZ::VBufferSessionId( 1 ), Token ) );
  std::vector<SyncSystem::VRefCountedToken> Pinned( 10 );   // of three blocks
  for( auto& rFrame : Pinned )
  {
    ASSERT_TRUE( m_Rig.m_pSource->Buffer()->Read( Token, rFrame ) );
    m_Rig.m_pSource->Buffer()->Advance( Token, 1 );
  }
  TakeMemory( 47 + 1 );
  EXPECT_EQ( m_Rig.SyncStatus().m_RefusedFrames, 1u );
  GiveMemoryBack();
  Pinned.clear();
  ASSERT_TRUE( m_Rig.m_pSource->Add() );
  EXPECT_EQ( m_Rig.SyncStatus().m_Session.m_Id, 2u );
}

}
