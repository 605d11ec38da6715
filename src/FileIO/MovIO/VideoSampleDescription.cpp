#include "Core/VideoInterface/EnumTable.h"
#include "FileIO/MovIO/AtomScope.h"
#include "FileIO/MovIO/SampleDescriptions.h"
#include "StageCoreRuntime/GlobalLog.h"

#include <algorithm>
#include <array>

namespace MovIO
{

namespace
{

using KVZ::IPixelFormat;
using KVZ::IVideoPayload;

struct VVideoFormat
{
  int32_t m_Value;   // a pixel format, or a payload
  const char* m_pCode;
  const char* m_pCompressor;
};

constexpr std::array UncompressedFormats = {
  VVideoFormat{ IPixelFormat::ER8G8B8, "raw ", "Uncompressed RGB" },
  VVideoFormat{ IPixelFormat::EB8G8R8, "24BG", "Uncompressed RGB" },
  VVideoFormat{ IPixelFormat::ER8G8B8u8, "RGBA", "Uncompressed RGB" },
  VVideoFormat{ IPixelFormat::EB8G8R8u8, "BGRA", "Uncompressed RGB" },
  VVideoFormat{ IPixelFormat::EU8Y8V8Y8, "2vuy", "Uncompressed 8-bit 4:2:2" },
  VVideoFormat{ IPixelFormat::EY8U8Y8V8, "yuvs", "Uncompressed 8-bit 4:2:2" },
  VVideoFormat{ IPixelFormat::EU10Y10V10Y10, "v210", "Uncompressed 10-bit 4:2:2" },
};
static_assert( UncompressedFormats.size() == 7 );

constexpr std::array CompressedFormats = {
  VVideoFormat{ IVideoPayload::EImageJPEG, "jpeg", "Photo - JPEG" },
  VVideoFormat{ IVideoPayload::EImagePNG, "png ", "Photo - PNG" },
  VVideoFormat{ IVideoPayload::EImageTIFF, "tiff", "TIFF" },
  VVideoFormat{ IVideoPayload::EVideoH264, "avc1", "H264" },
};
static_assert( CompressedFormats.size() == 4 );

template<class TFormats>
const VVideoFormat* Find( const TFormats& i_rFormats, int32_t i_Value )
{
  const auto Found = std::find_if( i_rFormats.begin(), i_rFormats.end(),
    [&]( const VVideoFormat& i_rFormat ) { return i_rFormat.m_Value == i_Value; } );
  return Found == i_rFormats.end() ? nullptr : &*Found;
}

const VVideoFormat* FindFormat( const VMovie& i_rMovie )
{
  if( i_rMovie.m_VideoPayload == IVideoPayload::EUncompressed )
  {
    const VVideoFormat* pFormat = Find( UncompressedFormats, i_rMovie.m_VideoInfo.m_PixelFormat );
    if( !pFormat )
    {
      KVZ_LOG_ERROR( "MovIO", "Video pixel format '%s' is not supported.", KVZ::NameOrUnspecified( i_rMovie.m_VideoInfo.m_PixelFormat ) );
    }
    return pFormat;
  }
  const VVideoFormat* pFormat = Find( CompressedFormats, i_rMovie.m_VideoPayload );
  if( !pFormat )
  {
    KVZ_LOG_ERROR( "MovIO", "Video payload '%s' is not supported.", KVZ::NameOrUnspecified( i_rMovie.m_VideoPayload ) );
  }
  return pFormat;
}

void WriteParameterSet( VMovPrimitiveWriter& io_rOut, const std::vector<uint8_t>& i_rSet )
{
  io_rOut.U16( static_cast<uint16_t>( i_rSet.size() ) ).Write( i_rSet.data(), i_rSet.size() );
}

// The decoder configuration (ISO/IEC 14496-15): version, profile, compatibility, level, four-byte lengths, one set of each kind.
bool WriteAvcC( VMovPrimitiveWriter& io_rOut, const VMovie& i_rMovie )
{
  VAtomScope AvcC( io_rOut, "avcC" );
  io_rOut.U8( 1 ).U8( 100 ).U8( 0 ).U8( 0x28 ).U8( 0xFF );
  io_rOut.U8( 0xE1 );
  WriteParameterSet( io_rOut, i_rMovie.m_SPS );
  io_rOut.U8( 1 );
  WriteParameterSet( io_rOut, i_rMovie.m_PPS );
  return AvcC.Close();
}

bool WriteEntry( VMovPrimitiveWriter& io_rOut, const VMovie& i_rMovie, const VVideoFormat& i_rFormat )
{
  VAtomScope Entry( io_rOut, i_rFormat.m_pCode );
  io_rOut.Zeros( 6 ).U16( 1 );                  // data reference
  io_rOut.U16( 1 ).U16( 0 ).FourCC( "tmsl" );   // version, revision, vendor
  io_rOut.U32( 0 ).U32( 0x200 );                // temporal and spatial quality
  io_rOut.U16( static_cast<uint16_t>( i_rMovie.m_VideoInfo.m_ImageWidth ) ).U16( static_cast<uint16_t>( i_rMovie.m_VideoInfo.m_ImageHeight ) );
  io_rOut.Fixed16_16( 72.0 ).Fixed16_16( 72.0 ).U32( 0 );   // dots an inch
  io_rOut.U16( 1 );                                         // frames a sample
  io_rOut.PaddedPascalString( i_rFormat.m_pCompressor, 32 );
  io_rOut.U16( 24 ).U16( 0xFFFF );   // depth, no colour table
  return Entry.Close( !i_rMovie.IsH264() || WriteAvcC( io_rOut, i_rMovie ) );
}

}

bool WriteVideoStsd( VMovPrimitiveWriter& io_rOut, const VMovie& i_rMovie )
{
  VAtomScope Stsd( io_rOut, "stsd" );
  io_rOut.Version0().U32( 1 );
  const VVideoFormat* pFormat = FindFormat( i_rMovie );
  return Stsd.Close( pFormat && WriteEntry( io_rOut, i_rMovie, *pFormat ) );
}

}
