// Memory that runs out: the card delivers faster than files can take.
#include "StageCoreRuntime/SanitizerBuild.h"
#include "tests/support/TemporaryFolder.h"
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

// Images take their time to compress, and the memory is full to its pre-roll when the recording begins.
TEST_P( MemoryTest, TheCaptureEndsWithWhatItHas )
{
  const std::string Small = std::string( GetParam().m_pKind ) + ":pattern=counter,speed=8,standard=" + Rate25.m_pStandard;
  const VHostResult Result = Record( m_Folder.File( "out" ),
    { "--card", Small, "--pixel-format", "U8Y8V8Y8", "--container", "images", "--video", "png", "--memory", "120", "--pre-roll", "0.8", "--frames",
      "5000" } );
  EXPECT_EQ( 3, Result.m_Run.m_ExitCode ) << Describe( Result.m_Run );
  const nlohmann::json& rDevice = Result.Device();
  EXPECT_EQ( FailureMemory, rDevice.value( "failure", 0 ) ) << Describe( Result.m_Run );
  EXPECT_EQ( "Complete", rDevice.value( "state", "" ) );
  EXPECT_NE( std::string::npos, Result.m_Run.m_Error.find( "stagehost: vi:0: " ) ) << "nobody was told why";
  EXPECT_NE( std::string::npos, Result.m_Run.m_Error.find( "--memory" ) ) << "nobody was told what helps";

  const std::vector<uint32_t> Counters = DecodeCounters( Result.Path() + "/take_vi0_%08d.png", 720, 576 );
  ASSERT_FALSE( Counters.empty() );
  for( size_t Frame = 0; Frame < Counters.size(); ++Frame )
  {
    EXPECT_EQ( Counters.front() + Frame, Counters[Frame] );
  }
  EXPECT_EQ( Counters.size(), rDevice.value( "frames_captured", 0u ) );
  EXPECT_EQ( Counters.size(), rDevice.value( "frames_written", 0u ) );
  EXPECT_EQ( 5000u - Counters.size(), rDevice.value( "lost", nlohmann::json::object() ).value( "memory", 0u ) );
  EXPECT_GT( rDevice.value( "buffer_peak_fill", 0.0 ), 0.9 );
}

// What the frames of all devices may take is a promise.
TEST_P( MemoryTest, TheBudgetHolds )
{
  // A sanitizer's own memory is no part of the promise.
  constexpr int64_t OwnMiB = DebugServices::IsSanitizerBuild ? 4096 : 96;
  const VHostResult Result = Record( m_Folder.File( "out" ), CounterCard( GetParam() ) + Memory + VArguments{ "--frames", "60" } );
  EXPECT_EQ( 0, Result.m_Run.m_ExitCode ) << Describe( Result.m_Run );
  EXPECT_LT( Result.m_Run.m_PeakResidentKiB / 1024, static_cast<int64_t>( MemoryMiB ) + OwnMiB );
}

INSTANTIATE_TEST_SUITE_P( Kinds, MemoryTest, testing::Values( FastDeckLink, FastBluefish ), KindName );

// A start further back than memory reaches waits for what never comes, and says so.
TEST( MemoryOfOneCard, APreRollThatItCannotHoldIsRefused )
{
  const TestSupport::VTemporaryFolder Folder;
  const VHostResult Result = Record( Folder.File( "out" ),
    CounterCard( FastBluefish, "speed=2" ) + Memory + VArguments{ "--pre-roll", "20", "--frames", "10" } );
  EXPECT_NE( 0, Result.m_Run.m_ExitCode );
  EXPECT_FALSE( Result.m_Run.m_bTimedOut );
  EXPECT_NE( std::string::npos, Result.m_Run.m_Error.find( "--pre-roll" ) ) << Describe( Result.m_Run );
}
