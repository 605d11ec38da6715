// Digits for burning into pictures, ready in one pixel layout and size.
#pragma once

#include "cards/common/Picture.h"

#include <cstdint>
#include <string_view>
#include <vector>

namespace VirtualCards
{

// White on black. Immutable after construction.
class VGlyphs
{
public:
  // i_Scale pixels for each dot of the font, which has cells of 6 by 8 dots.
  VGlyphs( const VPictureFormat& i_rFormat, uint32_t i_Scale );

  uint32_t CellWidth() const { return m_CellWidth; }
  uint32_t CellHeight() const { return m_CellHeight; }

  // i_X is rounded down to where the layout can be written. Characters without a glyph are left black; the text must fit the picture.
  void Draw( uint8_t* o_pPicture, std::string_view i_Text, uint32_t i_X, uint32_t i_Y ) const;

private:
  const VPictureFormat m_Format;
  const uint32_t m_Scale;
  const uint32_t m_CellWidth;
  const uint32_t m_CellHeight;
  const uint32_t m_CellBytes;    // of one row of a cell
  std::vector<uint8_t> m_Rows;   // one encoded row a row of dots, glyph after glyph
};

}
