// A file of any size: small pieces are kept with the place where they lie, long ones, which are images, are counted and forgotten.
#pragma once

#include "Utils/UtilsIO/IClosableStream.h"

#include <map>
#include <vector>

namespace TestSupport
{

class VSparseFile : public UtilsIO::IClosableStream
{
public:
  using VPieces = std::map<uint64_t, std::vector<uint8_t>>;   // as they were written, by position

  // Bytes from which a piece is taken for an image.
  explicit VSparseFile( VPieces& o_rPieces, size_t i_SmallestImage = 4096 ) : m_rPieces( o_rPieces ), m_SmallestImage( i_SmallestImage ) {}

  bool Read( void*, size_t ) override { return false; }
  bool ReadBlock( void*, size_t, size_t& ) override { return false; }
  bool IsGood() const override { return true; }
  using UtilsIO::IClosableStream::Write;
  bool Write( const void* i_pData, size_t i_Size ) override
  {
    if( i_Size < m_SmallestImage )
    {
      const auto* pBytes = static_cast<const uint8_t*>( i_pData );
      m_rPieces[m_Position].assign( pBytes, pBytes + i_Size );
    }
    m_Position += i_Size;
    return true;
  }
  bool Tell( uint64_t& o_rPosition ) override
  {
    o_rPosition = m_Position;
    return true;
  }
  bool Seek( uint64_t i_Position ) override
  {
    m_Position = i_Position;
    return true;
  }
  bool Close() override { return true; }

private:
  VPieces& m_rPieces;
  const size_t m_SmallestImage;
  uint64_t m_Position = 0;
};

}
