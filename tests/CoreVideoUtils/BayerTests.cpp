#include "tests/support/SoftwareConversions.h"

#include <gtest/gtest.h>

#include <algorithm>
#include <array>
#include <cmath>

using namespace SoftwareTests;
using TestSupport::Noise;

namespace
{

// An image whose pattern is moved against one that begins with red, in the words of the shader that does the same on the graphics card.
struct VMosaic
{
  IPixelFormat::Enum m_Format;
  int m_FirstRedX;
  int m_FirstRedY;
  VSize m_Size{};
  VBytes m_Bytes{};

  int Width() const { return static_cast<int>( m_Size.m_Width ); }
  int Height() const { return static_cast<int>( m_Size.m_Height ); }
  bool IsEvenX( int i_X ) const { return ( i_X + m_FirstRedX ) % 2 == 0; }
  bool IsEvenY( int i_Y ) const { return ( i_Y + m_FirstRedY ) % 2 == 0; }
  bool IsInside( int i_X, int i_Y ) const { return i_X >= 0 && i_Y >= 0 && i_X < Width() && i_Y < Height(); }

  // The nearest pixel of the image
  int At( int i_X, int i_Y ) const
  {
    return m_Bytes[static_cast<size_t>( std::clamp( i_Y, 0, Height() - 1 ) * Width() + std::clamp( i_X, 0, Width() - 1 ) )];
  }
};

// The filter as the shader computes it, in floating point
std::array<double, 3> Shade( const VMosaic& i_rImage, int i_X, int i_Y )
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
  if( i_rImage.IsEvenY( i_Y ) )
  {
    return i_rImage.IsEvenX( i_X ) ? std::array{ C, PX, PY } : std::array{ PZ, C, PW };
  }
  return i_rImage.IsEvenX( i_X ) ? std::array{ PW, C, PZ } : std::array{ PY, PX, C };
}

// The mean of red, green and blue, each the mean of the four or two neighbours that have it; those outside the image are black.
int Grey( const VMosaic& i_rImage, int i_X, int i_Y )
{
  const auto At = [&]( int i_Column, int i_Row )
  { return i_rImage.IsInside( i_X + i_Column, i_Y + i_Row ) ? i_rImage.At( i_X + i_Column, i_Y + i_Row ) : 0; };
  const int Beside = At( -1, 0 ) + At( 1, 0 ) + At( 0, -1 ) + At( 0, 1 );
  const int Diagonal = At( -1, -1 ) + At( 1, -1 ) + At( -1, 1 ) + At( 1, 1 );
  const bool bGreen = i_rImage.IsEvenX( i_X ) != i_rImage.IsEvenY( i_Y );
  return bGreen ? ( 2 * At( 0, 0 ) + Beside ) / 6 : ( 4 * At( 0, 0 ) + Beside + Diagonal ) / 12;
}

TEST( Bayer, EqualsTheFiltersInAllOrdersToTheEdges )
{
  for( const VSize Size : { VSize{ 75, 9 }, { 1, 1 }, { 2, 7 }, { 3, 1 } } )
  {
    for( VMosaic Image : { VMosaic{ IPixelFormat::EBayerRG8, 0, 0 }, { IPixelFormat::EBayerGB8, 0, 1 }, { IPixelFormat::EBayerGR8, 1, 0 },
           { IPixelFormat::EBayerBG8, 1, 1 } } )
    {
      Image.m_Size = Size;
      Image.m_Bytes = Noise( size_t{ Size.m_Width } * Size.m_Height, 5 );
      const VBytes Colours = Convert( Image.m_Format, Image.m_Bytes, IPixelFormat::ER8G8B8, Size );
      const VBytes Greys = Convert( Image.m_Format, Image.m_Bytes, IPixelFormat::ELuminance8, Size );
      for( size_t Pixel = 0; Pixel < Image.m_Bytes.size(); ++Pixel )
      {
        SCOPED_TRACE( KVZ::ToName( Image.m_Format ) + ", pixel " + std::to_string( Pixel ) );
        const int X = static_cast<int>( Pixel ) % Image.Width();
        const int Y = static_cast<int>( Pixel ) / Image.Width();
        const std::array<double, 3> Exact = Shade( Image, X, Y );
        for( size_t Channel = 0; Channel < 3; ++Channel )
        {
          ASSERT_EQ( std::floor( std::clamp( Exact[Channel], 0.0, 255.0 ) + 0.5 ), Colours[3 * Pixel + Channel] );
        }
        ASSERT_EQ( Grey( Image, X, Y ), Greys[Pixel] );
      }
    }
  }
}

TEST( Bayer, GreyWantsATargetOfExactlyItsSize )
{
  CoreVideoUtils::VPixelFormatConverter Converter;
  const VBytes Source( 16 );
  VBytes Target( 17 );
  for( const IPixelFormat::Enum Format : { IPixelFormat::EBayerBG8, IPixelFormat::EBayerGB7 } )
  {
    const auto Run = [&]( size_t i_TargetSize ) {
      return Converter.Convert( MakeInfo( Format, { 4, 4 } ), Source.data(), 16, IPixelFormat::ELuminance8, Target.data(), i_TargetSize );
    };
    EXPECT_TRUE( Run( 16 ) );
    EXPECT_FALSE( Run( 17 ) );
  }
}

TEST( Bayer, OnlyColourTargetsAreCorrected )
{
  constexpr VSize Size = { 20, 6 };
  const VBytes Image = Noise( 120, 5 );
  const KVZ::VColourRecord Grey = { 0.0f, 1.0f };
  const VBytes Plain = Convert( IPixelFormat::EBayerGR8, Image, IPixelFormat::ER8G8B8, Size );
  const VBytes Corrected = Convert( IPixelFormat::EBayerGR8, Image, IPixelFormat::ER8G8B8, Size, Grey );
  for( size_t Byte = 0; Byte < Plain.size(); ++Byte )
  {
    const size_t Red = Byte / 3 * 3;
    ASSERT_NEAR( ( Plain[Red] + Plain[Red + 1] + Plain[Red + 2] ) / 3.0, Corrected[Byte], 0.51 );
  }
  for( const IPixelFormat::Enum Target : { IPixelFormat::EU8Y8V8Y8, IPixelFormat::ELuminance8 } )
  {
    EXPECT_EQ( Convert( IPixelFormat::EBayerGR8, Image, Target, Size ), Convert( IPixelFormat::EBayerGR8, Image, Target, Size, Grey ) );
  }
}

}
