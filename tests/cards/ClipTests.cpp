// Clips on a virtual card, compared with what FFmpeg itself makes of them.
#include "cards/common/CardSpec.h"
#include "cards/common/ClipInput.h"
#include "tests/cards/DeckLinkClient.h"

#include "tests/support/ProgramRun.h"
#include "tests/support/TemporaryFolder.h"

#include <fstream>
#include <iterator>

using namespace CardsTests;
using KVZ::IVideoStandard;

namespace
{

using VBytes = std::vector<uint8_t>;

constexpr int ClipFrames = 12;

VBytes ReadFile( const std::string& i_rPath )
{
  std::ifstream File( i_rPath, std::ios::binary );
  return VBytes( std::istreambuf_iterator<char>( File ), {} );
}

void RunFFmpeg( std::vector<std::string> i_Arguments )
{
  std::vector<std::string> Command{ "ffmpeg", "-nostdin", "-v", "error", "-y" };
  Command.insert( Command.end(), i_Arguments.begin(), i_Arguments.end() );
  const TestSupport::VRunResult Result = TestSupport::RunProgram( Command );
  ASSERT_EQ( Result.m_ExitCode, 0 ) << Result.m_Error;
}

class DeckLinkClip : public VCardFixture
{
protected:
  std::string File( const std::string& i_rName ) { return m_Folder.File( i_rName ); }

  // A clip with moving pictures and a sweep in two channels
  std::string MakeClip( const std::string& i_rSize, const std::string& i_rRate, int i_Frames, double i_SoundSeconds )
  {
    RunFFmpeg( { "-f", "lavfi", "-i", "testsrc2=size=" + i_rSize + ":rate=" + i_rRate, "-f", "lavfi", "-i",
      "aevalsrc=0.5*sin(2000*t*t+400*t)|0.25*sin(3000*t):s=48000:d=" + std::to_string( i_SoundSeconds ), "-frames:v", std::to_string( i_Frames ),
      "-c:v", "ffv1", "-pix_fmt", "yuv420p", "-c:a", "pcm_s24le", File( "clip,a.mkv" ) } );
    return File( "clip,a.mkv" );
  }

  // Streams pictures and sound, and keeps them.
  void Begin( uint32_t i_Mode, uint32_t i_PixelFormat = PixelFormat::YUV8Bit, uint32_t i_Flags = InputFlag::Default )
  {
    m_Client.Record( 2 * 4 );
    Enable( i_Mode, i_PixelFormat, i_Flags );
    ASSERT_EQ( m_pInput->EnableAudioInput( 48000, AudioSampleType::Int32, 2 ), S_OK );
    Start();
  }

  const TestSupport::VTemporaryFolder m_Folder;
  VBytes& m_rVideo = m_Client.m_Video;
  VBytes& m_rSound = m_Client.m_Sound;
};

// The same bytes again without a gap
void ExpectTwice( const VBytes& i_rPass, const VBytes& i_rFound )
{
  const auto PassBytes = static_cast<std::ptrdiff_t>( i_rPass.size() );
  ASSERT_EQ( i_rFound.size(), 2 * i_rPass.size() );
  for( const std::ptrdiff_t First : { std::ptrdiff_t{ 0 }, PassBytes } )
  {
    const auto Differs = std::mismatch( i_rPass.begin(), i_rPass.end(), i_rFound.begin() + First ).first;
    EXPECT_EQ( Differs - i_rPass.begin(), PassBytes ) << "in the pass from byte " << First;
  }
}

}

