#include "CoreVideoUtils/BurnInText.h"
#include "CoreVideoUtils/PixelFormatConverter.h"
#include "tests/support/LogCapture.h"
#include "tests/support/TestFrames.h"

#include <gtest/gtest.h>

#include <algorithm>
#include <set>

using namespace CoreVideoUtils;
using KVZ::IPixelFormat;
using TestSupport::VideoInfo;

namespace
{

constexpr const char* Category = "CoreVideoUtils";

// Byte k of a pixel of grey g is g + 3 k; knows a single target, straight from grey.
class VCountingConverter : public KVZ::IPixelFormatConverter
{
public:
  explicit VCountingConverter( IPixelFormat::Enum i_Target ) : m_Target( i_Target ) {}

  bool Convert( const KVZ::VideoFrameInfo& i_rInfo, const uint8_t* i_pSource, size_t, IPixelFormat::Enum i_Target, uint8_t* o_pTarget,
    size_t i_Size ) override
  {
    if( i_rInfo.m_PixelFormat != IPixelFormat::ELuminance8 || i_Target != m_Target || m_Refused == *i_pSource )
    {
      return false;
    }
    for( size_t Byte = 0; Byte < i_Size; ++Byte )
    {
      o_pTarget[Byte] = ByteOf( *i_pSource, Byte );
    }
    return true;
  }
  void SetColourCorrection( const KVZ::VColourRecord& ) override {}
  void SetLensCorrection( const KVZ::VLensDistortionRecord& ) override {}
  void SetLensCorrectionEnabled( bool ) override {}

  static uint8_t ByteOf( uint8_t i_Grey, size_t i_Byte ) { return static_cast<uint8_t>( i_Grey + 3 * i_Byte ); }

  int m_Refused = -1;

private:
  const IPixelFormat::Enum m_Target;
};

struct VPlace
{
  uint32_t m_SizeIndex;
  uint32_t m_X;
  uint32_t m_Y;
};

// Pixel by pixel, as plainly as it can be said.
std::vector<uint8_t> Drawn( std::vector<uint8_t> i_Image, uint64_t i_Width, size_t i_PixelBytes, const VPlace& i_rPlace, const std::string& i_rText )
{
  const VBurnInFont Font( i_rPlace.m_SizeIndex );
  for( size_t Index = 0; Index < i_rText.size(); ++Index )
  {
    for( uint64_t Row = 0; Row < Font.Height(); ++Row )
    {
      for( uint64_t Column = 0; Column < Font.Width(); ++Column )
      {
        const uint64_t Offset = ( ( i_rPlace.m_Y + Row ) * i_Width + i_rPlace.m_X + Index * Font.Width() + Column ) * i_PixelBytes;
        for( size_t Byte = 0; Byte < i_PixelBytes && Offset + i_PixelBytes <= i_Image.size(); ++Byte )
        {
          i_Image[Offset + Byte] = VCountingConverter::ByteOf( Font.Glyph( i_rText[Index] )[Row * Font.Width() + Column], Byte );
        }
      }
    }
  }
  return i_Image;
}

struct VDrawCase
{
  const char* m_pName;
  IPixelFormat::Enum m_Format;
  size_t m_PixelBytes;
  VPlace m_Place;
};

const VDrawCase DrawCases[] = {
  { "Grey", IPixelFormat::ELuminance8, 1, { 0, 3, 5 } },
  { "Pairs", IPixelFormat::EU8Y8V8Y8, 2, { 1, 7, 2 } },
  { "Colour", IPixelFormat::EB8G8R8, 3, { 2, 0, 0 } },
  { "WrapsAtTheRightEdge", IPixelFormat::ER8G8B8u8, 4, { 3, 60, 1 } },
  { "LosesWhatIsBelowTheLastRow", IPixelFormat::ER8G8B8, 3, { 4, 10, 60 } },
  { "OutsideAltogether", IPixelFormat::ER8G8B8, 3, { 0, 0xFFFFFFFF, 0xFFFFFFFF } },
};

class BurnInTextDraws : public testing::TestWithParam<VDrawCase>
{
};

}

