// What is set in one run acts in the next ones, and nothing else ever touches it.
#include "tests/support/TemporaryFolder.h"
#include "tests/support/system/StageHost.h"

#include <gtest/gtest.h>

#include <algorithm>
#include <cstdlib>
#include <fstream>
#include <list>

using namespace SystemTests;

namespace
{

const VArguments Card = { "--card", "decklink:standard=SD_720_576I_5000,speed=4" };

std::string Key( const std::string& i_rName ) { return "VideoInput.vi:0.Settings." + i_rName; }

class SettingsTest : public testing::Test
{
protected:
  SettingsTest() { m_Options.m_Environment = { "XDG_CONFIG_HOME=" + m_Folder.File( "" ) }; }

  VRunResult Params( const VArguments& i_rMore, const VArguments& i_rCards = Card ) const
  {
    return TestSupport::RunStageHost( VArguments{ "params" } + i_rCards + i_rMore, m_Options );
  }
  void Set( const std::string& i_rName, const std::string& i_rValue ) const
  {
    const VRunResult Run = Params( { "set", Key( i_rName ), i_rValue } );
    EXPECT_EQ( 0, Run.m_ExitCode ) << Describe( Run );
    EXPECT_EQ( i_rValue + "\n", Run.m_Output );
  }
  std::string Get( const std::string& i_rName ) const { return Params( { "get", Key( i_rName ) } ).m_Output; }
  nlohmann::json Saved() const
  {
    const nlohmann::json Document = nlohmann::json::parse( ReadFile( m_Path ), nullptr, false );
    return Document.is_object() ? Document.value( "settings", nlohmann::json::object() ) : nlohmann::json();
  }
  VHostResult RecordMore( const std::string& i_rName, const VArguments& i_rMore = {}, const VArguments& i_rCards = Card ) const
  {
    return Record( m_Folder.File( "out" ), i_rCards + VArguments{ "--frames", "3", "--name", i_rName } + i_rMore, m_Options );
  }

  const TestSupport::VTemporaryFolder m_Folder;
  const std::string m_Path = m_Folder.File( "stagehost/settings.json" );
  VRunOptions m_Options;
};

int64_t CountOf( const std::string& i_rExtension, const std::string& i_rFolder )
{
  boost::system::error_code Error;
  return std::count_if( boost::filesystem::directory_iterator( i_rFolder, Error ), boost::filesystem::directory_iterator(),
    [&]( const boost::filesystem::directory_entry& i_rFile ) { return i_rFile.path().extension() == i_rExtension; } );
}

}

TEST_F( SettingsTest, ARecordingTakesWhatWasSetBefore )
{
  Set( "AudioChannelCount", "2" );
  Set( "Name", "left" );
  VHostResult Result = RecordMore( "a" );
  EXPECT_TRUE( Result.Path().ends_with( "/a_left.tvid" ) ) << Describe( Result.m_Run );
  EXPECT_EQ( 2, Inspect( Result.Path() )["internal"].value( "AudioFrameInfo.Channels", 0 ) );

  // The payload is one that only the container of an earlier run takes.
  Set( "VideoContainer", "IMAGES" );
  Set( "VideoPayload", "ImagePNG" );
  Result = RecordMore( "b" );
  EXPECT_EQ( 0, Result.m_Run.m_ExitCode ) << Describe( Result.m_Run );
  EXPECT_EQ( "images", Result.Device().value( "container", "" ) );
  EXPECT_EQ( 3, CountOf( ".png", m_Folder.File( "out/b_left" ) ) );

  // The command line has the last word, for its run.
  EXPECT_TRUE( RecordMore( "c", { "--container", "mkv", "--audio-channels", "0" } ).Path().ends_with( "/c_left.mkv" ) );
  EXPECT_TRUE( RecordMore( "d", { "--settings", "none" } ).Path().ends_with( "/d_vi0.tvid" ) );
  EXPECT_EQ( "IMAGES\n", Get( "VideoContainer" ) );

  const VRunResult Reset = Params( { "reset", "VideoInput.vi:0" } );
  EXPECT_EQ( 0, Reset.m_ExitCode ) << Describe( Reset );
  EXPECT_NE( std::string::npos, Reset.m_Output.find( Key( "AudioChannelCount" ) + " = 16\n" ) ) << Reset.m_Output;
  EXPECT_NE( std::string::npos, Reset.m_Output.find( Key( "VideoPayload" ) + " = Uncompressed\n" ) ) << Reset.m_Output;
  EXPECT_TRUE( Saved().empty() ) << Saved();
  EXPECT_TRUE( RecordMore( "e" ).Path().ends_with( "/e_vi0.tvid" ) );
}

