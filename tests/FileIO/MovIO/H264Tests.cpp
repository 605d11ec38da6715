// A stream that comes encoded: parameter sets, frame types, and whether a decoder makes the same pictures of the file as of the stream.
#include "tests/FileIO/MovIO/SmallMovie.h"
#include "tests/support/LogCapture.h"
#include "tests/support/OutsideReaders.h"
#include "tests/support/ProgramRun.h"
#include "tests/support/TemporaryFolder.h"

#include <gtest/gtest.h>

#include <fstream>
#include <iterator>

using namespace KVZ;
using namespace MovIO;
using namespace TestSupport;

namespace
{

VMovieSettings H264Settings()
{
  VMovieSettings Settings;
  Settings.m_Video = VideoInfo( IPixelFormat::EU8Y8V8Y8, 64, 48 );
  Settings.m_Payload = IVideoPayload::EVideoH264;
  return Settings;
}

VMovWriter::VSpans Spans( const VBytes& i_rBytes ) { return { { i_rBytes.data(), i_rBytes.size() } }; }

// Writes frames of one byte each, of these types in decoding order.
void WriteTypes( VSmallMovie& io_rMovie, const std::string& i_rTypes )
{
  ASSERT_TRUE( io_rMovie.Begin() && io_rMovie.m_Writer.SetSPS( Bytes( "sps" ) ) && io_rMovie.m_Writer.SetPPS( Bytes( "pp" ) ) );
  for( const char Type : i_rTypes )
  {
    ASSERT_TRUE( io_rMovie.m_Writer.WriteStoredFrame( Spans( Bytes( std::string( 1, Type ) ) ), Spans( Bytes( "aabb" ) ), Type ) );
  }
  ASSERT_TRUE( io_rMovie.m_Writer.Close() );
}

// One NAL unit of a byte stream (ITU-T H.264, Annex B), without its start code.
struct VUnit
{
  int Type() const { return m_Bytes.at( 0 ) & 0x1F; }

  VBytes m_Bytes;
};

std::vector<VUnit> SplitUnits( const VBytes& i_rStream )
{
  std::vector<VUnit> Units;
  size_t Zeros = 0;
  for( const uint8_t Byte : i_rStream )
  {
    if( Byte == 1 && Zeros >= 2 )
    {
      if( !Units.empty() )
      {
        Units.back().m_Bytes.resize( Units.back().m_Bytes.size() - Zeros );
      }
      Units.emplace_back();
    }
    else if( !Units.empty() )
    {
      Units.back().m_Bytes.push_back( Byte );
    }
    Zeros = Byte == 0 ? Zeros + 1 : 0;
  }
  return Units;
}

// Of a slice: the second of the numbers at its start (Exp-Golomb).
char FrameType( const VUnit& i_rUnit )
{
  size_t Bit = 8;
  const auto NextBit = [&]
  {
    const int Value = i_rUnit.m_Bytes.at( Bit / 8 ) >> ( 7 - Bit % 8 ) & 1;
    ++Bit;
    return Value;
  };
  uint32_t Value = 0;
  for( int Number = 0; Number < 2; ++Number )
  {
    int Zeros = 0;
    while( NextBit() == 0 )
    {
      ++Zeros;
    }
    Value = 1;
    for( int Digit = 0; Digit < Zeros; ++Digit )
    {
      Value = Value << 1 | static_cast<uint32_t>( NextBit() );
    }
    --Value;
  }
  return "PBI"[Value % 5];
}

class MovOfH264 : public testing::Test
{
protected:
  // One slice a frame, as x264 makes them.
  void MakeStream( const std::string& i_rOptions )
  {
    const VRunResult Run = RunProgram( { "ffmpeg", "-nostdin", "-v", "error", "-f", "lavfi", "-i", "testsrc2=size=64x48:rate=25", "-frames:v", "12",
      "-pix_fmt", "yuv420p", "-c:v", "libx264", "-threads", "1", "-x264-params", "slices=1:" + i_rOptions, m_StreamPath } );
    ASSERT_EQ( Run.m_ExitCode, 0 ) << Run.m_Error;
    std::ifstream File( m_StreamPath, std::ios::binary );
    m_Units = SplitUnits( VBytes( std::istreambuf_iterator<char>( File ), {} ) );
  }

