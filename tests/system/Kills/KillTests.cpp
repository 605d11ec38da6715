// Recordings whose program was killed: what FFmpeg still finds in them. A measurement over many random moments, printed as a line a container:
//
//   STAGECORE_KILLS=50 ctest --preset release -R KillSystemTests -V
#include "tests/support/EbmlParser.h"
#include "tests/support/RiffParser.h"
#include "tests/support/TemporaryFolder.h"
#include "tests/support/TvidParser.h"
#include "tests/support/system/CounterFile.h"

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

struct VKillCase
{
  const char* m_pName;
  const char* m_pContainer;
  const char* m_pVideo;
  bool m_bReadable;   // without what is written when a file is closed
};

constexpr VKillCase KillCases[] = {
  { "Tvid", "tvid", "uncompressed", true },
  { "Avi", "avi", "uncompressed", true },
  { "AviOfJPEG", "avi", "jpeg", true },
  { "Mkv", "mkv", "uncompressed", true },
  { "MkvOfJPEG", "mkv", "jpeg", true },
  { "Mov", "mov", "uncompressed", false },
  { "MP4", "mp4", "uncompressed", false },
};

// In the first RIFF, which is all that so short a file has.
uint64_t CountWholeInAvi( const TestSupport::VFileBytes& i_rFile )
{
  constexpr uint64_t ListHead = 12;
  uint64_t Position = ListHead;
  uint64_t Count = 0;
  while( Position + ListHead <= i_rFile.Size() )
  {
    const std::string Id = i_rFile.Text( Position, 4 );
    const uint64_t Size = i_rFile.Little( Position + 4, 4 );
    const bool bMovi = Id == "LIST" && i_rFile.Text( Position + 8, 4 ) == "movi";
    Position += bMovi ? ListHead : 8 + Size + Size % 2;
    Count += Id.substr( 0, 3 ) == "00d" && Position <= i_rFile.Size();
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
    return CountWholeInAvi( TestSupport::VFileBytes::OfFile( i_rPath ) );
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
  const std::vector<uint32_t> Counters = DecodeCounters( i_rPath, Width, Height );
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

class KillTest : public testing::TestWithParam<VKillCase>
{
};

TEST_P( KillTest, WholeFramesAreRead )
{
  const VKillCase& rCase = GetParam();
  constexpr uint64_t LeastFile = 131072;   // headers, and a compressed frame and more
  std::mt19937 Random( static_cast<uint32_t>( rCase.m_pName[0] + KillCount() ) );
  uint64_t AllWhole = 0;
  uint64_t AllRead = 0;
  for( size_t Kill = 0; Kill < KillCount(); ++Kill )
  {
    const TestSupport::VTemporaryFolder Folder;
    const std::string Path = Folder.File( "out" ) + "/take_vi0." + rCase.m_pContainer;
    const int64_t Captured = std::uniform_int_distribution<int64_t>( 20, 80 )( Random );
    SCOPED_TRACE( "from frame " + std::to_string( Captured ) + " on" );
    const auto IsUnderWay = [&]( const std::string& i_rText )
    {
      boost::system::error_code Missing;
      return HasCaptured( i_rText, Captured ) && boost::filesystem::file_size( Path, Missing ) >= LeastFile && !Missing;
    };
    const VHostResult Result = Record( Folder.File( "out" ),
      { "--card", "decklink:pattern=counter,audio=ramp,standard=SD_720_576I_5000,speed=4", "--frames", "100000", "--progress", "--container",
        rCase.m_pContainer, "--video", rCase.m_pVideo, "--audio-channels", "2" },
      SignalOnce( { SIGKILL }, IsUnderWay ) );
    ASSERT_EQ( SIGKILL, Result.m_Run.m_Signal ) << Describe( Result.m_Run );
    const uint64_t Whole = CountWhole( Path, rCase.m_pContainer );
    const uint64_t Read = CountRead( Path, rCase.m_pContainer );
    EXPECT_GE( Read, rCase.m_bReadable ? Whole : 0 );
    EXPECT_LE( Read, rCase.m_bReadable ? Whole + 1 : 0 ) << "one that was cut short may be shown in part";
    AllWhole += Whole;
    AllRead += std::min( Read, Whole );
  }
  EXPECT_GT( AllWhole, 0u ) << "nothing was on its way into the files";
  std::cout << rCase.m_pName << ": " << KillCount() << " kills, " << AllWhole << " whole frames, " << AllRead << " read\n";
}

INSTANTIATE_TEST_SUITE_P( Containers, KillTest, testing::ValuesIn( KillCases ),
  []( const auto& i_rInfo ) { return std::string( i_rInfo.param.m_pName ); } );
