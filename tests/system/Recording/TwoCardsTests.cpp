// Several cards, one timeline.
#include "tests/support/TemporaryFolder.h"
#include "tests/support/system/CounterFile.h"
#include "tests/support/system/Rates.h"
#include "tests/support/system/StageHost.h"

#include <gtest/gtest.h>

#include <algorithm>
#include <cstdlib>

using namespace SystemTests;

namespace
{

struct VCard
{
  VSignalRate m_Rate;
  const char* m_pTimecode;
};

struct VPairCase
{
  const char* m_pName;
  VCard m_Cards[2];
};

// By timecode, by delivery because the timecodes tell of different worlds, by delivery because there is none, and mixed.
const VPairCase PairCases[] = {
  { "25And5994", { { Rate25, "10:00:00:00" }, { Rate5994Drop, "10:00:00;00" } } },
  { "25And2997Drop", { { Rate25, "10:00:00:00" }, { Rate2997Drop, "10:00:00;00" } } },
  { "OtherTimecode", { { Rate25, "01:00:00:00" }, { Rate5994, "07:00:00:00" } } },
  { "NoTimecode", { { Rate50, "none" }, { Rate2398, "none" } } },
  { "OneTimecode", { { Rate25, "10:00:00:00" }, { Rate60, "none" } } },
  { "Bluefish", { { Bluefish25, "10:00:00:00" }, { Bluefish5994Drop, "10:00:00;00" } } },
  { "BothKinds", { { Bluefish50, "10:00:00:00" }, { Rate5994Drop, "10:00:00;00" } } },
  { "BothKindsNoTimecode", { { Bluefish25, "none" }, { Rate50, "none" } } },
};

// The cards of one program are made one after another; their first frames are that far apart, at most.
constexpr int64_t StartSpread = 135000000;

}

class TwoCardsTest : public testing::TestWithParam<VPairCase>
{
protected:
  const TestSupport::VTemporaryFolder m_Folder;
};

TEST_P( TwoCardsTest, FirstFramesLieWithinOneFrameOfEachOther )
{
  VArguments Arguments = { "--seconds", "1", "--pre-roll", "0.5", "--pixel-format", "U8Y8V8Y8" };
  for( const VCard& rCard : GetParam().m_Cards )
  {
    Arguments = Arguments + VArguments{ "--card", CounterCardText( rCard.m_Rate, std::string( "timecode=" ) + rCard.m_pTimecode ) };
  }
  const VHostResult Result = Record( m_Folder.File( "out" ), Arguments );
  EXPECT_EQ( 0, Result.m_Run.m_ExitCode ) << Describe( Result.m_Run );
  ASSERT_EQ( 2u, Result.m_Devices.size() ) << Describe( Result.m_Run );

  int64_t Starts[2] = {};
  int64_t CardTimes[2] = {};   // of the first frame since its card's own first
  for( size_t Card = 0; Card < 2; ++Card )
  {
    const VSignalRate& rRate = GetParam().m_Cards[Card].m_Rate;
    const std::vector<VCounterFrame> Frames = ReadUnbroken( Result.Path( Card ), rRate );
    ASSERT_FALSE( Frames.empty() );
    EXPECT_EQ( Frames.size(), Result.Device( Card ).value( "frames_requested", 0u ) );
    Starts[Card] = Result.Device( Card ).value( "start_tick", int64_t{ 0 } );
    CardTimes[Card] = Frames.front().m_Counter * rRate.m_Period;
  }
  const int64_t FramePeriod = std::max( GetParam().m_Cards[0].m_Rate.m_Period, GetParam().m_Cards[1].m_Rate.m_Period );
  EXPECT_LT( std::abs( Starts[0] - Starts[1] ), FramePeriod ) << Starts[0] << " " << Starts[1];
  EXPECT_LT( std::abs( CardTimes[0] - CardTimes[1] ), FramePeriod + StartSpread ) << CardTimes[0] << " " << CardTimes[1];
}

INSTANTIATE_TEST_SUITE_P( Pairs, TwoCardsTest, testing::ValuesIn( PairCases ),
  []( const auto& i_rInfo ) { return std::string( i_rInfo.param.m_pName ); } );

// Whatever the order on the command line, inputs of Bluefish444 cards come first.
TEST( TwoCards, BothKindsRecordBesideEachOther )
{
  const TestSupport::VTemporaryFolder Folder;
  const VHostResult Result = Record( Folder.File( "out" ),
    VArguments{ "--card", CounterCardText( Rate25, "speed=2" ), "--frames", "40" } + CounterCard( Bluefish25, "speed=2,inputs=2" ) );
  EXPECT_EQ( 0, Result.m_Run.m_ExitCode ) << Describe( Result.m_Run );
  ASSERT_EQ( 3u, Result.m_Devices.size() );
  const char* const Names[] = { "Super Nova C1:ChA", "Super Nova C1:ChB", "DeckLink C1" };
  for( size_t Device = 0; Device < 3; ++Device )
  {
    EXPECT_EQ( Names[Device], Result.Device( Device ).value( "name", "" ) );
    EXPECT_EQ( 40u, ReadUnbroken( Result.Path( Device ), Rate25 ).size() );
  }
}
