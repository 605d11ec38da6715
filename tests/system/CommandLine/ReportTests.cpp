// What people and scripts are told about devices, settings and files.
#include "tests/support/TemporaryFolder.h"
#include "tests/support/TvidParser.h"
#include "tests/support/system/Rates.h"
#include "tests/support/system/StageHost.h"

#include <gtest/gtest.h>

#include <boost/crc.hpp>

#include <sstream>

using namespace SystemTests;

namespace
{

std::vector<std::string> Lines( const std::string& i_rText )
{
  std::vector<std::string> Result;
  std::istringstream Stream( i_rText );
  for( std::string Line; std::getline( Stream, Line ); )
  {
    Result.push_back( Line );
  }
  return Result;
}

// Columns are parted by two blanks or more.
bool HasCells( const std::string& i_rLine, const std::vector<std::string>& i_rCells )
{
  size_t Place = 0;
  for( const std::string& rCell : i_rCells )
  {
    Place = i_rLine.find( rCell, Place );
    if( Place == std::string::npos )
    {
      return false;
    }
    Place += rCell.size();
  }
  return true;
}

nlohmann::json RunJson( const VArguments& i_rArguments )
{
  const VRunResult Run = TestSupport::RunStageHost( i_rArguments );
  EXPECT_EQ( 0, Run.m_ExitCode ) << Describe( Run );
  nlohmann::json Document = nlohmann::json::parse( Run.m_Output, nullptr, false );
  EXPECT_FALSE( Document.is_discarded() ) << Describe( Run );
  return Document;
}

std::string Crc32( const std::vector<uint8_t>& i_rBytes )
{
  boost::crc_32_type Crc;
  Crc.process_bytes( i_rBytes.data(), i_rBytes.size() );
  char Text[16];
  std::snprintf( Text, sizeof( Text ), "%08x", static_cast<unsigned>( Crc.checksum() ) );
  return Text;
}

}

class ReportTest : public testing::Test
{
protected:
  const TestSupport::VTemporaryFolder m_Folder;
};

TEST_F( ReportTest, DevicesAreATableForPeopleAndADocumentForScripts )
{
  const std::string Script = WriteScript( m_Folder.File( "script.json" ), { { { "frame", 0 }, { "do", "signal-loss" }, { "frames", 100000 } } } );
  const VArguments Cards = { "--card", "decklink:standard=HD_1920_1080P_2500", "--card", "decklink:standard=HD_1920_1080P_5000,timecode=none",
    "--card", "decklink:standard=HD_1920_1080P_2500,script=" + Script, "--card", "bluefish444:standard=HD_1280_720P_5000" };
  const VRunResult Run = TestSupport::RunStageHost( VArguments{ "devices" } + Cards );
  EXPECT_EQ( 0, Run.m_ExitCode ) << Describe( Run );
  EXPECT_EQ( "", Run.m_Error ) << "warnings where nothing is wrong";
  const std::vector<std::string> Rows = Lines( Run.m_Output );
  ASSERT_EQ( 5u, Rows.size() ) << Run.m_Output;
  EXPECT_TRUE( HasCells( Rows[0], { "URN", "NAME", "DRIVER", "STANDARD", "SIGNAL", "TIMECODE", "PIXEL FORMATS", "CHANNELS" } ) ) << Run.m_Output;
  EXPECT_TRUE( HasCells( Rows[1], { "vi:0", "Super Nova C1:ChA", "Bluefish 444", "HD_1280_720P_5000", "yes", "25 fps", "Luminance8", "0 1 2 3" } ) )
    << Run.m_Output;
  EXPECT_TRUE( HasCells( Rows[2], { "vi:1", "DeckLink C1", "HD_1920_1080P_2500", "yes", "25 fps", "U8Y8V8Y8", "16" } ) ) << Run.m_Output;
  EXPECT_TRUE( HasCells( Rows[3], { "vi:2", "DeckLink C2", "HD_1920_1080P_5000", "yes", "Not Detected" } ) ) << Run.m_Output;
  EXPECT_TRUE( HasCells( Rows[4], { "vi:3", "DeckLink C3", "no" } ) ) << Run.m_Output;
  EXPECT_EQ( Rows[0].find( "STANDARD" ), Rows[2].find( "HD_1920" ) ) << "columns stand under their heads";

  const nlohmann::json Devices = RunJson( VArguments{ "devices", "--json" } + Cards );
  ASSERT_EQ( 4u, Devices.size() );
  EXPECT_EQ( "vi:0", Devices[0].value( "urn", "" ) );
  EXPECT_EQ( "HD_1920_1080P_5000", Devices[2].value( "standard", "" ) );
  EXPECT_TRUE( Devices[0].value( "signal", false ) );
  EXPECT_FALSE( Devices[3].value( "signal", true ) );
  EXPECT_EQ( ( nlohmann::json{ 0, 2, 8, 16 } ), Devices[1].value( "channel_counts", nlohmann::json() ) );
  EXPECT_EQ( 16, Devices[0].value( "channels", 0 ) );
}

