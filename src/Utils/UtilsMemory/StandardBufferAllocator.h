// Buffers that come back: what an encoder needs for each frame is given out again instead of going through the heap.
//
// Any thread may allocate and release; each has a free list of its own, so that threads do not wait for one another. Buffers may outlive the
// allocator. The content of a buffer is what its last user left in it.
#pragma once

#include "Core/VideoInterface/BufferAllocator.h"

#include <memory>
#include <string>

namespace KVZ
{

class IStandardBufferAllocator : public IBufferAllocator
{
public:
  explicit IStandardBufferAllocator( std::string i_Name, std::string i_LogCategory = "UtilsMemory" );

  // The buffer that this thread released last, or another free one, or a new one. An empty pointer, with a line in the log, where memory has
  // run out.
  std::shared_ptr<IStandardBuffer> Allocate( size_t i_Size ) override;

private:
  class VPool;

  const std::string m_Name;
  const std::string m_LogCategory;
  const std::shared_ptr<VPool> m_pPool;
};

}
