// Cuts a client's blocks into frames: allocating one bumps a pointer and adds to a count, freeing one is a count, and a block goes back
// whole when its last allocation has gone.
//
// Threads. Allocate, Free, Pin and LinkBlocks may be called from any thread. Allocate takes a lock only when a new block is needed: the
// current block is taken out of its slot for the few instructions of a bump, and a second allocating thread waits them out. The counts of a
// block are atomic. A block's allocation count holds one for being the current block, so it can reach 0 only when nobody can bump it any
// more, and whoever brings it to 0 gives the block back. A pin may be raised where the memory cannot be freed meanwhile: under the lock of
// the buffer that frees it, or by somebody who has it pinned already. Unpinning releases, IsPinned acquires: what a reader did with a frame
// comes before what is done to it once it is seen unpinned.
#pragma once

#include "StageCoreRuntime/ThreadAnnotations.h"
#include "Utils/UtilsMemory/BalancingAllocator.h"

#include <boost/thread/lock_guard.hpp>
#include <boost/thread/mutex.hpp>

#include <algorithm>
#include <atomic>
#include <cstddef>
#include <cstdint>
#include <functional>
#include <memory>

namespace SyncSystem
{

class VCaptureBufferAllocator : public UtilsMemory::VGlobalFreeAllocatorWithRecovery
{
public:
  // Alignment of every allocation, a power of two of at least 16.
  explicit VCaptureBufferAllocator( std::shared_ptr<UtilsMemory::VBalancedClientAllocator> i_pClient, size_t i_Alignment = 16 );
  ~VCaptureBufferAllocator() override;

  size_t MaxAllocation() const override { return m_BlockPayload - std::min( m_BlockPayload, m_Overhead ); }
  // Null above MaxAllocation, or when no block can be had. May call the recovery function, so the caller holds no lock that it takes.
  void* Allocate( size_t i_Size ) override;

  // All three forward to the client.
  void SetRecovery( std::function<bool()> i_Recovery ) override;
  void SetRecoveryFinished( std::function<void()> i_Finished ) override;
  void GetMemoryStats( double& o_rTotalMiB, double& o_rUsedMiB ) const override;

  // Raises or lowers the pin count of the allocation's block. An empty block that is pinned does not go back.
  void Pin( void* i_pMemory, bool i_bPin );
  bool IsPinned( void* i_pMemory ) const;
  // The first allocation leaves together with the second, such as a frame's data with the frame's entry: from now on the second is the
  // last one in the blocks of both.
  void LinkBlocks( void* i_pMemory, void* i_pLeader );
  // The allocation linked last in the block of this one, or the block's last allocation if none was linked: once all up to it have gone,
  // so has the block. For linked memory, call it where the leader cannot be freed.
  void* LastInBlock( void* i_pMemory ) const;
  // Gives back the empty blocks that were kept by a pin which has gone; true if any went.
  bool ReleaseIfUnpinned();
  // Blocks given back since construction.
  uint64_t GetReleasedBlocks() const { return m_ReleasedBlocks.load( std::memory_order_relaxed ); }

protected:
  void FreeOwned( void* i_pMemory ) override;

private:
  struct VBlock;
  struct VHeader;

  static VHeader& HeaderOf( void* i_pMemory );
  static VBlock& BlockOf( void* i_pMemory );
  static VBlock* Busy();

  VBlock* TakeCurrent();
  void PutCurrent( VBlock* i_pBlock );
  void DropCurrentReference( VBlock* i_pBlock );
  void LeaveCurrentIfEmpty( VBlock* i_pBlock );
  VBlock* MakeBlock();
  void* Bump( VBlock& i_rBlock, size_t i_Size );
  void OnEmpty( VBlock* i_pBlock );
  void GiveBackLocked( VBlock* i_pBlock ) REQUIRES( m_Mutex );

  // Fixed after construction
  const std::shared_ptr<UtilsMemory::VBalancedClientAllocator> m_pClient;
  const size_t m_BlockPayload;
  const uintptr_t m_AlignMask;
  const size_t m_Overhead;   // block and allocation header, and what alignment may take at most

  std::atomic<VBlock*> m_pCurrent{ nullptr };   // Busy() while a thread bumps it
  std::atomic<uint64_t> m_ReleasedBlocks{ 0 };

  boost::mutex m_Mutex;
  size_t m_HeldBlocks GUARDED_BY( m_Mutex ) = 0;
  VBlock* m_pParked GUARDED_BY( m_Mutex ) = nullptr;   // empty blocks, kept by a pin
};

}
