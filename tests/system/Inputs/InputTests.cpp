// A clip played into a card comes out of the file picture by picture and sample by sample as FFmpeg itself decodes it.
#include "tests/support/OutsideReaders.h"
#include "tests/support/TemporaryFolder.h"
#include "tests/support/TvidParser.h"
#include "tests/support/system/PrivateDisplay.h"
#include "tests/support/system/StageHost.h"

#include <gtest/gtest.h>

#include <algorithm>
#include <cstring>
#include <set>

using namespace SystemTests;

namespace
{

constexpr size_t ClipFrames = 50;
constexpr size_t ClipRate = 50;
constexpr size_t SamplesPerFrame = 48000 / ClipRate;
constexpr uint32_t ClipChannels = 2;

using VPictures = std::vector<std::vector<uint8_t>>;

struct VKind
{
  const char* m_pName;
  const char* m_pPixelFormat;   // FFmpeg's, whose first bytes are what a card delivers by itself
  size_t m_BytesPerPixel;
};

constexpr size_t Pixels = 1280 * 720;

VPictures DecodedPictures( const std::string& i_rClip, const VKind& i_rKind )
{
  constexpr size_t FrameBytes = Pixels * 2;
  const std::vector<uint8_t> All = TestSupport::DecodeVideo( i_rClip, i_rKind.m_pPixelFormat );
  VPictures Pictures;
  for( const uint8_t* pFrame = All.data(); pFrame < All.data() + All.size(); pFrame += FrameBytes )
  {
    Pictures.emplace_back( pFrame, pFrame + Pixels * i_rKind.m_BytesPerPixel );
  }
  return Pictures;
}

VPictures RecordedPictures( const TestSupport::VTvidParser& i_rFile )
{
  VPictures Pictures;
  for( const auto& rFrame : i_rFile.Frames() )
  {
    Pictures.push_back( i_rFile.Video( rFrame ) );
  }
  return Pictures;
}

}

class ClipTest : public testing::TestWithParam<VKind>
{
protected:
  static VArguments Card( const std::string& i_rKeys ) { return { "--card", std::string( GetParam().m_pName ) + ":" + i_rKeys }; }

  std::string MakeClip()
  {
    const std::string Path = m_Folder.File( "clip.mkv" );
    const std::string Rate = std::to_string( ClipRate );
    const std::string Seconds = std::to_string( static_cast<double>( ClipFrames ) / ClipRate );
    const VRunResult Run = TestSupport::RunProgram( VArguments{ "ffmpeg", "-nostdin", "-v", "error", "-f", "lavfi", "-i",
      "testsrc2=s=1280x720:r=" + Rate, "-f", "lavfi", "-i", "sine=frequency=440:sample_rate=48000", "-t", Seconds, "-ac", "2", "-c:v", "mpeg4",
      "-q:v", "3", "-pix_fmt", "yuv420p", "-c:a", "pcm_s16le", Path } );
    EXPECT_EQ( 0, Run.m_ExitCode ) << Run.m_Error;
    return Path;
  }

  const TestSupport::VTemporaryFolder m_Folder;
};

TEST_P( ClipTest, EveryPictureAndSampleIsThatOfTheClip )
{
  const std::string Clip = MakeClip();
  const VPictures Expected = DecodedPictures( Clip, GetParam() );
  ASSERT_EQ( ClipFrames, Expected.size() );
  ASSERT_EQ( ClipFrames, std::set( Expected.begin(), Expected.end() ).size() ) << "pictures must differ to tell one from another";

  // Longer than the clip: it begins again.
  constexpr size_t FrameCount = ClipFrames + ClipFrames / 2;
  const VHostResult Result = Record( m_Folder.File( "out" ), Card( "input=" + Clip ) + VArguments{ "--frames", std::to_string( FrameCount ) } );
  ASSERT_EQ( 0, Result.m_Run.m_ExitCode ) << Describe( Result.m_Run );
  const TestSupport::VTvidParser File( Result.Path() );
  EXPECT_EQ( 1280u, File.Width() );
  EXPECT_EQ( 2700000, File.Number( "FramePeriodInTicks" ) ) << "the standard nearest to the clip";

  const VPictures Recorded = RecordedPictures( File );
  ASSERT_EQ( FrameCount, Recorded.size() );
  const size_t First = static_cast<size_t>( std::find( Expected.begin(), Expected.end(), Recorded.front() ) - Expected.begin() );
  ASSERT_LT( First, ClipFrames ) << "the first picture is none of the clip's";
  for( size_t Index = 0; Index < FrameCount; ++Index )
  {
    ASSERT_TRUE( Expected[( First + Index ) % ClipFrames] == Recorded[Index] )
      << "frame " << Index << ", the clip's " << ( First + Index ) % ClipFrames;
  }

  const std::vector<uint8_t> Bytes = TestSupport::DecodeAudio( Clip, "s16le" );
  std::vector<uint16_t> Samples( Bytes.size() / sizeof( uint16_t ) );
  std::memcpy( Samples.data(), Bytes.data(), Bytes.size() );
  ASSERT_EQ( ClipFrames * SamplesPerFrame * ClipChannels, Samples.size() );
  for( size_t Index = 0; Index < ClipFrames - First; ++Index )
  {
    const std::vector<uint16_t> Sound = File.Audio( File.Frames()[Index] );
    ASSERT_EQ( SamplesPerFrame * File.Channels(), Sound.size() );
    for( size_t Sample = 0; Sample < SamplesPerFrame; ++Sample )
    {
      for( uint32_t Channel = 0; Channel < ClipChannels; ++Channel )
      {
        ASSERT_EQ( Samples[( ( First + Index ) * SamplesPerFrame + Sample ) * ClipChannels + Channel], Sound[Sample * File.Channels() + Channel] )
          << "frame " << Index << ", sample " << Sample << ", channel " << Channel;
      }
    }
  }
}

