// What the model does not tell: errors, and lives of frames, entries and owners.
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

class CaptureBuffer : public testing::Test
{
protected:
  void Add( int i_Frames )
  {
    for( int Frame = 0; Frame < i_Frames; ++Frame ) ASSERT_TRUE( m_pBuffer->Add().IsValid() );
  }
  VToken At( int64_t i_Number ) const { return { m_pBuffer->GetCurrentBufferSession(), i_Number, nullptr }; }
  VCaptureSessionStatus Status() const
  {
    VCaptureSessionStatus Status;
    m_pBuffer->Status( Status );
    return Status;
  }

  TestSupport::VFrameMemory m_Memory{ 10, 2 };   // twenty frames
  std::shared_ptr<TestSupport::VNumberedCaptureBuffer> m_pBuffer = VCaptureBuffer::Make<TestSupport::VNumberedCaptureBuffer>(
    TestSupport::VNumberedCaptureBuffer::Settings( m_Memory ) );
};

TEST_F( CaptureBuffer, ErrorsOfAClientAreTheCapturesUntilTheNextOne )
{
  const std::vector<VCaptureError> Errors = { { 5, "disk full" } };
  const uint32_t Client = m_pBuffer->RegisterClient( [] {} );
  Add( 4 );
  ASSERT_TRUE( m_pBuffer->StartCapture( { VCaptureSessionId( 1 ), CaptureSessionType::Streamed, {}, At( 1 ), At( 3 ), 0, {} } ) );
  EXPECT_FALSE( m_pBuffer->FailCapture( { VCaptureSessionId( 2 ), CaptureSessionType::Streamed, {}, {}, {}, 8, {} } ) ) << "one capture at a time";
  EXPECT_FALSE( m_pBuffer->ClientFinished( 99, 0, {}, true ) );
  ASSERT_TRUE( m_pBuffer->ClientFinished( Client, ECaptureFailure::ReportedErrors, Errors[0], true ) );
  EXPECT_EQ( Status().m_Errors, Errors );
  VRefCountedToken Frame;
  VClientRead Read;
  ASSERT_TRUE( m_pBuffer->ClientNextFrame( Client, Frame, Read ) );
  EXPECT_EQ( Read.m_Errors, Errors );
  ASSERT_TRUE( m_pBuffer->StartCapture( { VCaptureSessionId( 2 ), CaptureSessionType::Streamed, {}, At( 1 ), At( 3 ), 0, {} } ) );
  EXPECT_TRUE( Status().m_Errors.empty() );
  ASSERT_TRUE( m_pBuffer->ClientNextFrame( Client, Frame, Read ) );
  EXPECT_TRUE( Read.m_Errors.empty() );
}

TEST_F( CaptureBuffer, PinnedFrameOutlivesItsOwners )
{
  Add( 2 );
  VToken Token = At( 1 );
  VRefCountedToken Pinned;
  ASSERT_TRUE( m_pBuffer->Read( Token, Pinned ) );
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
