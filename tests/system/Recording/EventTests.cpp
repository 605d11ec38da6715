// What happens to a signal while it is recorded. Events come again every so many frames of the card, so that a recording meets them wherever it
// began.
#include "tests/support/TemporaryFolder.h"
#include "tests/support/TvidParser.h"
#include "tests/support/system/CounterFile.h"
#include "tests/support/system/Rates.h"
#include "tests/support/system/StageHost.h"

#include <gtest/gtest.h>

using namespace SystemTests;

namespace
{

constexpr uint32_t Every = 100;           // frames from event to event
constexpr uint32_t TheOnly = 4 * Every;   // of an event that comes once: late enough for a slow machine to be recording
constexpr uint64_t FarBeyond = 600;       // frames of a recording that meets it

constexpr int FailureEndMoved = 2;

}

class EventTest : public testing::TestWithParam<VSignalRate>
{
protected:
  VHostResult RecordEvents( const nlohmann::json& i_rEvents, uint64_t i_Frames )
  {
    const std::string Script = WriteScript( m_Folder.File( "script.json" ), i_rEvents );
    return Record( m_Folder.File( "out" ),
      CounterCard( m_Rate, "timecode=01:00:00:00,speed=" EVENT_TESTS_SPEED ",script=" + Script ) +
        VArguments{ "--frames", std::to_string( i_Frames ), "--verbose" } );
  }

  // To the end in spite of these events: so many frames, none of them missing.
  VHostResult RecordThrough( const nlohmann::json& i_rEvents, uint64_t i_Frames, uint32_t i_First = 0 )
  {
    const VHostResult Result = RecordEvents( i_rEvents, i_Frames );
    EXPECT_EQ( 0, Result.m_Run.m_ExitCode ) << Describe( Result.m_Run );
    const std::vector<VCounterFrame> Frames = ReadUnbroken( Result.Path(), m_Rate );
    EXPECT_EQ( i_Frames, Frames.size() );
    EXPECT_TRUE( Frames.empty() || Frames.front().m_Counter >= i_First );
    EXPECT_EQ( 0, Result.Device().value( "failure", -1 ) );
    return Result;
  }

  // Gaps between neighbouring counters, as "from which card frame, how many are missing". Sound is checked within the frames, and
  // at the joints where nothing is missing.
  static std::vector<std::pair<uint32_t, uint32_t>> Gaps( const std::vector<VCounterFrame>& i_rFrames )
  {
    std::vector<std::pair<uint32_t, uint32_t>> Gaps;
    for( size_t Index = 1; Index < i_rFrames.size(); ++Index )
    {
      const uint32_t Expected = i_rFrames[Index - 1].m_Counter + 1;
      if( i_rFrames[Index].m_Counter != Expected )
      {
        Gaps.emplace_back( Expected, i_rFrames[Index].m_Counter - Expected );
      }
    }
    return Gaps;
  }

  static bool Says( const VHostResult& i_rResult, const std::string& i_rText )
  {
    return i_rResult.m_Run.m_Error.find( i_rText ) != std::string::npos;
  }