// A clip that is not begun again is a signal that goes away.
TEST_P( ClipTest, AnEndOfTheClipIsALossOfSignal )
{
  const std::string Clip = MakeClip();
  const VHostResult Result = Record( m_Folder.File( "out" ), Card( "loop=0,input=" + Clip ) + VArguments{ "--frames", "500" } );
  EXPECT_EQ( 3, Result.m_Run.m_ExitCode ) << Describe( Result.m_Run );
  EXPECT_EQ( 0, Result.Device().value( "lost", nlohmann::json::object() ).value( "card", -1 ) ) << "what has ended is not dropped";
  const VPictures Expected = DecodedPictures( Clip, GetParam() );
  const VPictures Recorded = RecordedPictures( TestSupport::VTvidParser( Result.Path() ) );
  ASSERT_FALSE( Recorded.empty() );
  ASSERT_LE( Recorded.size(), Expected.size() );
  EXPECT_TRUE( std::equal( Recorded.rbegin(), Recorded.rend(), Expected.rbegin() ) ) << "the last pictures are not the clip's last";
}

INSTANTIATE_TEST_SUITE_P( Kinds, ClipTest, testing::Values( VKind{ "decklink", "uyvy422", 2 }, VKind{ "bluefish444", "yuv422p", 1 } ),
  []( const auto& i_rInfo ) { return std::string( i_rInfo.param.m_pName ); } );

// A live input: what a program draws into a window.
TEST( Screen, AWindowIsRecordedAsItMovesByBothKindsOfCard )
{
  constexpr double PatienceSeconds = 30.0;
  constexpr size_t FrameCount = 75;
  const VPrivateDisplay Display;

  TestSupport::VProgram Player( { "ffplay", "-v", "info", "-stats", "-f", "lavfi", "-i", "testsrc2=s=720x576:r=25", "-noborder" },
    { .m_Environment = { "DISPLAY=" + Display.Name(), "SDL_VIDEODRIVER=x11", "SDL_AUDIODRIVER=dummy" } } );
  ASSERT_TRUE( Player.WaitFor( "M-V:", PatienceSeconds ) ) << Player.Printed();

  const TestSupport::VTemporaryFolder Folder;
  const std::string Input = ":standard=SD_720_576I_5000,input=-f x11grab -framerate 25 -video_size 720x576 -i " + Display.Name();
  const VHostResult Result = Record( Folder.File( "out" ),
    { "--card", "decklink" + Input, "--card", "bluefish444" + Input, "--pixel-format", "U8Y8V8Y8", "--frames", std::to_string( FrameCount ) } );
  EXPECT_EQ( 0, Result.m_Run.m_ExitCode ) << Describe( Result.m_Run );
  for( size_t Device = 0; Device < 2; ++Device )
  {
    const VPictures Pictures = RecordedPictures( TestSupport::VTvidParser( Result.Path( Device ) ) );
    EXPECT_EQ( FrameCount, Pictures.size() );
    EXPECT_GT( std::set( Pictures.begin(), Pictures.end() ).size(), FrameCount / 4 ) << "the window stood still";
  }
}