TEST_P( BurnInTextDraws, EachGlyphOnItsBox )
{
  const VDrawCase& rCase = GetParam();
  constexpr uint32_t Width = 97;
  constexpr uint32_t Height = 80;
  constexpr size_t Guard = 64;
  const std::string Text = "04:5;";
  const size_t Size = Width * Height * rCase.m_PixelBytes;
  std::vector<uint8_t> Image( Size, 0xC7 );
  const std::vector<uint8_t> Expected = Drawn( Image, Width, rCase.m_PixelBytes, rCase.m_Place, Text );
  Image.resize( Size + Guard, 0xEE );
  VCountingConverter Converter( rCase.m_Format );
  const KVZ::VideoFrameInfo Frame = VideoInfo( rCase.m_Format, Width, Height );
  ASSERT_TRUE( BurnInText( Converter, Frame, rCase.m_Place.m_SizeIndex, rCase.m_Place.m_X, rCase.m_Place.m_Y, Text, Image.data(), Size ) );
  EXPECT_TRUE( std::equal( Expected.begin(), Expected.end(), Image.begin() ) );
  EXPECT_EQ( std::count( Image.begin() + static_cast<long>( Size ), Image.end(), 0xEE ), static_cast<long>( Guard ) );
}

INSTANTIATE_TEST_SUITE_P( Formats, BurnInTextDraws, testing::ValuesIn( DrawCases ),
  []( const auto& i_rInfo ) { return std::string( i_rInfo.param.m_pName ); } );

namespace
{

constexpr uint32_t Width = 100;   // the ten-bit rows end with a group that is not whole
constexpr uint32_t Height = 30;

std::vector<uint8_t> ImageOf( IPixelFormat::Enum i_Format, uint8_t i_Byte )
{
  return std::vector<uint8_t>( KVZ::GetImageSize( i_Format, Width, Height ), i_Byte );
}

bool Draw( IPixelFormat::Enum i_Format, std::vector<uint8_t>& io_rImage, const std::string& i_rText, uint32_t i_SizeIndex = 0 )
{
  VPixelFormatConverter Converter;
  return BurnInText( Converter, VideoInfo( i_Format, Width, Height ), i_SizeIndex, 9, 4, i_rText, io_rImage.data(), io_rImage.size() );
}

// The sample of a ten-bit image: of six pixels in four words the samples are U0 Y0 V0, Y1 U1 Y2, V1 Y3 U2, Y4 V2 Y5.
uint32_t TenBitSample( const std::vector<uint8_t>& i_rImage, uint32_t i_Row, uint32_t i_Sample )
{
  const size_t Word = i_Row * KVZ::GetImageSize( IPixelFormat::EU10Y10V10Y10, Width, 1 ) + i_Sample / 3 * 4;
  const uint32_t Value = i_rImage[Word] | uint32_t{ i_rImage[Word + 1] } << 8 | uint32_t{ i_rImage[Word + 2] } << 16 |
    uint32_t{ i_rImage[Word + 3] } << 24;
  return Value >> i_Sample % 3 * 10 & 0x3FF;
}

}

// What is drawn with the real converter shows the same greys in every format.
TEST( BurnInText, ShowsTheSameInEveryFormat )
{
  std::vector<uint8_t> Grey = ImageOf( IPixelFormat::ELuminance8, 77 );
  ASSERT_TRUE( Draw( IPixelFormat::ELuminance8, Grey, "01:27" ) );
  std::vector<uint8_t> Pairs = ImageOf( IPixelFormat::EU8Y8V8Y8, 77 );
  ASSERT_TRUE( Draw( IPixelFormat::EU8Y8V8Y8, Pairs, "01:27" ) );
  std::vector<uint8_t> LumaFirst = ImageOf( IPixelFormat::EY8U8Y8V8, 77 );
  ASSERT_TRUE( Draw( IPixelFormat::EY8U8Y8V8, LumaFirst, "01:27" ) );
  std::vector<uint8_t> TenBit = ImageOf( IPixelFormat::EU10Y10V10Y10, 0 );
  ASSERT_TRUE( Draw( IPixelFormat::EU10Y10V10Y10, TenBit, "01:27" ) );
  for( uint32_t Row = 0; Row < Height; ++Row )
  {
    for( uint32_t Column = 0; Column < Width; ++Column )
    {
      SCOPED_TRACE( testing::Message() << "row " << Row << ", column " << Column );
      const bool bText = Row >= 4 && Row < 24 && Column >= 9 && Column < 9 + 5 * 12;
      const uint8_t Expected = Grey[Row * Width + Column];
      const size_t Pixel = ( Row * Width + Column ) * 2;
      EXPECT_NEAR( Pairs[Pixel + 1], Expected, 1 );
      EXPECT_EQ( Pairs[Pixel], bText ? 128 : 77 );
      EXPECT_NEAR( LumaFirst[Pixel], Expected, 1 );
      EXPECT_EQ( LumaFirst[Pixel + 1], bText ? 128 : 77 );
      const uint32_t Luma = Column * 2 + 1;
      EXPECT_NEAR( TenBitSample( TenBit, Row, Luma ), bText ? Expected * 4u : 0u, 4u );
      const uint32_t Chroma = Column / 2 * 4;
      const bool bChroma = Row >= 4 && Row < 24 && Column >= 8 && Column < 70;   // of whole pairs
      EXPECT_EQ( TenBitSample( TenBit, Row, Chroma ), bChroma ? 512u : 0u );
      EXPECT_EQ( TenBitSample( TenBit, Row, Chroma + 2 ), bChroma ? 512u : 0u );
    }
  }
}

