// The frame path leaves the heap alone, however long it runs.
#include "StageCoreRuntime/SanitizerBuild.h"

// A sanitizer brings its own operator new.
#if !defined( STAGECORE_SANITIZER_BUILD )

#include "SyncSystem/TimeBasedCaptureBuffer.h"

#include "tests/support/FrameMemory.h"

#include <gtest/gtest.h>

#include <cstdlib>
#include <new>

namespace
{

thread_local size_t t_Allocations = 0;

void* CountedAllocation( size_t i_Size )
{
  ++t_Allocations;
  void* pMemory = std::malloc( i_Size );
  if( !pMemory ) throw std::bad_alloc();
  return pMemory;
}

}

void* operator new( size_t i_Size ) { return CountedAllocation( i_Size ); }
void operator delete( void* i_pMemory ) noexcept { std::free( i_pMemory ); }
void operator delete( void* i_pMemory, size_t ) noexcept { std::free( i_pMemory ); }

namespace
{

using namespace SyncSystem;

TEST( CaptureBufferHeap, StoringEvictingAndReadingFramesAllocatesNothing )
{
  TestSupport::VFrameMemory Memory( 20, 8 );
  const auto pBuffer = VTimeBasedCaptureBuffer::Make( TestSupport::VNumberedCaptureBuffer::Settings( Memory ) );
  size_t Notifications = 0;
  const uint32_t Client = pBuffer->RegisterClient( [&Notifications] { ++Notifications; } );
  VFrameTiming Timing;
  Timing.m_Period = KVZ::VTick( 5400000 );
  Timing.m_CounterClock = KVZ::IClock( KVZ::IClock::CounterFromSessionStart, 0, 9 );
  const KVZ::IClock Clocks[] = { { KVZ::IClock::FrameNumber, 0, 9 }, { KVZ::IClock::Timecode, 1, 0 } };
  int64_t Frame = 0;
  const auto AddOne = [&]
  {
    VFrameEntry* pEntry = pBuffer->NewEntry( sizeof( TestSupport::VNumberedPayload ) );
    Timing.m_Clocks = {};
    for( const KVZ::IClock& rClock : Clocks ) Timing.m_Clocks.Set( rClock, Timing.m_Period * Frame );
    ++Frame;
    new( Payload( pEntry ) ) TestSupport::VNumberedPayload( Frame );
    uint32_t Id = 0;
    pBuffer->AddFrame( pEntry, Timing, Id );
  };
  for( int Warm = 0; Warm < 500; ++Warm ) AddOne();
  VCaptureRequest Request;
  Request.m_Id = KVZ::VCaptureSessionId( 1 );
  ASSERT_TRUE( pBuffer->StartCapture( Request ) );
  VRefCountedToken ClientFrame, Pinned;
  VClientRead Read;
  VToken Position;
  ASSERT_TRUE( pBuffer->GetNewestToken( Position ) );
  const size_t Before = t_Allocations;
  for( int Step = 0; Step < 20000; ++Step )
  {
    AddOne();
    do {
      pBuffer->ClientNextFrame( Client, ClientFrame, Read );
    } while( Read.m_Result == EClientResult::MoreToCome );
    pBuffer->Advance( Position, 1 );
    ASSERT_TRUE( pBuffer->Read( Position, Pinned ) );
  }
  EXPECT_EQ( t_Allocations - Before, 0u );
  EXPECT_EQ( Notifications, 20000u );   // one a frame, the start's included
  EXPECT_EQ( Pinned.Token().m_FrameNumber, 20500 );
  EXPECT_TRUE( TestSupport::NumberedPayload( ClientFrame.Frame() ).Holds( 20500 ) );
}

}

#endif
