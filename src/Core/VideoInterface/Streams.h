// The byte streams that writers and parsers work on. Positions are 64 bits wide. Failures are results, never exceptions.
#pragma once

#include "Core/VideoInterface/BufferAllocator.h"

#include <cstddef>
#include <cstdint>
#include <utility>
#include <vector>

namespace KVZ
{

class IInputStream
{
public:
  virtual ~IInputStream() = default;
  // All of the bytes or false.
  virtual bool Read( void* o_pData, size_t i_Size ) = 0;
  virtual bool IsGood() const = 0;
  // As many as there are, up to i_Size; the count goes to o_rRead. False only for a stream that has failed.
  virtual bool ReadBlock( void* o_pData, size_t i_Size, size_t& o_rRead ) = 0;
  virtual bool IsEnd() const { return false; }
};

class IOutputStream
{
public:
  using VSpan = std::pair<const void*, size_t>;

  virtual ~IOutputStream() = default;
  virtual bool Write( const void* i_pData, size_t i_Size ) = 0;

  // In order, stopping at the first failure.
  virtual bool Write( const std::vector<VSpan>& i_rSpans )
  {
    for( const VSpan& rSpan : i_rSpans )
    {
      if( !Write( rSpan.first, rSpan.second ) )
      {
        return false;
      }
    }
    return true;
  }

  virtual bool Write( const IBufferConst& i_rBuffer ) { return Write( i_rBuffer.Data(), i_rBuffer.Size() ); }
};

class ISeekable
{
public:
  virtual ~ISeekable() = default;
  virtual bool Tell( uint64_t& o_rPosition ) = 0;
  virtual bool Seek( uint64_t i_Position ) = 0;
};

class IInputStreamSeekable : public IInputStream, public virtual ISeekable
{
};

class IOutputStreamSeekable : public IOutputStream, public virtual ISeekable
{
};

class IStreamSeekable : public IInputStreamSeekable, public IOutputStreamSeekable
{
};

}
