// Files that cannot grow. RLIMIT_FSIZE stands for the full disk: it fails the same writes at the same place on every run.
#include "tests/support/TemporaryFolder.h"
#include "tests/support/TvidParser.h"
#include "tests/support/system/CounterFile.h"
#include "tests/support/system/Rates.h"
#include "tests/support/system/StageHost.h"

#include <boost/filesystem/operations.hpp>
#include <gtest/gtest.h>

using namespace SystemTests;
using TestSupport::VTvidParser;

namespace
{

constexpr uint64_t FrameCount = 4;

VArguments SmallCard() { return CounterCard( Rate2398, "speed=4" ); }

// Where the parts of such a recording lie; all recordings of the card are laid out the same.
struct VLayout
{
  uint64_t m_RecordsStart = 0;
  uint64_t m_RecordSize = 0;
  uint64_t m_IndexPosition = 0;
  uint64_t m_FileSize = 0;
};

VLayout MeasureLayout()
{
  const TestSupport::VTemporaryFolder Folder;
  const VHostResult Result = Record( Folder.File( "out" ), SmallCard() + VArguments{ "--frames", std::to_string( FrameCount ) } );
  EXPECT_EQ( 0, Result.m_Run.m_ExitCode ) << Describe( Result.m_Run );
  const VTvidParser File( Result.Path() );
  const VTvidParser::VFrame& rFirst = File.Frames().at( 0 );
  VLayout Layout;
  Layout.m_RecordsStart = File.RecordsStart();
  Layout.m_RecordSize = rFirst.m_AudioPosition + rFirst.m_AudioSize - rFirst.m_VideoPosition;
  Layout.m_IndexPosition = Layout.m_RecordsStart + FrameCount * Layout.m_RecordSize;
  Layout.m_FileSize = File.FileSize();
  return Layout;
}

const VLayout& Layout()
{
  static const VLayout s_Layout = MeasureLayout();
  return s_Layout;
}

// Names a place in the file.
struct VPlace
{
  const char* m_pName;
  uint64_t ( *m_Offset )();
};

uint64_t InRecord( uint64_t i_Record, double i_Share )
{
  return Layout().m_RecordsStart + i_Record * Layout().m_RecordSize + static_cast<uint64_t>( i_Share * static_cast<double>( Layout().m_RecordSize ) );
}

const VPlace Places[] = {
  { "Nothing", [] { return uint64_t{ 0 }; } },
  { "FirstByte", [] { return uint64_t{ 1 }; } },
  { "FixedHeader", [] { return uint64_t{ 47 }; } },
  { "BetweenHeaderAndBlocks", [] { return uint64_t{ 48 }; } },
  { "InternalBlock", [] { return uint64_t{ 300 }; } },
  { "EndOfBlocks", [] { return Layout().m_RecordsStart - 1; } },
  { "BeforeFirstRecord", [] { return Layout().m_RecordsStart; } },
  { "FirstImage", [] { return InRecord( 0, 0.4 ); } },
  { "FirstSound", [] { return InRecord( 0, 0.999 ); } },
  { "BetweenRecords", [] { return InRecord( 1, 0 ); } },
  { "ThirdImage", [] { return InRecord( 2, 0.5 ); } },
  { "LastByteOfSound", [] { return Layout().m_IndexPosition - 1; } },
  { "IndexCount", [] { return Layout().m_IndexPosition + 3; } },
  { "IndexEntry", [] { return Layout().m_IndexPosition + 8 + 16 + 5; } },
  { "LastByte", [] { return Layout().m_FileSize - 1; } },
};

}

class DiskTest : public testing::Test
{
protected:
  VHostResult RecordWithin( uint64_t i_Bytes, const VArguments& i_rMore = {} ) const
  {
    VRunOptions Options;
    Options.m_FileSizeLimit = i_Bytes;
    return Record( m_Folder.File( "out" ), SmallCard() + VArguments{ "--frames", std::to_string( FrameCount ) } + i_rMore, Options );
  }
  // Told by the exit code, in words that name the file, and in its device's record.
  static void ExpectFull( const VHostResult& i_rResult, const std::string& i_rPath )
  {
    EXPECT_EQ( 1, i_rResult.m_Run.m_ExitCode ) << Describe( i_rResult.m_Run );
    for( const std::string& rWords : { std::string( "stagehost: vi:0: " ), "\"" + i_rPath + "\"", std::string( "File too large" ) } )
    {
      EXPECT_NE( std::string::npos, i_rResult.m_Run.m_Error.find( rWords ) ) << Describe( i_rResult.m_Run );
    }
    EXPECT_EQ( i_rPath, i_rResult.Path() );
    EXPECT_NE( 0u, i_rResult.Device().value( "failure", 0u ) & 8 );
    EXPECT_FALSE( i_rResult.Device().value( "errors", nlohmann::json::array() ).empty() ) << Describe( i_rResult.m_Run );
  }

  const TestSupport::VTemporaryFolder m_Folder;
};

class DiskFullTest : public DiskTest, public testing::WithParamInterface<VPlace>
{
};

