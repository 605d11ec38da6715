// What cannot be done is refused in one line that names the thing and says what would be accepted. Nothing else is printed, and nothing is lost.
#include "tests/support/TemporaryFolder.h"
#include "tests/support/system/StageHost.h"

#include <boost/filesystem/operations.hpp>
#include <gtest/gtest.h>

#include <algorithm>
#include <fstream>

using namespace SystemTests;

namespace
{

struct VRefusalCase
{
  const char* m_pName;
  VArguments m_Arguments;   // FOLDER stands for the test's folder
  int m_ExitCode;
  std::vector<std::string> m_Words;   // each is in the line
};

const VArguments RecordTo = { "record", "--output", "FOLDER/out" };
const VArguments Five = RecordTo + VArguments{ "--frames", "5" };
const VArguments Ready = Five + VArguments{ "--card", "decklink:standard=SD_720_576I_5000" };
const VArguments Packed = Ready + VArguments{ "--pixel-format", "B8G8R8u8" };

VArguments CardText( const std::string& i_rText ) { return Five + VArguments{ "--card", i_rText }; }
VArguments Params( const VArguments& i_rMore ) { return VArguments{ "params", "--card", "decklink" } + i_rMore; }

const VRefusalCase RefusalCases[] = {
  // The command line
  { "NoCommand", {}, 2, { "devices", "record", "inspect", "params" } },
  { "UnknownCommand", { "recrod" }, 2, { "recrod" } },
  { "UnknownOption", Ready + VArguments{ "--colour" }, 2, { "--colour" } },
  { "NoLength", RecordTo + VArguments{ "--card", "decklink" }, 2, { "--seconds", "--frames" } },
  { "TwoLengths", Ready + VArguments{ "--seconds", "1" }, 2, { "--seconds", "--frames" } },
  { "NoOutput", { "record", "--frames", "5", "--card", "decklink" }, 2, { "--output" } },
  { "NoSeconds", RecordTo + VArguments{ "--card", "decklink", "--seconds", "0" }, 2, { "--seconds", "\"0\"", "above 0" } },
  { "NegativeSeconds", RecordTo + VArguments{ "--card", "decklink", "--seconds", "-1" }, 2, { "--seconds", "above 0" } },
  { "SecondsThatAreNone", RecordTo + VArguments{ "--card", "decklink", "--seconds", "nan" }, 2, { "--seconds", "\"nan\"" } },
  { "EndlessSeconds", RecordTo + VArguments{ "--card", "decklink", "--seconds", "1e300" }, 2, { "--seconds", "up to" } },
  { "HalfAFrame", RecordTo + VArguments{ "--card", "decklink", "--frames", "1.5" }, 2, { "--frames", "whole number" } },
  { "MoreFramesThanThereCanBe", RecordTo + VArguments{ "--card", "decklink", "--frames", "99999999999999999999" }, 2, { "--frames" } },
  { "PreRollOfAges", Ready + VArguments{ "--pre-roll", "1e30" }, 2, { "--pre-roll", "from 0 to" } },
  { "TooLittleMemory", Ready + VArguments{ "--memory", "1" }, 2, { "--memory", "MiB from" } },
  { "UnknownContainer", Ready + VArguments{ "--container", "wav" }, 2, { "--container", "wav", "tvid" } },
  { "TooManyChannels", Ready + VArguments{ "--audio-channels", "17" }, 2, { "--audio-channels", "16" } },
  { "NoName", Ready + VArguments{ "--name", "" }, 2, { "--name" } },
  { "ParamsOfWhat", Params( {} ), 2, { "list", "get", "set", "reset", "watch" } },
  { "InspectWhat", { "inspect" }, 2, { "FILE" } },
  // What the device does not offer
  { "UnknownPixelFormat", Ready + VArguments{ "--pixel-format", "XYZ" }, 2, { "--pixel-format XYZ", "U8Y8V8Y8" } },
  { "UnknownAudioFormat", Ready + VArguments{ "--audio-format", "Float" }, 2, { "--audio-format Float", "Int16", "Int32" } },
  // What a container does not take, or a payload does not have
  { "UncompressedImages", Ready + VArguments{ "--container", "images", "--video", "uncompressed" }, 2,
    { "--video uncompressed", "images", "jpeg, png, tiff" } },
  { "ImagesWithSound", Ready + VArguments{ "--container", "images", "--audio", "uncompressed" }, 2, { "--audio uncompressed", "images takes none" } },
  { "ImagesWithChannels", Ready + VArguments{ "--container", "images", "--audio-channels", "2" }, 2, { "--audio-channels 2", "images takes 0" } },
  { "ImagesWithSamples", Ready + VArguments{ "--container", "images", "--audio-format", "Int16" }, 2, { "--audio-format Int16", "images" } },
  { "PngInTvid", Ready + VArguments{ "--container", "tvid", "--video", "png" }, 2, { "--video png", "tvid takes uncompressed" } },
  { "TiffInAvi", Ready + VArguments{ "--container", "avi", "--video", "tiff" }, 2, { "--video tiff", "avi takes uncompressed, jpeg" } },
  { "QualityOfNothing", Ready + VArguments{ "--quality", "90" }, 2, { "--quality 90", "jpeg" } },
  { "QualityOfPng", Ready + VArguments{ "--container", "images", "--video", "png", "--quality", "90" }, 2, { "--quality 90", "jpeg" } },
  { "NoQuality", Ready + VArguments{ "--container", "images", "--quality", "0" }, 2, { "--quality", "1 to 100" } },
  { "TooMuchQuality", Ready + VArguments{ "--container", "images", "--quality", "101" }, 2, { "--quality", "1 to 100" } },
  { "PixelsOfAnotherContainer", Ready + VArguments{ "--container", "avi", "--pixel-format", "U10Y10V10Y10" }, 2,
    { "--pixel-format U10Y10V10Y10", "avi", "B8G8R8u8" } },
  { "PixelsThatCannotBeHad", Ready + VArguments{ "--pixel-format", "Luminance6" }, 2, { "--pixel-format Luminance6", "vi:0", "R8G8B8" } },
  { "PixelsOfAnImage", Ready + VArguments{ "--container", "images", "--pixel-format", "R8G8B8" }, 2,
    { "--pixel-format R8G8B8", "vi:0", "U8Y8V8Y8" } },
  { "ChannelsOfAnotherContainer", Ready + VArguments{ "--container", "avi", "--audio-channels", "5" }, 2,
    { "--audio-channels 5", "0, 1, 2, 3, 4, 8" } },
  { "BurnInOfWhat", Ready + VArguments{ "--burn-in", "name" }, 2, { "--burn-in", "timecode" } },
  { "LensOfACardsOwnPixels", Ready + VArguments{ "--lens", "360,288,-1.2e-6,0" }, 2, { "--lens" } },
  { "LensInSoftware", Packed + VArguments{ "--lens", "360,288,-1.2e-6,0", "--converter", "software" }, 2, { "--lens", "software" } },
  { "HalfALens", Packed + VArguments{ "--lens", "360,288" }, 2, { "--lens" } },
  // Devices
  { "UnknownDevice", Ready + VArguments{ "--device", "vi:7" }, 4, { "vi:7", "vi:0" } },
  { "UnknownWatchedDevice", { "watch", "--card", "decklink", "--device", "vi:5", "--seconds", "1" }, 4, { "There is no device \"vi:5\"" } },
  { "NoSecondsOfWatching", { "watch", "--card", "decklink", "--seconds", "0" }, 2, { "--seconds", "above 0" } },
  { "NoDevice", Five, 4, { "--card" } },
  // The card's text
  { "UnknownKind", CardText( "sony" ), 2, { "\"sony\"", "decklink" } },
  { "NoScript", CardText( "decklink:script=FOLDER/none.json" ), 2, { "FOLDER/none.json" } },
  { "ForeignScript", CardText( "decklink:script=FOLDER/file" ), 2, { "FOLDER/file", "JSON" } },
  { "EventOfNoKind", CardText( "decklink:script=FOLDER/script.json" ), 2, { "FOLDER/script.json", "event 0", "explode", "signal-loss" } },
  { "NoClip", CardText( "decklink:input=FOLDER/none.mov" ), 2, { "FOLDER/none.mov", "No such file" } },
  { "NoScreen", CardText( "decklink:input=-f x11grab -i :7654" ), 2, { ":7654" } },
  // Settings
  { "UnknownSetting", Params( { "get", "VideoInput.vi:0.Settings.Nonsense" } ), 2, { "VideoInput.vi:0.Settings.Nonsense", "params list" } },
  { "RefusedValue", Params( { "set", "VideoInput.vi:0.Settings.PixelFormat", "Nope" } ), 2,
    { "VideoInput.vi:0.Settings.PixelFormat", "Nope", "U8Y8V8Y8" } },
  { "RefusedCount", Params( { "set", "VideoInput.vi:0.Settings.AudioChannelCount", "3" } ), 2, { "AudioChannelCount", "0, 2, 8, 16" } },
  { "RefusedType", Params( { "set", "VideoInput.vi:0.Settings.Enabled", "maybe" } ), 2, { "Enabled", "maybe", "bool" } },
  { "ReadOnly", Params( { "set", "VideoInput.vi:0.Hardware.Status", "Ready" } ), 2, { "VideoInput.vi:0.Hardware.Status", "read-only" } },
  { "ReadOnlyReset", Params( { "reset", "VideoInput.vi:0.Hardware.Status" } ), 2, { "VideoInput.vi:0.Hardware.Status", "read-only" } },
  { "ResetOfNothing", Params( { "reset", "VideoInput.vi:3" } ), 2, { "VideoInput.vi:3", "params list" } },
  { "WatchOfNothing", Params( { "watch", "VideoInput.vi:3" } ), 2, { "VideoInput.vi:3", "params list" } },
  { "SetNowhere", Params( { "--settings", "none", "set", "VideoInput.vi:0.Settings.Name", "A" } ), 1, { "no file" } },
  { "NoSettings", Ready + VArguments{ "--settings", "FOLDER/none.json" }, 2, { "FOLDER/none.json" } },
  // Files
  { "FolderThatCannotBeMade", { "record", "--output", "/proc/here", "--frames", "5", "--card", "decklink" }, 1, { "\"/proc/here\"" } },
  { "FolderUnderAFile", { "record", "--output", "FOLDER/file/out", "--frames", "5", "--card", "decklink" }, 1,
    { "FOLDER/file/out", "Not a directory" } },
  { "FolderThatIsAFile", { "record", "--output", "FOLDER/file", "--frames", "5", "--card", "decklink" }, 1, { "FOLDER/file" } },
  { "NoFile", { "inspect", "FOLDER/none.tvid" }, 1, { "FOLDER/none.tvid", "No such file" } },
  { "FolderAsFile", { "inspect", "FOLDER" }, 1, { "FOLDER" } },
  { "ForeignFile", { "inspect", "FOLDER/file" }, 1, { "FOLDER/file", "Not a tvid file" } },
};

std::string WithFolder( std::string i_Text, const std::string& i_rFolder )
{
  const size_t Place = i_Text.find( "FOLDER" );
  return Place == std::string::npos ? i_Text : i_Text.replace( Place, 6, i_rFolder );
}

void WriteFile( const std::string& i_rPath, const std::string& i_rBytes ) { std::ofstream( i_rPath, std::ios::binary ) << i_rBytes; }

// One line of the program's own, and at most log lines besides.
void ExpectOneLine( const VRunResult& i_rRun )
{
  EXPECT_EQ( "", i_rRun.m_Output );
  EXPECT_EQ( 0u, i_rRun.m_Error.find( "stagehost: " ) ) << Describe( i_rRun );
  EXPECT_EQ( 1, std::count( i_rRun.m_Error.begin(), i_rRun.m_Error.end(), '\n' ) ) << Describe( i_rRun );
}

}

