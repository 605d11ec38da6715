// Rows of pixels in the layouts that cards deliver.
#pragma once

#include "Core/VideoInterface/PixelFormat.h"

#include <cstdint>
#include <span>

namespace VirtualCards
{

// One colour in both worlds: full-range RGB and video-range YCbCr of 8 bits.
struct VColour
{
  uint8_t m_Red = 0;
  uint8_t m_Green = 0;
  uint8_t m_Blue = 0;
  uint8_t m_Y = 16;
  uint8_t m_Cb = 128;
  uint8_t m_Cr = 128;
};

// By the matrix of ITU-R BT.709 for more than 576 lines, of BT.601 otherwise.
VColour MakeColour( uint8_t i_Red, uint8_t i_Green, uint8_t i_Blue, uint32_t i_Lines );

constexpr VColour Black{ 0, 0, 0, 16, 128, 128 };
constexpr VColour White{ 255, 255, 255, 235, 128, 128 };

// Bytes of i_Pixels neighbouring pixels; 0 for a layout that no card delivers: they have 4:2:2, RGB and luma alone. For a whole row of
// U10Y10V10Y10 this is without the padding to 128 bytes.
uint32_t BytesOf( KVZ::IPixelFormat::Enum i_Format, uint32_t i_Pixels );

// Bytes from one row to the next.
uint32_t RowBytes( KVZ::IPixelFormat::Enum i_Format, uint32_t i_Width );

// Pixels that can be written on their own lie at multiples of this.
uint32_t PixelGroup( KVZ::IPixelFormat::Enum i_Format );

// Writes neighbouring pixels that begin at a pixel group; a last group is filled up with zeros. In 4:2:2 the chroma is that of each
// pair's left pixel.
void EncodePixels( KVZ::IPixelFormat::Enum i_Format, std::span<const VColour> i_Pixels, uint8_t* o_pBytes );

}
