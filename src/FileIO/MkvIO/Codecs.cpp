#include "FileIO/MkvIO/Codecs.h"

#include "StageCoreRuntime/GlobalLog.h"

#include <algorithm>
#include <array>

namespace MkvIO
{

namespace
{

using P = KVZ::IPixelFormat;
using S = KVZ::IAudioSampleFormat;

struct VPixelRow
{
  P::Enum m_Format;
  VVideoCodec m_Codec;
};

constexpr VVideoCodec Fourcc( const char* i_pFourCC ) { return { "V_MS/VFW/FOURCC", EFourCCPlace::BitmapHeader, i_pFourCC }; }

constexpr std::array PixelRows = {
  VPixelRow{ P::ELuminance8, Fourcc( "GREY" ) },
  VPixelRow{ P::EBayerGB8, Fourcc( "GREY" ) },
  VPixelRow{ P::ER8G8B8u8, Fourcc( "RGBA" ) },
  VPixelRow{ P::EU8Y8V8Y8, Fourcc( "UYVY" ) },
  VPixelRow{ P::EY8U8Y8V8, Fourcc( "YUY2" ) },
};

constexpr VVideoCodec MotionJPEG{ "V_MJPEG" };

struct VSampleRow
{
  S::Enum m_Format;
  VAudioCodec m_Codec;
};

constexpr std::array SampleRows = {
  VSampleRow{ S::EInt16, { "A_PCM/INT/LIT", 16 } },
  VSampleRow{ S::EInt24, { "A_PCM/INT/LIT", 24 } },
  VSampleRow{ S::EInt32, { "A_PCM/INT/LIT", 32 } },
  VSampleRow{ S::EFloat32, { "A_PCM/FLOAT/IEEE", 32 } },
};

template<class TRows, class TFormat>
auto FindRow( const TRows& i_rRows, TFormat i_Format, const char* i_pComplaint )
{
  const auto Row = std::find_if( i_rRows.begin(), i_rRows.end(), [&]( const auto& i_rRow ) { return i_rRow.m_Format == i_Format; } );
  if( Row != i_rRows.end() )
  {
    return boost::make_optional( Row->m_Codec );
  }
  KVZ_LOG_ERROR( "MkvWriter", "%1%", i_pComplaint );
  return decltype( boost::make_optional( Row->m_Codec ) ){};
}

}

boost::optional<VVideoCodec> FindVideoCodec( KVZ::IVideoPayload::Enum i_Payload, P::Enum i_Format )
{
  switch( i_Payload )
  {
    case KVZ::IVideoPayload::EUncompressed: return FindRow( PixelRows, i_Format, "Unsupported uncompressed video pixel format." );
    case KVZ::IVideoPayload::EImageJPEG: return MotionJPEG;
    default: KVZ_LOG_ERROR( "MkvWriter", "Unsupported video payload format." ); return {};
  }
}

boost::optional<VAudioCodec> FindAudioCodec( S::Enum i_Format ) { return FindRow( SampleRows, i_Format, "Unsupported sample format" ); }

}
