// Reads the running frame number out of a picture with the counter pattern, in any layout that a card delivers.
//
// Knows nothing of the code that paints it: 32 cells of 16 by 16 pixels from the top left corner, highest bit first, white for 1; the
// next row of cells is the complement.
#pragma once

#include "Core/VideoInterface/PixelFormat.h"

#include <cstdint>
#include <cstring>
#include <optional>

namespace TestSupport
{

struct VPixels
{
  KVZ::IPixelFormat::Enum m_Format = KVZ::IPixelFormat::EUnspecified;   // any that a card delivers
  const uint8_t* m_pBytes = nullptr;
  size_t m_RowBytes = 0;
};

// Brightness from 0 to 255: luma, or green in RGB.
inline int BrightnessAt( const VPixels& i_rPixels, uint32_t i_X, uint32_t i_Y )
{
  const uint8_t* pRow = i_rPixels.m_pBytes + i_Y * i_rPixels.m_RowBytes;
  switch( i_rPixels.m_Format )
  {
    case KVZ::IPixelFormat::ELuminance8: return pRow[i_X];
    case KVZ::IPixelFormat::EU8Y8V8Y8: return pRow[2 * i_X + 1];
    case KVZ::IPixelFormat::EY8U8Y8V8: return pRow[2 * i_X];
    case KVZ::IPixelFormat::ER8G8B8:
    case KVZ::IPixelFormat::EB8G8R8: return pRow[3 * i_X + 1];
    case KVZ::IPixelFormat::ER8G8B8u8:
    case KVZ::IPixelFormat::EB8G8R8u8: return pRow[4 * i_X + 1];
    case KVZ::IPixelFormat::EU10Y10V10Y10: break;
    default: return -1;
  }
  // Of the twelve 10-bit components of a group, luma is every second one
  const uint32_t Component = 2 * ( i_X % 6 ) + 1;
  uint32_t Word = 0;
  std::memcpy( &Word, pRow + i_X / 6 * 16 + Component / 3 * 4, sizeof( Word ) );
  return static_cast<int>( ( Word >> Component % 3 * 10 & 0x3FF ) >> 2 );
}

// One row of cells; nothing where a cell is neither black nor white. A lossy codec may have moved the levels.
inline std::optional<uint32_t> ReadCells( const VPixels& i_rPixels, uint32_t i_Y )
{
  uint32_t Bits = 0;
  for( uint32_t Cell = 0; Cell < 32; ++Cell )
  {
    const int Brightness = BrightnessAt( i_rPixels, Cell * 16 + 8, i_Y );
    if( Brightness > 80 && Brightness < 170 )
    {
      return std::nullopt;
    }
    Bits = Bits << 1 | ( Brightness >= 170 ? 1u : 0u );
  }
  return Bits;
}

// Nothing when the complement disagrees: not this pattern, or two frames mixed.
inline std::optional<uint32_t> ReadCounter( const VPixels& i_rPixels )
{
  const std::optional<uint32_t> Number = ReadCells( i_rPixels, 8 );
  const std::optional<uint32_t> Complement = ReadCells( i_rPixels, 24 );
  return Number && Complement && *Number == ~*Complement ? Number : std::nullopt;
}

}