TEST_P( DiskFullTest, NamesTheFileAndKeepsWhatFits )
{
  const uint64_t Limit = GetParam().m_Offset();
  const VHostResult Result = RecordWithin( Limit );
  const std::string Path = m_Folder.File( "out" ) + "/take_vi0.tvid";
  ExpectFull( Result, Path );
  EXPECT_EQ( Limit, boost::filesystem::file_size( Path ) );
  EXPECT_EQ( Limit, Result.Device().value( "bytes", uint64_t{ 0 } ) );

  if( Limit < Layout().m_RecordsStart )
  {
    EXPECT_TRUE( Inspect( Path ).contains( "failure" ) ) << "a file without its head cannot be read";
    return;
  }
  const uint64_t Whole = std::min( FrameCount, ( Limit - Layout().m_RecordsStart ) / Layout().m_RecordSize );
  const nlohmann::json Told = Inspect( Path, true );
  EXPECT_EQ( false, Told.value( "finished", true ) ) << Told;
  EXPECT_EQ( Whole, Told.value( "frame_count", 0u ) ) << Told;
  EXPECT_EQ( Whole, ReadUnbroken( Path, Rate2398 ).size() );
}

INSTANTIATE_TEST_SUITE_P( Places, DiskFullTest, testing::ValuesIn( Places ),
  []( const auto& i_rInfo ) { return std::string( i_rInfo.param.m_pName ); } );

class MovieDiskTest : public DiskTest, public testing::WithParamInterface<std::tuple<const char*, uint64_t>>
{
};

TEST_P( MovieDiskTest, NamesTheFile )
{
  const auto& [pContainer, Limit] = GetParam();
  const VHostResult Result = RecordWithin( Limit, { "--container", pContainer, "--audio-channels", "2" } );
  ExpectFull( Result, m_Folder.File( "out" ) + "/take_vi0." + pContainer );
  EXPECT_LT( Result.Device().value( "frames_written", FrameCount ), FrameCount );
}

// In the headers, in the second picture and in the third.
INSTANTIATE_TEST_SUITE_P( Containers, MovieDiskTest,
  testing::Combine( testing::Values( "mov", "mp4", "avi", "mkv" ), testing::Values( 20u, 900000u, 2000000u ) ),
  []( const auto& i_rInfo ) { return std::get<0>( i_rInfo.param ) + std::to_string( std::get<1>( i_rInfo.param ) ); } );

TEST_F( DiskTest, AFileThatFitsExactlyIsComplete )
{
  const VHostResult Result = RecordWithin( Layout().m_FileSize );
  EXPECT_EQ( 0, Result.m_Run.m_ExitCode ) << Describe( Result.m_Run );
  EXPECT_EQ( FrameCount, ReadCounterFile( Result.Path() ).size() );
}

// One card's failure is its own, of whatever kind it is: the other file is whole.
TEST_F( DiskTest, TheOtherCardGoesOn )
{
  VRunOptions Options;
  Options.m_FileSizeLimit = 20'000'000;   // 25 small frames fit, 25 large ones do not
  const VHostResult Result = Record( m_Folder.File( "out" ),
    CounterCard( Bluefish60, "speed=2" ) + VArguments{ "--card", CounterCardText( Rate2398, "speed=2" ), "--frames", "25" }, Options );
  EXPECT_EQ( 1, Result.m_Run.m_ExitCode ) << Describe( Result.m_Run );
  ASSERT_EQ( 2u, Result.m_Devices.size() ) << Describe( Result.m_Run );
  EXPECT_NE( 0u, Result.Device( 0 ).value( "failure", 0u ) & 8 );
  EXPECT_EQ( 10u, ReadUnbroken( Result.Path( 0 ), Bluefish60 ).size() );
  EXPECT_EQ( 0u, Result.Device( 1 ).value( "failure", 1u ) );
  EXPECT_EQ( 25u, ReadUnbroken( Result.Path( 1 ), Rate2398 ).size() );
  EXPECT_TRUE( VTvidParser( Result.Path( 1 ) ).IsFinished() );
}

// The name of the file is taken by something that cannot be replaced.
TEST_F( DiskTest, AFileThatCannotBeMadeIsNamed )
{
  const std::string Path = m_Folder.File( "out" ) + "/take_vi0.tvid";
  boost::filesystem::create_directories( Path );
  const VHostResult Result = Record( m_Folder.File( "out" ), SmallCard() + VArguments{ "--frames", "4", "--overwrite" } );
  EXPECT_EQ( 1, Result.m_Run.m_ExitCode ) << Describe( Result.m_Run );
  EXPECT_NE( std::string::npos, Result.m_Run.m_Error.find( Path ) ) << Describe( Result.m_Run );
  EXPECT_TRUE( boost::filesystem::is_directory( Path ) );
}

// Standard output is a file too.
TEST_F( DiskTest, AResultThatCannotBePrintedIsAFailure )
{
  const VRunResult Run = TestSupport::RunProgram(
    { "sh", "-c", "exec \"$STAGECORE_BIN/stagehost\" devices --settings none --card decklink > /dev/full" } );
  EXPECT_EQ( 1, Run.m_ExitCode ) << Describe( Run );
}
