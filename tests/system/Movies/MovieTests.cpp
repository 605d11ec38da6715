// Recordings into the containers that everybody reads, judged by FFmpeg alone: as many frames as were asked for, the exact rate, the card's own
// pictures and sound without a gap, and the timecode that the host tells.
#include "tests/support/CounterReader.h"
#include "tests/support/EbmlParser.h"
#include "tests/support/OutsideReaders.h"
#include "tests/support/RampReader.h"
#include "tests/support/TemporaryFolder.h"
#include "tests/support/TvidParser.h"
#include "tests/support/system/Rates.h"
#include "tests/support/system/StageHost.h"

#include <gtest/gtest.h>

#include <csignal>
#include <fstream>
#include <iterator>

using namespace SystemTests;

namespace
{

constexpr uint32_t Width = 720;
constexpr uint64_t FrameCount = 67;
constexpr uint32_t Channels = 2;   // a number that all containers take
constexpr size_t CounterLines = 32;

struct VMovieRow
{
  const char* m_pContainer;
  const char* m_pVideo;
  const char* m_pCodec;
  bool m_bTimecodeTrack;
};

// What ffprobe says of every timecode track
const std::string UnknownTimecodeCodec = "Unsupported codec with id 0 for input stream 2\n";

const VMovieRow Movies[] = {
  { "mkv", "uncompressed", "rawvideo", false },
  { "mkv", "jpeg", "mjpeg", false },
  { "mov", "uncompressed", "rawvideo", true },
  { "mov", "jpeg", "mjpeg", true },
  { "mp4", "uncompressed", "rawvideo", true },
  { "mp4", "jpeg", "mjpeg", true },
  { "avi", "uncompressed", "rawvideo", false },
  { "avi", "jpeg", "mjpeg", false },
};

std::string CardText( const VSignalRate& i_rRate, const std::string& i_rStartLabel )
{
  return std::string( "decklink:pattern=counter,audio=ramp,speed=2,standard=" ) + i_rRate.m_pStandard + ",timecode=" + i_rStartLabel;
}

// Samples of a card's frames before this one.
uint64_t SamplesBefore( const VSignalRate& i_rRate, uint64_t i_Frame )
{
  uint64_t Sum = 0;
  for( uint64_t Frame = 0; Frame < i_Frame; ++Frame )
  {
    Sum += i_rRate.m_SampleCadence[Frame % i_rRate.m_SampleCadence.size()];
  }
  return Sum;
}

}

class MovieTest : public testing::TestWithParam<VMovieRow>
{
protected:
  // The counter of the first frame. All of them follow one another, and where pictures are stored as they are, the card's gradient stands below
  // each counter.
  uint32_t CheckPictures( const std::string& i_rPath, uint32_t i_Height, const std::vector<uint8_t>& i_rBelowCounter )
  {
    const bool bExact = !i_rBelowCounter.empty();
    const KVZ::IPixelFormat::Enum Format = bExact ? KVZ::IPixelFormat::EU8Y8V8Y8 : KVZ::IPixelFormat::EB8G8R8u8;
    const size_t RowBytes = KVZ::GetImageSize( Format, Width, 1 );
    const std::vector<uint8_t> Pictures = TestSupport::DecodeVideo( i_rPath, bExact ? "uyvy422" : "bgr0" );
    EXPECT_EQ( Pictures.size(), FrameCount * RowBytes * i_Height );
    uint32_t First = 0;
    for( size_t Frame = 0; Frame < Pictures.size() / ( RowBytes * i_Height ); ++Frame )
    {
      SCOPED_TRACE( Frame );
      const uint8_t* pPicture = Pictures.data() + Frame * RowBytes * i_Height;
      const auto Counter = TestSupport::ReadCounter( { Format, pPicture, RowBytes } );
      EXPECT_TRUE( Counter ) << "no counter in the picture";
      First = Frame == 0 ? Counter.value_or( 0 ) : First;
      EXPECT_EQ( Counter.value_or( 0 ), First + Frame );
      EXPECT_TRUE( std::equal( i_rBelowCounter.begin(), i_rBelowCounter.end(), pPicture + CounterLines * RowBytes ) );
    }
    return First;
  }

  // All of the card's samples of these frames, and no others.
  void CheckSound( const std::string& i_rPath, const VSignalRate& i_rRate, uint32_t i_FirstFrame )
  {
    const std::vector<uint8_t> Sound = TestSupport::DecodeAudio( i_rPath, "s16le" );
    const uint64_t Before = SamplesBefore( i_rRate, i_FirstFrame );
    const size_t Samples = Sound.size() / ( Channels * sizeof( int16_t ) );
    EXPECT_EQ( Samples, SamplesBefore( i_rRate, i_FirstFrame + FrameCount ) - Before );
    EXPECT_EQ( TestSupport::ReadRamp( { Sound.data(), Samples, Channels, sizeof( int16_t ) }, Channels ), static_cast<uint16_t>( Before ) );
  }

