// Captures as a recording meets them, each told from its start to its end.
#include "SyncSystem/CaptureBuffer.h"

#include "tests/support/FrameMemory.h"
#include "tests/support/LogCapture.h"
#include "tests/support/ManualPostalService.h"

#include <gtest/gtest.h>

#include <memory>
#include <numeric>
#include <vector>

namespace
{

using namespace SyncSystem;
using KVZ::VCaptureSessionId;
using TestSupport::NumberedPayload;

// A client that reads whenever it is told to, on the test's thread.
class VReader
{
public:
  explicit VReader( VCaptureBuffer& i_rBuffer ) : m_rBuffer( i_rBuffer ), m_Id( i_rBuffer.RegisterClient( [this] { m_bNotified = true; } ) ) {}
  ~VReader() { m_rBuffer.UnregisterClient( m_Id ); }

  // Answers a notification by reading up to this many frames, or until it is to wait.
  void Run( size_t i_Frames = ~size_t{ 0 } )
  {
    if( !m_bNotified ) return;
    while( i_Frames-- > 0 )
    {
      ReadOne();
      if( m_Read.m_Result == EClientResult::MoreToCome ) continue;
      m_bNotified = false;
      if( m_Read.m_Result == EClientResult::Finished ) Close();
      return;
    }
  }
  void Close()
  {
    ReadOne();
    EXPECT_EQ( m_Read.m_Result, EClientResult::Finished );
  }
  void ReadOne()
  {
    ASSERT_TRUE( m_rBuffer.ClientNextFrame( m_Id, m_Frame, m_Read, &m_Info ) );
    if( !m_Frame ) return;
    m_Frames.push_back( m_Frame.Token().m_FrameNumber );
    EXPECT_TRUE( NumberedPayload( m_Frame.Frame() ).Holds( m_Frames.back() ) );
  }

  VCaptureBuffer& m_rBuffer;
  bool m_bNotified = false;
  const uint32_t m_Id;
  VRefCountedToken m_Frame;
  VClientRead m_Read;
  VCaptureSessionInfo m_Info;
  std::vector<int64_t> m_Frames;
};

std::vector<int64_t> Numbers( int64_t i_First, int64_t i_Last )
{
  std::vector<int64_t> Result( static_cast<size_t>( i_Last - i_First + 1 ) );
  std::iota( Result.begin(), Result.end(), i_First );
  return Result;
}

class CaptureBuffer : public testing::Test
{
protected:
  void Add( int i_Frames )
  {
    for( int Frame = 0; Frame < i_Frames; ++Frame ) ASSERT_TRUE( m_pBuffer->Add().IsValid() );
  }
  VToken At( int64_t i_Number ) const { return { m_pBuffer->GetCurrentBufferSession(), i_Number, nullptr }; }
  bool Start( const VToken& i_rStart, const VToken& i_rEnd, CaptureSessionType::Enum i_Type = CaptureSessionType::Streamed )
  {
    VCaptureRequest Request;
    Request.m_Id = VCaptureSessionId( m_Id );
    Request.m_Type = i_Type;
    Request.m_Info = { Request.m_Id, "Take", 7, 3 };
    Request.m_Start = i_rStart;
    Request.m_End = i_rEnd;
    return m_pBuffer->StartCapture( Request );
  }
  bool End( const VToken& i_rEnd, uint32_t i_Failure = 0 ) { return m_pBuffer->SetCaptureEnd( VCaptureSessionId( m_Id ), { i_rEnd, i_Failure } ); }
  bool Cancel() { return m_pBuffer->CancelCapture( VCaptureSessionId( m_Id ) ); }
  VCaptureSessionStatus Status() const
  {
    VCaptureSessionStatus Status;
    m_pBuffer->Status( Status );
    return Status;
  }

