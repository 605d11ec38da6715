#include "CoreVideoUtils/MosaicRows.h"

#include <algorithm>

namespace CoreVideoUtils
{

namespace
{

using KVZ::IPixelFormat;

// In front of a row's first pixel; keeps rows aligned.
constexpr size_t Lead = 64;
static_assert( Lead >= BayerBorder );

// How far the pattern is moved against one whose first pixel is red
struct VFirstRed
{
  IPixelFormat::Enum m_Format;
  int m_X;
  int m_Y;
};

constexpr std::array FirstReds = {
  VFirstRed{ IPixelFormat::EBayerRG8, 0, 0 },
  VFirstRed{ IPixelFormat::EBayerGB8, 0, 1 },
  VFirstRed{ IPixelFormat::EBayerGR8, 1, 0 },
  VFirstRed{ IPixelFormat::EBayerBG8, 1, 1 },
};

VBayerRow FirstRowOf( IPixelFormat::Enum i_Format )
{
  const auto* const pFound = std::find_if( FirstReds.begin(), FirstReds.end(),
    [&]( const VFirstRed& i_rRow ) { return i_rRow.m_Format == i_Format; } );
  const VFirstRed FirstRed = pFound == FirstReds.end() ? FirstReds.front() : *pFound;
  // Blue ones stand one further than red ones in the row before.
  return { FirstRed.m_Y == 0, FirstRed.m_X == FirstRed.m_Y };
}

size_t StrideOf( uint32_t i_Width ) { return Lead + ( i_Width + BayerBorder + BayerSlack + 63 ) / 64 * 64; }

}

VMosaicRows::VMosaicRows( const VConversion& i_rConversion, EOutside i_Outside )
  : m_pImage( i_rConversion.m_pSource ),
    m_Width( i_rConversion.m_Width ),
    m_Height( i_rConversion.m_Height ),
    m_Outside( i_Outside ),
    m_FirstRow( FirstRowOf( i_rConversion.m_Source ) ),
    m_Stride( StrideOf( i_rConversion.m_Width ) ),
    m_pRows( std::make_unique<uint8_t[]>( m_Stride * ( Window + 1 ) ) )
{
  m_Held.fill( -1 );
}

const uint8_t* VMosaicRows::Get( int64_t i_Row )
{
  const int64_t Row = std::clamp<int64_t>( i_Row, 0, m_Height - 1 );
  if( Row != i_Row && m_Outside == EOutside::Zero )
  {
    return m_pRows.get() + Window * m_Stride + Lead;
  }
  const size_t Place = static_cast<size_t>( Row ) % Window;
  uint8_t* const pRow = m_pRows.get() + Place * m_Stride + Lead;
  if( m_Held[Place] != Row )
  {
    Fill( pRow, Row );
    m_Held[Place] = Row;
  }
  return pRow;
}

VBayerRow VMosaicRows::Colours( int64_t i_Row ) const
{
  return i_Row % 2 == 0 ? m_FirstRow : VBayerRow{ !m_FirstRow.m_bRed, !m_FirstRow.m_bColourFirst };
}

void VMosaicRows::Fill( uint8_t* o_pRow, int64_t i_Row ) const
{
  const uint8_t* const pImageRow = m_pImage + i_Row * m_Width;
  std::copy_n( pImageRow, m_Width, o_pRow );
  if( m_Outside == EOutside::Nearest && m_Width > 0 )
  {
    std::fill_n( o_pRow - BayerBorder, BayerBorder, pImageRow[0] );
    std::fill_n( o_pRow + m_Width, BayerBorder, pImageRow[m_Width - 1] );
  }
}

}
