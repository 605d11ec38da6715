// Conversions of one row of pixels, in the processor's widest vectors. No state, any thread. Nothing outside the row is read or written; rows
// need no alignment and do not overlap. ReferencePixels.h has the same arithmetic, plain and slow.
#pragma once

#include "Core/VideoInterface/PixelFormat.h"

#include <array>
#include <cstddef>
#include <cstdint>

namespace CoreVideoUtils
{

struct VRowFormats
{
  KVZ::IPixelFormat::Enum m_Source;
  KVZ::IPixelFormat::Enum m_Target;
};

// From: R8G8B8, B8G8R8, R8G8B8u8, B8G8R8u8, R5G6B5, Luminance8, U8Y8V8Y8, Y8U8Y8V8, U10Y10V10Y10.
// To: R8G8B8, B8G8R8, R8G8B8u8, B8G8R8u8, U8Y8V8Y8, Y8U8Y8V8, Luminance8; U10Y10V10Y10 from U8Y8V8Y8 and Y8U8Y8V8 alone.
// False, and nothing done, for other formats and for equal ones.
//
// The last pixel of a 4:2:2 row of odd width has no V: it takes that of the pair before it, and 128 where there is none; on its way to
// U10Y10V10Y10 it takes 0, as everything past the end of the row.
bool ConvertRow( VRowFormats i_Formats, const uint8_t* i_pSource, uint8_t* o_pTarget, size_t i_Pixels );

// Where a Bayer row has its pixels that are not green.
struct VBayerRow
{
  bool m_bRed;           // red ones, not blue ones
  bool m_bColourFirst;   // the first pixel is one of them
};

// Pixels on each side of a row that the functions below may read.
constexpr size_t BayerBorder = 2;
// Bytes after the border on the right that they may read as well and make no use of.
constexpr size_t BayerSlack = 128;

// Demosaics a row with the gradient-corrected filter of five by five pixels: the rows i_pRows[0] to [4] are those from two above to two below.
// To R8G8B8, B8G8R8, R8G8B8u8, B8G8R8u8, U8Y8V8Y8 and Y8U8Y8V8; false, and nothing done, for others.
bool DemosaicRow( const std::array<const uint8_t*, 5>& i_rRows, VBayerRow i_Row, KVZ::IPixelFormat::Enum i_Target, uint8_t* o_pTarget,
  size_t i_Pixels );

// A row's grey values: the mean of red, green and blue, where a colour that the pixel lacks is the mean of its neighbours of that colour.
// The rows i_pRows[0] to [2] are those from one above to one below.
void FilterBayerRow( const std::array<const uint8_t*, 3>& i_rRows, VBayerRow i_Row, uint8_t* o_pTarget, size_t i_Pixels );

}
