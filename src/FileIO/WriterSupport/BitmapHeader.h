// The BITMAPINFOHEADER of Video for Windows, as it lies in a file: little-endian, without padding. A field that no name is given for here is
// zero.
#pragma once

#include <array>
#include <bit>
#include <cstdint>

namespace WriterSupport
{

struct VBitmapHeader
{
  uint32_t m_Size = 40;
  int32_t m_Width = 0;
  int32_t m_Height = 0;   // negative: the first row is the upper one
  uint16_t m_Planes = 1;
  uint16_t m_BitCount = 0;
  std::array<char, 4> m_Compression{};
  uint32_t m_ImageSize = 0;
  uint32_t m_Reserved[4]{};
};
static_assert( sizeof( VBitmapHeader ) == 40 && std::endian::native == std::endian::little );

}
