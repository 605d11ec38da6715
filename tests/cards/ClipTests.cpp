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

// A clip with moving pictures and a sweep in two channels
void MakeClip( const std::string& i_rPath, const std::string& i_rSize, const std::string& i_rRate, int i_Frames, double i_SoundSeconds )
{
  RunFFmpeg( { "-f", "lavfi", "-i", "testsrc2=size=" + i_rSize + ":rate=" + i_rRate, "-f", "lavfi", "-i",
    "aevalsrc=0.5*sin(2000*t*t+400*t)|0.25*sin(3000*t):s=48000:d=" + std::to_string( i_SoundSeconds ), "-frames:v", std::to_string( i_Frames ),
    "-c:v", "ffv1", "-pix_fmt", "yuv420p", "-c:a", "pcm_s24le", i_rPath } );
}

class DeckLinkClip : public VCardFixture
{
protected:
  std::string File( const std::string& i_rName ) { return m_Folder.File( i_rName ); }

  void KeepContent()
  {
    m_Client.m_OnFrame = [this]( IDeckLinkVideoInputFrame* i_pFrame, IDeckLinkAudioInputPacket* i_pPacket )
    {
      m_Client.m_Seen.push_back( Look( *i_pFrame, i_pPacket ) );
      const TestSupport::VPixels Pixels = PixelsOf( *i_pFrame );
      m_Pictures.emplace_back( Pixels.m_pBytes, Pixels.m_pBytes + Pixels.m_RowBytes * static_cast<size_t>( i_pFrame->GetHeight() ) );
      if( i_pPacket )
      {
        void* pBytes = nullptr;
        EXPECT_EQ( i_pPacket->GetBytes( &pBytes ), S_OK );
        const uint8_t* pSound = static_cast<const uint8_t*>( pBytes );
        m_Sound.insert( m_Sound.end(), pSound, pSound + i_pPacket->GetSampleFrameCount() * 2 * 4 );
      }
    };
  }

  // Four pictures.
  void PlayOnce( double i_SoundSeconds, const std::string& i_rText )
  {
    MakeClip( File( "clip.mkv" ), "720x576", "25", 4, i_SoundSeconds );
    Plug( i_rText + File( "clip.mkv" ) );
    KeepContent();
    Enable( FourCharacterCode( "pal " ) );
    ASSERT_EQ( m_pInput->EnableAudioInput( 48000, AudioSampleType::Int32, 2 ), S_OK );
    Start();
  }

  // The card's pictures from i_First on, against a file of raw ones
  void ExpectPictures( size_t i_First, const VBytes& i_rExpected )
  {
    const size_t Size = m_Pictures[i_First].size();
    for( size_t i = 0; i < i_rExpected.size() / Size; ++i )
    {
      ASSERT_LT( i_First + i, m_Pictures.size() );
      const auto Begin = i_rExpected.begin() + static_cast<ptrdiff_t>( i * Size );
      ASSERT_TRUE( std::equal( m_Pictures[i_First + i].begin(), m_Pictures[i_First + i].end(), Begin ) ) << "picture " << i_First + i;
    }
  }

  const TestSupport::VTemporaryFolder m_Folder;
  std::vector<VBytes> m_Pictures;
  VBytes m_Sound;
};

VClipInput InputOf( uint32_t i_Width, uint32_t i_Height, double i_Rate, bool i_bInterlaced = false )
{
  VClipInput Input;
  Input.m_Width = i_Width;
  Input.m_Height = i_Height;
  Input.m_FrameRate = i_Rate;
  Input.m_bInterlaced = i_bInterlaced;
  return Input;
}

}

