#include "CoreVideoUtils/FrameSize.h"
#include "FileIO/RapidAVI/StreamFormats.h"
#include "StageCoreRuntime/GlobalLog.h"

#include <algorithm>
#include <limits>
#include <numeric>

namespace RapidAVI
{

namespace
{

using KVZ::IPixelFormat;

struct VPixelRow
{
  IPixelFormat::Enum m_Format;
  uint16_t m_BitCount;
  VFourCC m_Tag{};   // zero for a bitmap
  bool m_bPalette = false;
  bool m_bAlwaysTopDown = false;   // whatever the height's sign says
};

constexpr std::array PixelRows = {
  VPixelRow{ IPixelFormat::ELuminance8, 8, {}, true },
  VPixelRow{ IPixelFormat::EBayerRG8, 8, {}, true },
  VPixelRow{ IPixelFormat::EBayerGB8, 8, {}, true },
  VPixelRow{ IPixelFormat::EBayerGR8, 8, {}, true },
  VPixelRow{ IPixelFormat::EBayerBG8, 8, {}, true },
  VPixelRow{ IPixelFormat::ER5G6B5, 16 },
  VPixelRow{ IPixelFormat::ER8G8B8, 24 },
  VPixelRow{ IPixelFormat::EB8G8R8, 24 },
  VPixelRow{ IPixelFormat::ER8G8B8u8, 32 },
  VPixelRow{ IPixelFormat::EB8G8R8u8, 32 },
  VPixelRow{ IPixelFormat::EU8Y8V8Y8, 16, FourCC( "UYVY" ), false, true },
  VPixelRow{ IPixelFormat::EY8U8Y8V8, 16, FourCC( "YUY2" ), false, true },
  VPixelRow{ IPixelFormat::EU10Y10V10Y10, 20, {}, false, true },
  VPixelRow{ IPixelFormat::EBayerGB7, 7 },
  VPixelRow{ IPixelFormat::EBayerGB6, 6 },
  VPixelRow{ IPixelFormat::ELuminance7, 7 },
  VPixelRow{ IPixelFormat::ELuminance6, 6 },
};
static_assert( PixelRows.size() == KVZ::PixelFormatCount - 1 );

VPixelRow FindRow( IPixelFormat::Enum i_Format )
{
  const auto Found = std::find_if( PixelRows.begin(), PixelRows.end(), [&]( const VPixelRow& i_rRow ) { return i_rRow.m_Format == i_Format; } );
  return Found == PixelRows.end() ? VPixelRow{ i_Format, 0 } : *Found;
}

bool IsJPEG( const VFileDescription& i_rFile ) { return i_rFile.m_VideoPayload == KVZ::IVideoPayload::EImageJPEG; }

bool IsRateKnown( const VFileDescription& i_rFile ) { return i_rFile.m_Timing.m_TicksPerSecond != 0 && i_rFile.m_Timing.m_FramePeriodInTicks != 0; }

}

uint64_t GetFrameBytes( const VFileDescription& i_rFile ) { return CoreVideoUtils::GetFrameSize( i_rFile.m_Video ); }

uint64_t GetMicrosecondsPerFrame( const VFileDescription& i_rFile )
{
  return IsRateKnown( i_rFile ) ? uint64_t{ 1000000 } * i_rFile.m_Timing.m_FramePeriodInTicks / i_rFile.m_Timing.m_TicksPerSecond : 0;
}

// Of a frame that fits its own field, so that the product fits 64 bits.
uint32_t GetMaxBytesPerSecond( const VFileDescription& i_rFile )
{
  const KVZ::VTimingRecord& rTiming = i_rFile.m_Timing;
  const uint64_t Bytes = IsRateKnown( i_rFile ) ? GetFrameBytes( i_rFile ) * rTiming.m_TicksPerSecond / rTiming.m_FramePeriodInTicks : 0;
  return static_cast<uint32_t>( std::min<uint64_t>( Bytes, std::numeric_limits<uint32_t>::max() ) );
}

VFourCC GetVideoChunkId( const VFileDescription& i_rFile )
{
  return i_rFile.m_VideoPayload == KVZ::IVideoPayload::EUncompressed ? FourCC( "00db" ) : FourCC( "00dc" );
}

VStreamHeader MakeVideoStreamHeader( const VFileDescription& i_rFile )
{
  const KVZ::VTimingRecord& rTiming = i_rFile.m_Timing;
  if( !IsRateKnown( i_rFile ) )
  {
    KVZ_LOG_WARNING( "RapidAVI", "The frame rate is not known: readers will take one of their own." );
  }
  const uint32_t Divisor = std::max( std::gcd( rTiming.m_TicksPerSecond, rTiming.m_FramePeriodInTicks ), 1u );
  VStreamHeader Header;
  Header.m_Type = FourCC( "vids" );
  Header.m_Handler = IsJPEG( i_rFile ) ? FourCC( "mjpg" ) : FindRow( i_rFile.m_Video.m_PixelFormat ).m_Tag;
  Header.m_Scale = rTiming.m_FramePeriodInTicks / Divisor;
  Header.m_Rate = rTiming.m_TicksPerSecond / Divisor;
  Header.m_SuggestedBufferSize = static_cast<uint32_t>( GetFrameBytes( i_rFile ) );
  Header.m_Right = static_cast<uint16_t>( i_rFile.m_Video.m_ImageWidth );
  Header.m_Bottom = static_cast<uint16_t>( i_rFile.m_Video.m_ImageHeight );
  return Header;
}

WriterSupport::VBitmapHeader MakeBitmapHeader( const VFileDescription& i_rFile )
{
  const VPixelRow Row = FindRow( i_rFile.m_Video.m_PixelFormat );
  if( Row.m_bAlwaysTopDown && i_rFile.m_Video.m_bInverted )
  {
    KVZ_LOG_WARNING( "AVIIO", "YUV-based pixel formats in bottom-up order cannot be stored correctly in AVI.  Video will be upside-down." );
  }
  const bool bNegativeHeight = !i_rFile.m_Video.m_bInverted && !Row.m_bAlwaysTopDown && !IsJPEG( i_rFile );
  const auto Height = static_cast<int32_t>( i_rFile.m_Video.m_ImageHeight );
  WriterSupport::VBitmapHeader Header;
  Header.m_Width = static_cast<int32_t>( i_rFile.m_Video.m_ImageWidth );
  Header.m_Height = bNegativeHeight ? -Height : Height;
  Header.m_BitCount = Row.m_BitCount;
  Header.m_Compression = IsJPEG( i_rFile ) ? FourCC( "MJPG" ) : Row.m_Tag;
  Header.m_ImageSize = static_cast<uint32_t>( GetFrameBytes( i_rFile ) );
  return Header;
}

boost::optional<VPalette> MakePalette( const VFileDescription& i_rFile )
{
  if( i_rFile.m_VideoPayload != KVZ::IVideoPayload::EUncompressed || !FindRow( i_rFile.m_Video.m_PixelFormat ).m_bPalette )
  {
    return boost::none;
  }
  VPalette Palette;
  for( size_t Grey = 0; Grey < Palette.size(); ++Grey )
  {
    Palette[Grey].fill( static_cast<uint8_t>( Grey ) );
  }
  return Palette;
}

}
