// `stagehost watch`: every frame of a card becomes a state, whatever happens to its signal, and nothing runs while none comes.
#include "tests/support/TemporaryFolder.h"
#include "tests/support/system/Rates.h"
#include "tests/support/system/StageHost.h"

#include <gtest/gtest.h>

#include <array>
#include <csignal>
#include <fstream>

using namespace SystemTests;

namespace
{

VHostResult Watch( const VArguments& i_rArguments, const VRunOptions& i_rOptions = {} )
{
  return RunForDevices( VArguments{ "watch", "--json" } + i_rArguments, i_rOptions );
}

std::string CardText( const std::string& i_rMore = {}, const VSignalRate& i_rRate = Rate25 )
{
  return CounterCardText( i_rRate, "timecode=01:00:00:00" + ( i_rMore.empty() ? "" : "," + i_rMore ) );
}

// One of each kind, with the same signal.
VArguments Cards( const std::string& i_rMore = {} ) { return { "--card", CardText( i_rMore, Bluefish25 ), "--card", CardText( i_rMore ) }; }
constexpr size_t CardCount = 2;

// Frames that a second of watching brings at this speed, at least: the machine may be slow to start.
constexpr double LeastShare = 0.5;

}

class WatchTest : public testing::Test
{
protected:
  // No fault, and every frame of every device accounted for.
  static void ExpectWhole( const VHostResult& i_rResult )
  {
    for( const nlohmann::json& rDevice : i_rResult.m_Devices )
    {
      EXPECT_EQ( 0, rDevice.value( "faults", -1 ) ) << rDevice;
      EXPECT_EQ( 0, rDevice.value( "missed", -1 ) ) << rDevice;
    }
  }
  // No more than so many frames, and told by the exit code.
  static void ExpectLost( const VHostResult& i_rResult, const std::array<int, CardCount>& i_rMost )
  {
    int Lost = 0;
    for( size_t Card = 0; Card < CardCount; ++Card )
    {
      const nlohmann::json Device = i_rResult.Device( Card );
      EXPECT_LE( Device.value( "card_dropped", 1000 ), i_rMost[Card] ) << Device;
      EXPECT_EQ( 0, Device.value( "faults", -1 ) ) << Device;
      Lost += Device.value( "card_dropped", 0 );
    }
    EXPECT_EQ( Lost == 0 ? 0 : 3, i_rResult.m_Run.m_ExitCode ) << Describe( i_rResult.m_Run );
  }
  // Of both kinds of card.
  VHostResult WatchEvents( const nlohmann::json& i_rEvents, const std::string& i_rSeconds = "2" )
  {
    const std::string Script = WriteScript( m_Folder.File( "script.json" ), i_rEvents );
    VHostResult Result = Watch( Cards( "speed=4,script=" + Script ) + VArguments{ "--seconds", i_rSeconds } );
    EXPECT_EQ( CardCount, Result.m_Devices.size() ) << Describe( Result.m_Run );
    return Result;
  }

  const TestSupport::VTemporaryFolder m_Folder;
};

TEST_F( WatchTest, EveryFrameOfEveryCardIsAState )
{
  const VHostResult Result = Watch(
    Cards() + VArguments{ "--card", "decklink:pattern=counter,timecode=none,standard=SD_720_486P_5994", "--seconds", "2" } );
  EXPECT_EQ( 0, Result.m_Run.m_ExitCode ) << Describe( Result.m_Run );
  const double Rates[] = { 25.0, 25.0, 59.94 };
  ASSERT_EQ( std::size( Rates ), Result.m_Devices.size() ) << Describe( Result.m_Run );
  ExpectWhole( Result );
  for( size_t Card = 0; Card < std::size( Rates ); ++Card )
  {
    const nlohmann::json Device = Result.Device( Card );
    EXPECT_GE( Device.value( "states", 0.0 ) + Device.value( "dropped", 0.0 ), 2.0 * Rates[Card] * LeastShare ) << Device;
    EXPECT_GT( Device.value( "latency_p99_ms", -1.0 ), 0.0 );
    EXPECT_GE( Device.value( "latency_p99_ms", -1.0 ), Device.value( "latency_median_ms", 0.0 ) );
    EXPECT_GT( Device.value( "buffer_fill", 0.0 ), 0.0 );
    EXPECT_TRUE( Device.at( "drift" ).is_object() ) << Device;
  }
  for( size_t Card = 0; Card < CardCount; ++Card )
  {
    EXPECT_EQ( Rate25.m_pStandard, Result.Device( Card ).value( "standard", "" ) );
    EXPECT_EQ( "01:00:0", Result.Device( Card ).value( "timecode", "" ).substr( 0, 7 ) );
    EXPECT_EQ( 720, Result.Device( Card ).value( "width", 0 ) );
  }
  EXPECT_EQ( "Super Nova C1:ChA", Result.Device().value( "name", "" ) );
  EXPECT_EQ( "Luminance8", Result.Device().value( "pixel_format", "" ) );
  EXPECT_TRUE( Result.Device( 2 ).at( "timecode" ).is_null() );
}

