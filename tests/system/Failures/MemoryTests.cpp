// Memory that runs out: the card delivers faster than a file can take.
#include "StageCoreRuntime/SanitizerBuild.h"
#include "tests/support/TemporaryFolder.h"
#include "tests/support/TvidParser.h"
#include "tests/support/system/CounterFile.h"
#include "tests/support/system/Rates.h"
#include "tests/support/system/StageHost.h"

#include <gtest/gtest.h>

using namespace SystemTests;

namespace
{

constexpr int FailureMemory = 4;
constexpr uint64_t MemoryMiB = 256;

// As fast as it can; the memory is full to its pre-roll when the recording begins.
const VArguments FastCard = { "--card", "decklink:pattern=counter,audio=ramp,standard=HD_1920_1080P_6000,speed=100", "--memory",
  std::to_string( MemoryMiB ), "--pre-roll", "0.8" };
const VSignalRate FastRate{ "HD_1920_1080P_6000", 2250000, 30, 2, false, { 800 } };

}

class MemoryTest : public testing::Test
{
protected:
  const TestSupport::VTemporaryFolder m_Folder;
};

TEST_F( MemoryTest, TheCaptureEndsWithWhatItHas )
{
  const VRecordResult Result = Record( m_Folder.File( "out" ), FastCard + VArguments{ "--frames", "5000" } );
  EXPECT_EQ( 3, Result.m_Run.m_ExitCode ) << Describe( Result.m_Run );
  const nlohmann::json& rDevice = Result.Device();
  EXPECT_EQ( FailureMemory, rDevice.value( "failure", 0 ) ) << Describe( Result.m_Run );
  EXPECT_EQ( "Complete", rDevice.value( "state", "" ) );
  EXPECT_NE( std::string::npos, Result.m_Run.m_Error.find( "stagehost: vi:0: " ) ) << "nobody was told why";
  EXPECT_NE( std::string::npos, Result.m_Run.m_Error.find( "--memory" ) ) << "nobody was told what helps";

  const std::vector<VCounterFrame> Frames = ReadCounterFile( Result.Path() );
  // A machine that cannot keep up with the card makes it drop frames, which is another matter.
  if( !DebugServices::IsSanitizerBuild && rDevice.value( "lost", nlohmann::json::object() ).value( "card", 0u ) == 0 )
  {
    ExpectUnbroken( Frames, FastRate );
  }
  EXPECT_TRUE( TestSupport::VTvidParser( Result.Path() ).IsFinished() );
  EXPECT_EQ( Frames.size(), rDevice.value( "frames_captured", 0u ) );
  EXPECT_EQ( Frames.size(), rDevice.value( "frames_written", 0u ) );
  EXPECT_EQ( 5000u - Frames.size(), rDevice.value( "lost", nlohmann::json::object() ).value( "memory", 0u ) );
  EXPECT_GT( rDevice.value( "buffer_peak_fill", 0.0 ), 0.9 );
}

// What the frames of all devices may take is a promise.
TEST_F( MemoryTest, TheBudgetHolds )
{
  // A sanitizer's own memory is no part of the promise.
  constexpr int64_t OwnMiB = DebugServices::IsSanitizerBuild ? 4096 : 96;
  const VRecordResult Result = Record( m_Folder.File( "out" ),
    { "--card", "decklink:pattern=counter,standard=HD_1920_1080P_5994", "--memory", std::to_string( MemoryMiB ), "--frames", "60" } );
  EXPECT_EQ( 0, Result.m_Run.m_ExitCode ) << Describe( Result.m_Run );
  EXPECT_LT( Result.m_Run.m_PeakResidentKiB / 1024, static_cast<int64_t>( MemoryMiB ) + OwnMiB );
}

// A start further back than memory reaches waits for what never comes, and says so.
TEST_F( MemoryTest, APreRollThatMemoryCannotHoldIsRefused )
{
  const VRecordResult Result = Record( m_Folder.File( "out" ),
    { "--card", "decklink:pattern=counter,standard=HD_1920_1080P_6000,speed=2", "--memory", std::to_string( MemoryMiB ), "--pre-roll", "20",
      "--frames", "10" } );
  EXPECT_NE( 0, Result.m_Run.m_ExitCode );
  EXPECT_FALSE( Result.m_Run.m_bTimedOut );
  EXPECT_NE( std::string::npos, Result.m_Run.m_Error.find( "--pre-roll" ) ) << Describe( Result.m_Run );
}
