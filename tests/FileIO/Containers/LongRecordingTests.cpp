// Ten minutes at 29.97, where sound has a changing number of samples a frame: whether each frame still meets its own samples at the end.
#include "tests/FileIO/Containers/MovieWriters.h"
#include "tests/support/MovParser.h"
#include "tests/support/OutsideReaders.h"
#include "tests/support/ProgramRun.h"
#include "tests/support/TemporaryFolder.h"

#include <gtest/gtest.h>

#include <array>
#include <cmath>
#include <map>
#include <sstream>

using namespace Containers;
using namespace TestSupport;

namespace
{

constexpr uint32_t Frames = 17982;
constexpr double Period = 1001.0 / 30000.0;
constexpr double SampleRate = 48000.0;
constexpr uint64_t RiffBytes = 8 << 20;   // several RIFFs in an AVI

// Of the one channel.
uint64_t SamplesBefore( uint64_t i_Frame )
{
  constexpr std::array<uint64_t, 5> InCycle = { 0, 1602, 3203, 4805, 6406 };
  return i_Frame / InCycle.size() * 8008 + InCycle[i_Frame % InCycle.size()];
}

// Every pixel pair of a picture is the frame's number, every sample its own number.
VBytes Picture( const VHeader& i_rHeader, uint32_t i_Frame )
{
  VBytes Bytes( i_rHeader.ImageBytes() );
  for( size_t Byte = 0; Byte < Bytes.size(); ++Byte )
  {
    Bytes[Byte] = static_cast<uint8_t>( i_Frame >> Byte % 4 * 8 );
  }
  return Bytes;
}

VBytes Sound( uint32_t i_Frame )
{
  VBytes Bytes;
  for( uint64_t Sample = SamplesBefore( i_Frame ); Sample < SamplesBefore( i_Frame + 1 ); ++Sample )
  {
    Bytes.push_back( static_cast<uint8_t>( Sample ) );
    Bytes.push_back( static_cast<uint8_t>( Sample >> 8 ) );
  }
  return Bytes;
}

// What a reader makes of a file. Times are in seconds.
struct VRecording
{
  VBytes m_Pictures{};
  VBytes m_Sound{};
  std::vector<double> m_PictureTimes{};
  std::map<uint64_t, double> m_SoundTimes{};   // of the pieces in which sound is read, by their first samples
};

VRecording AskFFmpeg( const std::string& i_rPath )
{
  VRecording Recording{ DecodeVideo( i_rPath, "uyvy422" ), DecodeAudio( i_rPath, "s16le" ) };
  const VRunResult Run = RunProgram( { "ffprobe", "-v", "quiet", "-show_entries", "packet=stream_index,pts_time,size", "-of", "csv=p=0", i_rPath } );
  std::istringstream Lines( Run.m_Output );
  uint64_t Samples = 0;
  for( std::string Line; std::getline( Lines, Line ); )
  {
    std::istringstream Fields( Line );
    int Stream = 0;
    char Comma = 0;
    double Time = 0.0;
    uint64_t Bytes = 0;
    Fields >> Stream >> Comma >> Time >> Comma >> Bytes;
    if( Stream == 0 )
    {
      Recording.m_PictureTimes.push_back( Time );
      continue;
    }
    Recording.m_SoundTimes[Samples] = Time;
    Samples += Bytes / sizeof( int16_t );
  }
  return Recording;
}

// FFmpeg takes every single sample of a MOV file for a frame of its own, which takes it minutes.
VRecording ReadMov( const std::string& i_rPath )
{
  const auto File = VMovParser::OfFile( i_rPath );
  VRecording Recording;
  for( const VMovSample& rSample : File.Track( "vide" ).m_Samples )
  {
    Append( Recording.m_Pictures, File.Bytes( rSample ) );
    Recording.m_PictureTimes.push_back( static_cast<double>( rSample.m_DecodeTime ) / File.Track( "vide" ).m_Timescale );
  }
  for( const VMovSample& rSample : File.Track( "soun" ).m_Samples )
  {
    const uint64_t FirstSample = Recording.m_Sound.size() / sizeof( int16_t );
    Recording.m_SoundTimes[FirstSample] = static_cast<double>( rSample.m_DecodeTime ) / File.Track( "soun" ).m_Timescale;
    Append( Recording.m_Sound, File.Bytes( rSample ) );
  }
  return Recording;
}

class LongRecording : public testing::TestWithParam<VContainerRow>
{
};

}

TEST_P( LongRecording, KeepsEveryFrameWithItsSound )
{
  VHeader Header = MovieHeader( 16, 2 );
  Header.m_Timing = Rate2997;
  Header.m_Timecode.m_Standard = KVZ::ITimecodeStandard::ETimecode30Drop;
  const VTemporaryFolder Folder;
  const std::string Path = Folder.File( std::string( "long." ) + GetParam().m_pName );
  const auto pWriter = MakeWriter( GetParam().m_Container, { .m_RiffBytes = RiffBytes } );
  ASSERT_TRUE( pWriter->Open( Path ) && Header.WriteTo( *pWriter ) );
  VRecording Written;
  for( uint32_t Frame = 0; Frame < Frames; ++Frame )
  {
    ASSERT_TRUE( Header.WriteFrame( *pWriter, Picture( Header, Frame ), Sound( Frame ), Frame ) );
    Append( Written.m_Pictures, Picture( Header, Frame ) );
    Append( Written.m_Sound, Sound( Frame ) );
  }
  ASSERT_TRUE( pWriter->Close() );

  const VRecording Found = GetParam().m_Container == Mov.m_Container ? ReadMov( Path ) : AskFFmpeg( Path );
  EXPECT_TRUE( Found.m_Pictures == Written.m_Pictures );
  EXPECT_TRUE( Found.m_Sound == Written.m_Sound );
  ASSERT_EQ( Found.m_PictureTimes.size(), Frames );
  // Matroska counts microseconds and rounds a frame down to whole ones, for sound and pictures alike.
  const double ShownPeriod = GetParam().m_Container == Mkv.m_Container ? std::floor( Period * 1e6 ) / 1e6 : Period;
  for( uint32_t Frame = 0; Frame < Frames; ++Frame )
  {
    ASSERT_NEAR( Found.m_PictureTimes[Frame], Frame * ShownPeriod, 2e-6 ) << Frame;
    ASSERT_EQ( Found.m_SoundTimes.count( SamplesBefore( Frame ) ), 1u ) << Frame;
    ASSERT_NEAR( Found.m_SoundTimes.at( SamplesBefore( Frame ) ), Found.m_PictureTimes[Frame], 1.0 / SampleRate ) << Frame;
  }
}

INSTANTIATE_TEST_SUITE_P( Containers, LongRecording, testing::Values( Mov, Avi, Mkv ), testing::PrintToStringParamName() );
