// Recordings whose program was killed: what FFmpeg still finds in them. A measurement over many random moments, printed as a line a container:
//
//   STAGECORE_KILLS=50 ctest --preset release -R KillSystemTests -V
#include "tests/support/CounterReader.h"
#include "tests/support/EbmlParser.h"
#include "tests/support/RiffParser.h"
#include "tests/support/TemporaryFolder.h"
#include "tests/support/TvidParser.h"
#include "tests/support/system/StageHost.h"

#include <boost/filesystem/operations.hpp>
#include <gtest/gtest.h>

#include <csignal>
#include <cstdlib>
#include <iostream>
#include <random>

using namespace SystemTests;

namespace
{

constexpr uint32_t Width = 720;
constexpr uint32_t Height = 576;
constexpr uint64_t ImageBytes = uint64_t{ Width } * Height * 2;
constexpr uint64_t SoundBytes = 1920 * 2 * 2;
// Headers, and what stands around each frame
constexpr uint64_t HeaderBytes = 40000;
constexpr uint64_t BytesAroundAFrame = 200;

struct VKillCase
{
  const char* m_pName;
  const char* m_pContainer;
  const char* m_pVideo;
  int64_t m_Frames;   // captured when the kill comes
};

constexpr VKillCase Cases[] = {
  { "AviEarly", "avi", "uncompressed", 5 },
  { "Avi", "avi", "uncompressed", 60 },
  { "AviOfJPEG", "avi", "jpeg", 40 },
  { "MkvEarly", "mkv", "uncompressed", 5 },
  { "Mkv", "mkv", "uncompressed", 60 },
  { "MkvOfJPEG", "mkv", "jpeg", 40 },
};

VRunOptions KillAfter( int64_t i_Frames )
{
  VRunOptions Options;
  Options.m_OnErrorText = [i_Frames, bSent = false]( pid_t i_Child, const std::string& i_rText ) mutable
  {
    const std::vector<int64_t> Captured = NumbersBehind( "frames_captured=", i_rText );
    if( !bSent && !Captured.empty() && Captured.back() >= i_Frames )
    {
      bSent = true;
      kill( i_Child, SIGKILL );
    }
  };
  return Options;
}

// The numbers in the pictures, as FFmpeg decodes them. It may complain of the last one.
std::vector<uint32_t> DecodeCounters( const std::string& i_rPath )
{
  const VRunResult Run = TestSupport::RunProgram(
    { "ffmpeg", "-nostdin", "-v", "error", "-i", i_rPath, "-map", "0:v", "-fps_mode", "passthrough", "-pix_fmt", "uyvy422", "-f", "rawvideo", "-" } );
  std::vector<uint32_t> Counters;
  for( size_t Position = 0; Position + ImageBytes <= Run.m_Output.size(); Position += ImageBytes )
  {
    const auto* pImage = reinterpret_cast<const uint8_t*>( Run.m_Output.data() ) + Position;
    Counters.push_back( TestSupport::ReadCounter( { KVZ::IPixelFormat::EU8Y8V8Y8, pImage, size_t{ Width } * 2 } ).value_or( 0xFFFFFFFF ) );
  }
  return Counters;
}

}

class KillTest : public testing::TestWithParam<VKillCase>
{
protected:
  const TestSupport::VTemporaryFolder m_Folder;
};

TEST_P( KillTest, LosesNoMoreThanTheLastFrame )
{
  const VKillCase& rCase = GetParam();
  const VRecordResult Result = Record( m_Folder.File( "out" ),
    { "--card", "decklink:pattern=counter,audio=ramp,standard=SD_720_576I_5000,speed=4", "--frames", "100000", "--progress", "--container",
      rCase.m_pContainer, "--video", rCase.m_pVideo, "--audio-channels", "2" },
    KillAfter( rCase.m_Frames ) );
  ASSERT_EQ( SIGKILL, Result.m_Run.m_Signal ) << Describe( Result.m_Run );

  const std::string Path = m_Folder.File( "out" ) + "/take_vi0." + rCase.m_pContainer;
  std::vector<uint32_t> Counters = DecodeCounters( Path );
  ASSERT_GT( Counters.size(), 1u );
  // A last picture that was cut short is shown in part, or as a copy of the one before.
  Counters.pop_back();
  for( size_t Frame = 1; Frame < Counters.size(); ++Frame )
  {
    EXPECT_EQ( Counters[Frame], Counters.front() + Frame );
  }
  if( rCase.m_pVideo == std::string( "uncompressed" ) )
  {
    const uint64_t Found = ( Counters.size() + 1 ) * ( ImageBytes + SoundBytes );
    EXPECT_LT( boost::filesystem::file_size( Path ), HeaderBytes + Found + ImageBytes + SoundBytes + Counters.size() * BytesAroundAFrame );
  }
}

INSTANTIATE_TEST_SUITE_P( Containers, KillTest, testing::ValuesIn( Cases ),
  []( const auto& i_rInfo ) { return std::string( i_rInfo.param.m_pName ); } );

// Random moments, by the clock. What follows is true of each.
struct VMomentCase
{
  const char* m_pName;
  const char* m_pContainer;
  const char* m_pVideo;
  bool m_bReadable;   // without what is written when a file is closed
};

constexpr VMomentCase MomentCases[] = {
  { "Tvid", "tvid", "uncompressed", true },
  { "Avi", "avi", "uncompressed", true },
  { "AviOfJPEG", "avi", "jpeg", true },
  { "Mkv", "mkv", "uncompressed", true },
  { "MkvOfJPEG", "mkv", "jpeg", true },
  { "Mov", "mov", "uncompressed", false },
  { "MP4", "mp4", "uncompressed", false },
};

