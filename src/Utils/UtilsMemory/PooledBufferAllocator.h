// Buffers that come back: what an encoder needs for each frame is given out again instead of going through the heap.
//
// Any thread may allocate and release. Buffers may outlive the allocator. The content of a buffer is what its last user left in it.
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

  // The smallest free buffer with room for the size, or a new one. Throws std::bad_alloc, with a line in the log, where memory has run out.
  std::shared_ptr<KVZ::IBuffer> AllocateBuffer( size_t i_Size ) override;

private:
  class VPool;

  const std::string m_Name;
  const std::shared_ptr<VPool> m_pPool;
};

}
