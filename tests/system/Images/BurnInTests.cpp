// The timecode in the picture: the right label on each frame, drawn as the font has it, and nothing else changed.
#include "CoreVideoUtils/BurnInText.h"
#include "CoreVideoUtils/PixelFormatConverter.h"
#include "tests/support/TemporaryFolder.h"
#include "tests/support/system/Rates.h"
#include "tests/system/Images/Pictures.h"

using namespace SystemTests;
using KVZ::IPixelFormat;

namespace
{

constexpr uint64_t BurnInFrames = 8;

// Where the text stands in a picture of 720 x 486, and in the small font's cells of 19 x 32.
constexpr uint32_t SizeIndex = 1;
constexpr uint32_t Top = 32;
constexpr uint32_t CellWidth = 19;
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
  IPixelFormat::Enum m_Format;   // the recording's, or that of the images that come of it
  const char* m_pStart;
  const char* m_pImages = "";   // their payload and extension
};

const VBurnInCase BurnInCases[] = {
  { "EightBits", Rate2398, IPixelFormat::EU8Y8V8Y8, "10:20:59:20" },
  { "TenBits", Rate2398, IPixelFormat::EU10Y10V10Y10, "10:20:59:20" },
  { "Colour", Rate2398, IPixelFormat::EB8G8R8u8, "10:20:59:20" },   // the card cannot capture it
  { "TwoFramesALabel", Rate5994Drop, IPixelFormat::EU8Y8V8Y8, "10:20:59;28" },
  { "Images", Rate5994Drop, IPixelFormat::ER8G8B8, "10:20:59;28", "png" },
};

}

class BurnInTest : public testing::TestWithParam<VBurnInCase>
{
protected:
  VHostResult RecordCard( const std::string& i_rFolder, const VArguments& i_rMore )
  {
    const VBurnInCase& rCase = GetParam();
    const std::string Card = std::string( "decklink:pattern=counter,speed=2,standard=" ) + rCase.m_Rate.m_pStandard + ",timecode=" + rCase.m_pStart;
    const bool bImages = *rCase.m_pImages != 0;
    const VArguments Form = bImages ? VArguments{ "--container", "images", "--video", rCase.m_pImages }
                                    : VArguments{ "--pixel-format", KVZ::ToName( rCase.m_Format ) };
    VHostResult Result = Record( m_Folder.File( i_rFolder ),
      VArguments{ "--card", Card, "--frames", std::to_string( BurnInFrames ) } + Form + i_rMore );
    EXPECT_EQ( 0, Result.m_Run.m_ExitCode ) << Describe( Result.m_Run );
    return Result;
  }

  const TestSupport::VTemporaryFolder m_Folder;
};

TEST_P( BurnInTest, EachFrameCarriesItsLabel )
{
  const VBurnInCase& rCase = GetParam();
  const std::vector<uint8_t> Background = FrameOf( RecordCard( "plain", {} ), 0, rCase.m_pImages );
  const VHostResult Result = RecordCard( "drawn", { "--burn-in", "timecode" } );
  EXPECT_EQ( BurnInFrames, Result.Device().value( "frames_written", 0u ) );
  const std::string Start = Result.Device().value( "start_timecode", "" );
  const size_t RowBytes = Background.size() / 486;
  const uint32_t PerLabel = rCase.m_Rate.m_FramesPerLabel;
  const std::vector<uint8_t> FirstFrame = WithoutCounter( FrameOf( Result, 0, rCase.m_pImages ), RowBytes );
  // The first frame of the recording may be the second of its label.
  const uint32_t Ahead = PerLabel == 1 || FirstFrame == WithoutCounter( Drawn( Background, rCase.m_Format, Start + ".0" ), RowBytes ) ? 0 : 1;
  for( uint32_t Frame = 0; Frame < BurnInFrames; ++Frame )
  {
    const uint32_t Within = ( Frame + Ahead ) % PerLabel;
    const std::string Label = LabelOfFrame( Start, rCase.m_Rate, Frame + Ahead ) + ( PerLabel == 1 ? "" : "." + std::to_string( Within ) );
    const std::vector<uint8_t> Expected = WithoutCounter( Drawn( Background, rCase.m_Format, Label ), RowBytes );
    EXPECT_TRUE( Expected == WithoutCounter( FrameOf( Result, Frame, rCase.m_pImages ), RowBytes ) ) << "frame " << Frame << " is not " << Label;
  }
}

INSTANTIATE_TEST_SUITE_P( Signals, BurnInTest, testing::ValuesIn( BurnInCases ),
  []( const auto& i_rInfo ) { return std::string( i_rInfo.param.m_pName ); } );