TEST_F( ReportTest, CardsWithoutUsableInputsGiveNoDevice )
{
  const VRunResult Run = TestSupport::RunStageHost( { "devices", "--card", "bluefish444:inputs=0,outputs=2" } );
  EXPECT_EQ( 4, Run.m_ExitCode );
  EXPECT_NE( Run.m_Error.find( "Card has output channels but no inputs." ), std::string::npos ) << Describe( Run );
}

// Two rates that no common base has: recorded all the same, and told.
TEST_F( ReportTest, RatesThatDoNotFitAreWarnedOf )
{
  const VRunResult Run = TestSupport::RunStageHost(
    { "devices", "--card", "decklink:standard=HD_1920_1080P_2500", "--card", "decklink:standard=HD_1920_1080P_3000" } );
  EXPECT_EQ( 0, Run.m_ExitCode );
  EXPECT_EQ( 3u, Lines( Run.m_Output ).size() );
  EXPECT_NE( std::string::npos, Run.m_Error.find( "is incompatible with this video input's frame rate" ) ) << Describe( Run );
  EXPECT_EQ( std::string::npos, Run.m_Error.find( "(0.00 Hz)" ) ) << Describe( Run );
}

class SettingsReportTest : public testing::TestWithParam<VSignalRate>
{
};

TEST_P( SettingsReportTest, SettingsCanBeListedReadAndChanged )
{
  const VArguments Card = { "params", "--card", std::string( GetParam().m_pKind ) + ":standard=" + GetParam().m_pStandard };
  const VRunResult List = TestSupport::RunStageHost( Card + VArguments{ "list" } );
  EXPECT_EQ( 0, List.m_ExitCode ) << Describe( List );
  const std::vector<std::string> Tree = Lines( List.m_Output );
  const auto Group = std::find( Tree.begin(), Tree.end(), "VideoInput.vi:0.Settings" );
  const auto IsFormat = []( const std::string& i_rLine )
  {
    const bool bLuma = i_rLine.find( "Luminance8" ) != std::string::npos;
    return bLuma == ( GetParam().m_pKind == std::string( "bluefish444" ) ) &&
      HasCells( i_rLine, { "PixelFormat", "8", "U8Y8V8Y8, ", "U10Y10V10Y10", "The chosen pixel format" } );
  };
  EXPECT_EQ( 1, std::count_if( Group, Tree.end(), IsFormat ) ) << List.m_Output;
  for( const nlohmann::json& rSetting : RunJson( Card + VArguments{ "--json", "list" } ) )
  {
    EXPECT_FALSE( rSetting.value( "path", "" ).empty() );
    EXPECT_FALSE( rSetting.value( "description", "" ).empty() ) << rSetting;
  }
  const VRunResult Set = TestSupport::RunStageHost( Card + VArguments{ "set", "VideoInput.vi:0.Settings.PixelFormat", "U10Y10V10Y10" } );
  EXPECT_EQ( 0, Set.m_ExitCode ) << Describe( Set );
  EXPECT_EQ( "U10Y10V10Y10\n", Set.m_Output );
  const VRunResult Timecode = TestSupport::RunStageHost( Card + VArguments{ "get", "VideoInput.vi:0.Hardware.TimecodeStandard" } );
  EXPECT_EQ( "Receiving 25 fps\n", Timecode.m_Output ) << Describe( Timecode );
  const VRunResult Get = TestSupport::RunStageHost( Card + VArguments{ "get", "VideoInput.vi:0.Hardware.VideoStandard" } );
  EXPECT_EQ( GetParam().m_pStandard + std::string( "\n" ), Get.m_Output ) << Describe( Get );
}

