#include "CoreVideoUtils/BurnInText.h"
#include "tests/support/LogCapture.h"
#include "tests/support/SoftwareConversions.h"

#include <gtest/gtest.h>

#include <algorithm>
#include <set>

using namespace CoreVideoUtils;
using namespace SoftwareTests;

namespace
{

constexpr const char* Category = "CoreVideoUtils";

struct VDrawCase
{
  IPixelFormat::Enum m_Format;
  uint32_t m_SizeIndex;
  uint32_t m_X;
  uint32_t m_Y;
};

constexpr VDrawCase DrawCases[] = {
  { IPixelFormat::ELuminance8, 0, 3, 5 }, { IPixelFormat::EU8Y8V8Y8, 1, 7, 2 }, { IPixelFormat::EB8G8R8, 2, 0, 0 },
  { IPixelFormat::ER8G8B8u8, 3, 60, 1 },                  // wraps at the right edge
  { IPixelFormat::ER8G8B8, 4, 10, 60 },                   // loses what is below the last row
  { IPixelFormat::ER8G8B8, 0, 0xFFFFFFFF, 0xFFFFFFFF },   // outside altogether
};

// Pixel by pixel, as plainly as it can be said.
void DrawPlainly( const VDrawCase& i_rCase, uint64_t i_Width, const std::string& i_rText, VBytes& io_rImage )
{
  const VBurnInFont Font( i_rCase.m_SizeIndex );
  for( size_t Index = 0; Index < i_rText.size(); ++Index )
  {
    const uint8_t* pGrey = Font.Glyph( i_rText[Index] );
    for( uint64_t Row = 0; Row < Font.Height(); ++Row )
    {
      for( uint64_t Column = 0; Column < Font.Width(); ++Column )
      {
        const VBytes Pixel = Convert( IPixelFormat::ELuminance8, { *pGrey++ }, i_rCase.m_Format, { 1, 1 } );
        const uint64_t Offset = ( ( i_rCase.m_Y + Row ) * i_Width + i_rCase.m_X + Index * Font.Width() + Column ) * Pixel.size();
        if( Offset + Pixel.size() <= io_rImage.size() )
        {
          std::copy( Pixel.begin(), Pixel.end(), io_rImage.begin() + static_cast<long>( Offset ) );
        }
      }
    }
  }
}

constexpr VSize Size = { 100, 30 };   // the ten-bit rows end with a group that is not whole

VBytes ImageOf( IPixelFormat::Enum i_Format, uint8_t i_Byte ) { return VBytes( SizeOf( i_Format, Size ), i_Byte ); }

bool Draw( IPixelFormat::Enum i_Format, VBytes& io_rImage, const std::string& i_rText, uint32_t i_SizeIndex = 0 )
{
  VPixelFormatConverter Converter;
  return BurnInText( Converter, MakeInfo( i_Format, Size ), i_SizeIndex, 9, 4, i_rText, io_rImage.data(), io_rImage.size() );
}

// The sample of a ten-bit image: of six pixels in four words the samples are U0 Y0 V0, Y1 U1 Y2, V1 Y3 U2, Y4 V2 Y5.
uint32_t TenBitSample( const VBytes& i_rImage, uint32_t i_Row, uint32_t i_Sample )
{
  const size_t Word = i_Row * SizeOf( IPixelFormat::EU10Y10V10Y10, { Size.m_Width, 1 } ) + i_Sample / 3 * 4;
  const uint32_t Value = i_rImage[Word] | uint32_t{ i_rImage[Word + 1] } << 8 | uint32_t{ i_rImage[Word + 2] } << 16 |
    uint32_t{ i_rImage[Word + 3] } << 24;
  return Value >> i_Sample % 3 * 10 & 0x3FF;
}

}

TEST( BurnInText, DrawsEachGlyphOnItsBox )
{
  for( const VDrawCase& rCase : DrawCases )
  {
    SCOPED_TRACE( &rCase - DrawCases );
    const KVZ::VideoFrameInfo Info = MakeInfo( rCase.m_Format, { 97, 80 } );
    VBytes Expected( SizeOf( rCase.m_Format, { 97, 80 } ), 0xC7 );
    VBytes Image = Expected;
    DrawPlainly( rCase, 97, "04:5;", Expected );
    const VBytes Guard( 64, 0xEE );
    TestSupport::Append( Image, Guard );
    TestSupport::Append( Expected, Guard );
    VPixelFormatConverter Converter;
    ASSERT_TRUE( BurnInText( Converter, Info, rCase.m_SizeIndex, rCase.m_X, rCase.m_Y, "04:5;", Image.data(), Image.size() - Guard.size() ) );
    EXPECT_TRUE( Image == Expected );
  }
}

