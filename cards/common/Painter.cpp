#include "cards/common/Painter.h"

#include <atomic>
#include <cstring>
#include <vector>

namespace VirtualCards
{

namespace
{

class VBlackPainter final : public IPainter
{
public:
  explicit VBlackPainter( const VPictureFormat& i_rFormat ) : m_Format( i_rFormat ), m_Row( i_rFormat.RowBytes() )
  {
    EncodePixels( i_rFormat.m_PixelFormat, std::vector<VColour>( i_rFormat.Width(), Black ), m_Row.data() );
  }

  void Paint( VPicture& io_rPicture, const VSignalFrame& ) const override
  {
    uint8_t* pRow = io_rPicture.Bytes( m_Format.Size() );
    if( io_rPicture.m_Background == m_Id )
    {
      return;
    }
    for( uint32_t y = 0; y < m_Format.Height(); ++y, pRow += m_Row.size() )
    {
      std::memcpy( pRow, m_Row.data(), m_Row.size() );
    }
    io_rPicture.m_Background = m_Id;
  }

private:
  const VPictureFormat m_Format;
  std::vector<uint8_t> m_Row;
};

}

IPainter::IPainter()
  : m_Id(
      []
      {
        static std::atomic<uint64_t> s_LastId{ 0 };
        return ++s_LastId;
      }() )
{
}

std::unique_ptr<IPainter> MakePainter( EPattern i_Pattern, const VPictureFormat& i_rFormat )
{
  switch( i_Pattern )
  {
    case EPattern::Counter: return MakeCounterPainter( i_rFormat );
    case EPattern::Noise: return MakeNoisePainter( i_rFormat );
    default: return MakeBarsPainter( i_rFormat );
  }
}

std::unique_ptr<IPainter> MakeBlackPainter( const VPictureFormat& i_rFormat ) { return std::make_unique<VBlackPainter>( i_rFormat ); }

}