  // Gives the types of the frames.
  std::string WriteStream()
  {
    constexpr int Slice = 1;
    constexpr int KeySlice = 5;
    constexpr int SPS = 7;
    constexpr int PPS = 8;
    VMovWriter Writer( IVideoContainer::EMOV );
    EXPECT_TRUE( Writer.Open( m_Path ) && H264Settings().WriteTo( Writer ) );
    std::string Types;
    for( const VUnit& rUnit : m_Units )
    {
      switch( rUnit.Type() )
      {
        case SPS: EXPECT_TRUE( Writer.SetSPS( rUnit.m_Bytes ) ); break;
        case PPS: EXPECT_TRUE( Writer.SetPPS( rUnit.m_Bytes ) ); break;
        case Slice:
        case KeySlice:
          Types += FrameType( rUnit );
          EXPECT_TRUE( Writer.WriteStoredFrame( Spans( rUnit.m_Bytes ), {}, Types.back() ) );
          break;
        default: break;
      }
    }
    EXPECT_TRUE( Writer.Close() );
    return Types;
  }

  const VTemporaryFolder m_Folder;
  const std::string m_StreamPath = m_Folder.File( "stream.h264" );
  const std::string m_Path = m_Folder.File( "movie.mov" );
  std::vector<VUnit> m_Units;
};

}

TEST_F( MovOfH264, PlaysAsTheStreamDoes )
{
  MakeStream( "bframes=0:keyint=5:scenecut=0" );
  EXPECT_EQ( WriteStream(), "IPPPPIPPPPIP" );
  auto Answers = AskFFprobe( m_Path, "Unsupported codec with id 0 for input stream 2\n" );
  EXPECT_EQ( Answers["streams.stream.0.codec_name"], "h264" );
  EXPECT_EQ( Answers["streams.stream.0.codec_tag_string"], "avc1" );
  EXPECT_EQ( Answers["streams.stream.0.r_frame_rate"], "25/1" );
  EXPECT_EQ( Answers["streams.stream.0.nb_read_frames"], "12" );
  EXPECT_EQ( Answers["streams.stream.0.start_time"], "0.000000" );
  const VBytes Pictures = DecodeVideo( m_Path, "yuv420p" );
  EXPECT_EQ( Pictures.size(), 12u * 64 * 48 * 3 / 2 );
  EXPECT_EQ( Pictures, DecodeVideo( m_StreamPath, "yuv420p" ) );

  const auto Parser = VMovParser::OfFile( m_Path );
  std::vector<size_t> KeyFrames;
  for( const auto& rSample : Parser.Track( "vide" ).m_Samples )
  {
    if( rSample.m_bKeyFrame )
    {
      KeyFrames.push_back( static_cast<size_t>( &rSample - Parser.Track( "vide" ).m_Samples.data() ) );
    }
  }
  EXPECT_EQ( KeyFrames, ( std::vector<size_t>{ 0, 5, 10 } ) );
}

// The decoder puts pictures in order by what the stream says; the times in the file are those of streams in which two B frames come behind
// every other frame, which this one is but for its start.
TEST_F( MovOfH264, FramesOfTypeBAreDecodedToo )
{
  MakeStream( "bframes=2:b-adapt=0:b-pyramid=none:keyint=12:scenecut=0" );
  EXPECT_EQ( WriteStream(), "IPBBPBBPBBPB" );
  const VRunResult Run = RunProgram( { "ffmpeg", "-nostdin", "-v", "error", "-ignore_editlist", "1", "-i", m_Path, "-map", "0:v", "-fps_mode",
    "passthrough", "-pix_fmt", "yuv420p", "-f", "rawvideo", "-" } );
  EXPECT_EQ( Bytes( Run.m_Output ), DecodeVideo( m_StreamPath, "yuv420p" ) );
}

TEST_F( MovOfH264, EachFrameIsShownAtATimeOfItsOwn )
{
  VSmallMovie Movie( H264Settings() );
  WriteTypes( Movie, "IBBPBBPBB" );
  const auto Parser = Movie.Parse();
  const auto& rTrack = Parser.Track( "vide" );
  std::vector<uint64_t> Times;
  std::string KeyFrames;
  for( const auto& rSample : rTrack.m_Samples )
  {
    Times.push_back( rSample.m_ShownTime / 1920 );
    KeyFrames += rSample.m_bKeyFrame ? 'K' : '-';
  }
  EXPECT_EQ( Times, ( std::vector<uint64_t>{ 3, 1, 2, 6, 4, 5, 9, 7, 8 } ) );
  EXPECT_EQ( KeyFrames, "K--------" );
  EXPECT_EQ( rTrack.m_EditStart, 3 * 1920u );
  EXPECT_EQ( rTrack.m_EditDuration, 9 * 1920u );
  EXPECT_EQ( Parser.Root().Child( "moov" ).Child( "trak" ).Child( "mdia" ).Child( "minf" ).Child( "stbl" ).Tree(),
    "stsd stts stss ctts stsc stsz co64" );
}