// A converter that knows its target from colour alone will do.
TEST( BurnInText, FindsTheWayThroughColour )
{
  class VColourOnly : public VPixelFormatConverter
  {
  public:
    bool Convert( const KVZ::VideoFrameInfo& i_rInfo, const uint8_t* i_pSource, size_t i_Size, IPixelFormat::Enum i_Target, uint8_t* o_pTarget,
      size_t i_TargetSize ) override
    {
      const bool bFromGrey = i_rInfo.m_PixelFormat == IPixelFormat::ELuminance8 && i_Target != IPixelFormat::ER8G8B8;
      return !bFromGrey && VPixelFormatConverter::Convert( i_rInfo, i_pSource, i_Size, i_Target, o_pTarget, i_TargetSize );
    }
  };
  VColourOnly Converter;
  std::vector<uint8_t> Image = ImageOf( IPixelFormat::EU8Y8V8Y8, 77 );
  std::vector<uint8_t> Straight = Image;
  ASSERT_TRUE( Draw( IPixelFormat::EU8Y8V8Y8, Straight, "8" ) );
  ASSERT_TRUE( BurnInText( Converter, VideoInfo( IPixelFormat::EU8Y8V8Y8, Width, Height ), 0, 9, 4, "8", Image.data(), Image.size() ) );
  for( size_t Byte = 0; Byte < Image.size(); ++Byte )
  {
    ASSERT_NEAR( Image[Byte], Straight[Byte], 1 ) << Byte;
  }
}

TEST( BurnInText, AConversionThatFailsDrawsNothing )
{
  const TestSupport::VLogCapture Log( Category );
  VCountingConverter Converter( IPixelFormat::ER8G8B8 );
  Converter.m_Refused = 200;
  std::vector<uint8_t> Image = ImageOf( IPixelFormat::ER8G8B8, 1 );
  EXPECT_FALSE( BurnInText( Converter, VideoInfo( IPixelFormat::ER8G8B8, Width, Height ), 0, 0, 0, "1", Image.data(), Image.size() ) );
  EXPECT_EQ( Image, ImageOf( IPixelFormat::ER8G8B8, 1 ) );
  for( const auto Packed : { IPixelFormat::ELuminance7, IPixelFormat::EBayerGB6 } )
  {
    Image = ImageOf( Packed, 1 );
    EXPECT_FALSE( Draw( Packed, Image, "1" ) );
    EXPECT_EQ( Image, ImageOf( Packed, 1 ) );
  }
  EXPECT_TRUE( Log.Has( "Text cannot be drawn into frames of the pixel format 'Luminance7'." ) );
  EXPECT_TRUE( BurnInText( Converter, VideoInfo( IPixelFormat::EUnspecified, 0, 0 ), 0, 0, 0, "", nullptr, 0 ) ) << "nothing to draw";
}

TEST( BurnInText, AnUnknownSizeIsTheMiddleOne )
{
  const TestSupport::VLogCapture Log( Category );
  std::vector<uint8_t> Image = ImageOf( IPixelFormat::ELuminance8, 0 );
  std::vector<uint8_t> Middle = Image;
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
    const size_t Bytes = size_t{ Font.Width() } * Font.Height();
    std::set<std::vector<uint8_t>> Shapes;
    for( char Character = ' '; Character <= '~'; ++Character )
    {
      const std::vector<uint8_t> Shape( Font.Glyph( Character ), Font.Glyph( Character ) + Bytes );
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