class RefusalTest : public testing::TestWithParam<VRefusalCase>
{
protected:
  const TestSupport::VTemporaryFolder m_Folder;
};

TEST_P( RefusalTest, IsOneLineThatNamesTheThing )
{
  const std::string Folder = m_Folder.File( "here" );
  boost::filesystem::create_directories( Folder );
  WriteFile( Folder + "/file", std::string( 100, 'x' ) );
  WriteScript( Folder + "/script.json", { { { "frame", 1 }, { "do", "explode" } } } );
  VArguments Arguments = GetParam().m_Arguments;
  std::transform( Arguments.begin(), Arguments.end(), Arguments.begin(),
    [&]( const std::string& i_rText ) { return WithFolder( i_rText, Folder ); } );
  const VRunResult Run = TestSupport::RunStageHost( Arguments );
  EXPECT_EQ( GetParam().m_ExitCode, Run.m_ExitCode ) << Describe( Run );
  ExpectOneLine( Run );
  for( const std::string& rWord : GetParam().m_Words )
  {
    EXPECT_NE( std::string::npos, Run.m_Error.find( WithFolder( rWord, Folder ) ) ) << rWord << "\n" << Describe( Run );
  }
  EXPECT_EQ( std::string( 100, 'x' ), ReadFile( Folder + "/file" ) );
}

