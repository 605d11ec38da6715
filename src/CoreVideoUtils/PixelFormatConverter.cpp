#include "CoreVideoUtils/PixelFormatConverter.h"

#include "CoreVideoUtils/PixelConversions.h"
#include "StageCoreRuntime/GlobalLog.h"

#include <boost/thread/lock_guard.hpp>

#include <algorithm>
#include <array>
#include <memory>

namespace CoreVideoUtils
{

namespace
{

using KVZ::IPixelFormat;

bool ConvertUnpacked( const VConversion& i_rConversion );

struct VRow
{
  VFormatSet m_Targets;
  VFormatSet m_Sources;
  bool ( *m_pConvert )( const VConversion& );
};

constexpr VFormatSet Luminance8 = MakeFormatSet( { IPixelFormat::ELuminance8 } );
constexpr VFormatSet BayerGB8 = MakeFormatSet( { IPixelFormat::EBayerGB8 } );
constexpr VFormatSet Colour16 = MakeFormatSet( { IPixelFormat::ER5G6B5 } );
constexpr VFormatSet U8Y8V8Y8 = MakeFormatSet( { IPixelFormat::EU8Y8V8Y8 } );
constexpr VFormatSet Y8U8Y8V8 = MakeFormatSet( { IPixelFormat::EY8U8Y8V8 } );
constexpr VFormatSet TenBits = MakeFormatSet( { IPixelFormat::EU10Y10V10Y10 } );
constexpr VFormatSet R8G8B8 = MakeFormatSet( { IPixelFormat::ER8G8B8 } );
constexpr VFormatSet PackedFormats = PackedBayerFormats | PackedLuminanceFormats;

// All that can be converted, but for equal formats.
constexpr std::array Rows = {
  VRow{ Luminance8, RgbFormats, &ConvertColour },
  VRow{ Luminance8, YuvFormats, &ConvertFromYuv },
  VRow{ Luminance8, BayerFormats, &FilterBayer },
  VRow{ Luminance8, PackedLuminanceFormats, &UnpackPixels },
  VRow{ Luminance8, PackedBayerFormats, &ConvertUnpacked },

  VRow{ BayerGB8, PackedBayerFormats, &UnpackPixels },

  VRow{ RgbFormats, RgbFormats | Colour16 | Luminance8, &ConvertColour },
  VRow{ RgbFormats, YuvFormats, &ConvertFromYuv },
  VRow{ RgbFormats, BayerFormats, &Demosaic },
  VRow{ RgbFormats, PackedFormats, &ConvertUnpacked },

  VRow{ U8Y8V8Y8, RgbFormats | Colour16 | Luminance8 | TenBits, &ConvertToPairs },
  VRow{ U8Y8V8Y8, Y8U8Y8V8, &SwapPairs },
  VRow{ U8Y8V8Y8, BayerFormats, &Demosaic },
  VRow{ U8Y8V8Y8, PackedFormats, &ConvertUnpacked },

  VRow{ Y8U8Y8V8, R8G8B8, &ConvertToPairs },
  VRow{ Y8U8Y8V8, U8Y8V8Y8, &SwapPairs },

  VRow{ TenBits, PairFormats, &ConvertToTenBits },

  VRow{ PackedBayerFormats, BayerGB8, &PackPixels },
  VRow{ PackedLuminanceFormats, Luminance8, &PackPixels },
};

bool ConvertByTable( const VConversion& i_rConversion )
{
  const auto* const pRow = std::find_if( Rows.begin(), Rows.end(),
    [&]( const VRow& i_rRow )
    { return Contains( i_rRow.m_Targets, i_rConversion.m_Target ) && Contains( i_rRow.m_Sources, i_rConversion.m_Source ); } );
  return pRow != Rows.end() && pRow->m_pConvert( i_rConversion );
}

// By way of the same image with a byte a pixel.
bool ConvertUnpacked( const VConversion& i_rConversion )
{
  VConversion Unpack = i_rConversion;
  Unpack.m_Target = Contains( PackedBayerFormats, i_rConversion.m_Source ) ? IPixelFormat::EBayerGB8 : IPixelFormat::ELuminance8;
  Unpack.m_TargetSize = KVZ::GetImageSize( Unpack.m_Target, Unpack.m_Width, Unpack.m_Height );
  const std::unique_ptr<uint8_t[]> pImage( new uint8_t[Unpack.m_TargetSize] );
  Unpack.m_pTarget = pImage.get();
  VConversion Convert = i_rConversion;
  Convert.m_Source = Unpack.m_Target;
  Convert.m_pSource = Unpack.m_pTarget;
  return UnpackPixels( Unpack ) && ConvertByTable( Convert );
}

// Frame encoders set these once a frame, so the message is one for those who look closely.
void LogLensCorrection() { KVZ_LOG_DETAIL( "CoreVideoUtils", "Lens distortion correction not supported in software converter." ); }

}

bool VPixelFormatConverter::Convert( const KVZ::VideoFrameInfo& i_rSourceInfo, const uint8_t* i_pSource, size_t i_SourceSize,
  KVZ::IPixelFormat::Enum i_Target, uint8_t* o_pTarget, size_t i_TargetSize )
{
  const uint32_t Width = i_rSourceInfo.m_ImageWidth;
  const uint32_t Height = i_rSourceInfo.m_ImageHeight;
  const uint64_t SourceSize = KVZ::GetImageSize( i_rSourceInfo.m_PixelFormat, Width, Height );
  if( i_SourceSize < SourceSize || i_TargetSize < KVZ::GetImageSize( i_Target, Width, Height ) )
  {
    return false;
  }
  if( i_rSourceInfo.m_PixelFormat == i_Target )
  {
    std::copy_n( i_pSource, SourceSize, o_pTarget );
    return true;
  }
  return ConvertByTable( { i_rSourceInfo.m_PixelFormat, i_Target, Width, Height, i_pSource, o_pTarget, i_TargetSize, ColourCorrector() } );
}

void VPixelFormatConverter::SetColourCorrection( const KVZ::VColourRecord& i_rColour )
{
  boost::lock_guard<boost::mutex> Lock( m_Mutex );
  m_ColourCorrector.SetColourCorrection( i_rColour );
}

void VPixelFormatConverter::SetLensCorrection( const KVZ::VLensDistortionRecord& ) { LogLensCorrection(); }

void VPixelFormatConverter::SetLensCorrectionEnabled( bool ) { LogLensCorrection(); }

VColourCorrector VPixelFormatConverter::ColourCorrector() const
{
  boost::lock_guard<boost::mutex> Lock( m_Mutex );
  return m_ColourCorrector;
}

}
