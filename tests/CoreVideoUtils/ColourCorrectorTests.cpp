#include "CoreVideoUtils/ColourCorrector.h"
#include "tests/support/TestFrames.h"

#include <gtest/gtest.h>

#include <cmath>
#include <limits>

using CoreVideoUtils::VColourCorrector;

namespace
{

using TestSupport::VBytes;

VBytes Apply( const VColourCorrector& i_rCorrector, VBytes i_Pixels, size_t i_BytesPerPixel = 3 )
{
  i_rCorrector.Apply( i_Pixels.data(), i_Pixels.size() / i_BytesPerPixel, i_BytesPerPixel );
  return i_Pixels;
}

VBytes Apply( const KVZ::VColourRecord& i_rColour, VBytes i_Pixels, size_t i_BytesPerPixel = 3 )
{
  VColourCorrector Corrector;
  Corrector.SetColourCorrection( i_rColour );
  return Apply( Corrector, std::move( i_Pixels ), i_BytesPerPixel );
}

TEST( ColourCorrector, GammaFollowsThePower )
{
  for( const float Gamma : { 2.2f, 0.45f } )
  {
    for( int Value = 0; Value < 256; ++Value )
    {
      const auto Byte = static_cast<uint8_t>( Value );
      const VBytes Pixel = Apply( { 1.0f, Gamma }, { Byte, Byte, Byte, Byte }, 4 );
      const double Expected = 255.0 * std::pow( Value / 255.0, 1.0 / static_cast<double>( Gamma ) );
      ASSERT_NEAR( Expected, Pixel[0], 0.501 ) << Value;
      ASSERT_TRUE( Pixel[0] == Pixel[1] && Pixel[0] == Pixel[2] );
      ASSERT_EQ( Byte, Pixel[3] );
    }
  }
}

TEST( ColourCorrector, SaturationMovesChannelsToAndFromTheirMean )
{
  EXPECT_EQ( ( VBytes{ 100, 100, 100 } ), Apply( { 0.0f, 1.0f }, { 50, 100, 150 } ) );
  EXPECT_EQ( ( VBytes{ 75, 100, 125 } ), Apply( { 0.5f, 1.0f }, { 50, 100, 150 } ) );
  EXPECT_EQ( ( VBytes{ 0, 100, 200 } ), Apply( { 2.0f, 1.0f }, { 50, 100, 150 } ) );
  EXPECT_EQ( ( VBytes{ 0, 167, 255, 7 } ), Apply( { 3.0f, 1.0f }, { 20, 140, 220, 7 }, 4 ) );   // 3 * 140 - 2 * 126.67; limited on both sides
  EXPECT_EQ( ( VBytes{ 100, 100, 100 } ), Apply( { -5.0f, 1.0f }, { 50, 100, 150 } ) );         // no further than grey
}

// A gamma of 1 in between turns the table off, not out; gamma comes before saturation.
TEST( ColourCorrector, SettingsFollowOneAnother )
{
  const VBytes Plain = { 10, 60, 200 };
  VColourCorrector Corrector;
  Corrector.SetColourCorrection( { 1.0f, 2.0f } );
  const VBytes Bright = Apply( Corrector, Plain );
  Corrector.SetColourCorrection( { 1.0f, 1.0f } );
  EXPECT_TRUE( Corrector.IsNeutral() );
  EXPECT_EQ( Plain, Apply( Corrector, Plain ) );
  Corrector.SetColourCorrection( { 0.3f, 2.0f } );
  EXPECT_EQ( Apply( { 0.3f, 1.0f }, Bright ), Apply( Corrector, Plain ) );
}

TEST( ColourCorrector, SenselessSettingsStayInRange )
{
  EXPECT_EQ( ( VBytes{ 255, 255, 255 } ), Apply( { 1.0f, -1.0f }, { 0, 100, 255 } ) );   // above 255, held there
  EXPECT_EQ( ( VBytes{ 0, 0, 255 } ), Apply( { 1.0f, 0.0f }, { 0, 100, 255 } ) );
  const float NoNumber = std::numeric_limits<float>::quiet_NaN();
  EXPECT_EQ( ( VBytes{ 0, 0, 0 } ), Apply( { NoNumber, NoNumber }, { 0, 100, 200 } ) );
  EXPECT_EQ( ( VBytes{ 0, 0, 255 } ), Apply( { std::numeric_limits<float>::infinity(), 1.0f }, { 0, 100, 255 } ) );
}

}
