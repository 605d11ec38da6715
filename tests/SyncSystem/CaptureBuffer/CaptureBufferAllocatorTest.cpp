#include "SyncSystem/CaptureBufferAllocator.h"

#include "tests/support/FrameMemory.h"

#include <gtest/gtest.h>

#include <cstring>

namespace
{

using SyncSystem::VCaptureBufferAllocator;

struct VMemory
{
  explicit VMemory( size_t i_Blocks, size_t i_BlockBytes = 1024, size_t i_Alignment = 16 )
    : m_pPool( std::make_shared<UtilsMemory::VBalancingAllocator>( i_BlockBytes ) ),
      m_pClient( m_pPool->MakeClient() ),
      m_Allocator( m_pClient, i_Alignment )
  {
    m_pPool->Configure( i_Blocks, 0, 0 );
  }

  std::shared_ptr<UtilsMemory::VBalancingAllocator> m_pPool;
  std::shared_ptr<UtilsMemory::VBalancedClientAllocator> m_pClient;
  VCaptureBufferAllocator m_Allocator;
};

TEST( CaptureBufferAllocator, LargestRequestFitsWhateverTheAlignment )
{
  for( const size_t Alignment : { size_t{ 16 }, size_t{ 64 }, size_t{ 512 } } )
  {
    VMemory Memory( 1, 4096, Alignment );
    const size_t Max = Memory.m_Allocator.MaxAllocation();
    EXPECT_EQ( Memory.m_Allocator.Allocate( Max + 1 ), nullptr );
    void* pMemory = Memory.m_Allocator.Allocate( Max );
    ASSERT_NE( pMemory, nullptr );
    EXPECT_EQ( reinterpret_cast<uintptr_t>( pMemory ) % Alignment, 0u );
    std::memset( pMemory, 1, Max );
    Memory.m_Allocator.Free( pMemory );
    EXPECT_EQ( Memory.m_pClient->GetHeldBlocks(), 0u );
  }
  VMemory Memory( 1 );
  EXPECT_EQ( Memory.m_Allocator.MaxAllocation(), 1024u - 64 - 16 );
}

TEST( CaptureBufferAllocator, LinkedAllocationsHaveOneLast )
{
  VMemory Memory( 2 );
  void* pData = Memory.m_Allocator.Allocate( 400 );
  EXPECT_EQ( Memory.m_Allocator.LastInBlock( pData ), pData );
  void* pMore = Memory.m_Allocator.Allocate( 400 );
  EXPECT_EQ( Memory.m_Allocator.LastInBlock( pData ), pMore );
  void* pEntry = Memory.m_Allocator.Allocate( 100 );
  Memory.m_Allocator.LinkBlocks( pMore, pEntry );
  void* pNotLinkedYet = Memory.m_Allocator.Allocate( 100 );
  EXPECT_EQ( Memory.m_Allocator.LastInBlock( pData ), pEntry );
  EXPECT_EQ( Memory.m_Allocator.LastInBlock( pEntry ), pEntry );
  for( void* pMemory : { pData, pMore, pEntry, pNotLinkedYet } ) Memory.m_Allocator.Free( pMemory );
}

}