namespace
{

uint32_t Number32( const std::vector<uint8_t>& i_rBytes, uint64_t i_Position )
{
  uint32_t Number = 0;
  std::memcpy( &Number, i_rBytes.data() + i_Position, sizeof( Number ) );
  return Number;
}

// In the first RIFF, which is all that so short a file has.
uint64_t CountWholeInAvi( const std::vector<uint8_t>& i_rBytes )
{
  constexpr uint64_t ListHead = 12;
  uint64_t Position = ListHead;
  uint64_t Count = 0;
  while( Position + ListHead <= i_rBytes.size() )
  {
    const std::string Id( i_rBytes.begin() + static_cast<std::ptrdiff_t>( Position ),
      i_rBytes.begin() + static_cast<std::ptrdiff_t>( Position + 4 ) );
    const std::string Form( i_rBytes.begin() + static_cast<std::ptrdiff_t>( Position + 8 ),
      i_rBytes.begin() + static_cast<std::ptrdiff_t>( Position + ListHead ) );
    const uint64_t Size = Number32( i_rBytes, Position + 4 );
    const bool bMovi = Id == "LIST" && Form == "movi";
    Position += bMovi ? ListHead : 8 + Size + Size % 2;
    Count += Id.substr( 0, 3 ) == "00d" && Position <= i_rBytes.size();
  }
  return Count;
}

uint64_t CountWhole( const std::string& i_rPath, const std::string& i_rContainer )
{
  if( i_rContainer == "tvid" )
  {
    return TestSupport::VTvidParser( i_rPath ).Frames().size();
  }
  if( i_rContainer == "avi" )
  {
    return CountWholeInAvi( TestSupport::VRiffParser::ReadFile( i_rPath ) );
  }
  if( i_rContainer == "mkv" )
  {
    const TestSupport::VEbmlParser File( TestSupport::VRiffParser::ReadFile( i_rPath ) );
    return File.FindAll( { TestSupport::Ebml::Segment, TestSupport::Ebml::Cluster } ).size();
  }
  return boost::filesystem::file_size( i_rPath ) / ( ImageBytes + SoundBytes );
}

// The program tells how many frames a tvid has; the others are FFmpeg's to decode.
uint64_t CountRead( const std::string& i_rPath, const std::string& i_rContainer )
{
  if( i_rContainer == "tvid" )
  {
    return Inspect( i_rPath ).value( "frame_count", uint64_t{ 0 } );
  }
  const std::vector<uint32_t> Counters = DecodeCounters( i_rPath );
  for( size_t Frame = 1; Frame + 1 < Counters.size(); ++Frame )
  {
    EXPECT_EQ( Counters[Frame], Counters.front() + Frame );
  }
  return Counters.size();
}

size_t KillCount()
{
  const char* const pCount = std::getenv( "STAGECORE_KILLS" );
  return pCount ? std::strtoul( pCount, nullptr, 10 ) : 1;
}

}

class KillMomentTest : public testing::TestWithParam<VMomentCase>
{
};

TEST_P( KillMomentTest, WholeFramesAreRead )
{
  const VMomentCase& rCase = GetParam();
  constexpr uint64_t LeastFile = 65536;   // anything shorter has headers at most
  std::mt19937 Random( static_cast<uint32_t>( rCase.m_pName[0] + KillCount() ) );
  std::uniform_real_distribution<double> Moment( 0.3, 1.2 );
  uint64_t Early = 0;
  uint64_t AllWhole = 0;
  uint64_t AllRead = 0;
  for( size_t Kill = 0; Kill < KillCount(); ++Kill )
  {
    const TestSupport::VTemporaryFolder Folder;
    const std::string Seconds = std::to_string( Moment( Random ) );
    SCOPED_TRACE( Seconds + " s" );
    const VRunResult Run = TestSupport::RunProgram( { "timeout", "-s", "KILL", Seconds, std::string( std::getenv( "STAGECORE_BIN" ) ) + "/stagehost",
      "record", "--settings", "none", "--card", "decklink:pattern=counter,audio=ramp,standard=SD_720_576I_5000,speed=4", "--frames", "100000",
      "--audio-channels", "2", "--container", rCase.m_pContainer, "--video", rCase.m_pVideo, "--output", Folder.File( "out" ) } );
    ASSERT_TRUE( Run.m_Signal == SIGKILL || Run.m_ExitCode == 128 + SIGKILL ) << Describe( Run );
    const std::string Path = Folder.File( "out" ) + "/take_vi0." + rCase.m_pContainer;
    if( !boost::filesystem::exists( Path ) || boost::filesystem::file_size( Path ) < LeastFile )
    {
      ++Early;
      continue;
    }
    const uint64_t Whole = CountWhole( Path, rCase.m_pContainer );
    const uint64_t Read = CountRead( Path, rCase.m_pContainer );
    EXPECT_GE( Read, rCase.m_bReadable ? Whole : 0 );
    EXPECT_LE( Read, rCase.m_bReadable ? Whole + 1 : 0 ) << "one that was cut short may be shown in part";
    AllWhole += Whole;
    AllRead += std::min( Read, Whole );
  }
  std::cout << rCase.m_pName << ": " << KillCount() << " kills, " << Early << " before the first frame, " << AllWhole << " whole frames, " << AllRead
            << " read\n";
}

INSTANTIATE_TEST_SUITE_P( Containers, KillMomentTest, testing::ValuesIn( MomentCases ),
  []( const auto& i_rInfo ) { return std::string( i_rInfo.param.m_pName ); } );
