// The timecode in the picture: the right label on each frame, drawn as the font has it, and nothing else changed.
#include "CoreVideoUtils/BurnInText.h"
#include "CoreVideoUtils/PixelFormatConverter.h"
#include "tests/support/TemporaryFolder.h"
#include "tests/support/TvidParser.h"
#include "tests/support/system/Rates.h"
#include "tests/support/system/StageHost.h"
#include "tests/system/Images/Pictures.h"

using namespace SystemTests;
using KVZ::IPixelFormat;
using TestSupport::VTvidParser;

namespace
{

constexpr uint64_t BurnInFrames = 8;

// Where the text stands in a picture of 720 x 486, and in the small font's cells of 19 x 32.
constexpr uint32_t SizeIndex = 1;
constexpr uint32_t Top = 32;
constexpr uint32_t CellWidth = 19;
constexpr uint32_t CellHeight = 32;
constexpr uint32_t PictureWidth = 720;

uint32_t LeftOf( const std::string& i_rText ) { return ( PictureWidth - CellWidth * static_cast<uint32_t>( i_rText.size() ) ) / 2 & ~1u; }

// The frame with the text in it.
std::vector<uint8_t> Drawn( std::vector<uint8_t> i_Frame, IPixelFormat::Enum i_Format, const std::string& i_rText )
{
  KVZ::VideoFrameInfo Info;
  Info.m_ImageWidth = PictureWidth;
  Info.m_ImageHeight = 486;
  Info.m_PixelFormat = i_Format;
  CoreVideoUtils::VPixelFormatConverter Converter;
  EXPECT_TRUE( CoreVideoUtils::BurnInText( Converter, Info, SizeIndex, LeftOf( i_rText ), Top, i_rText, i_Frame.data(), i_Frame.size() ) );
  return i_Frame;
}

std::vector<uint8_t> WithoutCounter( std::vector<uint8_t> i_Frame, size_t i_RowBytes )
{
  std::fill_n( i_Frame.begin(), std::min( i_Frame.size(), i_RowBytes * 32 ), uint8_t{ 0 } );
  return i_Frame;
}

struct VBurnInCase
{
  const char* m_pName;
  VSignalRate m_Rate;
  IPixelFormat::Enum m_Format;
  const char* m_pStart;
};

const VBurnInCase EightBits = { "EightBits", Rate2398, IPixelFormat::EU8Y8V8Y8, "10:20:59:20" };
const VBurnInCase TenBits = { "TenBits", Rate2398, IPixelFormat::EU10Y10V10Y10, "10:20:59:20" };
const VBurnInCase Colour = { "Colour", Rate2398, IPixelFormat::EB8G8R8u8, "10:20:59:20" };   // the card cannot capture it
const VBurnInCase TwoFramesALabel = { "TwoFramesALabel", Rate5994Drop, IPixelFormat::EU8Y8V8Y8, "10:20:59;28" };

}

class BurnInTest : public testing::TestWithParam<VBurnInCase>
{
protected:
  VRecordResult RecordCard( const std::string& i_rFolder, const VArguments& i_rMore )
  {
    const VBurnInCase& rCase = GetParam();
    const std::string Card = std::string( "decklink:pattern=counter,speed=2,standard=" ) + rCase.m_Rate.m_pStandard + ",timecode=" + rCase.m_pStart;
    VRecordResult Result = Record( m_Folder.File( i_rFolder ),
      VArguments{ "--card", Card, "--pixel-format", KVZ::ToName( rCase.m_Format ), "--frames", std::to_string( BurnInFrames ) } + i_rMore );
    EXPECT_EQ( 0, Result.m_Run.m_ExitCode ) << Describe( Result.m_Run );
    return Result;
  }

  const TestSupport::VTemporaryFolder m_Folder;
};

class BurnInImageTest : public BurnInTest
{
};

TEST_P( BurnInTest, EachFrameCarriesItsLabel )
{
  const VBurnInCase& rCase = GetParam();
  VTvidParser Plain( RecordCard( "plain", {} ).Path() );
  const std::vector<uint8_t> Background = Plain.Video( Plain.Frames().at( 0 ) );

  const VRecordResult Result = RecordCard( "drawn", { "--burn-in", "timecode" } );
  VTvidParser File( Result.Path() );
  ASSERT_EQ( BurnInFrames, File.Frames().size() );
  const std::string Start = Result.Device().value( "start_timecode", "" );
  const size_t RowBytes = Background.size() / 486;
  const uint32_t PerLabel = rCase.m_Rate.m_FramesPerLabel;
  const std::vector<uint8_t> FirstFrame = WithoutCounter( File.Video( File.Frames()[0] ), RowBytes );
  // The first frame of the recording may be the second of its label.
  const uint32_t Ahead = PerLabel == 1 || FirstFrame == WithoutCounter( Drawn( Background, rCase.m_Format, Start + ".0" ), RowBytes ) ? 0 : 1;
  for( uint32_t Frame = 0; Frame < BurnInFrames; ++Frame )
  {
    const uint32_t Within = ( Frame + Ahead ) % PerLabel;
    const std::string Label = LabelOfFrame( Start, rCase.m_Rate, Frame + Ahead ) + ( PerLabel == 1 ? "" : "." + std::to_string( Within ) );
    const std::vector<uint8_t> Expected = WithoutCounter( Drawn( Background, rCase.m_Format, Label ), RowBytes );
    EXPECT_TRUE( Expected == WithoutCounter( File.Video( File.Frames()[Frame] ), RowBytes ) ) << "frame " << Frame << " is not " << Label;
  }
}

// Where the text covers them the pixels of a lossless image are the glyphs themselves.
TEST_P( BurnInImageTest, ShowsTheGlyphs )
{
  const VRecordResult Result = RecordCard( "images", { "--container", "images", "--video", "png", "--burn-in", "timecode" } );
  const std::string Start = Result.Device().value( "start_timecode", "" );
  const std::string Text = GetParam().m_Rate.m_FramesPerLabel == 1 ? Start : Start + ".0";
  const VPicture Picture = DecodeByFFmpeg( FramePath( Result.Path(), 0, "png" ) );
  ASSERT_EQ( PictureWidth * 486u * 3u, Picture.size() );
  const CoreVideoUtils::VBurnInFont Font( SizeIndex );
  for( size_t Index = 0; Index < Start.size(); ++Index )   // the label; what stands behind it may be the label's second frame
  {
    for( uint32_t Row = 0; Row < CellHeight; ++Row )
    {
      for( uint32_t Column = 0; Column < CellWidth; ++Column )
      {
        const uint8_t Grey = Font.Glyph( Start[Index] )[Row * CellWidth + Column];
        const size_t Pixel = ( ( Top + Row ) * PictureWidth + LeftOf( Text ) + Index * CellWidth + Column ) * 3;
        ASSERT_EQ( VPicture( 3, Grey ), VPicture( Picture.begin() + static_cast<long>( Pixel ), Picture.begin() + static_cast<long>( Pixel + 3 ) ) )
          << "character " << Index << ", row " << Row << ", column " << Column;
      }
    }
  }
}

INSTANTIATE_TEST_SUITE_P( Signals, BurnInTest, testing::Values( EightBits, TenBits, Colour, TwoFramesALabel ),
  []( const auto& i_rInfo ) { return std::string( i_rInfo.param.m_pName ); } );

INSTANTIATE_TEST_SUITE_P( Signals, BurnInImageTest, testing::Values( EightBits, TenBits, TwoFramesALabel ),
  []( const auto& i_rInfo ) { return std::string( i_rInfo.param.m_pName ); } );