  // Ended by an event: whole up to the frame before one, and told as such. The news of a returning signal runs beside its frames, so that a few of
  // those may still belong to the old session.
  void ExpectEndedEarly( const VHostResult& i_rResult, int i_Failure, uint32_t i_FramesMissing = 0 )
  {
    constexpr size_t MostStragglers = 10;
    EXPECT_EQ( 3, i_rResult.m_Run.m_ExitCode ) << Describe( i_rResult.m_Run );
    std::vector<VCounterFrame> Frames = ReadCounterFile( i_rResult.Path() );
    ASSERT_FALSE( Frames.empty() );
    const size_t FrameCount = Frames.size();
    const auto Found = Gaps( Frames );
    const bool bStragglers = i_FramesMissing != 0 && Found.size() == 1 && Found.front().second == i_FramesMissing;
    if( bStragglers )
    {
      Frames.resize( Found.front().first - Frames.front().m_Counter );
      EXPECT_LE( FrameCount - Frames.size(), MostStragglers );
    }
    ExpectUnbroken( Frames, m_Rate );
    EXPECT_EQ( TheOnly - 1, Frames.back().m_Counter ) << "the last frame is not the one before an event";
    const nlohmann::json& rDevice = i_rResult.Device();
    EXPECT_EQ( "Complete", rDevice.value( "state", "" ) );
    EXPECT_EQ( i_Failure, rDevice.value( "failure", -1 ) );
    EXPECT_EQ( FrameCount, rDevice.value( "frames_captured", 0u ) );
    EXPECT_EQ( FrameCount, rDevice.value( "frames_written", 0u ) );
    const nlohmann::json Lost = rDevice.value( "lost", nlohmann::json() );
    EXPECT_EQ( rDevice.value( "frames_requested", 0u ) - FrameCount, Lost.value( "signal", 0u ) ) << Lost;
    EXPECT_LE( Lost.value( "card", 0u ), bStragglers ? i_FramesMissing : 0u ) << "an absence behind the end is none of the card's losses: " << Lost;
    EXPECT_EQ( 0, Lost.value( "memory", -1 ) + Lost.value( "writer", -1 ) ) << Lost;
    EXPECT_TRUE( TestSupport::VTvidParser( i_rResult.Path() ).IsFinished() );
  }

  const TestSupport::VTemporaryFolder m_Folder;
  const VSignalRate m_Rate = GetParam();
};

TEST_P( EventTest, SignalLostAndBackEndsTheCaptureAtItsLastFrame )
{
  constexpr uint32_t Absence = Every;   // a second of real time, in which a busy machine too takes notice
  const VHostResult Result = RecordEvents( { { { "frame", TheOnly }, { "do", "signal-loss" }, { "frames", Absence } } }, FarBeyond );
  ExpectEndedEarly( Result, FailureEndMoved, Absence );
  EXPECT_TRUE( Says( Result, "stagehost: vi:0: The signal was interrupted or changed after " ) ) << Describe( Result.m_Run );
  EXPECT_TRUE( Says( Result, "SetSourceEnabled: Source disabled - will request new global session" ) ) << Describe( Result.m_Run );
  EXPECT_TRUE( Says( Result, "SetSourceEnabled: Source enabled - Source is guaranteed to start new buffer session and global sync session" ) );
  EXPECT_TRUE( Says( Result, "Forcing new Buffer Session" ) );
}

// A signal that stays away gives the buffer no reason to end anything: the host ends the capture when nothing has come for a while.
TEST_P( EventTest, SignalLostForGoodEndsAfterASilence )
{
  const VHostResult Result = RecordEvents( { { { "frame", TheOnly }, { "do", "signal-loss" }, { "frames", 1000000 } } }, FarBeyond );
  ExpectEndedEarly( Result, 0 );
  EXPECT_TRUE( Says( Result, "stagehost: vi:0: No more frames came after " ) ) << Describe( Result.m_Run );
}

TEST_P( EventTest, RemovedCardEndsAfterASilence )
{
  const VHostResult Result = RecordEvents( { { { "frame", TheOnly }, { "do", "remove" } } }, FarBeyond );
  ExpectEndedEarly( Result, 0 );
}

TEST_P( EventTest, FormatOfAnotherRateEndsTheCapture )
{
  const VHostResult Result = RecordEvents( { { { "frame", TheOnly }, { "do", "format" }, { "standard", "SD_720_486I_5994" } } }, FarBeyond );
  ExpectEndedEarly( Result, FailureEndMoved );
  EXPECT_TRUE( Says( Result, "New Buffer Session due to period changing from 5400000 to 4504500" ) ) << Describe( Result.m_Run );
}

