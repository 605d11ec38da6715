#include "cards/common/Painter.h"

#include <algorithm>
#include <array>
#include <cstring>
#include <vector>

namespace VirtualCards
{

namespace
{

constexpr uint32_t CellSize = 16;    // pixels, both ways
constexpr uint32_t CellCount = 32;   // one a bit
constexpr uint32_t CellsWidth = CellSize * CellCount;
constexpr uint32_t CellsHeight = 2 * CellSize;

uint32_t DepthAt( const VPictureFormat& i_rFormat, uint32_t i_Y )
{
  return i_Y < CellsHeight ? 0 : ( i_Y - CellsHeight ) * 255 / ( i_rFormat.Height() - CellsHeight );
}

// Grey from left to right, with less and less blue towards the bottom: a shift either way shows.
VColour GradientAt( const VPictureFormat& i_rFormat, uint32_t i_X, uint32_t i_Depth )
{
  const uint32_t Grey = i_X * 255 / ( i_rFormat.Width() - 1 );
  const uint32_t Blue = Grey * ( 255 - i_Depth ) / 255;
  return MakeColour( static_cast<uint8_t>( Grey ), static_cast<uint8_t>( Grey ), static_cast<uint8_t>( Blue ), i_rFormat.Height() );
}

class VCounterPainter final : public IPainter
{
public:
  explicit VCounterPainter( const VPictureFormat& i_rFormat ) : m_Format( i_rFormat ), m_RowBytes( i_rFormat.RowBytes() )
  {
    const uint32_t Group = PixelGroup( i_rFormat.m_PixelFormat );
    m_Edge = ( CellsWidth + Group - 1 ) / Group * Group;
    for( uint32_t x = CellsWidth; x < m_Edge; ++x )
    {
      m_EdgePixels.push_back( GradientAt( i_rFormat, x, 0 ) );
    }
  }

  void Paint( VPicture& io_rPicture, const VSignalFrame& i_rFrame ) const override
  {
    uint8_t* pBytes = io_rPicture.Bytes( m_Format.Size() );
    if( io_rPicture.m_Background != m_Id )
    {
      PaintGradient( pBytes );
      io_rPicture.m_Background = m_Id;
    }
    const uint32_t Number = static_cast<uint32_t>( i_rFrame.m_Number );
    PaintCells( pBytes, Number );
    PaintCells( pBytes + size_t{ CellSize } * m_RowBytes, ~Number );
  }

private:
  void PaintGradient( uint8_t* o_pBytes ) const
  {
    std::vector<VColour> Row( m_Format.Width() );
    for( uint32_t y = 0; y < m_Format.Height(); ++y, o_pBytes += m_RowBytes )
    {
      const uint32_t Depth = DepthAt( m_Format, y );
      if( y > 0 && Depth == DepthAt( m_Format, y - 1 ) )
      {
        std::memcpy( o_pBytes, o_pBytes - m_RowBytes, m_RowBytes );
        continue;
      }
      for( uint32_t x = 0; x < m_Format.Width(); ++x )
      {
        Row[x] = GradientAt( m_Format, x, Depth );
      }
      EncodePixels( m_Format.m_PixelFormat, Row, o_pBytes );
    }
  }

  void PaintCells( uint8_t* o_pRow, uint32_t i_Bits ) const
  {
    std::array<VColour, CellsWidth + 8> Pixels;
    for( uint32_t Cell = 0; Cell < CellCount; ++Cell )
    {
      const bool bOne = i_Bits >> ( CellCount - 1 - Cell ) & 1;
      std::fill_n( Pixels.begin() + Cell * CellSize, CellSize, bOne ? White : Black );
    }
    // The last group of pixels may reach into the gradient
    std::copy( m_EdgePixels.begin(), m_EdgePixels.end(), Pixels.begin() + CellsWidth );
    EncodePixels( m_Format.m_PixelFormat, std::span( Pixels ).first( m_Edge ), o_pRow );
    for( uint32_t y = 1; y < CellSize; ++y )
    {
      std::memcpy( o_pRow + size_t{ y } * m_RowBytes, o_pRow, BytesOf( m_Format.m_PixelFormat, m_Edge ) );
    }
  }

  const VPictureFormat m_Format;
  const uint32_t m_RowBytes;
  uint32_t m_Edge = 0;   // pixels, whole groups
  std::vector<VColour> m_EdgePixels;
};

}

std::unique_ptr<IPainter> MakeCounterPainter( const VPictureFormat& i_rFormat ) { return std::make_unique<VCounterPainter>( i_rFormat ); }

}