// To these formats grey has no straight way: one goes through colour, the other from there through 4:2:2.
TEST( BurnInText, ShowsTheSameWhereGreyIsConvertedInSteps )
{
  VBytes Grey = ImageOf( IPixelFormat::ELuminance8, 77 );
  VBytes LumaFirst = ImageOf( IPixelFormat::EY8U8Y8V8, 77 );
  VBytes TenBit = ImageOf( IPixelFormat::EU10Y10V10Y10, 0 );
  ASSERT_TRUE( Draw( IPixelFormat::ELuminance8, Grey, "01:27" ) );
  ASSERT_TRUE( Draw( IPixelFormat::EY8U8Y8V8, LumaFirst, "01:27" ) );
  ASSERT_TRUE( Draw( IPixelFormat::EU10Y10V10Y10, TenBit, "01:27" ) );
  for( uint32_t Row = 0; Row < Size.m_Height; ++Row )
  {
    for( uint32_t Column = 0; Column < Size.m_Width; ++Column )
    {
      SCOPED_TRACE( testing::Message() << "row " << Row << ", column " << Column );
      const bool bTextRow = Row >= 4 && Row < 24;
      const bool bText = bTextRow && Column >= 9 && Column < 9 + 5 * 12;
      const bool bChroma = bTextRow && Column >= 8 && Column < 70;   // of whole pairs
      const size_t Pixel = Row * Size.m_Width + Column;
      EXPECT_NEAR( LumaFirst[2 * Pixel], Grey[Pixel], 1 );
      EXPECT_EQ( LumaFirst[2 * Pixel + 1], bText ? 128 : 77 );
      EXPECT_NEAR( TenBitSample( TenBit, Row, Column * 2 + 1 ), bText ? Grey[Pixel] * 4u : 0u, 4u );
      EXPECT_EQ( TenBitSample( TenBit, Row, Column / 2 * 4 ), bChroma ? 512u : 0u );
      EXPECT_EQ( TenBitSample( TenBit, Row, Column / 2 * 4 + 2 ), bChroma ? 512u : 0u );
    }
  }
}

TEST( BurnInText, AConversionThatFailsDrawsNothing )
{
  class VRefusing : public VPixelFormatConverter
  {
  public:
    bool Convert( const KVZ::VideoFrameInfo& i_rInfo, const uint8_t* i_pSource, size_t i_Size, IPixelFormat::Enum i_Target, uint8_t* o_pTarget,
      size_t i_TargetSize ) override
    {
      return *i_pSource != 200 && VPixelFormatConverter::Convert( i_rInfo, i_pSource, i_Size, i_Target, o_pTarget, i_TargetSize );
    }
  };
  const TestSupport::VLogCapture Log( Category );
  VRefusing Converter;
  VBytes Image = ImageOf( IPixelFormat::ER8G8B8, 1 );
  EXPECT_FALSE( BurnInText( Converter, MakeInfo( IPixelFormat::ER8G8B8, Size ), 0, 0, 0, "1", Image.data(), Image.size() ) );
  EXPECT_EQ( Image, ImageOf( IPixelFormat::ER8G8B8, 1 ) );
  for( const auto Packed : { IPixelFormat::ELuminance7, IPixelFormat::EBayerGB6 } )
  {
    Image = ImageOf( Packed, 1 );
    EXPECT_FALSE( Draw( Packed, Image, "1" ) );
    EXPECT_EQ( Image, ImageOf( Packed, 1 ) );
  }
  EXPECT_TRUE( Log.Has( "Text cannot be drawn into frames of the pixel format 'Luminance7'." ) );
  EXPECT_TRUE( BurnInText( Converter, MakeInfo( IPixelFormat::EUnspecified, { 0, 0 } ), 0, 0, 0, "", nullptr, 0 ) ) << "nothing to draw";
}

TEST( BurnInText, AnUnknownSizeIsTheMiddleOne )
{
  const TestSupport::VLogCapture Log( Category );
  VBytes Image = ImageOf( IPixelFormat::ELuminance8, 0 );
  VBytes Middle = Image;
  ASSERT_TRUE( Draw( IPixelFormat::ELuminance8, Middle, "3", 2 ) );
  EXPECT_TRUE( Log.Texts().empty() );
  ASSERT_TRUE( Draw( IPixelFormat::ELuminance8, Image, "3", 5 ) );
  EXPECT_EQ( Image, Middle );
  ASSERT_EQ( Log.Texts(), std::vector<std::string>{ "Unsupported burn in text size." } );
  EXPECT_EQ( Log.Lines().front().m_Level, 2 );
}

TEST( BurnInFont, EveryCharacterHasAShapeOfItsOwn )
{
  for( uint32_t Index = 0; Index < FontCells.size(); ++Index )
  {
    const VBurnInFont Font( Index );
    std::set<VBytes> Shapes;
    for( char Character = ' '; Character <= '~'; ++Character )
    {
      const VBytes Shape( Font.Glyph( Character ), Font.Glyph( Character ) + Font.Width() * Font.Height() );
      EXPECT_EQ( *std::max_element( Shape.begin(), Shape.end() ) > 200, Character != ' ' ) << Character << " of font " << Index;
      Shapes.insert( Shape );
    }
    EXPECT_EQ( Shapes.size(), FontCharacters );
    for( const char Other : { '\n', '\x1F', '\x7F', static_cast<char>( 0xE4 ) } )
    {
      EXPECT_EQ( Font.Glyph( Other ), Font.Glyph( '?' ) );
    }
  }
}
