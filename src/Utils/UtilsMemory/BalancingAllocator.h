// One budget of large equal blocks, shared between clients.
//
// Every client is guaranteed a number of blocks, which stay free for it while it does not hold them. The rest belongs to whoever asked most
// recently: each request enters its client at the front of the list of grants, and grants beyond the budget drop out at its back, so a
// client that stops asking loses its claim to the others. A client over its share, or without a free block, must give up something of its
// own first: that is its recovery function.
//
// Blocks are taken from below when the budget is set and kept until it falls: in between no memory comes from the system or goes there. The
// block freed last is given out first, so memory becomes resident only as far as it is needed at once.
//
// Every operation may be called from any thread.
#pragma once

#include "StageCoreRuntime/ThreadAnnotations.h"
#include "Utils/UtilsMemory/Allocator.h"

#include <boost/circular_buffer.hpp>
#include <boost/thread/lock_guard.hpp>
#include <boost/thread/mutex.hpp>

#include <atomic>
#include <cstddef>
#include <functional>
#include <memory>
#include <set>
#include <vector>

namespace UtilsMemory
{

class VBalancedClientAllocator;

class VBalancingAllocator : public std::enable_shared_from_this<VBalancingAllocator>
{
public:
  // Block size: payload bytes of a block. Overhead: bytes before the payload, raised to 16. Blocks come from the given allocator, or from
  // the heap. Must be owned by a shared pointer. Holds no block before Configure.
  explicit VBalancingAllocator( size_t i_BlockSize, size_t i_Overhead = 0, std::shared_ptr<VAllocator> i_pAllocator = nullptr );
  VBalancingAllocator( const VBalancingAllocator& ) = delete;
  VBalancingAllocator& operator=( const VBalancingAllocator& ) = delete;
  ~VBalancingAllocator();

  // Sets the budget, in blocks: in all; held back from the shares, for clients that wait for others to give theirs up; promised to each
  // client. False if blocks could not be had from below, or if more blocks are in use than the budget allows: those go back below as they
  // are freed.
  bool Configure( size_t i_Total, size_t i_Reserve, size_t i_Guarantee );

  // A new client. It leaves the pool when its last owner lets go; blocks that are in use then stay valid until they are freed.
  std::shared_ptr<VBalancedClientAllocator> MakeClient();

  size_t GetBlockSize() const { return m_BlockSize; }

private:
  friend class VBalancedClientAllocator;

  // What an allocation needs from the pool.
  void EnterGrant( VBalancedClientAllocator& i_rClient );
  void* TakeWithinShare( VBalancedClientAllocator& i_rClient );
  void* TakeAny( VBalancedClientAllocator& i_rClient );
  // True if that was the last block of a client whose owners have gone.
  bool GiveBack( VBalancedClientAllocator& i_rClient, void* i_pBlock );
  void SetMinimumShare( VBalancedClientAllocator& i_rClient, size_t i_Blocks );
  void Unregister( VBalancedClientAllocator& i_rClient );
  // The client's owners have gone; true if it holds no block.
  bool Abandon( VBalancedClientAllocator& i_rClient );
  // Blocks the client could hold at most, as things stand. No lock.
  size_t Attainable( const VBalancedClientAllocator& i_rClient ) const;

  void TrimLocked() REQUIRES( m_Mutex );
  size_t WithheldLocked() const REQUIRES( m_Mutex );
  void DropOldestGrantLocked() REQUIRES( m_Mutex );
  void RecomputeLocked() REQUIRES( m_Mutex );
  void UpdateShareLocked( VBalancedClientAllocator& i_rClient ) REQUIRES( m_Mutex );
  size_t LackOfOthersLocked( const VBalancedClientAllocator& i_rClient ) const REQUIRES( m_Mutex );
  void* TakeLocked( VBalancedClientAllocator& i_rClient ) REQUIRES( m_Mutex );
  bool ObtainBlocksLocked() REQUIRES( m_Mutex );
  bool ReturnSurplusLocked() REQUIRES( m_Mutex );
  void CountClaimsLocked() REQUIRES( m_Mutex );

  // Fixed after construction
  const std::shared_ptr<VAllocator> m_pAllocator;
  const size_t m_BlockSize;
  const size_t m_Overhead;
  const size_t m_AllocationSize;   // m_BlockSize + m_Overhead

  // Written with m_Mutex held, read without it for statistics
  std::atomic<size_t> m_TotalBlocks{ 0 };
  std::atomic<size_t> m_Used{ 0 };   // blocks in the hands of clients that have gone
  std::atomic<size_t> m_GuaranteedPerClient{ 0 };
  std::atomic<size_t> m_Claims{ 0 };   // sum over clients of the larger of what they hold and the guarantee

  mutable boost::mutex m_Mutex;
  size_t m_AllocatedBlocks GUARDED_BY( m_Mutex ) = 0;
  size_t m_Reserve GUARDED_BY( m_Mutex ) = 0;
  size_t m_Deficit GUARDED_BY( m_Mutex ) = 0;   // sum over clients of what they want less than the guarantee
  std::vector<void*> m_FreeBlocks GUARDED_BY( m_Mutex );
  boost::circular_buffer<VBalancedClientAllocator*> m_Grants GUARDED_BY( m_Mutex );   // newest at the front
  std::set<VBalancedClientAllocator*> m_Clients GUARDED_BY( m_Mutex );
};

// One client's view of the pool: its requests are whole blocks.
class VBalancedClientAllocator : public VGlobalFreeAllocatorWithRecovery
{
public:
  // The block size.
  size_t MaxAllocation() const override;
  // One block, 16-byte aligned, whose contents are undefined.
  void* Allocate( size_t i_Size ) override;
  // Leaves the pool: its requests give null from now on. Its last owner's going does the same.
  void Release() override;
  void SetRecovery( std::function<bool()> i_Recovery ) override;
  void SetRecoveryFinished( std::function<void()> i_Finished ) override;
  void GetMemoryStats( double& o_rTotalMiB, double& o_rUsedMiB ) const override;

  // Blocks that the client may take without giving any up, whatever it asked for lately; the share is the larger of this, its grants and
  // the guarantee. It takes nothing from what is promised to others.
  void SetShare( size_t i_Blocks );
  // Blocks in hand.
  size_t GetHeldBlocks() const { return m_Held.load( std::memory_order_relaxed ); }

protected:
  void FreeOwned( void* i_pMemory ) override;

private:
  friend class VBalancingAllocator;

  explicit VBalancedClientAllocator( std::shared_ptr<VBalancingAllocator> i_pBalancing );
  static void Abandon( VBalancedClientAllocator* i_pClient );
  bool Recover();
  void TellRecoveryFinished();

  const std::shared_ptr<VBalancingAllocator> m_pBalancing;

  // Written with the pool's mutex held
  size_t m_Wanted = 0;   // its entries in the list of grants
  size_t m_MinimumShare = 0;
  size_t m_Share = 0;
  bool m_bReleased = false;    // takes no more part
  bool m_bAbandoned = false;   // deletes itself when its last block comes back
  std::atomic<size_t> m_Held{ 0 };

  boost::mutex m_RecoveryMutex;   // never held across a call
  std::shared_ptr<const std::function<bool()>> m_pRecovery GUARDED_BY( m_RecoveryMutex );
  std::shared_ptr<const std::function<void()>> m_pRecoveryFinished GUARDED_BY( m_RecoveryMutex );
};

}