TEST_F( DeckLinkClip, PicturesAndSoundArriveUnchangedInEveryFormatAndLoopWithoutAGap )
{
  const std::string Clip = MakeClip( "1280x720", "50", ClipFrames, 0.17 );
  Plug( "decklink:input=" + Clip );
  RunFFmpeg( { "-i", Clip, "-map", "0:a", "-ar", "48000", "-c:a", "pcm_s32le", "-f", "s32le", File( "sound" ) } );
  // The sound ends before the last picture: what a pass lacks is silence.
  constexpr size_t PassBytes = size_t{ ClipFrames } * 960 * 2 * 4;
  VBytes Sound = ReadFile( File( "sound" ) );
  ASSERT_EQ( Sound.size(), size_t{ 8160 } * 2 * 4 );
  Sound.resize( PassBytes );
  const struct
  {
    uint32_t m_Format;
    const char* m_pCodec;
    const char* m_pLayout;
  } Cases[] = { { PixelFormat::YUV8Bit, "rawvideo", "uyvy422" }, { PixelFormat::YUV10Bit, "v210", "yuv422p" },
    { PixelFormat::BGRA8Bit, "rawvideo", "bgra" } };
  for( const auto& [Format, pCodec, pLayout] : Cases )
  {
    RunFFmpeg( { "-i", Clip, "-map", "0:v", "-c:v", pCodec, "-pix_fmt", pLayout, "-f", "rawvideo", File( "raw" ) } );
    m_rVideo.clear();
    m_rSound.clear();

    // The nearest standard is the clip's own; another format begins it again
    Begin( FourCharacterCode( "hp50" ), Format );
    Step( 2 * ClipFrames );
    m_pInput->StopStreams();
    ExpectTwice( ReadFile( File( "raw" ) ), m_rVideo );
    ExpectTwice( Sound, m_rSound );
  }
  EXPECT_EQ( m_Client.m_Seen.back().m_StreamTime, ( 2 * ClipFrames - 1 ) * 2700000 );
}

TEST_F( DeckLinkClip, AnotherSizeAndRateAreFittedIntoTheStandardUntilTheClipEndsForGood )
{
  // 15 pictures a second, four by three: black at both sides, and each picture more than once
  Plug( "decklink:standard=HD_1280_720P_6000,loop=0,input=" + MakeClip( "320x240", "15", 15, 1.0 ) );
  Begin( FourCharacterCode( "hp60" ) );
  Step( 57 );
  constexpr size_t PictureBytes = 1280 * 720 * 2;
  ASSERT_EQ( m_rVideo.size(), 57 * PictureBytes );
  EXPECT_TRUE( m_Client.m_Seen[56].m_bSignal );
  const auto PictureAt = [&]( size_t i_Number ) { return m_rVideo.data() + i_Number * PictureBytes; };
  const auto Equal = [&]( size_t i_A, size_t i_B ) { return std::memcmp( PictureAt( i_A ), PictureAt( i_B ), PictureBytes ) == 0; };
  const TestSupport::VPixels Pixels{ KVZ::IPixelFormat::EU8Y8V8Y8, PictureAt( 20 ), 1280 * 2 };
  for( const uint32_t x : { 0u, 150u, 1130u, 1279u } )
  {
    EXPECT_EQ( BrightnessAt( Pixels, x, 360 ), 16 ) << x;
  }
  std::set<int> Levels;
  for( uint32_t x = 170; x < 1110; x += 10 )
  {
    Levels.insert( BrightnessAt( Pixels, x, 360 ) );
  }
  EXPECT_GT( Levels.size(), 5u );
  EXPECT_TRUE( Equal( 20, 21 ) || Equal( 21, 22 ) );
  EXPECT_FALSE( Equal( 20, 28 ) );

  Step( 4 );
  EXPECT_FALSE( m_Client.m_Seen.back().m_bSignal );
  m_pInput->StopStreams();
  Start();
  Step();
  ASSERT_EQ( m_Client.m_Seen.size(), 62u );
  EXPECT_FALSE( m_Client.m_Seen.back().m_bSignal );
}

TEST_F( DeckLinkClip, AFormatEventShowsTheClipInTheNewStandard )
{
  Plug( "decklink:audio=ramp,input=" + MakeClip( "1280x720", "50", ClipFrames, 0.5 ) );
  RestartOnFormat();
  Begin( FourCharacterCode( "hp50" ), PixelFormat::YUV8Bit, InputFlag::FormatDetection );
  Step( 2 );
  Event( R"({ "do": "format", "standard": "SD_720_576I_5000" })" );
  Step( 2 );
  EXPECT_EQ( m_Client.m_FormatCalls, 2 );
  ASSERT_EQ( m_Client.m_Seen.size(), 4u );
  EXPECT_TRUE( m_Client.m_Seen[3].m_bSignal );
  EXPECT_EQ( m_Client.m_Seen[3].m_Height, 576 );
  EXPECT_EQ( TestSupport::ReadRamp( { m_rSound.data(), 2 * 960 + 2 * 1920, 2, 4 }, 2 ), 0 )
    << "sound that is asked for takes the place of the clip's";
}

