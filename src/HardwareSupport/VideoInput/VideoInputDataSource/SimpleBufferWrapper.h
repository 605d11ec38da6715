// A piece of a stored frame as a buffer, without a copy. The frame stays pinned for as long as anybody holds the buffer.
#pragma once

#include "Core/VideoInterface/BufferAllocator.h"
#include "SyncSystem/RefCountedToken.h"

#include <cstddef>
#include <cstdint>
#include <utility>

namespace VideoInputHAL
{

class ISimpleBufferWrapper : public KVZ::IBufferConst
{
public:
  ISimpleBufferWrapper( SyncSystem::VRefCountedToken i_Frame, const uint8_t* i_pData, size_t i_Size )
    : m_Frame( std::move( i_Frame ) ), m_pData( i_pData ), m_Size( i_Size )
  {
  }

  const uint8_t* Data() const override { return m_pData; }
  size_t Size() const override { return m_Size; }

private:
  const SyncSystem::VRefCountedToken m_Frame;
  const uint8_t* const m_pData;
  const size_t m_Size;
};

}