INSTANTIATE_TEST_SUITE_P( Kinds, SettingsReportTest, BothKinds, KindName );

// Every sum and position is checked against a reader that shares no code with it.
TEST_F( ReportTest, InspectTellsWhatTheFileHolds )
{
  const VHostResult Result = Record( m_Folder.File( "out" ),
    { "--card", "decklink:standard=SD_720_486I_5994,timecode=10:00:00;00,speed=4", "--frames", "4", "--name", "shot" } );
  ASSERT_EQ( 0, Result.m_Run.m_ExitCode ) << Describe( Result.m_Run );
  TestSupport::VTvidParser File( Result.Path() );
  const nlohmann::json Told = Inspect( Result.Path(), true );
  EXPECT_EQ( true, Told.value( "finished", false ) );
  EXPECT_EQ( File.FileSize(), Told.value( "bytes", uint64_t{ 0 } ) );
  EXPECT_EQ( Result.Device().value( "bytes", uint64_t{ 1 } ), Told.value( "bytes", uint64_t{ 0 } ) );
  EXPECT_EQ( Result.Device().value( "start_timecode", "" ), Told.value( "start_timecode", "none" ) );
  const nlohmann::json Frames = Told.value( "frames", nlohmann::json::array() );
  ASSERT_EQ( File.Frames().size(), Frames.size() );
  for( size_t Index = 0; Index < Frames.size(); ++Index )
  {
    const auto& rFrame = File.Frames()[Index];
    const std::vector<uint16_t> Samples = File.Audio( rFrame );
    const auto* const pSound = reinterpret_cast<const uint8_t*>( Samples.data() );
    EXPECT_EQ( rFrame.m_Key, Frames[Index].value( "key", uint64_t{ 99 } ) );
    EXPECT_EQ( rFrame.m_VideoPosition, Frames[Index].value( "position", uint64_t{ 0 } ) );
    EXPECT_EQ( Crc32( File.Video( rFrame ) ), Frames[Index].value( "video_crc32", "" ) );
    EXPECT_EQ( Crc32( { pSound, pSound + rFrame.m_AudioSize } ), Frames[Index].value( "audio_crc32", "" ) );
  }
  const VRunResult Text = TestSupport::RunStageHost( { "inspect", "--frames", Result.Path() } );
  EXPECT_EQ( 0, Text.m_ExitCode );
  for( const char* pPart : { "720 x 486", "U8Y8V8Y8", "finished    yes", "29.970 frames a second", "Int16, 48000 Hz, 16 channels", "10:00:0" } )
  {
    EXPECT_NE( std::string::npos, Text.m_Output.find( pPart ) ) << pPart << "\n" << Text.m_Output;
  }
  EXPECT_TRUE( HasCells( Lines( Text.m_Output ).back(), { "3", Crc32( File.Video( File.Frames().back() ) ) } ) ) << Text.m_Output;
}

// Without a terminal there is no line that is rewritten in place; blocks come where they are asked for.
TEST_F( ReportTest, ProgressIsForWhoeverAskedForIt )
{
  const VArguments Card = { "--card", "decklink:standard=SD_720_576I_5000,speed=4", "--frames", "250" };
  const VHostResult Quiet = Record( m_Folder.File( "quiet" ), Card );
  EXPECT_EQ( "", Quiet.m_Run.m_Error );
  const VHostResult Blocks = Record( m_Folder.File( "blocks" ), Card + VArguments{ "--progress" } );
  const std::vector<int64_t> Captured = NumbersBehind( "frames_captured=", Blocks.m_Run.m_Error );
  EXPECT_GE( Captured.size(), 2u );
  EXPECT_TRUE( std::is_sorted( Captured.begin(), Captured.end() ) );
  EXPECT_LT( Captured.front(), 250 ) << "frames that are still to come are not captured";
  EXPECT_NE( std::string::npos, Blocks.m_Run.m_Error.find( "progress=end" ) );
}
