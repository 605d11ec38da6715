// Pictures and sounds as an independent reader sees them.
#include "cards/common/Painter.h"
#include "cards/common/Sound.h"

#include "tests/support/CounterReader.h"
#include "tests/support/RampReader.h"

#include <gtest/gtest.h>

using namespace VirtualCards;
using KVZ::IPixelFormat;
using KVZ::IVideoStandard;
using TestSupport::VPixels;

namespace
{

VPictureFormat FormatOf( IVideoStandard::Enum i_Standard, IPixelFormat::Enum i_Format ) { return { KVZ::FindVideoStandard( i_Standard ), i_Format }; }

VPixels PixelsOf( const VPictureFormat& i_rFormat, VPicture& i_rPicture )
{
  return { i_rFormat.m_PixelFormat, i_rPicture.Bytes( i_rFormat.Size() ), i_rFormat.RowBytes() };
}

VSignalFrame FrameNumber( uint64_t i_Number )
{
  VSignalFrame Frame;
  Frame.m_Number = i_Number;
  VSignalTimecode Timecode;
  Timecode.m_Label.m_Standard = KVZ::ITimecodeStandard::ETimecode25;
  Timecode.m_Label.m_Frames = static_cast<uint8_t>( i_Number % 25 );
  Frame.m_Timecode = Timecode;
  return Frame;
}

std::vector<uint8_t> BytesOf( const VPictureFormat& i_rFormat, VPicture& i_rPicture )
{
  const uint8_t* pBytes = i_rPicture.Bytes( i_rFormat.Size() );
  return { pBytes, pBytes + i_rFormat.Size() };
}

// Every format at three sizes, with the given pattern
template<class TCheck>
void ForEachFormat( EPattern i_Pattern, TCheck i_Check )
{
  for( const IVideoStandard::Enum Standard :
    { IVideoStandard::ESD_720_486I_5994, IVideoStandard::EHD_1280_720P_5000, IVideoStandard::EHD_1920_1080P_2500 } )
  {
    for( const IPixelFormat::Enum Format : { IPixelFormat::EU8Y8V8Y8, IPixelFormat::EY8U8Y8V8, IPixelFormat::EU10Y10V10Y10, IPixelFormat::ER8G8B8,
           IPixelFormat::EB8G8R8, IPixelFormat::ER8G8B8u8, IPixelFormat::EB8G8R8u8, IPixelFormat::ELuminance8 } )
    {
      SCOPED_TRACE( KVZ::ToName( Standard ) + " " + KVZ::ToName( Format ) );
      const VPictureFormat Picture = FormatOf( Standard, Format );
      EXPECT_EQ( Picture.Size(), KVZ::GetImageSize( Format, Picture.Width(), Picture.Height() ) );
      i_Check( Picture, *MakePainter( i_Pattern, Picture ) );
    }
  }
}

}

TEST( CounterPattern, AReaderFindsTheNumberInEveryFormat )
{
  ForEachFormat( EPattern::Counter,
    []( const VPictureFormat& i_rFormat, const IPainter& i_rPainter )
    {
      VPicture Picture;
      for( const uint64_t Number : { 0ull, 1ull, 0x80000001ull, 0xDEADBEEFull, 0x12345678ull } )
      {
        i_rPainter.Paint( Picture, FrameNumber( Number ) );
        EXPECT_EQ( TestSupport::ReadCounter( PixelsOf( i_rFormat, Picture ) ), static_cast<uint32_t>( Number ) );
      }
    } );
}

TEST( CounterPattern, CellsHaveExactLevelsAndEdges )
{
  const VPictureFormat Format = FormatOf( IVideoStandard::EHD_1920_1080P_2500, IPixelFormat::EU10Y10V10Y10 );
  VPicture Picture;
  MakeCounterPainter( Format )->Paint( Picture, FrameNumber( 1 ) );
  const VPixels Pixels = PixelsOf( Format, Picture );
  for( uint32_t x = 0; x < 512; ++x )
  {
    ASSERT_EQ( TestSupport::BrightnessAt( Pixels, x, 15 ), x >= 496 ? 235 : 16 ) << x;
    ASSERT_EQ( TestSupport::BrightnessAt( Pixels, x, 16 ), x >= 496 ? 16 : 235 ) << x;
  }
  EXPECT_EQ( TestSupport::BrightnessAt( Pixels, 512, 0 ), TestSupport::BrightnessAt( Pixels, 512, 31 ) );
  EXPECT_LT( TestSupport::BrightnessAt( Pixels, 600, 500 ), TestSupport::BrightnessAt( Pixels, 1600, 500 ) );
}