TEST_F( DeckLinkClip, PicturesAndSoundArriveUnchangedInEveryFormatAndLoopWithoutAGap )
{
  MakeClip( File( "clip,a.mkv" ), "1280x720", "50", ClipFrames, 1.0 );
  Plug( "decklink:input=" + File( "clip,a.mkv" ) );
  RunFFmpeg( { "-i", File( "clip,a.mkv" ), "-map", "0:a", "-ar", "48000", "-c:a", "pcm_s32le", "-f", "s32le", File( "sound" ) } );
  // FFmpeg ends the sound with the last picture, by whole packets: what a pass lacks is silence.
  constexpr size_t PassBytes = size_t{ ClipFrames } * 960 * 2 * 4;
  VBytes Sound = ReadFile( File( "sound" ) );
  ASSERT_GT( Sound.size(), PassBytes / 2 );
  Sound.resize( PassBytes );
  const struct
  {
    uint32_t m_Format;
    std::vector<std::string> m_Encoding;
  } Cases[] = { { PixelFormat::YUV8Bit, { "-pix_fmt", "uyvy422" } }, { PixelFormat::YUV10Bit, { "-c:v", "v210" } },
    { PixelFormat::BGRA8Bit, { "-pix_fmt", "bgra" } } };
  KeepContent();
  for( const auto& [Format, Encoding] : Cases )
  {
    std::vector<std::string> Command{ "-i", File( "clip,a.mkv" ), "-map", "0:v" };
    Command.insert( Command.end(), Encoding.begin(), Encoding.end() );
    Command.insert( Command.end(), { "-f", "rawvideo", File( "raw" ) } );
    RunFFmpeg( Command );
    const VBytes Pictures = ReadFile( File( "raw" ) );
    m_Pictures.clear();
    m_Sound.clear();

    // The nearest standard is the clip's own; another format begins it again
    Enable( FourCharacterCode( "hp50" ), Format );
    ASSERT_EQ( m_pInput->EnableAudioInput( 48000, AudioSampleType::Int32, 2 ), S_OK );
    Start();
    Step( 2 * ClipFrames );
    m_pInput->StopStreams();
    ASSERT_EQ( m_Pictures.size(), 2u * ClipFrames );
    ASSERT_EQ( Pictures.size(), ClipFrames * m_Pictures[0].size() );
    ExpectPictures( 0, Pictures );
    ExpectPictures( ClipFrames, Pictures );
    ASSERT_EQ( m_Sound.size(), 2 * PassBytes );
    for( size_t Pass = 0; Pass < 2; ++Pass )
    {
      const auto First = m_Sound.begin() + static_cast<std::ptrdiff_t>( Pass * PassBytes );
      const auto Differs = std::mismatch( Sound.begin(), Sound.end(), First ).first;
      EXPECT_EQ( static_cast<size_t>( Differs - Sound.begin() ), PassBytes ) << "pass " << Pass << ": each begins with its own sound";
    }
  }
  EXPECT_EQ( m_Client.m_Seen.back().m_StreamTime, ( 2 * ClipFrames - 1 ) * 2700000 );
}

TEST_F( DeckLinkClip, WithoutALoopTheSignalIsLostAtTheEndAndMissingSoundIsSilent )
{
  PlayOnce( 0.08, "decklink:loop=0,audio=ramp,input=" );
  Step( 6 );
  ASSERT_EQ( m_Client.m_Seen.size(), 6u );
  EXPECT_TRUE( m_Client.m_Seen[3].m_bSignal );
  EXPECT_FALSE( m_Client.m_Seen[4].m_bSignal );
  EXPECT_FALSE( m_Client.m_Seen[5].m_bSignal );
  EXPECT_EQ( TestSupport::ReadRamp( { m_Sound.data(), 4 * 1920, 2, 4 }, 2 ), 0 ) << "sound that is asked for takes the place of the clip's";
  m_pInput->StopStreams();
  Start();
  Step();
  EXPECT_FALSE( m_Client.m_Seen.back().m_bSignal ) << "the end is for good";
}

TEST_F( DeckLinkClip, SoundShorterThanThePicturesEndsInSilence )
{
  PlayOnce( 0.06, "decklink:loop=0,input=" );
  Step( 4 );
  ASSERT_EQ( m_Sound.size(), 4u * 1920 * 8 );
  const auto LastSound = std::find_if( m_Sound.rbegin(), m_Sound.rend(), []( uint8_t i_Byte ) { return i_Byte != 0; } );
  EXPECT_NEAR( static_cast<double>( m_Sound.rend() - LastSound ), 0.06 * 48000 * 8, 8 );
}

