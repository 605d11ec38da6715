// A clip played into a card comes out of the file picture by picture and sample by sample as FFmpeg itself decodes it.
#include "tests/support/TemporaryFolder.h"
#include "tests/support/TvidParser.h"
#include "tests/support/system/StageHost.h"

#include <gtest/gtest.h>

#include <algorithm>
#include <cstring>
#include <set>
#include <sstream>

using namespace SystemTests;

namespace
{

constexpr size_t ClipFrames = 50;
constexpr size_t ClipRate = 50;
constexpr size_t SamplesPerFrame = 48000 / ClipRate;
constexpr uint32_t ClipChannels = 2;

struct VKind
{
  const char* m_pName;
  const char* m_pFilter;   // FFmpeg's, to the pixel format that a card delivers by itself
};

// The CRC-32 of every picture of a clip, in order.
std::vector<std::string> DecodedSums( const std::string& i_rClip, const char* i_pFilter )
{
  const VRunResult Run = TestSupport::RunProgram( { "ffmpeg", "-nostdin", "-v", "error", "-i", i_rClip, "-map", "0:v:0", "-fps_mode", "passthrough",
    "-vf", i_pFilter, "-c:v", "rawvideo", "-f", "framehash", "-hash", "crc32", "-" } );
  EXPECT_EQ( 0, Run.m_ExitCode ) << Run.m_Error;
  std::vector<std::string> Sums;
  std::istringstream Stream( Run.m_Output );
  for( std::string Line; std::getline( Stream, Line ); )
  {
    if( !Line.empty() && Line.front() != '#' )
    {
      Sums.push_back( Line.substr( Line.find_last_of( ", " ) + 1 ) );
    }
  }
  return Sums;
}

std::vector<uint16_t> DecodedSamples( const std::string& i_rClip )
{
  const VRunResult Run = TestSupport::RunProgram( { "ffmpeg", "-nostdin", "-v", "error", "-i", i_rClip, "-map", "0:a:0", "-f", "s16le", "-" } );
  EXPECT_EQ( 0, Run.m_ExitCode ) << Run.m_Error;
  std::vector<uint16_t> Samples( Run.m_Output.size() / sizeof( uint16_t ) );
  std::memcpy( Samples.data(), Run.m_Output.data(), Samples.size() * sizeof( uint16_t ) );
  return Samples;
}

std::vector<std::string> RecordedSums( const std::string& i_rPath )
{
  std::vector<std::string> Sums;
  const nlohmann::json Told = Inspect( i_rPath, true );
  for( const nlohmann::json& rFrame : Told.value( "frames", nlohmann::json::array() ) )
  {
    Sums.push_back( rFrame.value( "video_crc32", "" ) );
  }
  return Sums;
}

}

class ClipTest : public testing::TestWithParam<VKind>
{
protected:
  static VArguments Card( const std::string& i_rKeys ) { return { "--card", std::string( GetParam().m_pName ) + ":" + i_rKeys }; }

  std::string MakeClip( const VArguments& i_rMore = {} )
  {
    const std::string Path = m_Folder.File( "clip.mkv" );
    const std::string Rate = std::to_string( ClipRate );
    const std::string Seconds = std::to_string( static_cast<double>( ClipFrames ) / ClipRate );
    const VRunResult Run = TestSupport::RunProgram(
      VArguments{ "ffmpeg", "-nostdin", "-v", "error", "-f", "lavfi", "-i", "testsrc2=s=1280x720:r=" + Rate, "-f", "lavfi", "-i",
        "sine=frequency=440:sample_rate=48000", "-t", Seconds, "-ac", "2", "-c:v", "mpeg4", "-q:v", "3", "-pix_fmt", "yuv420p", "-c:a",
        "pcm_s16le" } +
      i_rMore + VArguments{ Path } );
    EXPECT_EQ( 0, Run.m_ExitCode ) << Run.m_Error;
    return Path;
  }

  const TestSupport::VTemporaryFolder m_Folder;
};

TEST_P( ClipTest, EveryPictureAndSampleIsThatOfTheClip )
{
  const std::string Clip = MakeClip();
  const std::vector<std::string> Expected = DecodedSums( Clip, GetParam().m_pFilter );
  ASSERT_EQ( ClipFrames, Expected.size() );
  ASSERT_EQ( ClipFrames, std::set<std::string>( Expected.begin(), Expected.end() ).size() ) << "pictures must differ to tell one from another";

  // Longer than the clip: it begins again.
  constexpr size_t FrameCount = ClipFrames + ClipFrames / 2;
  const VRecordResult Result = Record( m_Folder.File( "out" ), Card( "input=" + Clip ) + VArguments{ "--frames", std::to_string( FrameCount ) } );
  ASSERT_EQ( 0, Result.m_Run.m_ExitCode ) << Describe( Result.m_Run );
  TestSupport::VTvidParser File( Result.Path() );
  EXPECT_EQ( 1280u, File.Width() );
  EXPECT_EQ( 2700000, File.Number( "FramePeriodInTicks" ) ) << "the standard nearest to the clip";

  const std::vector<std::string> Recorded = RecordedSums( Result.Path() );
  ASSERT_EQ( FrameCount, Recorded.size() );
  const size_t First = static_cast<size_t>( std::find( Expected.begin(), Expected.end(), Recorded.front() ) - Expected.begin() );
  ASSERT_LT( First, ClipFrames ) << "the first picture is none of the clip's";
  for( size_t Index = 0; Index < FrameCount; ++Index )
  {
    ASSERT_EQ( Expected[( First + Index ) % ClipFrames], Recorded[Index] ) << "frame " << Index << ", the clip's " << ( First + Index ) % ClipFrames;
  }

  const std::vector<uint16_t> Samples = DecodedSamples( Clip );
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
  const VRecordResult Result = Record( m_Folder.File( "out" ), Card( "loop=0,input=" + Clip ) + VArguments{ "--frames", "500" } );
  EXPECT_EQ( 3, Result.m_Run.m_ExitCode ) << Describe( Result.m_Run );
  EXPECT_EQ( 0, Result.Device().value( "lost", nlohmann::json::object() ).value( "card", -1 ) ) << "what has ended is not dropped";
  const std::vector<std::string> Expected = DecodedSums( Clip, GetParam().m_pFilter );
  const std::vector<std::string> Recorded = RecordedSums( Result.Path() );
  ASSERT_FALSE( Recorded.empty() );
  ASSERT_LE( Recorded.size(), Expected.size() );
  EXPECT_TRUE( std::equal( Recorded.rbegin(), Recorded.rend(), Expected.rbegin() ) ) << "the last pictures are not the clip's last";
}

INSTANTIATE_TEST_SUITE_P( Kinds, ClipTest,
  testing::Values( VKind{ "decklink", "format=uyvy422" }, VKind{ "bluefish444", "format=yuv422p,extractplanes=y" } ),
  []( const auto& i_rInfo ) { return std::string( i_rInfo.param.m_pName ); } );