// The Bluefish444 card comes first, and takes what the other does not.
TEST_F( SettingsTest, EachKindOfCardTakesItsOwn )
{
  const VArguments Both = Card + VArguments{ "--card", "bluefish444:standard=SD_720_576I_5000,speed=4" };
  EXPECT_EQ( "R8G8B8\n", Params( { "set", Key( "PixelFormat" ), "R8G8B8" }, Both ).m_Output );
  EXPECT_EQ( "3\n", Params( { "set", Key( "AudioChannelCount" ), "3" }, Both ).m_Output );
  const VHostResult Result = RecordMore( "a", {}, Both );
  const std::pair<const char*, int> Expected[] = { { "R8G8B8", 3 }, { "U8Y8V8Y8", 16 } };
  for( size_t Device = 0; Device < std::size( Expected ); ++Device )
  {
    const nlohmann::json Told = Inspect( Result.Path( Device ) )["internal"];
    EXPECT_EQ( Expected[Device].first, Told.value( "VideoFrameInfo.PixelFormat", "" ) ) << Describe( Result.m_Run );
    EXPECT_EQ( Expected[Device].second, Told.value( "AudioFrameInfo.Channels", 0 ) );
  }
}

TEST_F( SettingsTest, ADisabledDeviceIsLeftOutUnlessItIsNamed )
{
  const VArguments Two = Card + Card;
  EXPECT_EQ( "false\n", Params( { "set", "VideoInput.vi:1.Settings.Enabled", "false" }, Two ).m_Output );
  VHostResult Result = RecordMore( "a", {}, Two );
  ASSERT_EQ( 1u, Result.m_Devices.size() ) << Describe( Result.m_Run );
  EXPECT_EQ( "vi:0", Result.Device().value( "urn", "" ) );
  Result = RecordMore( "b", { "--device", "vi:1" }, Two );
  EXPECT_EQ( 1u, Result.m_Devices.size() );
  EXPECT_EQ( "vi:1", Result.Device().value( "urn", "" ) ) << Describe( Result.m_Run );

  EXPECT_EQ( "false\n", Params( { "set", Key( "Enabled" ), "false" }, Two ).m_Output );
  Result = RecordMore( "c", {}, Two );
  EXPECT_EQ( 4, Result.m_Run.m_ExitCode );
  EXPECT_EQ( "stagehost: No device is enabled; --device URN takes one all the same.\n", Result.m_Run.m_Error );
  const VRunResult Devices = TestSupport::RunStageHost( VArguments{ "devices", "--json" } + Two, m_Options );
  EXPECT_EQ( 2u, nlohmann::json::parse( Devices.m_Output, nullptr, false ).size() ) << Describe( Devices );
}

TEST_F( SettingsTest, AFolderThatIsNoMoreGivesWay )
{
  Set( "CaptureDirectory", "None" );
  std::string Text = ReadFile( m_Path );
  Text.replace( Text.find( "\"None\"" ), 6, "\"Fast Disk\"" );
  std::ofstream( m_Path ) << Text;
  const VRunResult Run = Params( { "get", Key( "CaptureDirectory" ) } );
  EXPECT_EQ( "Default\n", Run.m_Output );
  EXPECT_NE( std::string::npos,
    Run.m_Error.find( "Device vi:0 is using an invalid capture folder [ Fast Disk ], reverting to default capture folder." ) )
    << Run.m_Error;
  EXPECT_EQ( Text, ReadFile( m_Path ) ) << "the folder may come back";
}

TEST_F( SettingsTest, WhatIsRefusedLeavesNoTrace )
{
  EXPECT_EQ( 2, Params( { "set", "VideoInput.vi:0.Hardware.Status", "Ready" } ).m_ExitCode );
  EXPECT_EQ( 2, Params( { "set", Key( "Threshold" ), "1.5" } ).m_ExitCode );
  EXPECT_EQ( 0, Params( { "list" } ).m_ExitCode );
  EXPECT_EQ( 0, Params( { "reset", Key( "Threshold" ) } ).m_ExitCode );
  EXPECT_EQ( "", ReadFile( m_Path ) );
  Set( "Threshold", "0.25" );
  for( const char* pNothing : { "", "." } )
  {
    EXPECT_EQ( 2, Params( { "reset", pNothing } ).m_ExitCode ) << "nothing named is not all";
  }
  Set( "TimeOffsetTicks", "-135000" );
  EXPECT_EQ( "0.25\n", Get( "Threshold" ) );
  const nlohmann::json All = nlohmann::json::parse( Params( { "list", "--json" } ).m_Output, nullptr, false );
  EXPECT_EQ( 2, std::count_if( All.begin(), All.end(), []( const nlohmann::json& i_rSetting ) { return i_rSetting.value( "saved", false ); } ) );
}