// A picture of another size at the same rate changes no clock. No file may hold both.
TEST_P( EventTest, FormatOfTheSameRateLeavesAWholeFile )
{
  const VHostResult Result = RecordEvents( { { { "frame", TheOnly }, { "do", "format" }, { "standard", "HD_1920_1080P_2500" } } }, FarBeyond );
  EXPECT_NE( 0, Result.m_Run.m_ExitCode ) << Describe( Result.m_Run );
  EXPECT_FALSE( Result.m_Run.m_bTimedOut );
  const std::vector<VCounterFrame> Frames = ReadUnbroken( Result.Path(), m_Rate );
  ASSERT_FALSE( Frames.empty() );
  EXPECT_EQ( TheOnly - 1, Frames.back().m_Counter );
  EXPECT_TRUE( TestSupport::VTvidParser( Result.Path() ).IsFinished() );
  EXPECT_TRUE( Says( Result, "the format of the frames changed from 720 x 576" ) ) << Describe( Result.m_Run );
}

TEST_P( EventTest, DroppedFramesAreCountedAndTheRecordingGoesOn )
{
  constexpr uint32_t Dropped = 3;
  const VHostResult Result = RecordEvents( EveryFrames( Every, { { "do", "drop" }, { "frames", Dropped } } ), 250 );
  EXPECT_EQ( 3, Result.m_Run.m_ExitCode ) << Describe( Result.m_Run );
  const std::vector<VCounterFrame> Frames = ReadCounterFile( Result.Path() );
  ASSERT_EQ( 250u, Frames.size() );
  const auto Found = Gaps( Frames );
  ASSERT_GE( Found.size(), 2u );
  for( const auto& rGap : Found )
  {
    EXPECT_EQ( 0u, rGap.first % Every );
    EXPECT_EQ( Dropped, rGap.second );
  }
  EXPECT_EQ( Found.size() * Dropped, Result.Device().value( "lost", nlohmann::json::object() ).value( "card", 0u ) ) << Result.Device();
  EXPECT_EQ( 250, Result.Device().value( "frames_written", 0 ) );
  EXPECT_EQ( 0, Result.Device().value( "failure", -1 ) );
}

TEST_P( EventTest, TimecodeJumpGoesOnInTheSameFile )
{
  nlohmann::json Events = nlohmann::json::array();
  for( uint32_t Jump = 1; Jump < 20; ++Jump )
  {
    Events.push_back(
      { { "frame", Jump * Every }, { "do", "timecode-jump" }, { "to", ( Jump < 10 ? "0" : "" ) + std::to_string( Jump ) + ":00:00:00" } } );
  }
  const VHostResult Result = RecordThrough( Events, 250 );
  EXPECT_TRUE( Says( Result, "New Sync Session. Clock Changes: Timecode Discontinuity (" ) ) << Describe( Result.m_Run );
  EXPECT_TRUE( Says( Result, "AddFrame: Frame forced new local sync session" ) );
}

TEST_P( EventTest, TimecodeLossGoesOnInTheSameFile )
{
  const VHostResult Result = RecordThrough( EveryFrames( Every, { { "do", "timecode-loss" }, { "frames", 30 } } ), 250 );
  EXPECT_TRUE( Says( Result, "Timecode Removed, " ) ) << Describe( Result.m_Run );
  EXPECT_TRUE( Says( Result, "Timecode Added, " ) );
}

TEST_P( EventTest, MidnightGoesOnInTheSameFile )
{
  RecordThrough( { { { "frame", 150 }, { "do", "timecode-jump" }, { "to", "23:59:58:00" } } }, 300 );
}

TEST_P( EventTest, LateFramesAreFramesAllTheSame )
{
  const VHostResult Result = RecordThrough( EveryFrames( Every, { { "do", "late" }, { "milliseconds", 400 } } ), 250 );
  EXPECT_EQ( 0, Result.Device().value( "lost", nlohmann::json::object() ).value( "card", -1 ) );
}

INSTANTIATE_TEST_SUITE_P( Kinds, EventTest, BothKinds, KindName );

// A card that arrives after the program has begun is waited for. Of the other kind nobody is told.
class ArrivalTest : public EventTest
{
};

TEST_P( ArrivalTest, ACardMayArriveLater ) { RecordThrough( { { { "frame", Every }, { "do", "arrive" } } }, 20, Every ); }

INSTANTIATE_TEST_SUITE_P( DeckLink, ArrivalTest, testing::Values( Rate25 ), KindName );