TEST_F( DeckLinkClip, AnotherSizeAndRateAreFittedIntoTheStandard )
{
  // 15 pictures a second, four by three: black at both sides, and each picture more than once
  MakeClip( File( "clip.mkv" ), "320x240", "15", 15, 1.0 );
  Plug( "decklink:standard=HD_1280_720P_6000,loop=0,input=" + File( "clip.mkv" ) );
  KeepContent();
  Enable( FourCharacterCode( "hp60" ) );
  Start();
  Step( 57 );
  ASSERT_EQ( m_Pictures.size(), 57u );
  EXPECT_TRUE( m_Client.m_Seen[56].m_bSignal );
  const TestSupport::VPixels Pixels{ KVZ::IPixelFormat::EU8Y8V8Y8, m_Pictures[20].data(), 1280 * 2 };
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
  EXPECT_TRUE( m_Pictures[20] == m_Pictures[21] || m_Pictures[21] == m_Pictures[22] );
  EXPECT_FALSE( m_Pictures[20] == m_Pictures[28] );
}

TEST_F( DeckLinkClip, AFormatEventShowsTheClipInTheNewStandard )
{
  MakeClip( File( "clip.mkv" ), "1280x720", "50", ClipFrames, 0.5 );
  Plug( "decklink:input=" + File( "clip.mkv" ) );
  KeepContent();
  RestartOnFormat();
  Enable( FourCharacterCode( "hp50" ), PixelFormat::YUV8Bit, InputFlag::FormatDetection );
  Start();
  Step( 2 );
  Event( R"({ "do": "format", "standard": "SD_720_576I_5000" })" );
  Step( 2 );
  EXPECT_EQ( m_Client.m_FormatCalls, 2 );
  ASSERT_EQ( m_Client.m_Seen.size(), 4u );
  EXPECT_TRUE( m_Client.m_Seen[3].m_bSignal );
  EXPECT_EQ( m_Client.m_Seen[3].m_Height, 576 );
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
  EXPECT_NE( RefusalOf( Folder.File( "missing.mov" ) ).find( "No such file" ), std::string::npos );
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
  const VCardKind& rKind = *FindCardKind( "decklink" );
  EXPECT_EQ( NearestStandard( rKind, InputOf( 1920, 1080, 25 ) ), IVideoStandard::EHD_1920_1080P_2500 );
  EXPECT_EQ( NearestStandard( rKind, InputOf( 1920, 1080, 25, true ) ), IVideoStandard::EHD_1920_1080I_5000 );
  EXPECT_EQ( NearestStandard( rKind, InputOf( 1920, 1080, 30000.0 / 1001 ) ), IVideoStandard::EHD_1920_1080P_2997 );
  EXPECT_EQ( NearestStandard( rKind, InputOf( 1920, 1080, 23.976 ) ), IVideoStandard::EHD_1920_1080P_2398 );
  EXPECT_EQ( NearestStandard( rKind, InputOf( 1920, 1088, 24 ) ), IVideoStandard::EHD_1920_1080P_2400 );
  EXPECT_EQ( NearestStandard( rKind, InputOf( 1280, 720, 25 ) ), IVideoStandard::EHD_1280_720P_5000 );
  EXPECT_EQ( NearestStandard( rKind, InputOf( 720, 576, 25 ) ), IVideoStandard::ESD_720_576I_5000 );
  EXPECT_EQ( NearestStandard( rKind, InputOf( 3840, 2160, 60000.0 / 1001 ) ), IVideoStandard::EHD_3840_2160P_5994 );
  EXPECT_EQ( NearestStandard( rKind, VClipInput() ), DefaultStandard );
  EXPECT_EQ( NearestStandard( *FindCardKind( "bluefish444" ), InputOf( 1280, 720, 25 ) ), IVideoStandard::EHD_1280_720P_2500 );
}
