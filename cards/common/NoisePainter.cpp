#include "cards/common/Painter.h"

#include <cstring>
#include <vector>

namespace VirtualCards
{

namespace
{

constexpr size_t BlockBytes = 1 << 20;   // stays in the processor's cache
constexpr size_t Step = 16;              // rows begin at multiples of this in the block: whole groups in every layout

// SplitMix64: every value of the counter gives an independent number.
uint64_t Scramble( uint64_t i_Value )
{
  i_Value += 0x9E3779B97F4A7C15;
  i_Value = ( i_Value ^ i_Value >> 30 ) * 0xBF58476D1CE4E5B9;
  i_Value = ( i_Value ^ i_Value >> 27 ) * 0x94D049BB133111EB;
  return i_Value ^ i_Value >> 31;
}

// Component values that mean synchronisation on SDI never occur in a picture.
uint32_t NoiseWord( KVZ::IPixelFormat::Enum i_Format, uint64_t i_Random )
{
  uint32_t Word = 0;
  if( i_Format == KVZ::IPixelFormat::EU10Y10V10Y10 )
  {
    for( int i = 0; i < 3; ++i )
    {
      Word |= static_cast<uint32_t>( 4 + ( i_Random >> 16 * i & 0xFFFF ) % 1016 ) << 10 * i;
    }
    return Word;
  }
  for( int i = 0; i < 4; ++i )
  {
    Word |= static_cast<uint32_t>( 1 + ( i_Random >> 16 * i & 0xFFFF ) % 254 ) << 8 * i;
  }
  const bool bOpaque = i_Format == KVZ::IPixelFormat::EB8G8R8u8 || i_Format == KVZ::IPixelFormat::ER8G8B8u8;
  return bOpaque ? Word | 0xFF000000 : Word;
}

// Every row is a piece of one block of noise, taken from a place that depends on frame and row: a copy a row, no more.
class VNoisePainter final : public IPainter
{
public:
  explicit VNoisePainter( const VPictureFormat& i_rFormat ) : m_Format( i_rFormat ), m_Block( BlockBytes )
  {
    for( size_t i = 0; i < BlockBytes; i += 4 )
    {
      const uint32_t Word = NoiseWord( i_rFormat.m_PixelFormat, Scramble( i ) );
      std::memcpy( m_Block.data() + i, &Word, sizeof( Word ) );
    }
  }

  void Paint( VPicture& io_rPicture, const VSignalFrame& i_rFrame ) const override
  {
    uint8_t* pRow = io_rPicture.Bytes( m_Format.Size() );
    const size_t RowBytes = m_Format.RowBytes();
    const size_t Used = BytesOf( m_Format.m_PixelFormat, m_Format.Width() );
    const uint64_t Places = ( BlockBytes - RowBytes ) / Step;
    for( uint32_t y = 0; y < m_Format.Height(); ++y, pRow += RowBytes )
    {
      const uint64_t Place = Scramble( i_rFrame.m_Number << 16 | y ) % Places;
      std::memcpy( pRow, m_Block.data() + Place * Step, Used );
    }
    io_rPicture.m_Background = m_Id;
  }

private:
  const VPictureFormat m_Format;
  std::vector<uint8_t> m_Block;
};

}

std::unique_ptr<IPainter> MakeNoisePainter( const VPictureFormat& i_rFormat ) { return std::make_unique<VNoisePainter>( i_rFormat ); }

}
