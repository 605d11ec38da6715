// Recordings whose program was killed: what FFmpeg still finds in them. Containers that keep their tables to the end are not among them.
#include "tests/support/CounterReader.h"
#include "tests/support/TemporaryFolder.h"
#include "tests/support/system/StageHost.h"

#include <boost/filesystem/operations.hpp>
#include <gtest/gtest.h>

#include <csignal>

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
