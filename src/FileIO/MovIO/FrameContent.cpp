#include "FileIO/MovIO/FrameContent.h"

#include <algorithm>
#include <array>
#include <cstring>
#include <string_view>

namespace MovIO
{

namespace
{

using KVZ::IPixelFormat;
using KVZ::IVideoPayload;
using VSpans = std::vector<KVZ::IOutputStream::VSpan>;

struct VMagic
{
  IVideoPayload::Enum m_Payload;
  std::string_view m_Bytes;
};

constexpr std::array Magics = {
  VMagic{ IVideoPayload::EImageJPEG, { "\xFF\xD8\xFF", 3 } },
  VMagic{ IVideoPayload::EImagePNG, { "\x89PNG\r\n\x1A\n", 8 } },
  VMagic{ IVideoPayload::EImageTIFF, { "II\x2A\x00", 4 } },
};

// A buffer that is shorter than the magic bytes is not looked at.
bool BeginsWith( const VSpans& i_rFrame, std::string_view i_Bytes )
{
  return i_rFrame.empty() || i_rFrame.front().second < i_Bytes.size() || std::memcmp( i_rFrame.front().first, i_Bytes.data(), i_Bytes.size() ) == 0;
}

bool IsLargeEnough( const VMovie& i_rMovie, const VSpans& i_rFrame )
{
  const IPixelFormat::Enum Format = i_rMovie.m_VideoInfo.m_PixelFormat;
  if( Format != IPixelFormat::ER8G8B8 && Format != IPixelFormat::EU8Y8V8Y8 )
  {
    return true;
  }
  uint64_t Size = 0;
  for( const auto& rSpan : i_rFrame )
  {
    Size += rSpan.second;
  }
  return Size >= KVZ::GetImageSize( Format, i_rMovie.m_VideoInfo.m_ImageWidth, i_rMovie.m_VideoInfo.m_ImageHeight );
}

}

bool IsContentOf( const VMovie& i_rMovie, const VSpans& i_rFrame, char i_FrameType )
{
  switch( i_rMovie.m_VideoPayload )
  {
    case IVideoPayload::EUncompressed: return IsLargeEnough( i_rMovie, i_rFrame );
    case IVideoPayload::EVideoH264: return i_FrameType == 'B' || i_FrameType == 'I' || i_FrameType == 'P';
    default:
    {
      const auto Found = std::find_if( Magics.begin(), Magics.end(),
        [&]( const VMagic& i_rMagic ) { return i_rMagic.m_Payload == i_rMovie.m_VideoPayload; } );
      return Found == Magics.end() || BeginsWith( i_rFrame, Found->m_Bytes );
    }
  }
}

}