TEST( Patterns, APictureThatIsReusedEqualsAFreshOne )
{
  for( const EPattern Pattern : { EPattern::Bars, EPattern::Counter, EPattern::Noise } )
  {
    ForEachFormat( Pattern,
      []( const VPictureFormat& i_rFormat, const IPainter& i_rPainter )
      {
        VPicture Reused;
        MakeBlackPainter( i_rFormat )->Paint( Reused, {} );
        i_rPainter.Paint( Reused, FrameNumber( 1 ) );
        i_rPainter.Paint( Reused, FrameNumber( 100 ) );
        VPicture Fresh;
        i_rPainter.Paint( Fresh, FrameNumber( 100 ) );
        EXPECT_TRUE( BytesOf( i_rFormat, Reused ) == BytesOf( i_rFormat, Fresh ) );
        i_rPainter.Paint( Reused, FrameNumber( 101 ) );
        EXPECT_FALSE( BytesOf( i_rFormat, Reused ) == BytesOf( i_rFormat, Fresh ) );
      } );
  }
}

TEST( BarsPattern, SevenBarsWithTheirPublishedLevels )
{
  // 75 % bars in BT.709, 8 bits (SMPTE RP 219): luma of grey, yellow, cyan, green, magenta, red, blue
  const int Luma[] = { 180, 168, 145, 133, 63, 51, 28 };
  const VPictureFormat Format = FormatOf( IVideoStandard::EHD_1920_1080P_2500, IPixelFormat::EU8Y8V8Y8 );
  VPicture Picture;
  MakeBarsPainter( Format )->Paint( Picture, FrameNumber( 0 ) );
  for( uint32_t Bar = 0; Bar < 7; ++Bar )
  {
    EXPECT_NEAR( TestSupport::BrightnessAt( PixelsOf( Format, Picture ), Bar * 1920 / 7 + 137, 300 ), Luma[Bar], 1 ) << Bar;
  }
}

TEST( Sound, TheToneIsContinuousAtMinus18dBFSAndDiffersByChannel )
{
  VSound Sound;
  Sound.m_Audio = EAudio::Tone;
  Sound.m_SignalChannels = 2;
  std::vector<uint8_t> Bytes;
  for( const uint32_t Samples : { 1602u, 1601u, 1602u, 1601u, 1602u } )
  {
    Sound.m_FirstSample = Bytes.size() / 4;
    Sound.m_Samples = Samples;
    Bytes.resize( Bytes.size() + size_t{ Samples } * 4 );
    Sound.Write( { 16, 2 }, Bytes.data() + Sound.m_FirstSample * 4 );
  }
  const TestSupport::VSamples All{ Bytes.data(), Bytes.size() / 4, 2, 2 };
  int32_t Peak = 0;
  bool bDiffers = false;
  for( size_t i = 48; i < All.m_Frames; ++i )
  {
    Peak = std::max( Peak, SampleAt( All, i, 0 ) );
    bDiffers = bDiffers || SampleAt( All, i, 0 ) != SampleAt( All, i, 1 );
    ASSERT_EQ( SampleAt( All, i, 0 ), SampleAt( All, i - 48, 0 ) ) << "not 1 kHz at " << i;
  }
  EXPECT_NEAR( Peak, 4125, 1 );   // 32768 * 10^(-18/20)
  EXPECT_TRUE( bDiffers );
}

TEST( Sound, AClipsSamplesKeepTheirUpperHalfAndTheirChannels )
{
  VSound Sound;
  Sound.m_bClip = true;
  Sound.m_SignalChannels = 16;
  Sound.m_Samples = 2;
  Sound.m_Clip = { 0x12345678, -0x10000, 0x7FFFFFFF, 0 };
  Sound.m_ClipChannels = 2;
  std::vector<int16_t> Samples( 2 * 8 );
  Sound.Write( { 16, 8 }, reinterpret_cast<uint8_t*>( Samples.data() ) );
  EXPECT_EQ( Samples, std::vector<int16_t>( { 0x1234, -1, 0, 0, 0, 0, 0, 0, 0x7FFF, 0, 0, 0, 0, 0, 0, 0 } ) );
}
