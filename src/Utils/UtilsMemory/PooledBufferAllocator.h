// Buffers that come back: what an encoder needs for each frame is given out again instead of going through the heap.
//
// Any thread may allocate and release; each has a free list of its own, so that threads do not wait for one another. Buffers may outlive the
// allocator. The content of a buffer is what its last user left in it.
#pragma once

#include "Core/VideoInterface/BufferAllocator.h"

#include <memory>
#include <string>

namespace UtilsMemory
{

class VPooledBufferAllocator : public KVZ::IBufferAllocator
{
public:
  explicit VPooledBufferAllocator( std::string i_Name );

  // The buffer that this thread released last, or another free one, or a new one. Throws std::bad_alloc, with a line in the log, where memory
  // has run out.
  std::shared_ptr<KVZ::IBuffer> AllocateBuffer( size_t i_Size ) override;

private:
  class VPool;

  const std::string m_Name;
  const std::shared_ptr<VPool> m_pPool;
};

}