TEST_F( MovOfH264, AFrameIsStoredBehindItsParameterSet )
{
  VSmallMovie Movie( H264Settings() );
  WriteTypes( Movie, "IP" );
  const auto Parser = Movie.Parse();
  const auto& rSamples = Parser.Track( "vide" ).m_Samples;
  EXPECT_EQ( Parser.Bytes( rSamples.at( 1 ) ), ( VBytes{ 0, 0, 0, 2, 'p', 'p', 0, 0, 0, 1, 'P' } ) );
  EXPECT_EQ( Parser.Bytes( Parser.Track( "soun" ).m_Samples.at( 1 ) ), Bytes( "aabb" ) );
  const auto& rStsd = Parser.Root().Child( "moov" ).Child( "trak" ).Child( "mdia" ).Child( "minf" ).Child( "stbl" ).Child( "stsd" );
  const VBytes Description = Parser.Body( rStsd );
  const VBytes Configuration = { 0, 0, 0, 24, 'a', 'v', 'c', 'C',   // size, type
    1, 100, 0, 40, 0xFF,                                            // version, profile, compatibility, level, length of lengths
    0xE1, 0, 3, 's', 'p', 's', 1, 0, 2, 'p', 'p' };                 // one set of each kind
  EXPECT_EQ( VBytes( Description.end() - 24, Description.end() ), Configuration );
  EXPECT_EQ( Parser.Number( rStsd, 8 ), 86u + 24 );
}

TEST_F( MovOfH264, ParameterSetsAreTakenWhereTheyBelong )
{
  const VLogCapture Log( "MovIO" );
  VSmallMovie Movie( H264Settings() );
  EXPECT_TRUE( Movie.m_Writer.SetSPS( Bytes( "first" ) ) );
  EXPECT_FALSE( Movie.m_Writer.SetPPS( Bytes( "too early" ) ) );
  ASSERT_TRUE( Movie.Begin() );
  EXPECT_TRUE( Movie.m_Writer.SetSPS( Bytes( "first" ) ) );
  EXPECT_FALSE( Movie.m_Writer.SetSPS( Bytes( "other" ) ) );
  EXPECT_EQ( Log.Texts(), std::vector<std::string>{ "SPS has changed mid-way through movie." } );
  EXPECT_TRUE( Movie.m_Writer.SetPPS( Bytes( "one" ) ) );
  EXPECT_TRUE( Movie.m_Writer.SetPPS( Bytes( "two" ) ) );
  EXPECT_FALSE( Movie.m_Writer.SetPPS( VBytes( 65536 ) ) );
  EXPECT_FALSE( Movie.m_Writer.WriteStoredFrame( Spans( Bytes( "x" ) ), {}, 'A' ) );
  EXPECT_TRUE( Movie.m_Writer.WriteStoredFrame( Spans( Bytes( "x" ) ), {}, 'I' ) );
  ASSERT_TRUE( Movie.m_Writer.Close() );
  const auto Parser = Movie.Parse();
  EXPECT_EQ( Parser.Bytes( Parser.Track( "vide" ).m_Samples.at( 0 ) ), ( VBytes{ 0, 0, 0, 3, 't', 'w', 'o', 0, 0, 0, 1, 'x' } ) );

  VSmallMovie Uncompressed;
  ASSERT_TRUE( Uncompressed.Begin() );
  EXPECT_FALSE( Uncompressed.m_Writer.SetPPS( Bytes( "pps" ) ) );
}

// Nothing here makes H.264 of pictures.
TEST_F( MovOfH264, PicturesAreRefusedAtTheFirstFrame )
{
  const VLogCapture Log;
  VSmallMovie Movie( H264Settings() );
  ASSERT_TRUE( Movie.Begin() );
  EXPECT_TRUE( Log.Texts().empty() );
  EXPECT_FALSE( Movie.Frame( VBytes( 64 * 48 * 2 ) ) );
  EXPECT_TRUE( Log.Has( "Unsupported video payload format 'VideoH264'." ) );
  EXPECT_TRUE( Movie.m_Writer.Close() );
}
