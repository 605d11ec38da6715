#include "cards/common/Glyphs.h"
#include "cards/common/Painter.h"

#include <algorithm>
#include <array>
#include <cstdio>
#include <cstring>
#include <vector>

namespace VirtualCards
{

namespace
{

constexpr uint8_t Level75 = 191;   // 75 % of full scale
constexpr std::array<std::array<uint8_t, 3>, 7> BarColours = { {
  { Level75, Level75, Level75 },   // grey
  { Level75, Level75, 0 },         // yellow
  { 0, Level75, Level75 },         // cyan
  { 0, Level75, 0 },               // green
  { Level75, 0, Level75 },         // magenta
  { Level75, 0, 0 },               // red
  { 0, 0, Level75 },               // blue
} };

constexpr uint32_t MovingWidth = 24;   // pixels; both are whole groups in every layout
constexpr uint32_t MovingStep = 12;    // pixels a frame
constexpr std::string_view NoTimecode = "--:--:--:--";
constexpr uint32_t NumberDigits = 8;

std::vector<uint8_t> Encode( const VPictureFormat& i_rFormat, const std::vector<VColour>& i_rPixels )
{
  std::vector<uint8_t> Bytes( i_rFormat.RowBytes() );
  EncodePixels( i_rFormat.m_PixelFormat, i_rPixels, Bytes.data() );
  return Bytes;
}

std::vector<VColour> BarPixels( const VPictureFormat& i_rFormat )
{
  std::vector<VColour> Pixels;
  for( uint32_t x = 0; x < i_rFormat.Width(); ++x )
  {
    // In pairs, so that a bar's edge never falls inside one
    const auto& [Red, Green, Blue] = BarColours[x / 2 * 2 * BarColours.size() / i_rFormat.Width()];
    Pixels.push_back( MakeColour( Red, Green, Blue, i_rFormat.Height() ) );
  }
  return Pixels;
}

std::vector<VColour> RampPixels( const VPictureFormat& i_rFormat )
{
  std::vector<VColour> Pixels;
  for( uint32_t x = 0; x < i_rFormat.Width(); ++x )
  {
    const uint8_t Grey = static_cast<uint8_t>( x * 255 / ( i_rFormat.Width() - 1 ) );
    Pixels.push_back( MakeColour( Grey, Grey, Grey, i_rFormat.Height() ) );
  }
  return Pixels;
}

class VBarsPainter final : public IPainter
{
public:
  explicit VBarsPainter( const VPictureFormat& i_rFormat )
    : m_Format( i_rFormat ),
      m_RowBytes( i_rFormat.RowBytes() ),
      m_RampTop( i_rFormat.Height() * 3 / 4 ),
      m_BandTop( i_rFormat.Height() * 5 / 6 ),
      m_Bars( Encode( i_rFormat, BarPixels( i_rFormat ) ) ),
      m_Ramp( Encode( i_rFormat, RampPixels( i_rFormat ) ) ),
      m_Band( Encode( i_rFormat, std::vector<VColour>( i_rFormat.Width(), Black ) ) ),
      m_Moving( BytesOf( i_rFormat.m_PixelFormat, MovingWidth ) ),
      m_Large( i_rFormat, i_rFormat.Height() / 108 ),
      m_Small( i_rFormat, std::max( 1u, i_rFormat.Height() / 216 ) )
  {
    EncodePixels( i_rFormat.m_PixelFormat, std::vector<VColour>( MovingWidth, White ), m_Moving.data() );
  }

  void Paint( VPicture& io_rPicture, const VSignalFrame& i_rFrame ) const override
  {
    uint8_t* pBytes = io_rPicture.Bytes( m_Format.Size() );
    if( io_rPicture.m_Background == m_Id )
    {
      RemoveMovingBar( pBytes, io_rPicture.m_MovingPart );
    }
    else
    {
      PaintBackground( pBytes );
      io_rPicture.m_Background = m_Id;
    }
    const uint32_t Places = ( m_Format.Width() - MovingWidth ) / MovingStep + 1;
    io_rPicture.m_MovingPart = static_cast<uint32_t>( i_rFrame.m_Number % Places ) * MovingStep;
    PaintMovingBar( pBytes, io_rPicture.m_MovingPart );
    PaintTexts( pBytes, i_rFrame );
  }

private:
  const uint8_t* BackgroundRow( uint32_t i_Y ) const { return ( i_Y < m_RampTop ? m_Bars : i_Y < m_BandTop ? m_Ramp : m_Band ).data(); }

  void PaintBackground( uint8_t* o_pBytes ) const
  {
    for( uint32_t y = 0; y < m_Format.Height(); ++y )
    {
      std::memcpy( o_pBytes + y * m_RowBytes, BackgroundRow( y ), m_RowBytes );
    }
  }

  void RemoveMovingBar( uint8_t* o_pBytes, uint32_t i_X ) const
  {
    const size_t Offset = BytesOf( m_Format.m_PixelFormat, i_X );
    for( uint32_t y = 0; y < m_BandTop; ++y )
    {
      std::memcpy( o_pBytes + y * m_RowBytes + Offset, BackgroundRow( y ) + Offset, m_Moving.size() );
    }
  }

  void PaintMovingBar( uint8_t* o_pBytes, uint32_t i_X ) const
  {
    const size_t Offset = BytesOf( m_Format.m_PixelFormat, i_X );
    for( uint32_t y = 0; y < m_BandTop; ++y )
    {
      std::memcpy( o_pBytes + y * m_RowBytes + Offset, m_Moving.data(), m_Moving.size() );
    }
  }

  void PaintTexts( uint8_t* o_pBytes, const VSignalFrame& i_rFrame ) const
  {
    const std::string Timecode = i_rFrame.m_Timecode ? KVZ::ToText( i_rFrame.m_Timecode->m_Label ) : std::string( NoTimecode );
    const uint32_t Width = static_cast<uint32_t>( NoTimecode.size() ) * m_Large.CellWidth();
    m_Large.Draw( o_pBytes, Timecode, ( m_Format.Width() - Width ) / 2, CentreInBand( m_Large ) );

    std::array<char, 24> Number{};
    std::snprintf( Number.data(), Number.size(), "%08u", static_cast<unsigned>( i_rFrame.m_Number % 100000000 ) );
    m_Small.Draw( o_pBytes, Number.data(), m_Format.Width() - ( NumberDigits + 1 ) * m_Small.CellWidth(), CentreInBand( m_Small ) );
  }

  uint32_t CentreInBand( const VGlyphs& i_rGlyphs ) const { return m_BandTop + ( m_Format.Height() - m_BandTop - i_rGlyphs.CellHeight() ) / 2; }

  const VPictureFormat m_Format;
  const size_t m_RowBytes;
  const uint32_t m_RampTop;
  const uint32_t m_BandTop;
  const std::vector<uint8_t> m_Bars;
  const std::vector<uint8_t> m_Ramp;
  const std::vector<uint8_t> m_Band;
  std::vector<uint8_t> m_Moving;
  const VGlyphs m_Large;
  const VGlyphs m_Small;
};

}

std::unique_ptr<IPainter> MakeBarsPainter( const VPictureFormat& i_rFormat ) { return std::make_unique<VBarsPainter>( i_rFormat ); }

}
