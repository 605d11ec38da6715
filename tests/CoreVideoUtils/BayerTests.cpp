#include "CoreVideoUtils/PixelFormatConverter.h"
#include "tests/support/TestFrames.h"

#include <gtest/gtest.h>

#include <cmath>

using KVZ::IPixelFormat;

namespace
{

using TestSupport::VBytes;

// How the patterns are moved against one that begins with red, in the words of the shader that does the same on the graphics card
struct VPattern
{
  IPixelFormat::Enum m_Format;
  int m_FirstRedX;
  int m_FirstRedY;
};
constexpr VPattern Patterns[] = { { IPixelFormat::EBayerRG8, 0, 0 }, { IPixelFormat::EBayerGB8, 0, 1 }, { IPixelFormat::EBayerGR8, 1, 0 },
  { IPixelFormat::EBayerBG8, 1, 1 } };

struct VImage
{
  int m_Width;
  int m_Height;
  VBytes m_Bytes;

  // The nearest pixel of the image
  double At( int i_X, int i_Y ) const
  {
    const int X = std::clamp( i_X, 0, m_Width - 1 );
    const int Y = std::clamp( i_Y, 0, m_Height - 1 );
    return m_Bytes[static_cast<size_t>( Y * m_Width + X )];
  }
};

VBytes Convert( const VImage& i_rImage, IPixelFormat::Enum i_Source, IPixelFormat::Enum i_Target, const KVZ::VColourRecord& i_rColour = {} )
{
  CoreVideoUtils::VPixelFormatConverter Converter;
  Converter.SetColourCorrection( i_rColour );
  const auto Info = TestSupport::VideoInfo( i_Source, static_cast<uint32_t>( i_rImage.m_Width ), static_cast<uint32_t>( i_rImage.m_Height ) );
  VBytes Target( static_cast<size_t>( KVZ::GetImageSize( i_Target, Info.m_ImageWidth, Info.m_ImageHeight ) ) );
  EXPECT_TRUE( Converter.Convert( Info, i_rImage.m_Bytes.data(), i_rImage.m_Bytes.size(), i_Target, Target.data(), Target.size() ) );
  return Target;
}

VImage MakeNoise( int i_Width, int i_Height ) { return { i_Width, i_Height, TestSupport::Noise( static_cast<size_t>( i_Width * i_Height ), 5 ) }; }

// What a pixel of the pattern shows: 0 red, 1 green, 2 blue.
int ChannelAt( const VPattern& i_rPattern, int i_X, int i_Y )
{
  const bool bRedRow = ( i_Y + i_rPattern.m_FirstRedY ) % 2 == 0;
  const bool bRedColumn = ( i_X + i_rPattern.m_FirstRedX ) % 2 == 0;
  return bRedRow != bRedColumn ? 1 : ( bRedRow ? 0 : 2 );
}

// A scene of one colour, as the pattern sees it
VImage MakeFlat( const VPattern& i_rPattern, int i_Width, int i_Height, const std::array<uint8_t, 3>& i_rColour )
{
  VImage Image = { i_Width, i_Height, {} };
  for( int Y = 0; Y < i_Height; ++Y )
  {
    for( int X = 0; X < i_Width; ++X )
    {
      Image.m_Bytes.push_back( i_rColour[static_cast<size_t>( ChannelAt( i_rPattern, X, Y ) )] );
    }
  }
  return Image;
}

// The filter as the shader computes it, in floating point
std::array<double, 3> Shade( const VImage& i_rImage, const VPattern& i_rPattern, int i_X, int i_Y )
{
  const auto At = [&]( int i_Column, int i_Row ) { return i_rImage.At( i_X + i_Column, i_Y + i_Row ); };
  const double C = At( 0, 0 );
  const double D = At( -1, -1 ) + At( 1, -1 ) + At( -1, 1 ) + At( 1, 1 );
  const double A = At( 0, -2 ) + At( 0, 2 );
  const double B = At( 0, -1 ) + At( 0, 1 );
  const double E = At( -2, 0 ) + At( 2, 0 );
  const double F = At( -1, 0 ) + At( 1, 0 );
  const double PX = ( 4.0 * C - 1.0 * A - 1.0 * E + 2.0 * B + 2.0 * F ) / 8;
  const double PY = ( 6.0 * C + 2.0 * D - 1.5 * A - 1.5 * E ) / 8;
  const double PZ = ( 5.0 * C - 1.0 * D + 0.5 * A - 1.0 * E + 4.0 * F ) / 8;
  const double PW = ( 5.0 * C - 1.0 * D - 1.0 * A + 0.5 * E + 4.0 * B ) / 8;
  const bool bEvenX = ( i_X + i_rPattern.m_FirstRedX ) % 2 == 0;
  const bool bEvenY = ( i_Y + i_rPattern.m_FirstRedY ) % 2 == 0;
  if( bEvenY )
  {
    return bEvenX ? std::array{ C, PX, PY } : std::array{ PZ, C, PW };
  }
  return bEvenX ? std::array{ PW, C, PZ } : std::array{ PY, PX, C };
}

TEST( Bayer, DemosaicEqualsTheShadersFilterToTheEdges )
{
  for( const VImage& rImage : { MakeNoise( 75, 9 ), MakeNoise( 1, 1 ), MakeNoise( 2, 7 ), MakeNoise( 3, 1 ) } )
  {
    for( const VPattern& rPattern : Patterns )
    {
      const VBytes Colours = Convert( rImage, rPattern.m_Format, IPixelFormat::ER8G8B8 );
      for( size_t Byte = 0; Byte < Colours.size(); ++Byte )
      {
        const int Pixel = static_cast<int>( Byte / 3 );
        const double Exact = Shade( rImage, rPattern, Pixel % rImage.m_Width, Pixel / rImage.m_Width )[Byte % 3];
        ASSERT_EQ( std::floor( std::clamp( Exact, 0.0, 255.0 ) + 0.5 ), Colours[Byte] ) << rPattern.m_Format << ", byte " << Byte;
      }
    }
  }
}

TEST( Bayer, AFlatSceneKeepsItsColour )
{
  const std::array<uint8_t, 3> Colour = { 200, 100, 51 };
  for( const VPattern& rPattern : Patterns )
  {
    const VImage Image = MakeFlat( rPattern, 40, 12, Colour );
    const VBytes Colours = Convert( Image, rPattern.m_Format, IPixelFormat::EB8G8R8u8 );
    const VBytes Grey = Convert( Image, rPattern.m_Format, IPixelFormat::ELuminance8 );
    for( int Y = 2; Y < Image.m_Height - 2; ++Y )
    {
      for( int X = 2; X < Image.m_Width - 2; ++X )
      {
        const auto Pixel = static_cast<size_t>( Y * Image.m_Width + X );
        ASSERT_EQ( ( VBytes{ 51, 100, 200, 255 } ), VBytes( &Colours[4 * Pixel], &Colours[4 * Pixel] + 4 ) ) << rPattern.m_Format;
        ASSERT_EQ( ( 200 + 100 + 51 ) / 3, Grey[Pixel] ) << rPattern.m_Format << " at " << X << ", " << Y;
      }
    }
  }
}

// Nothing comes from outside the image.
TEST( Bayer, GreyIsDarkerAtTheEdges )
{
  const VImage Image = { 4, 4, VBytes( 16, 120 ) };
  const VBytes Grey = Convert( Image, IPixelFormat::EBayerRG8, IPixelFormat::ELuminance8 );
  EXPECT_EQ( 70, Grey[0] );    // red: (4 + 2 + 1) / 12
  EXPECT_EQ( 100, Grey[1] );   // green: (2 + 3) / 6
  EXPECT_EQ( 80, Grey[3] );    // green in a corner: (2 + 2) / 6
  EXPECT_EQ( 90, Grey[2] );    // red at an edge: (4 + 3 + 2) / 12
  EXPECT_EQ( 120, Grey[5] );   // blue inside
  EXPECT_EQ( 70, Grey[15] );   // blue in a corner
}

TEST( Bayer, GreyWantsATargetOfExactlyItsSize )
{
  CoreVideoUtils::VPixelFormatConverter Converter;
  KVZ::VideoFrameInfo Info;
  Info.m_ImageWidth = Info.m_ImageHeight = 4;
  const VBytes Source( 16 );
  VBytes Target( 17 );
  for( const IPixelFormat::Enum Format : { IPixelFormat::EBayerBG8, IPixelFormat::EBayerGB7 } )
  {
    Info.m_PixelFormat = Format;
    EXPECT_TRUE( Converter.Convert( Info, Source.data(), Source.size(), IPixelFormat::ELuminance8, Target.data(), 16 ) );
    EXPECT_FALSE( Converter.Convert( Info, Source.data(), Source.size(), IPixelFormat::ELuminance8, Target.data(), 17 ) );
  }
}

TEST( Bayer, OnlyColourTargetsAreCorrected )
{
  const VImage Image = MakeNoise( 20, 6 );
  const KVZ::VColourRecord Grey = { 0.0f, 1.0f };
  const VBytes Plain = Convert( Image, IPixelFormat::EBayerGR8, IPixelFormat::ER8G8B8 );
  const VBytes Corrected = Convert( Image, IPixelFormat::EBayerGR8, IPixelFormat::ER8G8B8, Grey );
  for( size_t Byte = 0; Byte < Plain.size(); Byte += 3 )
  {
    const double Mean = ( Plain[Byte] + Plain[Byte + 1] + Plain[Byte + 2] ) / 3.0;
    ASSERT_NEAR( Mean, Corrected[Byte], 0.51 );
    ASSERT_TRUE( Corrected[Byte] == Corrected[Byte + 1] && Corrected[Byte] == Corrected[Byte + 2] );
  }
  for( const IPixelFormat::Enum Target : { IPixelFormat::EU8Y8V8Y8, IPixelFormat::ELuminance8 } )
  {
    EXPECT_EQ( Convert( Image, IPixelFormat::EBayerGR8, Target ), Convert( Image, IPixelFormat::EBayerGR8, Target, Grey ) );
  }
}

}
