// Images, and what the two converters make of them.
#pragma once

#include "CoreVideoUtils/PixelFormatConverter.h"
#include "CoreVideoUtilsOpenGL/PixelFormatConverterOpenGL.h"

#include <gtest/gtest.h>

#include <algorithm>
#include <cstdlib>
#include <cstring>
#include <optional>
#include <random>
#include <string>
#include <vector>

namespace OpenGLTests
{

using CoreVideoUtilsOpenGL::EUse;
using CoreVideoUtilsOpenGL::VPixelFormatConverterOpenGL;
using KVZ::IPixelFormat;
using VBytes = std::vector<uint8_t>;

// Another value of a variable while it lives.
class VOtherVariable
{
public:
  VOtherVariable( const char* i_pName, const char* i_pValue ) : m_pName( i_pName )
  {
    if( const char* const pFormer = std::getenv( i_pName ) )
    {
      m_Former = pFormer;
    }
    setenv( i_pName, i_pValue, 1 );
  }
  ~VOtherVariable() { m_Former ? setenv( m_pName, m_Former->c_str(), 1 ) : unsetenv( m_pName ); }
  VOtherVariable( const VOtherVariable& ) = delete;
  VOtherVariable& operator=( const VOtherVariable& ) = delete;

private:
  const char* const m_pName;
  std::optional<std::string> m_Former;
};

struct VImage
{
  KVZ::VideoFrameInfo m_Info;
  VBytes m_Bytes;
};

inline size_t SizeOf( IPixelFormat::Enum i_Format, const KVZ::VideoFrameInfo& i_rInfo )
{
  return static_cast<size_t>( KVZ::GetImageSize( i_Format, i_rInfo.m_ImageWidth, i_rInfo.m_ImageHeight ) );
}

inline VImage MakeImage( IPixelFormat::Enum i_Format, uint32_t i_Width, uint32_t i_Height )
{
  VImage Image;
  Image.m_Info.m_PixelFormat = i_Format;
  Image.m_Info.m_ImageWidth = i_Width;
  Image.m_Info.m_ImageHeight = i_Height;
  Image.m_Bytes.resize( SizeOf( i_Format, Image.m_Info ) );
  return Image;
}

inline VImage MakeNoise( IPixelFormat::Enum i_Format, uint32_t i_Width, uint32_t i_Height )
{
  std::mt19937 Random( i_Width * 31 + i_Height );
  VImage Image = MakeImage( i_Format, i_Width, i_Height );
  for( uint8_t& rByte : Image.m_Bytes )
  {
    rByte = static_cast<uint8_t>( Random() >> 8 );
  }
  if( i_Format == IPixelFormat::EU8Y8V8Y8 || i_Format == IPixelFormat::EY8U8Y8V8 )
  {
    std::replace( Image.m_Bytes.begin(), Image.m_Bytes.end(), uint8_t{ 0 }, uint8_t{ 1 } );   // the signal's timing, as below
  }
  if( i_Format == IPixelFormat::EU10Y10V10Y10 )
  {
    // Codes 0 to 3 and 1020 to 1023 carry the signal's timing and no picture.
    for( size_t Byte = 0; Byte < Image.m_Bytes.size(); Byte += 4 )
    {
      uint32_t Word = 0;
      for( int Value = 0; Value < 3; ++Value )
      {
        Word = Word << 10 | ( 4 + Random() % 1016 );
      }
      std::memcpy( &Image.m_Bytes[Byte], &Word, sizeof( Word ) );
    }
  }
  return Image;
}

inline std::optional<VBytes> Convert( KVZ::IPixelFormatConverter& i_rConverter, const VImage& i_rImage, IPixelFormat::Enum i_Target )
{
  VBytes Target( SizeOf( i_Target, i_rImage.m_Info ) );
  const bool bDone = i_rConverter.Convert( i_rImage.m_Info, i_rImage.m_Bytes.data(), i_rImage.m_Bytes.size(), i_Target, Target.data(),
    Target.size() );
  return bDone ? std::optional( Target ) : std::nullopt;
}

inline VBytes InSoftware( const VImage& i_rImage, IPixelFormat::Enum i_Target, const KVZ::VColourRecord& i_rColour = {} )
{
  CoreVideoUtils::VPixelFormatConverter Converter;
  Converter.SetColourCorrection( i_rColour );
  return Convert( Converter, i_rImage, i_Target ).value_or( VBytes() );
}

// With a converter of its own. Empty where it was refused.
inline VBytes InOpenGL( const VImage& i_rImage, IPixelFormat::Enum i_Target, const KVZ::VColourRecord& i_rColour = {} )
{
  VPixelFormatConverterOpenGL Converter( {} );
  Converter.SetColourCorrection( i_rColour );
  return Convert( Converter, i_rImage, i_Target ).value_or( VBytes() );
}

// Colour formats with a fourth byte have nothing to compare there.
inline bool HasFourthByte( IPixelFormat::Enum i_Format ) { return i_Format == IPixelFormat::ER8G8B8u8 || i_Format == IPixelFormat::EB8G8R8u8; }

// The largest difference of two images of the same format; 256 where they are not of one size.
inline int LargestDifference( const VBytes& i_rA, const VBytes& i_rB, bool i_bFourthByte = false )
{
  int Largest = i_rA.size() == i_rB.size() && !i_rA.empty() ? 0 : 256;
  for( size_t Index = 0; Largest != 256 && Index < i_rA.size(); ++Index )
  {
    if( !i_bFourthByte || Index % 4 != 3 )
    {
      Largest = std::max( Largest, std::abs( i_rA[Index] - i_rB[Index] ) );
    }
  }
  return Largest;
}

}
