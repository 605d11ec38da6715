// A stream that comes encoded: parameter sets, frame types, and whether a decoder makes the same pictures of the file as of the stream.
#include "tests/FileIO/MovIO/SmallMovie.h"
#include "tests/support/LogCapture.h"
#include "tests/support/OutsideReaders.h"
#include "tests/support/ProgramRun.h"
#include "tests/support/TemporaryFolder.h"
#include "tests/support/WholeFile.h"

#include <gtest/gtest.h>

#include <algorithm>
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

// The NAL units of a byte stream (ITU-T H.264, Annex B), without their start codes.
std::vector<VBytes> SplitUnits( const std::string& i_rStream )
{
  const std::string StartCode( "\0\0\1", 3 );
  std::vector<VBytes> Units;
  for( size_t Code = i_rStream.find( StartCode ); Code != std::string::npos; )
  {
    const size_t Begin = Code + StartCode.size();
    Code = i_rStream.find( StartCode, Begin );
    VBytes Unit = Bytes( i_rStream.substr( Begin, Code - Begin ) );
    Unit.erase( std::find_if( Unit.rbegin(), Unit.rend(), []( uint8_t i_Byte ) { return i_Byte != 0; } ).base(), Unit.end() );
    Units.push_back( Unit );
  }
  return Units;
}

// In streams of x264 every I frame is a key frame and no other frame refers to a B frame.
char FrameType( const VBytes& i_rSlice )
{
  constexpr int KeySlice = 5;
  const bool bReferredTo = i_rSlice.at( 0 ) >> 5 != 0;
  return ( i_rSlice.at( 0 ) & 0x1F ) == KeySlice ? 'I' : bReferredTo ? 'P' : 'B';
}

// 'K' for each of them.
std::string KeyFrames( const VMovParser& i_rParser )
{
  std::string Text;
  for( const auto& rSample : i_rParser.Track( "vide" ).m_Samples )
  {
    Text += rSample.m_bKeyFrame ? 'K' : '-';
  }
  return Text;
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
    m_Units = SplitUnits( TestSupport::ReadFile( m_StreamPath ) );
  }

  // Gives the types of the frames.
  std::string WriteStream()
  {
    constexpr int LastSlice = 5;
    constexpr int SPS = 7;
    constexpr int PPS = 8;
    VMovWriter Writer( IVideoContainer::EMOV );
    EXPECT_TRUE( Writer.Open( m_Path ) && H264Settings().WriteTo( Writer ) );
    std::string Types;
    for( const VBytes& rUnit : m_Units )
    {
      const int Type = rUnit.at( 0 ) & 0x1F;
      if( Type == SPS || Type == PPS )
      {
        EXPECT_TRUE( Type == SPS ? Writer.SetSPS( rUnit ) : Writer.SetPPS( rUnit ) );
      }
      else if( Type <= LastSlice )
      {
        Types += FrameType( rUnit );
        EXPECT_TRUE( Writer.WriteStoredFrame( Spans( rUnit ), {}, Types.back() ) );
      }
    }
    EXPECT_TRUE( Writer.Close() );
    return Types;
  }

  const VTemporaryFolder m_Folder;
  const std::string m_StreamPath = m_Folder.File( "stream.h264" );
  const std::string m_Path = m_Folder.File( "movie.mov" );
  std::vector<VBytes> m_Units;
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
  EXPECT_EQ( KeyFrames( VMovParser::OfFile( m_Path ) ), "K----K----K-" );
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