TEST( ClipInput, WhatCannotBeOpenedIsRefusedWithFFmpegsReason )
{
  const TestSupport::VTemporaryFolder Folder;
  std::ofstream( Folder.File( "text.mov" ) ) << "no clip";
  RunFFmpeg( { "-f", "lavfi", "-i", "sine=d=1", Folder.File( "sound.wav" ) } );
  const auto RefusalOf = []( const std::string& i_rText )
  {
    std::string Error;
    EXPECT_EQ( DeckLinkControl().AddCard( ( "decklink:input=" + i_rText ).c_str(), {}, Error ), 0u );
    EXPECT_EQ( Error.find( '\n' ), std::string::npos );
    EXPECT_NE( Error.find( "input: " ), std::string::npos ) << Error;
    EXPECT_NE( Error.find( "accepted: " ), std::string::npos ) << Error;
    return Error;
  };
  EXPECT_NE( RefusalOf( Folder.File( "text.mov" ) ).find( "Invalid data" ), std::string::npos );
  EXPECT_NE( RefusalOf( Folder.File( "sound.wav" ) ).find( "no pictures" ), std::string::npos );
  EXPECT_NE( RefusalOf( "-f lavfi -i 'testsrc2" ).find( "quotation" ), std::string::npos );
  RefusalOf( "-f nosuchformat -i x" );
}

TEST( ClipInput, OptionsAreSplitAsAShellWould )
{
  using VWords = std::vector<std::string>;
  EXPECT_EQ( SplitOptions( "-f x11grab  -i :99" ), VWords( { "-f", "x11grab", "-i", ":99" } ) );
  EXPECT_EQ( SplitOptions( R"(-i 'a b' "c \" d" e\ f '' g'h'i)" ), VWords( { "-i", "a b", "c \" d", "e f", "", "ghi" } ) );
  EXPECT_EQ( SplitOptions( R"(-i '\')" ), VWords( { "-i", "\\" } ) );
  EXPECT_FALSE( SplitOptions( "-i \"a" ) );
  EXPECT_FALSE( SplitOptions( "-i a\\" ) );
}

TEST( ClipInput, NearestStandardGoesBySizeThenRateThenScan )
{
  const auto Nearest = []( uint32_t i_Width, uint32_t i_Height, double i_Rate, bool i_bInterlaced = false, const char* i_pKind = "decklink" )
  {
    VClipInput Input;
    Input.m_Width = i_Width;
    Input.m_Height = i_Height;
    Input.m_FrameRate = i_Rate;
    Input.m_bInterlaced = i_bInterlaced;
    return NearestStandard( *FindCardKind( i_pKind ), Input );
  };
  EXPECT_EQ( Nearest( 1920, 1080, 25 ), IVideoStandard::EHD_1920_1080P_2500 );
  EXPECT_EQ( Nearest( 1920, 1080, 25, true ), IVideoStandard::EHD_1920_1080I_5000 );
  EXPECT_EQ( Nearest( 1920, 1080, 30000.0 / 1001 ), IVideoStandard::EHD_1920_1080P_2997 );
  EXPECT_EQ( Nearest( 1920, 1080, 23.976 ), IVideoStandard::EHD_1920_1080P_2398 );
  EXPECT_EQ( Nearest( 1920, 1088, 24 ), IVideoStandard::EHD_1920_1080P_2400 );
  EXPECT_EQ( Nearest( 1280, 720, 25 ), IVideoStandard::EHD_1280_720P_5000 );
  EXPECT_EQ( Nearest( 1280, 720, 25, false, "bluefish444" ), IVideoStandard::EHD_1280_720P_2500 );
  EXPECT_EQ( Nearest( 0, 0, 0 ), DefaultStandard );
}
