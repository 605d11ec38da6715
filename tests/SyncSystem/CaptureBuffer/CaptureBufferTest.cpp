// Captures as a recording meets them, each told from its start to its end.
#include "SyncSystem/CaptureBuffer.h"

#include "tests/support/FrameMemory.h"

#include <gtest/gtest.h>

#include <memory>
#include <vector>

namespace
{

using namespace SyncSystem;
using KVZ::VCaptureSessionId;
using TestSupport::NumberedPayload;

// A client that reads on the test's thread.
class VReader
{
public:
  explicit VReader( VCaptureBuffer& i_rBuffer ) : m_rBuffer( i_rBuffer ), m_Id( i_rBuffer.RegisterClient( [] {} ) ) {}
  ~VReader() { m_rBuffer.UnregisterClient( m_Id ); }

  // Up to this many frames, or until it is to wait.
  void Run( size_t i_Frames = ~size_t{ 0 } )
  {
    do {
      ASSERT_TRUE( m_rBuffer.ClientNextFrame( m_Id, m_Frame, m_Read, &m_Info ) );
    } while( --i_Frames > 0 && ( m_Read.m_Result == EClientResult::MoreToCome || m_Read.m_Result == EClientResult::Finished ) );
  }

  VCaptureBuffer& m_rBuffer;
  const uint32_t m_Id;
  VRefCountedToken m_Frame;
  VClientRead m_Read;
  VCaptureSessionInfo m_Info;
};

class CaptureBuffer : public testing::Test
{
protected:
  void Add( int i_Frames )
  {
    for( int Frame = 0; Frame < i_Frames; ++Frame ) ASSERT_TRUE( m_pBuffer->Add().IsValid() );
  }
  VToken At( int64_t i_Number ) const { return { m_pBuffer->GetCurrentBufferSession(), i_Number, nullptr }; }
  bool Start( const VToken& i_rStart, const VToken& i_rEnd )
  {
    const VCaptureSessionId Id( m_Id );
    return m_pBuffer->StartCapture( { Id, CaptureSessionType::Streamed, { Id, "Take", 7, 3 }, i_rStart, i_rEnd, 0, {} } );
  }
  VCaptureSessionStatus Status() const
  {
    VCaptureSessionStatus Status;
    m_pBuffer->Status( Status );
    return Status;
  }

  uint32_t m_Id = 1;
  TestSupport::VFrameMemory m_Memory{ 10, 2 };   // twenty frames
  std::shared_ptr<TestSupport::VNumberedCaptureBuffer> m_pBuffer = VCaptureBuffer::Make<TestSupport::VNumberedCaptureBuffer>(
    TestSupport::VNumberedCaptureBuffer::Settings( m_Memory ) );
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
  ASSERT_TRUE( m_pBuffer->SetCaptureEnd( VCaptureSessionId( m_Id ), { At( 36 ), 0 } ) );
  Good.Run();
  EXPECT_EQ( Status().m_State, ECaptureState::Complete );
  ASSERT_EQ( Status().m_Errors, ( std::vector<VCaptureError>{ { 5, "disk full" } } ) );
  Bad.Run();
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

TEST_F( CaptureBuffer, EntryThatIsNotAddedLeavesNoTrace )
{
  VFrameEntry* pEntry = m_pBuffer->NewEntry( 16 );
  ASSERT_NE( pEntry, nullptr );
  m_pBuffer->DiscardEntry( pEntry );
  EXPECT_EQ( m_Memory.m_pClient->GetHeldBlocks(), 0u );
  EXPECT_EQ( m_pBuffer->NewEntry( m_pBuffer->Allocator().MaxAllocation() ), nullptr );
}

}