TEST( MovOfStoredFrames, EachIsShownAtATimeOfItsOwnAndLiesBehindItsParameterSet )
{
  VSmallMovie Movie( H264Settings() );
  ASSERT_TRUE( Movie.Begin() && Movie.m_Writer.SetSPS( Bytes( "sps" ) ) && Movie.m_Writer.SetPPS( Bytes( "pp" ) ) );
  for( const char Type : std::string( "IBBPBBPBB" ) )
  {
    ASSERT_TRUE( Movie.m_Writer.WriteStoredFrame( Spans( Bytes( std::string( 1, Type ) ) ), Spans( Bytes( "aabb" ) ), Type ) );
  }
  ASSERT_TRUE( Movie.m_Writer.Close() );
  const auto Parser = Movie.Parse();
  const auto& rTrack = Parser.Track( "vide" );
  std::vector<uint64_t> Times;
  for( const auto& rSample : rTrack.m_Samples )
  {
    Times.push_back( rSample.m_ShownTime / 1920 );
  }
  EXPECT_EQ( Times, ( std::vector<uint64_t>{ 3, 1, 2, 6, 4, 5, 9, 7, 8 } ) );
  EXPECT_EQ( KeyFrames( Parser ), "K--------" );
  EXPECT_EQ( rTrack.m_EditStart, 3 * 1920u );
  EXPECT_EQ( rTrack.m_EditDuration, 9 * 1920u );
  EXPECT_EQ( Parser.Bytes( rTrack.m_Samples.at( 3 ) ), ( VBytes{ 0, 0, 0, 2, 'p', 'p', 0, 0, 0, 1, 'P' } ) );
  EXPECT_EQ( Parser.Bytes( Parser.Track( "soun" ).m_Samples.at( 3 ) ), Bytes( "aabb" ) );

  EXPECT_EQ( SampleTable( Parser, 0 ).Tree(), "stsd stts stss ctts stsc stsz co64" );
  const auto& rStsd = SampleTable( Parser, 0 ).Child( "stsd" );
  const VBytes Description = Parser.Body( rStsd );
  const VBytes Configuration = { 0, 0, 0, 24, 'a', 'v', 'c', 'C',   // size, type
    1, 100, 0, 40, 0xFF,                                            // version, profile, compatibility, level, length of lengths
    0xE1, 0, 3, 's', 'p', 's', 1, 0, 2, 'p', 'p' };                 // one set of each kind
  EXPECT_EQ( VBytes( Description.end() - 24, Description.end() ), Configuration );
  EXPECT_EQ( Parser.Number( rStsd, 8 ), 86u + 24 );
}

TEST( MovOfStoredFrames, WhatDoesNotBelongThereIsRefused )
{
  const VLogCapture Log;
  VSmallMovie Movie( H264Settings() );
  VMovWriter& rWriter = Movie.m_Writer;
  EXPECT_FALSE( rWriter.WriteStoredFrame( {}, {}, 'I' ) );
  EXPECT_TRUE( rWriter.SetSPS( Bytes( "first" ) ) );
  EXPECT_FALSE( rWriter.SetPPS( Bytes( "too early" ) ) );
  ASSERT_TRUE( Movie.Begin() );
  EXPECT_TRUE( rWriter.SetSPS( Bytes( "first" ) ) );
  EXPECT_FALSE( rWriter.SetSPS( Bytes( "other" ) ) );
  EXPECT_EQ( Log.Texts().back(), "SPS has changed mid-way through movie." );
  EXPECT_TRUE( rWriter.SetPPS( Bytes( "one" ) ) );
  EXPECT_TRUE( rWriter.SetPPS( Bytes( "two" ) ) );
  EXPECT_FALSE( rWriter.SetPPS( VBytes( 65536 ) ) );
  EXPECT_FALSE( rWriter.WriteStoredFrame( Spans( Bytes( "x" ) ), {}, 'A' ) );
  EXPECT_TRUE( rWriter.WriteStoredFrame( Spans( Bytes( "x" ) ), {}, 'I' ) );
  EXPECT_FALSE( Movie.Frame( VBytes( 64 * 48 * 2 ) ) ) << "nothing here makes H.264 of pictures";
  EXPECT_TRUE( Log.Has( "Unsupported video payload format 'VideoH264'." ) );
  ASSERT_TRUE( rWriter.Close() );
  const auto Parser = Movie.Parse();
  EXPECT_EQ( Parser.Bytes( Parser.Track( "vide" ).m_Samples.at( 0 ) ), ( VBytes{ 0, 0, 0, 3, 't', 'w', 'o', 0, 0, 0, 1, 'x' } ) );

  VSmallMovie Uncompressed;
  ASSERT_TRUE( Uncompressed.Begin() );
  EXPECT_FALSE( Uncompressed.m_Writer.SetPPS( Bytes( "pps" ) ) );
}
