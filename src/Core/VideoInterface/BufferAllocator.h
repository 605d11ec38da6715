// Owned spans of bytes, and what makes them.
#pragma once

#include <cstddef>
#include <cstdint>
#include <memory>
#include <string>
#include <vector>

namespace KVZ
{

class IBufferConst
{
public:
  virtual ~IBufferConst() = default;
  virtual const uint8_t* Data() const = 0;
  virtual size_t Size() const = 0;
};

class IBuffer : public IBufferConst
{
public:
  using IBufferConst::Data;
  virtual uint8_t* Data() = 0;
};

// A buffer on the heap.
class IStandardBuffer : public IBuffer
{
public:
  explicit IStandardBuffer( size_t i_Size = 0 ) : m_Bytes( i_Size ) {}

  uint8_t* Data() override { return m_Bytes.data(); }
  const uint8_t* Data() const override { return m_Bytes.data(); }
  size_t Size() const override { return m_Bytes.size(); }

  std::vector<uint8_t>& Bytes() { return m_Bytes; }

private:
  std::vector<uint8_t> m_Bytes;
};

// The list that travels from the frame through the encoder to the writer, in stream order. An encoder replaces its content.
using VBufferList = std::vector<std::shared_ptr<const IBufferConst>>;

// Bytes of all buffers together.
inline uint64_t GetTotalSize( const VBufferList& i_rBuffers )
{
  uint64_t Sum = 0;
  for( const auto& rpBuffer : i_rBuffers )
  {
    Sum += rpBuffer->Size();
  }
  return Sum;
}

// Gives out buffers. Implementations may keep returned ones for reuse; the name appears in diagnostics.
class IBufferAllocator
{
public:
  virtual ~IBufferAllocator() = default;
  // Its content is anything. An empty pointer where memory has run out.
  virtual std::shared_ptr<IStandardBuffer> Allocate( size_t i_Size ) = 0;
};

}
