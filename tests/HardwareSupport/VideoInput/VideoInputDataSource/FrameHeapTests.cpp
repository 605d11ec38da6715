// From the device's call to the stored, timed frame the heap is left alone, while old frames are given up.
#include "StageCoreRuntime/SanitizerBuild.h"

// A sanitizer brings its own operator new.
#if !defined( STAGECORE_SANITIZER_BUILD )

#include "tests/HardwareSupport/VideoInput/VideoInputDataSource/VideoRig.h"

#include <cstdlib>
#include <new>

namespace
{

thread_local size_t t_Allocations = 0;

void* CountedAllocation( size_t i_Size )
{
  ++t_Allocations;
  void* pMemory = std::malloc( i_Size );
  if( !pMemory )
  {
    throw std::bad_alloc();
  }
  return pMemory;
}

}

void* operator new( size_t i_Size ) { return CountedAllocation( i_Size ); }
void operator delete( void* i_pMemory ) noexcept { std::free( i_pMemory ); }
void operator delete( void* i_pMemory, size_t ) noexcept { std::free( i_pMemory ); }

namespace
{

TEST( VideoFrameHeap, DeliveringTimedFramesWithTimecodeAllocatesNothing )
{
  VVideoRig Rig;
  const auto pSource = Rig.Make();
  Rig.m_Timecode.m_Standard = KVZ::ITimecodeStandard::ETimecode25;
  uint64_t Notified = 0;   // as a client that records is
  pSource->Buffer()->NewDataCallback().AddImmediate( [&Notified]( KVZ::VBufferSessionId ) { ++Notified; } );
  const auto DeliverTimed = [&]( int i_Frames )
  {
    for( int Frame = 0; Frame < i_Frames; ++Frame )
    {
      Rig.m_pTime->m_Now += Period.Seconds() + ( Frame % 2 ? 0.0001 : -0.0001 );
      ASSERT_TRUE( Rig.Deliver() );
    }
  };
  DeliverTimed( 1000 );
  Rig.Join( *pSource, 1 );
  ASSERT_GT( t_Allocations, 0u );

  const uint64_t BlocksBefore = Rig.m_Memory.m_pAllocator->GetReleasedBlocks();
  const size_t Before = t_Allocations;
  DeliverTimed( 20000 );
  EXPECT_EQ( t_Allocations - Before, 0u );
  EXPECT_EQ( Notified, 21000u );
  EXPECT_GT( Rig.m_Memory.m_pAllocator->GetReleasedBlocks(), BlocksBefore + 1000 );
  Rig.OnStrand( *pSource, [&] { EXPECT_EQ( pSource->GetSourceSyncStatus().m_LatestCounterFrames, 20999u ); } );
}

}

#endif
