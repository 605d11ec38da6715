// The rows of a Bayer image as the row functions want them: with a border on each side, and with rows above and below the image.
#pragma once

#include "CoreVideoUtils/PixelConversions.h"
#include "CoreVideoUtils/PixelRows.h"

#include <array>
#include <cstdint>
#include <memory>

namespace CoreVideoUtils
{

// Keeps copies of a few rows. One thread.
class VMosaicRows
{
public:
  enum class EOutside
  {
    Zero,
    Nearest   // the nearest pixel of the image
  };

  // The conversion's source is a Bayer format of 8 bits a pixel and outlives this.
  VMosaicRows( const VConversion& i_rConversion, EOutside i_Outside );

  // i_Row may lie up to two rows outside an image that is not empty. Stays valid until a row is asked for that is five or more further.
  const uint8_t* Get( int64_t i_Row );

  VBayerRow Colours( int64_t i_Row ) const;

private:
  static constexpr size_t Window = 5;

  void Fill( uint8_t* o_pRow, int64_t i_Row ) const;

  const uint8_t* const m_pImage;
  const int64_t m_Width;
  const int64_t m_Height;
  const EOutside m_Outside;
  const VBayerRow m_FirstRow;
  const size_t m_Stride;
  const std::unique_ptr<uint8_t[]> m_pRows;   // the window's, and one of zeros
  std::array<int64_t, Window> m_Held;         // the image's row in each place, -1 for none
};

}