INSTANTIATE_TEST_SUITE_P( Cases, RefusalTest, testing::ValuesIn( RefusalCases ),
  []( const auto& i_rInfo ) { return std::string( i_rInfo.param.m_pName ); } );

class BadInputTest : public testing::Test
{
protected:
  std::string MakeRecording( const std::string& i_rName, const VArguments& i_rMore = {} )
  {
    const VHostResult Result = Record( m_Folder.File( "out" ),
      VArguments{ "--card", "decklink:pattern=counter,standard=SD_720_576I_5000,speed=8", "--frames", "3", "--name", i_rName } + i_rMore );
    EXPECT_EQ( 0, Result.m_Run.m_ExitCode ) << Describe( Result.m_Run );
    return Result.Path();
  }

  const TestSupport::VTemporaryFolder m_Folder;
};

TEST_F( BadInputTest, AFileThatIsThereStaysAsItIs )
{
  const std::string Path = MakeRecording( "take" );
  WriteFile( Path, "mine" );
  const VHostResult Refused = Record( m_Folder.File( "out" ),
    { "--card", "decklink:pattern=counter,standard=SD_720_576I_5000,speed=8", "--frames", "3" } );
  EXPECT_EQ( 1, Refused.m_Run.m_ExitCode );
  ExpectOneLine( Refused.m_Run );
  EXPECT_NE( std::string::npos, Refused.m_Run.m_Error.find( Path ) ) << Describe( Refused.m_Run );
  EXPECT_NE( std::string::npos, Refused.m_Run.m_Error.find( "--overwrite" ) ) << Describe( Refused.m_Run );
  EXPECT_EQ( "mine", ReadFile( Path ) );

  EXPECT_EQ( Path, MakeRecording( "take", { "--overwrite" } ) );
  EXPECT_EQ( 3u, Inspect( Path ).value( "frame_count", 0u ) );
}

