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

const VArguments Memory = { "--memory", std::to_string( MemoryMiB ) };
const VSignalRate FastDeckLink{ "HD_1920_1080P_6000", 2250000, 30, 2, false, { 800 } };
const VSignalRate FastBluefish{ "HD_1920_1080P_6000", 2250000, 30, 2, false, { 800 }, "bluefish444" };

}

class MemoryTest : public testing::TestWithParam<VSignalRate>
{
protected:
  const TestSupport::VTemporaryFolder m_Folder;
};

// As fast as it can; the memory is full to its pre-roll when the recording begins.
TEST_P( MemoryTest, TheCaptureEndsWithWhatItHas )
{
  const VRecordResult Result = Record( m_Folder.File( "out" ),
    CounterCard( GetParam(), "speed=100" ) + Memory + VArguments{ "--pre-roll", "0.8", "--frames", "5000" } );
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
    ExpectUnbroken( Frames, GetParam() );
  }
  EXPECT_TRUE( TestSupport::VTvidParser( Result.Path() ).IsFinished() );
  EXPECT_EQ( Frames.size(), rDevice.value( "frames_captured", 0u ) );
  EXPECT_EQ( Frames.size(), rDevice.value( "frames_written", 0u ) );
  EXPECT_EQ( 5000u - Frames.size(), rDevice.value( "lost", nlohmann::json::object() ).value( "memory", 0u ) );
  EXPECT_GT( rDevice.value( "buffer_peak_fill", 0.0 ), 0.9 );
}

// What the frames of all devices may take is a promise.
TEST_P( MemoryTest, TheBudgetHolds )
{
  // A sanitizer's own memory is no part of the promise.
  constexpr int64_t OwnMiB = DebugServices::IsSanitizerBuild ? 4096 : 96;
  const VRecordResult Result = Record( m_Folder.File( "out" ), CounterCard( GetParam() ) + Memory + VArguments{ "--frames", "60" } );
  EXPECT_EQ( 0, Result.m_Run.m_ExitCode ) << Describe( Result.m_Run );
  EXPECT_LT( Result.m_Run.m_PeakResidentKiB / 1024, static_cast<int64_t>( MemoryMiB ) + OwnMiB );
}

INSTANTIATE_TEST_SUITE_P( Kinds, MemoryTest, testing::Values( FastDeckLink, FastBluefish ), KindName );

// A start further back than memory reaches waits for what never comes, and says so.
TEST( MemoryOfOneCard, APreRollThatItCannotHoldIsRefused )
{
  const TestSupport::VTemporaryFolder Folder;
  const VRecordResult Result = Record( Folder.File( "out" ),
    CounterCard( FastBluefish, "speed=2" ) + Memory + VArguments{ "--pre-roll", "20", "--frames", "10" } );
  EXPECT_NE( 0, Result.m_Run.m_ExitCode );
  EXPECT_FALSE( Result.m_Run.m_bTimedOut );
  EXPECT_NE( std::string::npos, Result.m_Run.m_Error.find( "--pre-roll" ) ) << Describe( Result.m_Run );
}
