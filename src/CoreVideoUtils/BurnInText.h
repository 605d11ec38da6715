// Draws a line of text, such as a timecode, into the pixels of a frame: light characters on a solid dark box, in the frame's own pixel format.
//
// Any thread, if the converter's Convert may be called there. No state.
#pragma once

#include "CoreVideoUtils/Fonts/FontCells.h"
#include "CoreVideoUtils/IPixelFormatConverter.h"

#include <cstddef>
#include <cstdint>
#include <string_view>

namespace CoreVideoUtils
{

constexpr uint32_t DefaultBurnInFont = 2;

// One of five fixed-size fonts: cells of 12x20, 19x32, 28x48, 38x64 and 43x72 pixels. An index outside them gives the default font, with a
// line in the log.
class VBurnInFont
{
public:
  explicit VBurnInFont( uint32_t i_SizeIndex );

  uint32_t Width() const { return m_Cell.m_Width; }
  uint32_t Height() const { return m_Cell.m_Height; }
  // Width x Height grey values, row by row. Anything but printable ASCII has the glyph of '?'.
  const uint8_t* Glyph( char i_Character ) const;

private:
  VFontCell m_Cell;
  const uint8_t* m_pBitmap;
};

// Position in pixels from the image's first; the text may be as long as it likes: what runs off the right edge goes on at the next row's left,
// and what lies behind the buffer's end is left out. An empty text changes nothing.
//
// The grey values come through the converter: straight, or through R8G8B8 where it knows no straight way. False, with nothing drawn, where it
// knows none at all, and for the formats packed from 7 and 6 bits, in which a pixel has no address of its own.
bool BurnInText( KVZ::IPixelFormatConverter& i_rConverter, const KVZ::VideoFrameInfo& i_rInfo, uint32_t i_SizeIndex, uint32_t i_X, uint32_t i_Y,
  std::string_view i_Text, uint8_t* io_pPixels, size_t i_Size );

}