  // What the card shows below the counter, from a recording that keeps every byte.
  std::vector<uint8_t> BelowCounter( const VSignalRate& i_rRate )
  {
    const VRecordResult Result = Record( m_Folder.File( "reference" ), { "--card", CardText( i_rRate, "01:00:00:00" ), "--frames", "2" } );
    EXPECT_EQ( 0, Result.m_Run.m_ExitCode ) << Describe( Result.m_Run );
    TestSupport::VTvidParser File( Result.Path() );
    const std::vector<uint8_t> Picture = File.Video( File.Frames().at( 0 ) );
    return { Picture.begin() + static_cast<std::ptrdiff_t>( CounterLines * Width * 2 ), Picture.end() };
  }

  const TestSupport::VTemporaryFolder m_Folder;
};

TEST_P( MovieTest, HoldsTheCardsFramesSoundAndTimecode )
{
  const VMovieRow& rRow = GetParam();
  const std::string StartLabel = "00:00:59;20";   // the recording passes labels that drop-frame leaves out
  const VRecordResult Result = Record( m_Folder.File( "out" ),
    { "--card", CardText( Rate2997Drop, StartLabel ), "--frames", std::to_string( FrameCount ), "--container", rRow.m_pContainer, "--video",
      rRow.m_pVideo, "--audio-channels", std::to_string( Channels ) } );
  ASSERT_EQ( 0, Result.m_Run.m_ExitCode ) << Describe( Result.m_Run );
  EXPECT_EQ( FrameCount, Result.Device().value( "frames_written", 0u ) );
  const std::string Path = Result.Path();
  EXPECT_EQ( Path.substr( Path.size() - 4 ), std::string( "." ) + rRow.m_pContainer );

  std::map<std::string, std::string> Told = TestSupport::AskFFprobe( Path, rRow.m_bTimecodeTrack ? UnknownTimecodeCodec : "" );
  EXPECT_EQ( Told["streams.stream.0.codec_name"], rRow.m_pCodec );
  EXPECT_EQ( Told["streams.stream.0.nb_read_frames"], std::to_string( FrameCount ) );
  EXPECT_EQ( Told["streams.stream.0.r_frame_rate"], "30000/1001" );
  EXPECT_EQ( Told["streams.stream.0.avg_frame_rate"], "30000/1001" );
  EXPECT_EQ( Told["streams.stream.1.codec_name"], "pcm_s16le" );
  EXPECT_EQ( Told["streams.stream.1.channels"], std::to_string( Channels ) );
  EXPECT_EQ( Told["streams.stream.1.sample_rate"], "48000" );
  if( rRow.m_bTimecodeTrack )
  {
    EXPECT_EQ( Told["streams.stream.2.tags.timecode"], Result.Device().value( "start_timecode", "" ) );
  }

  const bool bExact = std::string( rRow.m_pVideo ) == "uncompressed";
  const uint32_t First = CheckPictures( Path, 486, bExact ? BelowCounter( Rate2997Drop ) : std::vector<uint8_t>() );
  EXPECT_EQ( LabelOfFrame( StartLabel, Rate2997Drop, First ), Result.Device().value( "start_timecode", "" ) );
  CheckSound( Path, Rate2997Drop, First );
}

INSTANTIATE_TEST_SUITE_P( Containers, MovieTest, testing::ValuesIn( Movies ),
  []( const auto& i_rInfo ) { return std::string( i_rInfo.param.m_pContainer ) + "_" + i_rInfo.param.m_pVideo; } );

// Matroska is made so that a file which nobody closed can be read.
TEST( KilledMovieTest, AMatroskaRecordingHoldsItsFrames )
{
  constexpr int64_t EnoughFrames = 50;
  const TestSupport::VTemporaryFolder Folder;
  VRunOptions Options;
  int64_t Captured = 0;
  Options.m_OnErrorText = [&Captured]( pid_t i_Child, const std::string& i_rText )
  {
    const std::vector<int64_t> Counts = NumbersBehind( "frames_captured=", i_rText );
    if( Captured == 0 && !Counts.empty() && Counts.back() >= EnoughFrames )
    {
      Captured = Counts.back();
      kill( i_Child, SIGKILL );
    }
  };
  const VRecordResult Result = Record( Folder.File( "out" ),
    { "--card", CardText( Rate25, "01:00:00:00" ), "--frames", "100000", "--container", "mkv", "--progress" }, Options );
  EXPECT_EQ( SIGKILL, Result.m_Run.m_Signal ) << Describe( Result.m_Run );
  const std::string Path = Folder.File( "out/take_vi0.mkv" );
  std::ifstream Stream( Path, std::ios::binary );
  const TestSupport::VEbmlParser File( { std::istreambuf_iterator<char>( Stream ), {} } );
  const std::string Whole = std::to_string( File.FindAll( { TestSupport::Ebml::Segment, TestSupport::Ebml::Cluster } ).size() );
  EXPECT_TRUE( File.Find( { TestSupport::Ebml::Segment } ).m_bUnknownSize );
  EXPECT_NE( Whole, "0" );
  const VRunResult Probe = TestSupport::RunProgram(
    { "ffprobe", "-v", "quiet", "-count_frames", "-show_entries", "stream=nb_read_frames", "-of", "csv=p=0", Path } );
  EXPECT_EQ( Probe.m_Output, Whole + "\n" + Whole + "\n" ) << "pictures and sounds";
}