TEST_F( WatchTest, GoesOnWhenTheTimecodeJumps )
{
  nlohmann::json Events = nlohmann::json::array();
  for( int Jump = 1; Jump < 10; ++Jump )
  {
    Events.push_back( { { "frame", Jump * 40 }, { "do", "timecode-jump" }, { "to", "1" + std::to_string( Jump ) + ":00:00:00" } } );
  }
  const VHostResult Result = WatchEvents( Events );
  EXPECT_EQ( 0, Result.m_Run.m_ExitCode ) << Describe( Result.m_Run );
  ExpectWhole( Result );
  for( const nlohmann::json& rDevice : Result.m_Devices )
  {
    EXPECT_GE( rDevice.value( "sessions", 0 ), 2 ) << rDevice;
    EXPECT_GE( rDevice.value( "states", 0 ), 50 );
  }
}

TEST_F( WatchTest, GoesOnWhenTheFormatChanges )
{
  const VHostResult Result = WatchEvents( { { { "frame", 100 }, { "do", "format" }, { "standard", "SD_720_486I_5994" } } }, "3" );
  ExpectLost( Result, { 10, 10 } );   // frames pass by while a Bluefish444 card is set up anew, and on a slow machine any card
  ExpectWhole( Result );
  for( const nlohmann::json& rDevice : Result.m_Devices )
  {
    EXPECT_EQ( "SD_720_486I_5994", rDevice.value( "standard", "" ) );
    EXPECT_EQ( 486, rDevice.value( "height", 0 ) );
    EXPECT_EQ( 4504500, rDevice.value( "period", 0 ) );
  }
}

// The frames in between are the card's loss where it has counted them: its device may have been stopped by then. That of a Bluefish444 card looks
// again after a second.
TEST_F( WatchTest, GoesOnWhenTheSignalComesBack )
{
  const VHostResult Result = WatchEvents( { { { "frame", 100 }, { "do", "signal-loss" }, { "frames", 50 } } }, "3" );
  ExpectLost( Result, { 50 + 100, 50 } );
  EXPECT_GE( Result.Device( 0 ).value( "states", 0 ), 100 ) << Result.Device( 0 );
  EXPECT_GE( Result.Device( 1 ).value( "states", 0 ), 150 ) << Result.Device( 1 );
}

TEST_F( WatchTest, TellsFramesThatTheCardHasLost )
{
  const VHostResult Result = WatchEvents( EveryFrames( 50, { { "do", "drop" }, { "frames", 3 } } ) );
  EXPECT_EQ( 3, Result.m_Run.m_ExitCode ) << Describe( Result.m_Run );
  for( const nlohmann::json& rDevice : Result.m_Devices )
  {
    EXPECT_GT( rDevice.value( "card_dropped", 0 ), 0 );
    EXPECT_EQ( 0, rDevice.value( "card_dropped", 0 ) % 3 ) << rDevice;
    EXPECT_EQ( 0, rDevice.value( "faults", -1 ) ) << rDevice;
  }
}

// The node sleeps in its wait for the next frame: it never wakes up more often than frames come.
TEST_F( WatchTest, NothingRunsWhileNoFrameComes )
{
  const VHostResult Silent = WatchEvents( { { { "frame", 60 }, { "do", "signal-loss" }, { "frames", 1000000 } } }, "2" );
  for( const nlohmann::json& rDevice : Silent.m_Devices )
  {
    EXPECT_EQ( 0, rDevice.value( "faults", -1 ) );
    EXPECT_FALSE( rDevice.value( "signal", true ) );
    // Each frame wakes it once at most, and so does each change of what it is connected with, of which there is one at the start.
    EXPECT_LE( rDevice.value( "wake_ups", 1000 ), 60 + 2 ) << rDevice;
  }
}

TEST_F( WatchTest, KeepsAPictureOfEachDevice )
{
  const VHostResult Result = Watch( Cards( "speed=4" ) + VArguments{ "--seconds", "1", "--snapshot", m_Folder.File( "pictures" ) } );
  EXPECT_EQ( 0, Result.m_Run.m_ExitCode ) << Describe( Result.m_Run );
  for( const char* pName : { "pictures/vi0.png", "pictures/vi1.png" } )
  {
    const std::string Bytes = ReadFile( m_Folder.File( pName ) );
    ASSERT_GT( Bytes.size(), 24u );
    EXPECT_EQ( std::string( "\x89PNG\r\n\x1a\n", 8 ), Bytes.substr( 0, 8 ) );
    EXPECT_EQ( std::string( "\0\0\x02\xd0\0\0\x02\x40", 8 ), Bytes.substr( 16, 8 ) ) << "720 by 576";
  }

  std::ofstream( m_Folder.File( "occupied" ) ) << "a file";
  const VHostResult Refused = Watch( { "--card", CardText(), "--seconds", "1", "--snapshot", m_Folder.File( "occupied" ) } );
  EXPECT_EQ( 1, Refused.m_Run.m_ExitCode );
  EXPECT_NE( std::string::npos, Refused.m_Run.m_Error.find( "occupied" ) );
}

TEST_F( WatchTest, AnInterruptEndsItWithTheFigures )
{
  const VHostResult Result = Watch( { "--card", CardText( "speed=4" ), "--verbose" },
    SignalOnce( { SIGINT }, []( const std::string& i_rText ) { return i_rText.find( "Node Watch vi:0 runs." ) != std::string::npos; } ) );
  EXPECT_FALSE( Result.m_Run.m_bTimedOut );
  EXPECT_EQ( 1u, Result.m_Devices.size() ) << Describe( Result.m_Run );
}
