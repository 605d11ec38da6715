#include "SyncSystem/CaptureBufferAllocator.h"

#include "tests/support/FrameMemory.h"

#include <gtest/gtest.h>

#include <cstring>

namespace
{

using SyncSystem::VCaptureBufferAllocator;
using TestSupport::VFrameMemory;

TEST( CaptureBufferAllocator, LargestRequestFitsWhateverTheAlignment )
{
  for( const size_t Alignment : { size_t{ 16 }, size_t{ 64 }, size_t{ 512 } } )
  {
    VFrameMemory Memory( 1, 20 );
    VCaptureBufferAllocator Allocator( Memory.m_pClient, Alignment );
    const size_t Max = Allocator.MaxAllocation();
    EXPECT_EQ( Allocator.Allocate( Max + 1 ), nullptr );
    void* pMemory = Allocator.Allocate( Max );
    ASSERT_NE( pMemory, nullptr );
    EXPECT_EQ( reinterpret_cast<uintptr_t>( pMemory ) % Alignment, 0u );
    std::memset( pMemory, 1, Max );
    Allocator.Free( pMemory );
    EXPECT_EQ( Memory.m_pClient->GetHeldBlocks(), 0u );
  }
  EXPECT_EQ( VFrameMemory( 1, 5, 64 ).m_pAllocator->MaxAllocation(), VFrameMemory::BlockBytes( 5, 64 ) - 64 - 16 );
}

TEST( CaptureBufferAllocator, LinkedAllocationsHaveOneLast )
{
  VFrameMemory Memory( 2, 20 );
  VCaptureBufferAllocator& rAllocator = *Memory.m_pAllocator;
  const size_t Half = rAllocator.MaxAllocation() / 2 - 32;
  void* pData = rAllocator.Allocate( Half );
  EXPECT_EQ( rAllocator.LastInBlock( pData ), pData );
  void* pMore = rAllocator.Allocate( Half );
  EXPECT_EQ( rAllocator.LastInBlock( pData ), pMore );
  void* pEntry = rAllocator.Allocate( 100 );
  rAllocator.LinkBlocks( pMore, pEntry );
  void* pNotLinkedYet = rAllocator.Allocate( 100 );
  EXPECT_EQ( rAllocator.LastInBlock( pData ), pEntry );
  EXPECT_EQ( rAllocator.LastInBlock( pEntry ), pEntry );
  for( void* pMemory : { pData, pMore, pEntry, pNotLinkedYet } ) rAllocator.Free( pMemory );
}

}