// A card that shows nothing: there is a device, and no signal.
TEST_F( BadInputTest, NoSignalIsToldAsSuch )
{
  const std::string Script = WriteScript( m_Folder.File( "script.json" ), { { { "frame", 0 }, { "do", "signal-loss" }, { "frames", 100000 } } } );
  const VHostResult Result = Record( m_Folder.File( "out" ), { "--card", "decklink:standard=SD_720_576I_5000,script=" + Script, "--frames", "3" } );
  EXPECT_EQ( 4, Result.m_Run.m_ExitCode );
  ExpectOneLine( Result.m_Run );
  EXPECT_NE( std::string::npos, Result.m_Run.m_Error.find( "vi:0" ) );
  EXPECT_NE( std::string::npos, Result.m_Run.m_Error.find( "no signal" ) );
}

// Cut short, or with a changed byte in its head or index, a finished file is damaged: that is told, or a byte changes nothing but what an attribute
// says. A crash or an endless run is neither.
TEST_F( BadInputTest, ADamagedFileNeverBringsInspectDown )
{
  constexpr size_t FixedHeader = 40;
  const std::string Whole = ReadFile( MakeRecording( "take" ) );
  const std::string Path = m_Folder.File( "damaged.tvid" );
  const auto Check = [&]( const std::string& i_rBytes, bool i_bMayBeRead )
  {
    WriteFile( Path, i_rBytes );
    const VRunResult Run = TestSupport::RunStageHost( { "inspect", "--json", Path } );
    if( Run.m_ExitCode == 0 )
    {
      EXPECT_TRUE( i_bMayBeRead );
      EXPECT_EQ( "", Run.m_Error );
      return;
    }
    EXPECT_EQ( 1, Run.m_ExitCode ) << Describe( Run );
    ExpectOneLine( Run );
    EXPECT_NE( std::string::npos, Run.m_Error.find( Path ) );
  };
  for( const size_t Length : { size_t{ 0 }, size_t{ 19 }, FixedHeader, size_t{ 500 }, Whole.size() / 2, Whole.size() - 56, Whole.size() - 1 } )
  {
    SCOPED_TRACE( Length );
    Check( Whole.substr( 0, Length ), false );
  }
  const size_t Records = Whole.size() - 3 * ( 720 * 576 * 2 + 4 + 1920 * 16 * 2 ) - 8 - 3 * 16;
  std::vector<size_t> Places = { 0, 10, 19, 20, 25, 31, 33, 39 };
  for( size_t Place = FixedHeader; Place < Records; Place += 37 )
  {
    Places.push_back( Place );
  }
  for( size_t Place = Whole.size() - 56; Place < Whole.size(); Place += 5 )
  {
    Places.push_back( Place );
  }
  for( const size_t Place : Places )
  {
    SCOPED_TRACE( Place );
    std::string Damaged = Whole;
    Damaged[Place] = static_cast<char>( Damaged[Place] ^ 0x5A );
    Check( Damaged, Place >= FixedHeader );
  }
}
