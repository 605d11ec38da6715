// The conversions of whole images that the software converter chooses from. No state, any thread.
#pragma once

#include "Core/VideoInterface/PixelFormat.h"
#include "CoreVideoUtils/ColourCorrector.h"

#include <cstddef>
#include <cstdint>
#include <initializer_list>

namespace CoreVideoUtils
{

// A bit for each format
using VFormatSet = uint32_t;
static_assert( KVZ::PixelFormatCount <= 32 );

constexpr VFormatSet MakeFormatSet( std::initializer_list<KVZ::IPixelFormat::Enum> i_Formats )
{
  VFormatSet Set = 0;
  for( const KVZ::IPixelFormat::Enum Format : i_Formats )
  {
    Set |= VFormatSet{ 1 } << Format;
  }
  return Set;
}

constexpr bool Contains( VFormatSet i_Set, KVZ::IPixelFormat::Enum i_Format )
{
  return i_Format >= 0 && i_Format < KVZ::PixelFormatCount && ( i_Set >> i_Format & 1 ) != 0;
}

constexpr VFormatSet RgbFormats = MakeFormatSet(
  { KVZ::IPixelFormat::ER8G8B8, KVZ::IPixelFormat::EB8G8R8, KVZ::IPixelFormat::ER8G8B8u8, KVZ::IPixelFormat::EB8G8R8u8 } );
constexpr VFormatSet PairFormats = MakeFormatSet( { KVZ::IPixelFormat::EU8Y8V8Y8, KVZ::IPixelFormat::EY8U8Y8V8 } );
constexpr VFormatSet YuvFormats = PairFormats | MakeFormatSet( { KVZ::IPixelFormat::EU10Y10V10Y10 } );
constexpr VFormatSet BayerFormats = MakeFormatSet(
  { KVZ::IPixelFormat::EBayerRG8, KVZ::IPixelFormat::EBayerGB8, KVZ::IPixelFormat::EBayerGR8, KVZ::IPixelFormat::EBayerBG8 } );
constexpr VFormatSet PackedBayerFormats = MakeFormatSet( { KVZ::IPixelFormat::EBayerGB7, KVZ::IPixelFormat::EBayerGB6 } );
constexpr VFormatSet PackedLuminanceFormats = MakeFormatSet( { KVZ::IPixelFormat::ELuminance7, KVZ::IPixelFormat::ELuminance6 } );

struct VConversion
{
  KVZ::IPixelFormat::Enum m_Source = KVZ::IPixelFormat::EUnspecified;
  KVZ::IPixelFormat::Enum m_Target = KVZ::IPixelFormat::EUnspecified;
  uint32_t m_Width = 0;    // pixels
  uint32_t m_Height = 0;   // rows
  const uint8_t* m_pSource = nullptr;
  uint8_t* m_pTarget = nullptr;
  uint64_t m_TargetSize = 0;   // bytes, no less than the image's
  VColourCorrector m_Corrector{};
};

// Each gives false, with nothing written, for formats that are not its own; those for 4:2:2 and for ten bits say so in the log.

// R8G8B8, B8G8R8, R8G8B8u8, B8G8R8u8, R5G6B5, Luminance8 to the first four and to Luminance8.
bool ConvertColour( const VConversion& i_rConversion );
// U8Y8V8Y8, Y8U8Y8V8, U10Y10V10Y10 to R8G8B8, B8G8R8, R8G8B8u8, B8G8R8u8, Luminance8.
bool ConvertFromYuv( const VConversion& i_rConversion );
// What ConvertColour takes, and U10Y10V10Y10, to U8Y8V8Y8 and Y8U8Y8V8.
bool ConvertToPairs( const VConversion& i_rConversion );
// U8Y8V8Y8 and Y8U8Y8V8 to U10Y10V10Y10.
bool ConvertToTenBits( const VConversion& i_rConversion );
// U8Y8V8Y8 to Y8U8Y8V8 and back.
bool SwapPairs( const VConversion& i_rConversion );
// Bayer formats of 8 bits to all that DemosaicRow writes; colour correction for the targets in red, green and blue.
bool Demosaic( const VConversion& i_rConversion );
// Bayer formats of 8 bits to Luminance8; what lies outside the image counts as 0. False also where the target is larger than the image.
bool FilterBayer( const VConversion& i_rConversion );
// Formats of 8 bits a pixel to those of 7 and 6, and back.
bool PackPixels( const VConversion& i_rConversion );
bool UnpackPixels( const VConversion& i_rConversion );

}