TEST_F( SettingsTest, AnOddNameSpoilsNeitherTheListNorARecording )
{
  std::string Name = "\x1b[2J\n";
  for( int Count = 0; Count < 200; ++Count )
  {
    Name += "\xc3\xa9";
  }
  Set( "Name", Name );
  const std::string List = Params( { "list" } ).m_Output;
  EXPECT_EQ( std::string::npos, List.find( '\x1b' ) );
  EXPECT_NE( std::string::npos, List.find( "SD NTSC 16:9 (40:33)" ) ) << "all choices: " << List;
  const size_t Flags = List.find( "FLAGS" );
  const size_t Line = List.rfind( '\n', List.find( "\xc3\xa9..." ) ) + 1;
  EXPECT_EQ( List.find( "saved", Line ) - Line - static_cast<size_t>( std::count( List.begin(), List.end(), '\xc3' ) ), Flags ) << List;

  const VHostResult Result = RecordMore( "a" );
  EXPECT_EQ( 0u, Result.m_Devices.size() ) << "refused before it begins";
  EXPECT_NE( std::string::npos, Result.m_Run.m_Error.find( "cannot be made: File name too long" ) ) << Result.m_Run.m_Error;
}

TEST_F( SettingsTest, ADamagedFileStopsNobody )
{
  Set( "AudioChannelCount", "2" );
  const std::string Half = ReadFile( m_Path ).substr( 0, 40 );
  std::ofstream( m_Path ) << Half;
  const VHostResult Result = RecordMore( "a" );
  EXPECT_EQ( 0, Result.m_Run.m_ExitCode ) << Describe( Result.m_Run );
  EXPECT_EQ( 0u, Result.m_Run.m_Error.find( "stagehost: The settings file \"" + m_Path + "\" is damaged" ) ) << Result.m_Run.m_Error;
  EXPECT_EQ( 1, std::count( Result.m_Run.m_Error.begin(), Result.m_Run.m_Error.end(), '\n' ) ) << Result.m_Run.m_Error;
  EXPECT_EQ( Half, ReadFile( m_Path + ".damaged" ) );
  EXPECT_EQ( "16\n", Get( "AudioChannelCount" ) );
  EXPECT_EQ( "", RecordMore( "b" ).m_Run.m_Error );
}

TEST_F( SettingsTest, TheUsersFolderIsWhereTheDesktopSaysItIs )
{
  const std::string Home = m_Folder.File( "home" );
  for( const char* pConfig : { "XDG_CONFIG_HOME=", "XDG_CONFIG_HOME=relative" } )
  {
    VRunOptions Options;
    Options.m_Environment = { pConfig, "HOME=" + Home };
    const VRunResult Run = TestSupport::RunStageHost( VArguments{ "params" } + Card + VArguments{ "set", Key( "Name" ), pConfig }, Options );
    EXPECT_EQ( 0, Run.m_ExitCode ) << Describe( Run );
    EXPECT_NE( std::string::npos, ReadFile( Home + "/.config/stagehost/settings.json" ).find( pConfig ) );
  }
}

TEST_F( SettingsTest, ProcessesLoseNothingOfEachOther )
{
  const std::vector<VArguments> Wishes = { { Key( "Name" ), "A" }, { Key( "AudioChannelCount" ), "8" }, { Key( "Threshold" ), "0.5" },
    { Key( "MaximumBlobHeight" ), "7" }, { Key( "TimeOffsetTicks" ), "5" }, { Key( "UseTimecodeForSync" ), "false" } };
  std::list<TestSupport::VProgram> Programs;
  for( const VArguments& rWish : Wishes )
  {
    const VArguments Command = { std::string( std::getenv( "STAGECORE_BIN" ) ) + "/stagehost", "params", "--settings", m_Path, "set" };
    Programs.emplace_back( Command + Card + rWish );
  }
  for( const VArguments& rWish : Wishes )
  {
    EXPECT_EQ( rWish[1] + "\n", Programs.front().WaitForEnd( 30.0 ).m_Output ) << Programs.front().Printed();
    Programs.pop_front();
  }
  EXPECT_EQ( Wishes.size(), Saved().size() ) << Saved();
}

TEST_F( SettingsTest, ChangesArePrintedUntilInterrupted )
{
  nlohmann::json Events = nlohmann::json::array();
  for( int Number = 1; Number < 40; ++Number )
  {
    Events.push_back( { { "frame", 100 * Number }, { "do", "format" }, { "standard", Number % 2 ? "SD_720_486I_5994" : "SD_720_576I_5000" } } );
  }
  const std::string Script = WriteScript( m_Folder.File( "script.json" ), Events );
  const VArguments Command = { std::string( std::getenv( "STAGECORE_BIN" ) ) + "/stagehost", "params", "--settings", "none", "--card",
    "decklink:standard=SD_720_576I_5000,speed=4,script=" + Script, "watch", "VideoInput.vi:0.Hardware", "--json" };
  TestSupport::VProgram Watch( Command );
  ASSERT_TRUE( Watch.WaitFor( "watching 6 settings", 20.0 ) ) << Watch.Printed();
  EXPECT_TRUE( Watch.WaitFor( R"({"path":"VideoInput.vi:0.Hardware.VideoStandard","value":"SD_720_486I_5994"})", 20.0 ) ) << Watch.Printed();
  Watch.Interrupt();
  EXPECT_EQ( 0, Watch.WaitForEnd( 20.0 ).m_ExitCode ) << Watch.Printed();
  EXPECT_EQ( std::string::npos, Watch.Printed().find( "Settings" ) ) << Watch.Printed();
}
