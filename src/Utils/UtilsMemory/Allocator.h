// The allocators' contract: VAllocator, allocators whose pointers find their own way home, and those that can ask for memory back.
#pragma once

#include <cstddef>
#include <functional>

namespace UtilsMemory
{

class VAllocator
{
public:
  VAllocator() = default;
  VAllocator( const VAllocator& ) = delete;
  VAllocator& operator=( const VAllocator& ) = delete;
  virtual ~VAllocator() = default;

  // Bytes of the largest request that can ever succeed.
  virtual size_t MaxAllocation() const = 0;
  // Null is the only failure.
  virtual void* Allocate( size_t i_Size ) = 0;
  virtual void Free( void* i_pMemory ) = 0;
};

// A pointer from one of these may be freed through any other of them: the 16 bytes before it hold a pointer to its own allocator.
class VGlobalFreeAllocator : public VAllocator
{
public:
  static constexpr size_t HiddenBytes = 16;

  // Any thread. Null is ignored.
  void Free( void* i_pMemory ) final;
  // The holder will ask no more of this allocator. What is outstanding stays usable and can still be freed.
  virtual void Release() {}

protected:
  // Writes the hidden pointer into the HiddenBytes before the memory.
  void Own( void* i_pMemory );
  virtual void FreeOwned( void* i_pMemory ) = 0;
};

class VGlobalFreeAllocatorWithRecovery : public VGlobalFreeAllocator
{
public:
  // Called without any lock, on the thread that asks for memory, when there is none for it: gives memory back to this allocator and says
  // whether any went. A call that is running on another thread may end after a replacement.
  virtual void SetRecovery( std::function<bool()> i_Recovery ) = 0;
  // Called when recovery could not help either and the request is about to fail.
  virtual void SetRecoveryFinished( std::function<void()> i_Finished ) = 0;
  // What this allocator could hold at most just now, and what it holds. Takes no lock, so the two may be a moment apart.
  virtual void GetMemoryStats( double& o_rTotalMiB, double& o_rUsedMiB ) const = 0;
};

// The plain heap. Fresh large memory is not touched but for its first 16 bytes, so it becomes resident only as it is used.
class VGlobalFreeAllocatorNewDelete : public VGlobalFreeAllocator
{
public:
  size_t MaxAllocation() const override { return ~size_t{ 0 }; }
  void* Allocate( size_t i_Size ) override;

protected:
  void FreeOwned( void* i_pMemory ) override;
};

}
