// Draws the five fonts of burn-in text into one file: font after font, glyph after glyph from space to '~', each a cell of grey values.
//   BurnInFontGenerator OUTLINES.ttf BITMAPS.bin
#include "CoreVideoUtils/Fonts/FontCells.h"

#include <ft2build.h>
#include FT_FREETYPE_H

#include <algorithm>
#include <cstdint>
#include <cstdio>
#include <fstream>
#include <stdexcept>
#include <string>
#include <vector>

namespace
{

using CoreVideoUtils::VFontCell;

// Signed, as a glyph may reach out of its cell.
struct VCell
{
  explicit VCell( const VFontCell& i_rCell ) : m_Width( static_cast<int>( i_rCell.m_Width ) ), m_Height( static_cast<int>( i_rCell.m_Height ) ) {}

  int m_Width;
  int m_Height;
};

void Require( FT_Error i_Error, const char* i_pWhat )
{
  if( i_Error )
  {
    throw std::runtime_error( std::string( i_pWhat ) + ": FreeType error " + std::to_string( i_Error ) );
  }
}

class VFace
{
public:
  explicit VFace( const char* i_pPath )
  {
    Require( FT_Init_FreeType( &m_pLibrary ), "FreeType does not start" );
    Require( FT_New_Face( m_pLibrary, i_pPath, 0, &m_pFace ), i_pPath );
  }
  ~VFace() { FT_Done_FreeType( m_pLibrary ); }
  VFace( const VFace& ) = delete;
  VFace& operator=( const VFace& ) = delete;

  // Rows above and below the baseline that the characters need.
  struct VExtent
  {
    int m_Above = 0;
    int m_Below = 0;
  };

  // The largest size at which every character fits the cell.
  VExtent FitInto( const VCell& i_rCell )
  {
    for( int Pixels = 2 * i_rCell.m_Height; Pixels > 4; --Pixels )
    {
      Require( FT_Set_Pixel_Sizes( m_pFace, 0, static_cast<FT_UInt>( Pixels ) ), "Size" );
      VExtent Extent;
      int Advance = 0;
      for( char Character = CoreVideoUtils::FirstFontCharacter; Character <= CoreVideoUtils::LastFontCharacter; ++Character )
      {
        const FT_GlyphSlot pGlyph = Render( Character );
        Extent.m_Above = std::max( Extent.m_Above, pGlyph->bitmap_top );
        Extent.m_Below = std::max( Extent.m_Below, static_cast<int>( pGlyph->bitmap.rows ) - pGlyph->bitmap_top );
        Advance = std::max( Advance, static_cast<int>( pGlyph->advance.x >> 6 ) );
      }
      if( Advance <= i_rCell.m_Width && Extent.m_Above + Extent.m_Below + 2 <= i_rCell.m_Height )
      {
        return Extent;
      }
    }
    throw std::runtime_error( "No size fits" );
  }

  FT_GlyphSlot Render( char i_Character )
  {
    Require( FT_Load_Char( m_pFace, static_cast<FT_ULong>( i_Character ), FT_LOAD_RENDER ), "Character" );
    return m_pFace->glyph;
  }

private:
  FT_Library m_pLibrary = nullptr;
  FT_Face m_pFace = nullptr;
};

// In the middle of the cell, all characters on one baseline.
void DrawGlyph( VFace& io_rFace, char i_Character, const VCell& i_rCell, const VFace::VExtent& i_rExtent, uint8_t* o_pCell )
{
  const FT_GlyphSlot pGlyph = io_rFace.Render( i_Character );
  const int Baseline = ( i_rCell.m_Height - i_rExtent.m_Above - i_rExtent.m_Below ) / 2 + i_rExtent.m_Above;
  const int Left = ( i_rCell.m_Width - static_cast<int>( pGlyph->advance.x >> 6 ) ) / 2 + pGlyph->bitmap_left;
  for( int Row = 0; Row < static_cast<int>( pGlyph->bitmap.rows ); ++Row )
  {
    for( int Column = 0; Column < static_cast<int>( pGlyph->bitmap.width ); ++Column )
    {
      const int X = Left + Column;
      const int Y = Baseline - pGlyph->bitmap_top + Row;
      if( X >= 0 && X < i_rCell.m_Width && Y >= 0 && Y < i_rCell.m_Height )
      {
        o_pCell[Y * i_rCell.m_Width + X] = pGlyph->bitmap.buffer[Row * pGlyph->bitmap.pitch + Column];
      }
    }
  }
}

void DrawFont( VFace& io_rFace, const VCell& i_rCell, std::vector<uint8_t>& io_rBitmaps )
{
  const VFace::VExtent Extent = io_rFace.FitInto( i_rCell );
  const size_t CellBytes = static_cast<size_t>( i_rCell.m_Width ) * static_cast<size_t>( i_rCell.m_Height );
  for( char Character = CoreVideoUtils::FirstFontCharacter; Character <= CoreVideoUtils::LastFontCharacter; ++Character )
  {
    io_rBitmaps.resize( io_rBitmaps.size() + CellBytes );
    DrawGlyph( io_rFace, Character, i_rCell, Extent, io_rBitmaps.data() + io_rBitmaps.size() - CellBytes );
  }
}

}

int main( int i_Count, char** i_ppArguments )
try
{
  if( i_Count != 3 )
  {
    throw std::runtime_error( "usage: BurnInFontGenerator OUTLINES.ttf BITMAPS.bin" );
  }
  VFace Face( i_ppArguments[1] );
  std::vector<uint8_t> Bitmaps;
  for( const VFontCell& rCell : CoreVideoUtils::FontCells )
  {
    DrawFont( Face, VCell( rCell ), Bitmaps );
  }
  std::ofstream File( i_ppArguments[2], std::ios::binary );
  File.write( reinterpret_cast<const char*>( Bitmaps.data() ), static_cast<std::streamsize>( Bitmaps.size() ) );
  File.close();
  return File ? 0 : 1;
}
catch( const std::exception& rError )
{
  std::fprintf( stderr, "%s\n", rError.what() );
  return 1;
}
