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

#include <boost/filesystem/operations.hpp>
#include <gtest/gtest.h>

#include <csignal>
#include <cstdlib>

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
  const char* m_pTag;
  bool m_bTimecodeTrack;
};

// What ffprobe says of every timecode track
const std::string UnknownTimecodeCodec = "Unsupported codec with id 0 for input stream 2\n";

const VMovieRow Movies[] = {
  { "mkv", "uncompressed", "rawvideo", "UYVY", false },
  { "mkv", "jpeg", "mjpeg", "[0][0][0][0]", false },
  { "mov", "uncompressed", "rawvideo", "2vuy", true },
  { "mov", "jpeg", "mjpeg", "jpeg", true },
  { "mp4", "uncompressed", "rawvideo", "2vuy", true },
  { "mp4", "jpeg", "mjpeg", "jpeg", true },
  { "avi", "uncompressed", "rawvideo", "UYVY", false },
  { "avi", "jpeg", "mjpeg", "MJPG", false },
};

std::string CardText( const VSignalRate& i_rRate, const std::string& i_rStartLabel )
{
  return CounterCardText( i_rRate, "speed=2,timecode=" + i_rStartLabel );
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

void CheckByMkvToolNix( const std::string& i_rPath )
{
  const nlohmann::json Told = nlohmann::json::parse( TestSupport::RunProgram( { "mkvmerge", "-J", i_rPath } ).m_Output, nullptr, false );
  EXPECT_TRUE( Told.value( "warnings", nlohmann::json() ).empty() && Told.value( "errors", nlohmann::json() ).empty() ) << Told;
  EXPECT_EQ( Told.value( "tracks", nlohmann::json() ).size(), 2u ) << Told;
  const VRunResult Info = TestSupport::RunProgram( { "mkvinfo", "--all", "--check-mode", i_rPath } );
  EXPECT_EQ( Info.m_ExitCode, 0 ) << Describe( Info );
  for( const char* pWord : { "(Unknown element", "arning", "rror", "damaged" } )
  {
    EXPECT_EQ( Info.m_Output.find( pWord ), std::string::npos ) << Info.m_Output.substr( Info.m_Output.find( pWord ), 200 );
  }
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
    const VHostResult Result = Record( m_Folder.File( "reference" ), { "--card", CardText( i_rRate, "01:00:00:00" ), "--frames", "2" } );
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
  const VHostResult Result = Record( m_Folder.File( "out" ),
    { "--card", CardText( Rate2997Drop, StartLabel ), "--frames", std::to_string( FrameCount ), "--container", rRow.m_pContainer, "--video",
      rRow.m_pVideo, "--audio-channels", std::to_string( Channels ) } );
  ASSERT_EQ( 0, Result.m_Run.m_ExitCode ) << Describe( Result.m_Run );
  EXPECT_EQ( FrameCount, Result.Device().value( "frames_written", 0u ) );
  const std::string Path = Result.Path();
  EXPECT_EQ( Path.substr( Path.size() - 4 ), std::string( "." ) + rRow.m_pContainer );

  std::map<std::string, std::string> Told = TestSupport::AskFFprobe( Path, rRow.m_bTimecodeTrack ? UnknownTimecodeCodec : "" );
  EXPECT_EQ( Told["streams.stream.0.codec_name"], rRow.m_pCodec );
  EXPECT_EQ( Told["streams.stream.0.codec_tag_string"], rRow.m_pTag );
  EXPECT_EQ( Told["streams.stream.0.width"] + " x " + Told["streams.stream.0.height"], "720 x 486" );
  EXPECT_NEAR( std::strtod( Told["format.duration"].c_str(), nullptr ), FrameCount * 1001.0 / 30000.0, FrameCount * 1e-6 )
    << "whole microseconds a frame";
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

  EXPECT_EQ( TestSupport::AskMediaInfo( Path, "Video;%Width% %Height% %FrameRate% %FrameCount%" ), "720 486 29.970 67" );
  if( std::string( rRow.m_pContainer ) != "mp4" )   // there MediaInfo does not know this description of PCM
  {
    EXPECT_EQ( TestSupport::AskMediaInfo( Path, "Audio;%Channels% %BitDepth% %SamplingRate%" ), "2 16 48000" );
  }
  if( std::string( rRow.m_pContainer ) == "mkv" )
  {
    CheckByMkvToolNix( Path );
  }

  const bool bExact = std::string( rRow.m_pVideo ) == "uncompressed";
  const uint32_t First = CheckPictures( Path, 486, bExact ? BelowCounter( Rate2997Drop ) : std::vector<uint8_t>() );
  EXPECT_EQ( LabelOfFrame( StartLabel, Rate2997Drop, First ), Result.Device().value( "start_timecode", "" ) );
  CheckSound( Path, Rate2997Drop, First );
}

INSTANTIATE_TEST_SUITE_P( Containers, MovieTest, testing::ValuesIn( Movies ),
  []( const auto& i_rInfo ) { return std::string( i_rInfo.param.m_pContainer ) + "_" + i_rInfo.param.m_pVideo; } );

// What is another in each take: times, and the container.
bool IsOfOneTake( const std::string& i_rKey )
{
  const auto Has = [&]( const char* i_pWord ) { return i_rKey.find( i_pWord ) != std::string::npos; };
  return Has( "Time" ) || Has( "Start" ) || Has( "Container" );
}

TEST( MovieAttributesTest, MatroskaHoldsAllThatTheSystemsOwnContainerHolds )
{
  const TestSupport::VTemporaryFolder Folder;
  const auto Take = [&]( const std::string& i_rContainer )
  {
    return Record( Folder.File( i_rContainer ),
      { "--card", CardText( Rate25, "01:00:00:00" ), "--frames", "3", "--container", i_rContainer, "--audio-channels", "2" } )
      .Path();
  };
  const TestSupport::VTvidParser Reference( Take( "tvid" ) );
  const std::string Matroska = ReadFile( Take( "mkv" ) );
  auto Tags = TestSupport::ReadTags( TestSupport::VEbmlParser( { Matroska.begin(), Matroska.end() } ) );
  EXPECT_EQ( Tags.size(), Reference.Internal().size() + Reference.External().size() );
  for( const auto& [pPrefix, rBlock] :
    { std::pair( "Tarvo.Internal.", Reference.Internal() ), std::pair( "Tarvo.External.", Reference.External() ) } )
  {
    for( const auto& [rKey, rValue] : rBlock )
    {
      const auto Found = Tags.find( pPrefix + rKey );
      ASSERT_NE( Found, Tags.end() ) << rKey;
      const std::string* const pText = std::get_if<std::string>( &rValue );
      EXPECT_TRUE( !pText || IsOfOneTake( rKey ) || *pText == Found->second ) << rKey << " " << Found->second;
    }
  }
}

// A place that takes everything and keeps nothing: the writer has no complaint, the file is wrong all the same.
TEST( MovieCheckTest, AFinishedMovieThatCannotBeReadIsAFailure )
{
  for( const std::string Container : { "mov", "mp4" } )
  {
    const TestSupport::VTemporaryFolder Folder;
    const std::string Path = Folder.File( "take_vi0." + Container );
    boost::filesystem::create_symlink( "/dev/null", Path );
    const VHostResult Result = Record( Folder.File( "" ),
      { "--card", CardText( Rate25, "01:00:00:00" ), "--frames", "3", "--container", Container, "--overwrite" } );
    EXPECT_EQ( 1, Result.m_Run.m_ExitCode ) << Describe( Result.m_Run );
    EXPECT_NE( std::string::npos, Result.m_Run.m_Error.find( "is not right: The file has no tracks: it was not finished." ) )
      << Describe( Result.m_Run );
    EXPECT_FALSE( Result.Device().value( "errors", nlohmann::json::array() ).empty() ) << Describe( Result.m_Run );
  }
}

TEST( MovieLimitTest, ARecordingThatIsToBeLongerThanItsContainerIsWarnedOf )
{
  const TestSupport::VTemporaryFolder Folder;
  const VRunOptions Options = SignalAfterFrames( { SIGINT }, 0 );
  const VArguments Card = { "--card", CardText( Rate2997Drop, "01:00:00;00" ), "--progress" };
  const VHostResult Movie = Record( Folder.File( "mov" ), Card + VArguments{ "--seconds", "20000", "--container", "mov" }, Options );
  EXPECT_NEAR( Movie.Device().value( "longest_seconds", 0.0 ), 4294967295.0 / 240000.0, 0.01 ) << Describe( Movie.m_Run );
  EXPECT_NE( std::string::npos,
    Movie.m_Run.m_Error.find( "stagehost: vi:0: With these settings a MOV file is full after 5.0 hours. The recording is to be longer." ) )
    << Describe( Movie.m_Run );
  const VHostResult Plain = Record( Folder.File( "tvid" ), Card + VArguments{ "--seconds", "20000" }, Options );
  EXPECT_TRUE( Plain.Device().contains( "longest_seconds" ) && Plain.Device()["longest_seconds"].is_null() ) << Describe( Plain.m_Run );
  EXPECT_EQ( std::string::npos, Plain.m_Run.m_Error.find( "is full" ) ) << Describe( Plain.m_Run );
}
