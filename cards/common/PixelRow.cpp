#include "cards/common/PixelRow.h"

#include <algorithm>
#include <array>
#include <cstring>

namespace VirtualCards
{

namespace
{

using KVZ::IPixelFormat;

constexpr uint32_t V210GroupPixels = 6;
constexpr uint32_t V210GroupBytes = 16;

enum class EFirst
{
  Luma,
  Chroma
};

void Encode422( std::span<const VColour> i_Pixels, EFirst i_First, uint8_t* o_pBytes )
{
  const size_t LumaPlace = i_First == EFirst::Luma ? 0 : 1;
  for( size_t i = 0; i < i_Pixels.size(); ++i, o_pBytes += 2 )
  {
    const VColour& rPair = i_Pixels[i & ~size_t{ 1 }];
    o_pBytes[1 - LumaPlace] = i % 2 == 0 ? rPair.m_Cb : rPair.m_Cr;
    o_pBytes[LumaPlace] = i_Pixels[i].m_Y;
  }
}

// i_PixelBytes is 3, or 4 with an opaque fourth byte.
void EncodeRGB( std::span<const VColour> i_Pixels, uint32_t i_PixelBytes, uint8_t* o_pBytes )
{
  for( const VColour& rPixel : i_Pixels )
  {
    const uint8_t Bytes[4] = { rPixel.m_Red, rPixel.m_Green, rPixel.m_Blue, 255 };
    std::memcpy( o_pBytes, Bytes, i_PixelBytes );
    o_pBytes += i_PixelBytes;
  }
}

void EncodeBGR( std::span<const VColour> i_Pixels, uint32_t i_PixelBytes, uint8_t* o_pBytes )
{
  for( const VColour& rPixel : i_Pixels )
  {
    const uint8_t Bytes[4] = { rPixel.m_Blue, rPixel.m_Green, rPixel.m_Red, 255 };
    std::memcpy( o_pBytes, Bytes, i_PixelBytes );
    o_pBytes += i_PixelBytes;
  }
}

void EncodeLuma( std::span<const VColour> i_Pixels, uint8_t* o_pBytes )
{
  for( const VColour& rPixel : i_Pixels )
  {
    *o_pBytes++ = rPixel.m_Y;
  }
}

// Six pixels in four little-endian words of three 10-bit components: Cb Y Cr, Y Cb Y, Cr Y Cb, Y Cr Y.
void EncodeV210( std::span<const VColour> i_Pixels, uint8_t* o_pBytes )
{
  for( size_t Start = 0; Start < i_Pixels.size(); Start += V210GroupPixels )
  {
    std::array<uint32_t, 12> Components{};
    const size_t Count = std::min<size_t>( V210GroupPixels, i_Pixels.size() - Start );
    for( size_t i = 0; i < Count; ++i )
    {
      const VColour& rPair = i_Pixels[Start + ( i & ~size_t{ 1 } )];
      Components[2 * i] = ( i % 2 == 0 ? rPair.m_Cb : rPair.m_Cr ) * 4u;
      Components[2 * i + 1] = i_Pixels[Start + i].m_Y * 4u;
    }
    for( size_t Word = 0; Word < 4; ++Word )
    {
      const uint32_t Value = Components[3 * Word] | Components[3 * Word + 1] << 10 | Components[3 * Word + 2] << 20;
      std::memcpy( o_pBytes, &Value, sizeof( Value ) );
      o_pBytes += sizeof( Value );
    }
  }
}

uint8_t Round( double i_Value )
{
  return static_cast<uint8_t>( i_Value + 0.5 );   // of full-range colours, all three stay within 16 to 240
}

}

VColour MakeColour( uint8_t i_Red, uint8_t i_Green, uint8_t i_Blue, uint32_t i_Lines )
{
  const double Kr = i_Lines > 576 ? 0.2126 : 0.299;
  const double Kb = i_Lines > 576 ? 0.0722 : 0.114;
  const double Luma = Kr * i_Red + ( 1.0 - Kr - Kb ) * i_Green + Kb * i_Blue;
  VColour Colour{ i_Red, i_Green, i_Blue, 16, 128, 128 };
  Colour.m_Y = Round( 16.0 + 219.0 * Luma / 255.0 );
  Colour.m_Cb = Round( 128.0 + 112.0 * ( i_Blue - Luma ) / ( 1.0 - Kb ) / 255.0 );
  Colour.m_Cr = Round( 128.0 + 112.0 * ( i_Red - Luma ) / ( 1.0 - Kr ) / 255.0 );
  return Colour;
}

uint32_t BytesOf( IPixelFormat::Enum i_Format, uint32_t i_Pixels )
{
  switch( i_Format )
  {
    case IPixelFormat::ELuminance8: return i_Pixels;
    case IPixelFormat::EU8Y8V8Y8:
    case IPixelFormat::EY8U8Y8V8: return i_Pixels * 2;
    case IPixelFormat::ER8G8B8:
    case IPixelFormat::EB8G8R8: return i_Pixels * 3;
    case IPixelFormat::ER8G8B8u8:
    case IPixelFormat::EB8G8R8u8: return i_Pixels * 4;
    case IPixelFormat::EU10Y10V10Y10: return ( i_Pixels + V210GroupPixels - 1 ) / V210GroupPixels * V210GroupBytes;
    default: return 0;
  }
}

uint32_t RowBytes( IPixelFormat::Enum i_Format, uint32_t i_Width )
{
  return i_Format == IPixelFormat::EU10Y10V10Y10 ? ( i_Width + 47 ) / 48 * 128 : BytesOf( i_Format, i_Width );
}

uint32_t PixelGroup( IPixelFormat::Enum i_Format )
{
  switch( i_Format )
  {
    case IPixelFormat::EU8Y8V8Y8:
    case IPixelFormat::EY8U8Y8V8: return 2;
    case IPixelFormat::EU10Y10V10Y10: return V210GroupPixels;
    default: return 1;
  }
}

void EncodePixels( IPixelFormat::Enum i_Format, std::span<const VColour> i_Pixels, uint8_t* o_pBytes )
{
  switch( i_Format )
  {
    case IPixelFormat::ELuminance8: EncodeLuma( i_Pixels, o_pBytes ); break;
    case IPixelFormat::EU8Y8V8Y8: Encode422( i_Pixels, EFirst::Chroma, o_pBytes ); break;
    case IPixelFormat::EY8U8Y8V8: Encode422( i_Pixels, EFirst::Luma, o_pBytes ); break;
    case IPixelFormat::EU10Y10V10Y10: EncodeV210( i_Pixels, o_pBytes ); break;
    case IPixelFormat::ER8G8B8: EncodeRGB( i_Pixels, 3, o_pBytes ); break;
    case IPixelFormat::ER8G8B8u8: EncodeRGB( i_Pixels, 4, o_pBytes ); break;
    case IPixelFormat::EB8G8R8: EncodeBGR( i_Pixels, 3, o_pBytes ); break;
    case IPixelFormat::EB8G8R8u8: EncodeBGR( i_Pixels, 4, o_pBytes ); break;
    default: break;
  }
}

}