  uint32_t m_Id = 1;
  std::shared_ptr<TestSupport::VManualPostalService> m_pPostalService = std::make_shared<TestSupport::VManualPostalService>();
  TestSupport::VFrameMemory m_Memory{ 10, 2 };   // twenty frames
  std::shared_ptr<TestSupport::VNumberedCaptureBuffer> m_pBuffer = VCaptureBuffer::Make<TestSupport::VNumberedCaptureBuffer>(
    TestSupport::VNumberedCaptureBuffer::Settings( m_Memory, m_pPostalService ) );
};

TEST_F( CaptureBuffer, FailedClientLeavesTheCaptureToTheOthers )
{
  VReader Bad( *m_pBuffer );
  VReader Good( *m_pBuffer );
  Add( 4 );
  ASSERT_TRUE( Start( At( 1 ), {} ) );
  Bad.Run( 2 );
  Good.Run();
  EXPECT_EQ( Status().m_AvailableFrames, 2u );
  ASSERT_TRUE( m_pBuffer->ClientFinished( Bad.m_Id, ECaptureFailure::ReportedErrors, VCaptureError{ 5, "disk full" }, true ) );
  EXPECT_EQ( Status().m_AvailableFrames, 0u );
  for( int Frame = 0; Frame < 30; ++Frame )   // the one that stopped protects nothing
  {
    Add( 1 );
    Good.Run();
  }
  Add( 2 );
  ASSERT_TRUE( End( At( 36 ) ) );
  Good.Run();
  EXPECT_EQ( Status().m_State, ECaptureState::Complete );
  ASSERT_EQ( Status().m_Errors, ( std::vector<VCaptureError>{ { 5, "disk full" } } ) );
  Bad.ReadOne();
  EXPECT_EQ( Bad.m_Read.m_Result, EClientResult::NoFrameYet );
  EXPECT_EQ( Bad.m_Read.m_Errors.size(), 1u );
  EXPECT_FALSE( m_pBuffer->ClientFinished( 99, 0, {}, true ) );
  // The next capture begins with a clean sheet.
  ++m_Id;
  ASSERT_TRUE( Start( At( 30 ), At( 32 ) ) );
  EXPECT_TRUE( Status().m_Errors.empty() );
  EXPECT_EQ( Status().m_Failure, 0u );
}

TEST_F( CaptureBuffer, ACaptureThatCannotBeginIsToldAsFailed )
{
  const VCaptureRequest Failed = { VCaptureSessionId( 4 ), CaptureSessionType::Streamed, {}, {}, {}, 8, { { 1, "no target" } } };
  VReader Reader( *m_pBuffer );
  Add( 5 );
  ASSERT_TRUE( Start( At( 1 ), At( 3 ) ) );
  EXPECT_FALSE( m_pBuffer->FailCapture( Failed ) ) << "one capture at a time";
  Reader.Run();
  EXPECT_EQ( Reader.m_Info.m_Name, "Take" );
  ASSERT_TRUE( m_pBuffer->FailCapture( Failed ) );
  EXPECT_EQ( Status().m_State, ECaptureState::Idle );
  EXPECT_EQ( Status().m_Failure, 8u );
  EXPECT_EQ( Status().m_Errors.size(), 1u );
}

TEST_F( CaptureBuffer, PinnedFrameOutlivesItsSessionAndItsOwners )
{
  Add( 2 );
  VToken Token = At( 1 );
  VRefCountedToken Pinned, Copy;
  ASSERT_TRUE( m_pBuffer->Read( Token, Pinned ) );
  m_pBuffer->StartNewBufferSession();
  Add( 60 );
  std::vector<KVZ::VBufferSessionId> Sessions;
  EXPECT_EQ( m_pBuffer->GetBufferSessions( Sessions ), 1u );
  EXPECT_TRUE( NumberedPayload( Pinned.Frame() ).Holds( 1 ) );
  EXPECT_FALSE( m_pBuffer->Read( Token, Copy ) );   // it has left the buffer, whoever holds it
  Copy = Pinned;
  Pinned = Copy;
  Copy.Clear();
  Add( 60 );
  EXPECT_TRUE( NumberedPayload( Pinned.Frame() ).Holds( 1 ) );
  m_pBuffer.reset();
  m_Memory = TestSupport::VFrameMemory( 1, 1 );
  EXPECT_TRUE( NumberedPayload( Pinned.Frame() ).Holds( 1 ) );
  Pinned = VRefCountedToken();
}

TEST_F( CaptureBuffer, SessionThatRunsEmptyLeaves )
{
  TestSupport::VLogCapture Log( "CaptureBuffer" );
  std::vector<uint32_t> Removed;
  m_pBuffer->BufferSessionRemovedCallback().Add( [&Removed]( KVZ::VBufferSessionId i_Id ) { Removed.push_back( i_Id.Value() ); } );
  Add( 3 );
  m_pBuffer->StartNewBufferSession();
  Add( 3 );
  m_pBuffer->StartNewBufferSession();
  Add( 18 );
  m_pPostalService->RunAll();
  EXPECT_EQ( Removed, std::vector<uint32_t>{ 1 } );
  EXPECT_TRUE( Log.Has( "Test Buffer:Session 1 has been removed from buffer. There are 2 sessions remaining" ) );
  EXPECT_EQ( Log.Lines().size(), 1u );
}

// One frame fills the memory: whatever comes evicts all there is, and the session goes on all the same.
TEST( CaptureBufferTiny, RunningSessionSurvivesWithoutFrames )
{
  TestSupport::VFrameMemory Memory( 1, 1 );
  const auto pBuffer = VCaptureBuffer::Make<TestSupport::VNumberedCaptureBuffer>( TestSupport::VNumberedCaptureBuffer::Settings( Memory ) );
  VReader Reader( *pBuffer );
  ASSERT_TRUE( pBuffer->Add().IsValid() );
  VCaptureRequest Request;
  Request.m_Id = VCaptureSessionId( 1 );
  ASSERT_TRUE( pBuffer->StartCapture( Request ) );
  EXPECT_FALSE( pBuffer->Add().IsValid() );   // the client has not taken the first one
  for( int64_t Frame = 2; Frame <= 50; ++Frame )
  {
    Reader.Run();
    Reader.m_Frame.Clear();
    ASSERT_EQ( pBuffer->Add().m_FrameNumber, Frame );
  }
  Reader.Run();
  EXPECT_EQ( Reader.m_Frames, Numbers( 1, 50 ) );
  EXPECT_EQ( pBuffer->GetCurrentBufferSession().Value(), 1u );
}

// All that there was has been evicted, and a pin keeps its memory from the next frame.
TEST( CaptureBufferTiny, SessionWithoutFramesAsTheStartOfACapture )
{
  TestSupport::VFrameMemory Memory( 1, 1 );
  const auto pBuffer = VCaptureBuffer::Make<TestSupport::VNumberedCaptureBuffer>( TestSupport::VNumberedCaptureBuffer::Settings( Memory ) );
  VToken Evicted = pBuffer->Add();
  VRefCountedToken Pinned;
  VToken Token;
  const auto Empty = [&]
  {
    pBuffer->Read( Evicted, Pinned );
    EXPECT_FALSE( pBuffer->Add().IsValid() );
    EXPECT_FALSE( pBuffer->GetNewestToken( Token ) );
    Pinned.Clear();
  };
  Empty();
  VCaptureRequest Request;
  Request.m_Id = VCaptureSessionId( 1 );
  Request.m_Start = Evicted;
  ASSERT_TRUE( pBuffer->StartCapture( Request ) );
  VCaptureSessionStatus Status;
  pBuffer->Status( Status );
  EXPECT_EQ( Status.m_State, ECaptureState::WaitingForStart );   // clipped to the frame that comes next
  Evicted = pBuffer->Add();
  pBuffer->Status( Status );
  EXPECT_EQ( Status.m_State, ECaptureState::Capturing );
  EXPECT_EQ( Status.m_Start.m_FrameNumber, 2 );
  Empty();
  std::vector<uint32_t> Removed;
  pBuffer->BufferSessionRemovedCallback().AddImmediate( [&Removed]( KVZ::VBufferSessionId i_Id ) { Removed.push_back( i_Id.Value() ); } );
  pBuffer->StartNewBufferSession();
  EXPECT_EQ( Removed, std::vector<uint32_t>{ 1 } );
}

TEST_F( CaptureBuffer, EntryThatIsNotAddedLeavesNoTrace )
{
  VFrameEntry* pEntry = m_pBuffer->NewEntry( 16 );
  ASSERT_NE( pEntry, nullptr );
  m_pBuffer->DiscardEntry( pEntry );
  EXPECT_EQ( m_Memory.m_pClient->GetHeldBlocks(), 0u );
  EXPECT_EQ( m_pBuffer->NewEntry( m_pBuffer->Allocator().MaxAllocation() ), nullptr );
}

}
