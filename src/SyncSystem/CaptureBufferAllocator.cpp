#include "SyncSystem/CaptureBufferAllocator.h"

#include "StageCoreRuntime/DebugServices.h"

#include <algorithm>
#include <new>
#include <thread>

namespace SyncSystem
{

namespace
{

constexpr size_t BlockHeaderBytes = 64;

}

struct VCaptureBufferAllocator::VBlock
{
  std::atomic<uint32_t> m_Allocations{ 1 };   // one of them for being the current block
  std::atomic<uint32_t> m_Pins{ 0 };
  std::byte* m_pNextFree;   // touched by the thread that has the block out of the slot
  std::byte* const m_pEnd;
  std::atomic<void*> m_pLastAllocated{ nullptr };
  std::atomic<void*> m_pLastLinked{ nullptr };
  VBlock* m_pNextBlock = nullptr;   // in the list of parked blocks

  VBlock( std::byte* i_pNextFree, std::byte* i_pEnd ) : m_pNextFree( i_pNextFree ), m_pEnd( i_pEnd ) {}
};

// In front of every allocation; the first field is the hidden pointer of the base class.
struct VCaptureBufferAllocator::VHeader
{
  UtilsMemory::VGlobalFreeAllocator* m_pAllocator;
  VBlock* m_pBlock;
};

VCaptureBufferAllocator::VCaptureBufferAllocator( std::shared_ptr<UtilsMemory::VBalancedClientAllocator> i_pClient, size_t i_Alignment )
  : m_pClient( std::move( i_pClient ) ),
    m_BlockPayload( m_pClient->MaxAllocation() ),
    m_AlignMask( std::max<uintptr_t>( i_Alignment, 16 ) - 1 ),
    m_Overhead( BlockHeaderBytes + sizeof( VHeader ) + m_AlignMask + 1 - 16 )
{
  static_assert( sizeof( VBlock ) <= BlockHeaderBytes );
  static_assert( sizeof( VHeader ) == HiddenBytes );
  KVZ_ASSERT( ( i_Alignment & ( i_Alignment - 1 ) ) == 0 );
}

VCaptureBufferAllocator::~VCaptureBufferAllocator()
{
  if( VBlock* pCurrent = m_pCurrent.load() ) DropCurrentReference( pCurrent );
  ReleaseIfUnpinned();
  KVZ_ASSERT( m_HeldBlocks == 0 );
}

VCaptureBufferAllocator::VHeader& VCaptureBufferAllocator::HeaderOf( void* i_pMemory ) { return *( static_cast<VHeader*>( i_pMemory ) - 1 ); }

VCaptureBufferAllocator::VBlock& VCaptureBufferAllocator::BlockOf( void* i_pMemory ) { return *HeaderOf( i_pMemory ).m_pBlock; }

// An address that no block has.
VCaptureBufferAllocator::VBlock* VCaptureBufferAllocator::Busy()
{
  alignas( VBlock ) static std::byte s_Busy{};
  return reinterpret_cast<VBlock*>( &s_Busy );
}

void* VCaptureBufferAllocator::Allocate( size_t i_Size )
{
  if( i_Size > MaxAllocation() ) return nullptr;
  VBlock* pBlock = TakeCurrent();
  if( pBlock )
  {
    if( void* pMemory = Bump( *pBlock, i_Size ) )
    {
      PutCurrent( pBlock );
      return pMemory;
    }
    // Out of the slot before a new one is asked for: once its frames have gone it can then be the block that recovery frees.
    DropCurrentReference( pBlock );
  }
  m_pCurrent.store( nullptr, std::memory_order_release );
  pBlock = MakeBlock();
  if( !pBlock ) return nullptr;
  void* pMemory = Bump( *pBlock, i_Size );
  if( VBlock* pDisplaced = TakeCurrent() ) DropCurrentReference( pDisplaced );
  PutCurrent( pBlock );
  return pMemory;
}

// The current block, if there is one, and with it the slot, which others find Busy until PutCurrent or a store.
VCaptureBufferAllocator::VBlock* VCaptureBufferAllocator::TakeCurrent()
{
  VBlock* pBlock = m_pCurrent.exchange( Busy(), std::memory_order_acquire );
  while( pBlock == Busy() )
  {
    std::this_thread::yield();
    pBlock = m_pCurrent.exchange( Busy(), std::memory_order_acquire );
  }
  return pBlock;
}

// The block holds an allocation that its caller has not seen yet, so it cannot have gone empty meanwhile.
void VCaptureBufferAllocator::PutCurrent( VBlock* i_pBlock ) { m_pCurrent.store( i_pBlock, std::memory_order_release ); }

void VCaptureBufferAllocator::DropCurrentReference( VBlock* i_pBlock )
{
  if( i_pBlock->m_Allocations.fetch_sub( 1, std::memory_order_acq_rel ) == 1 ) OnEmpty( i_pBlock );
}

// The caller saw one count left in the block. If that is the slot's, the block leaves the slot; if it is the last allocation of another
// block, or the slot's owner is just adding one, nothing is to be done. The block itself is not touched unless it was in the slot.
void VCaptureBufferAllocator::LeaveCurrentIfEmpty( VBlock* i_pBlock )
{
  if( m_pCurrent.compare_exchange_strong( i_pBlock, nullptr, std::memory_order_acq_rel ) ) DropCurrentReference( i_pBlock );
}

VCaptureBufferAllocator::VBlock* VCaptureBufferAllocator::MakeBlock()
{
  void* pMemory = m_pClient->Allocate( m_BlockPayload );
  if( !pMemory ) return nullptr;
  auto* pStart = static_cast<std::byte*>( pMemory );
  auto* pBlock = new( pMemory ) VBlock( pStart + BlockHeaderBytes, pStart + m_BlockPayload );
  boost::lock_guard<boost::mutex> Lock( m_Mutex );
  ++m_HeldBlocks;
  return pBlock;
}

// Null if the block has no room left.
void* VCaptureBufferAllocator::Bump( VBlock& i_rBlock, size_t i_Size )
{
  const size_t Padding = -( reinterpret_cast<uintptr_t>( i_rBlock.m_pNextFree ) + sizeof( VHeader ) ) & m_AlignMask;
  const auto Room = static_cast<size_t>( i_rBlock.m_pEnd - i_rBlock.m_pNextFree );
  if( sizeof( VHeader ) + Padding + i_Size > Room ) return nullptr;
  void* pResult = i_rBlock.m_pNextFree + sizeof( VHeader ) + Padding;
  i_rBlock.m_pNextFree += sizeof( VHeader ) + Padding + i_Size;
  Own( pResult );
  HeaderOf( pResult ).m_pBlock = &i_rBlock;
  i_rBlock.m_Allocations.fetch_add( 1, std::memory_order_relaxed );
  i_rBlock.m_pLastAllocated.store( pResult, std::memory_order_relaxed );
  return pResult;
}

void VCaptureBufferAllocator::FreeOwned( void* i_pMemory )
{
  VBlock* pBlock = &BlockOf( i_pMemory );
  const uint32_t Former = pBlock->m_Allocations.fetch_sub( 1, std::memory_order_acq_rel );
  if( Former == 1 ) OnEmpty( pBlock );
  else if( Former == 2 ) LeaveCurrentIfEmpty( pBlock );
}

void VCaptureBufferAllocator::OnEmpty( VBlock* i_pBlock )
{
  boost::lock_guard<boost::mutex> Lock( m_Mutex );
  if( i_pBlock->m_Pins.load( std::memory_order_acquire ) == 0 )
  {
    GiveBackLocked( i_pBlock );
    return;
  }
  i_pBlock->m_pNextBlock = m_pParked;
  m_pParked = i_pBlock;
}

bool VCaptureBufferAllocator::ReleaseIfUnpinned()
{
  boost::lock_guard<boost::mutex> Lock( m_Mutex );
  bool bReleased = false;
  for( VBlock** ppBlock = &m_pParked; *ppBlock; )
  {
    VBlock* pBlock = *ppBlock;
    if( pBlock->m_Pins.load( std::memory_order_acquire ) != 0 )
    {
      ppBlock = &pBlock->m_pNextBlock;
      continue;
    }
    *ppBlock = pBlock->m_pNextBlock;
    GiveBackLocked( pBlock );
    bReleased = true;
  }
  return bReleased;
}

void VCaptureBufferAllocator::GiveBackLocked( VBlock* i_pBlock )
{
  --m_HeldBlocks;
  i_pBlock->~VBlock();
  m_pClient->Free( i_pBlock );
  m_ReleasedBlocks.fetch_add( 1, std::memory_order_relaxed );
}

void VCaptureBufferAllocator::Pin( void* i_pMemory, bool i_bPin )
{
  if( i_bPin ) BlockOf( i_pMemory ).m_Pins.fetch_add( 1, std::memory_order_relaxed );
  else BlockOf( i_pMemory ).m_Pins.fetch_sub( 1, std::memory_order_release );
}

bool VCaptureBufferAllocator::IsPinned( void* i_pMemory ) const { return BlockOf( i_pMemory ).m_Pins.load( std::memory_order_acquire ) != 0; }

void VCaptureBufferAllocator::LinkBlocks( void* i_pMemory, void* i_pLeader )
{
  BlockOf( i_pMemory ).m_pLastLinked.store( i_pLeader, std::memory_order_relaxed );
  BlockOf( i_pLeader ).m_pLastLinked.store( i_pLeader, std::memory_order_relaxed );
}

void* VCaptureBufferAllocator::LastInBlock( void* i_pMemory ) const
{
  const VBlock& rBlock = BlockOf( i_pMemory );
  void* pLinked = rBlock.m_pLastLinked.load( std::memory_order_relaxed );
  return pLinked ? pLinked : rBlock.m_pLastAllocated.load( std::memory_order_relaxed );
}

void VCaptureBufferAllocator::SetRecovery( std::function<bool()> i_Recovery ) { m_pClient->SetRecovery( std::move( i_Recovery ) ); }

void VCaptureBufferAllocator::SetRecoveryFinished( std::function<void()> i_Finished ) { m_pClient->SetRecoveryFinished( std::move( i_Finished ) ); }

void VCaptureBufferAllocator::GetMemoryStats( double& o_rTotalMiB, double& o_rUsedMiB ) const
{
  m_pClient->GetMemoryStats( o_rTotalMiB, o_rUsedMiB );
}

}
