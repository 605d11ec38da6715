// A buffer that says that it is larger than any memory. Nobody gets to read it.
#pragma once

#include "Core/VideoInterface/BufferAllocator.h"

namespace TestSupport
{

class VEndlessBuffer : public KVZ::IBufferConst
{
public:
  explicit VEndlessBuffer( size_t i_Size ) : m_Size( i_Size ) {}

  const uint8_t* Data() const override { return nullptr; }
  size_t Size() const override { return m_Size; }

private:
  const size_t m_Size;
};

}
