// Images, and what the two converters make of them.
#pragma once

#include "CoreVideoUtils/PixelFormatConverter.h"
#include "CoreVideoUtilsOpenGL/PixelFormatConverterOpenGL.h"
#include "tests/support/LogCapture.h"
#include "tests/support/TestFrames.h"

#include <gtest/gtest.h>

#include <algorithm>
#include <array>
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
using KVZ::VLensDistortionRecord;
using TestSupport::VBytes;

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
  const KVZ::VideoFrameInfo Info = TestSupport::VideoInfo( i_Format, i_Width, i_Height );
  return { Info, VBytes( SizeOf( i_Format, Info ) ) };
}

inline VImage MakeNoise( IPixelFormat::Enum i_Format, uint32_t i_Width, uint32_t i_Height )
{
  std::mt19937 Random( i_Width * 31 + i_Height );
  VImage Image = MakeImage( i_Format, i_Width, i_Height );
  Image.m_Bytes = TestSupport::Noise( Image.m_Bytes.size(), Random() );
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

inline VLensDistortionRecord MakeLensRecord( std::array<double, 2> i_Centre, std::array<double, 3> i_Parameters )
{
  return { VLensDistortionRecord::ETarvo3Parameter, i_Centre, i_Parameters };
}

inline void SetLens( VPixelFormatConverterOpenGL& i_rConverter, const VLensDistortionRecord& i_rLens )
{
  i_rConverter.SetLensCorrection( i_rLens );
  i_rConverter.SetLensCorrectionEnabled( true );
}

inline VBytes Corrected( const VImage& i_rImage, IPixelFormat::Enum i_Target, const VLensDistortionRecord& i_rLens )
{
  VPixelFormatConverterOpenGL Converter( {} );
  SetLens( Converter, i_rLens );
  return Convert( Converter, i_rImage, i_Target ).value_or( VBytes() );
}

// The largest difference of two images; 256 where they are not of one size. A fourth byte that is no colour must be a half in the second one.
inline int LargestDifference( const VBytes& i_rExpected, const VBytes& i_rDrawn, bool i_bFourthByte = false )
{
  int Largest = i_rExpected.size() == i_rDrawn.size() && !i_rExpected.empty() ? 0 : 256;
  for( size_t Index = 0; Largest != 256 && Index < i_rDrawn.size(); ++Index )
  {
    const int Drawn = i_rDrawn[Index];
    const bool bColour = !i_bFourthByte || Index % 4 != 3;
    Largest = std::max( Largest, bColour ? std::abs( i_rExpected[Index] - Drawn ) : ( Drawn == 127 || Drawn == 128 ? 0 : 256 ) );
  }
  return Largest;
}

inline size_t CountBeginningWith( const TestSupport::VLogCapture& i_rLog, const std::string& i_rText )
{
  const auto Texts = i_rLog.Texts();
  return static_cast<size_t>(
    std::count_if( Texts.begin(), Texts.end(), [&]( const std::string& i_rLine ) { return i_rLine.compare( 0, i_rText.size(), i_rText ) == 0; } ) );
}

}
