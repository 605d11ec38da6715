// The memory of one picture, reused from frame to frame.
#pragma once

#include "Core/VideoInterface/VideoStandard.h"
#include "cards/common/PixelRow.h"

#include <cstddef>
#include <cstdint>
#include <memory>
#include <new>

namespace VirtualCards
{

struct VPictureFormat
{
  const KVZ::VVideoStandardRow* m_pStandard = nullptr;
  KVZ::IPixelFormat::Enum m_PixelFormat = KVZ::IPixelFormat::EUnspecified;

  bool operator==( const VPictureFormat& ) const = default;

  uint32_t Width() const { return m_pStandard->m_Width; }
  uint32_t Height() const { return m_pStandard->m_Height; }
  uint32_t RowBytes() const { return VirtualCards::RowBytes( m_PixelFormat, Width() ); }
  size_t Size() const { return size_t{ RowBytes() } * Height(); }
};

// Not for several threads at once. The bytes exist from the first Bytes() on, so that pictures nobody looks at cost no memory.
class VPicture
{
public:
  // Zeros at first.
  uint8_t* Bytes( size_t i_Size )
  {
    if( m_Size != i_Size )
    {
      m_pBytes.reset( new( Alignment ) uint8_t[i_Size]() );
      m_Size = i_Size;
      m_Background = 0;
    }
    return m_pBytes.get();
  }

  // Memory of the same kind changes hands without a copy; what was painted is forgotten.
  void Swap( VPicture& io_rOther )
  {
    std::swap( m_pBytes, io_rOther.m_pBytes );
    std::swap( m_Size, io_rOther.m_Size );
    m_Background = io_rOther.m_Background = 0;
  }

  size_t Size() const { return m_Size; }

  // Painters' notes: the id of the one whose background lies here, 0 for none, and where on it the moving part stands.
  uint64_t m_Background = 0;
  uint32_t m_MovingPart = 0;

private:
  static constexpr std::align_val_t Alignment{ 64 };
  struct VDelete
  {
    void operator()( uint8_t* i_pBytes ) const { operator delete[]( i_pBytes, Alignment ); }
  };

  std::unique_ptr<uint8_t[], VDelete> m_pBytes;
  size_t m_Size = 0;
};

}
