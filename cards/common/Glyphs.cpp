#include "cards/common/Glyphs.h"

#include <array>
#include <cstring>

namespace VirtualCards
{

namespace
{

constexpr uint32_t CellColumns = 6;
constexpr uint32_t CellRows = 8;

struct VGlyph
{
  char m_Character;
  std::array<uint8_t, CellRows> m_Rows;   // lowest five bits are the dots, leftmost first; the sixth column is the gap
};

constexpr std::array Font = {
  VGlyph{ ' ', { 0, 0, 0, 0, 0, 0, 0, 0 } },
  VGlyph{ '0', { 0b01110, 0b10001, 0b10011, 0b10101, 0b11001, 0b10001, 0b01110, 0 } },
  VGlyph{ '1', { 0b00100, 0b01100, 0b00100, 0b00100, 0b00100, 0b00100, 0b01110, 0 } },
  VGlyph{ '2', { 0b01110, 0b10001, 0b00001, 0b00110, 0b01000, 0b10000, 0b11111, 0 } },
  VGlyph{ '3', { 0b01110, 0b10001, 0b00001, 0b00110, 0b00001, 0b10001, 0b01110, 0 } },
  VGlyph{ '4', { 0b00010, 0b00110, 0b01010, 0b10010, 0b11111, 0b00010, 0b00010, 0 } },
  VGlyph{ '5', { 0b11111, 0b10000, 0b11110, 0b00001, 0b00001, 0b10001, 0b01110, 0 } },
  VGlyph{ '6', { 0b00110, 0b01000, 0b10000, 0b11110, 0b10001, 0b10001, 0b01110, 0 } },
  VGlyph{ '7', { 0b11111, 0b00001, 0b00010, 0b00100, 0b01000, 0b01000, 0b01000, 0 } },
  VGlyph{ '8', { 0b01110, 0b10001, 0b10001, 0b01110, 0b10001, 0b10001, 0b01110, 0 } },
  VGlyph{ '9', { 0b01110, 0b10001, 0b10001, 0b01111, 0b00001, 0b00010, 0b01100, 0 } },
  VGlyph{ ':', { 0, 0b00100, 0b00100, 0, 0b00100, 0b00100, 0, 0 } },
  VGlyph{ ';', { 0, 0b00100, 0b00100, 0, 0b00100, 0b00100, 0b01000, 0 } },
  VGlyph{ '-', { 0, 0, 0, 0b01110, 0, 0, 0, 0 } },
};

size_t GlyphIndex( char i_Character )
{
  for( size_t i = 0; i < Font.size(); ++i )
  {
    if( Font[i].m_Character == i_Character )
    {
      return i;
    }
  }
  return 0;
}

}

VGlyphs::VGlyphs( const VPictureFormat& i_rFormat, uint32_t i_Scale )
  : m_Format( i_rFormat ),
    m_Scale( i_Scale ),
    m_CellWidth( CellColumns * i_Scale ),
    m_CellHeight( CellRows * i_Scale ),
    m_CellBytes( BytesOf( i_rFormat.m_PixelFormat, m_CellWidth ) ),
    m_Rows( Font.size() * CellRows * m_CellBytes )
{
  std::vector<VColour> Pixels( m_CellWidth );
  uint8_t* pRow = m_Rows.data();
  for( const VGlyph& rGlyph : Font )
  {
    for( const uint8_t Dots : rGlyph.m_Rows )
    {
      for( uint32_t x = 0; x < m_CellWidth; ++x )
      {
        const uint32_t Column = x / m_Scale;
        Pixels[x] = Column < 5 && ( Dots >> ( 4 - Column ) & 1 ) ? White : Black;
      }
      EncodePixels( m_Format.m_PixelFormat, Pixels, pRow );
      pRow += m_CellBytes;
    }
  }
}

void VGlyphs::Draw( uint8_t* o_pPicture, std::string_view i_Text, uint32_t i_X, uint32_t i_Y ) const
{
  const size_t RowBytes = m_Format.RowBytes();
  const uint32_t X = i_X - i_X % CellColumns;   // a whole group in every layout
  uint8_t* pCell = o_pPicture + i_Y * RowBytes + BytesOf( m_Format.m_PixelFormat, X );
  for( const char Character : i_Text )
  {
    const uint8_t* pGlyph = m_Rows.data() + GlyphIndex( Character ) * CellRows * m_CellBytes;
    for( uint32_t y = 0; y < m_CellHeight; ++y )
    {
      std::memcpy( pCell + y * RowBytes, pGlyph + y / m_Scale * m_CellBytes, m_CellBytes );
    }
    pCell += m_CellBytes;
  }
}

}
