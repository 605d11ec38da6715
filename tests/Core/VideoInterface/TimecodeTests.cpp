#include "Core/VideoInterface/Timecode.h"

#include <gtest/gtest.h>

#include <limits>

using namespace KVZ;

namespace
{

constexpr int64_t DropPeriod = 4504500;

// Runs through the labels of a day in order, as an LTC counter does.
template<class TVisitor>
void ForEachLabel( int32_t i_Standard, TVisitor i_Visitor )
{
  const int Nominal = FindTimecodeStandard( i_Standard )->m_NominalFrames;
  for( int Second = 0; Second < 24 * 60 * 60; ++Second )
  {
    for( int Frame = 0; Frame < Nominal; ++Frame )
    {
      const auto Byte = []( int i_Value ) { return static_cast<uint8_t>( i_Value ); };
      const ITimecode Timecode{ i_Standard, Byte( Second / 3600 ), Byte( Second / 60 % 60 ), Byte( Second % 60 ), Byte( Frame ) };
      if( IsValid( Timecode ) )
      {
        i_Visitor( Timecode );
      }
    }
  }
}

}

class TimecodeOfStandard : public testing::TestWithParam<int32_t>
{
};

TEST_P( TimecodeOfStandard, EveryLabelOfADayIsOnePeriodAfterTheOneBeforeAndComesBack )
{
  const VTimecodeStandardRow& rRow = *FindTimecodeStandard( GetParam() );
  int64_t Expected = 0;
  int64_t Wrong = 0;
  ForEachLabel( GetParam(),
    [&]( const ITimecode& i_rTimecode )
    {
      ITimecode Back;
      Back.m_Standard = GetParam();
      Wrong += ToTicks( i_rTimecode ) != Expected || !FromTicks( Back, Expected ) || !IsSameReading( Back, i_rTimecode );
      Expected += rRow.m_Period;
    } );
  EXPECT_EQ( Wrong, 0 );
  EXPECT_EQ( Expected, GetTicksPerDay( { GetParam() } ) );
}

INSTANTIATE_TEST_SUITE_P( AllStandards, TimecodeOfStandard, testing::Range( 0, 6 ) );

TEST( Timecode, ValidityHasALimitForEachField )
{
  const ITimecode Good{ 2, 23, 59, 59, 24 };
  EXPECT_TRUE( IsValid( Good ) );
  EXPECT_FALSE( IsValid( ITimecode() ) );
  for( const ITimecode& rBad : { ITimecode{ 2, 24, 0, 0, 0 }, ITimecode{ 2, 0, 60, 0, 0 }, ITimecode{ 2, 0, 0, 60, 0 }, ITimecode{ 2, 0, 0, 0, 25 },
         ITimecode{ 6, 0, 0, 0, 0 } } )
  {
    EXPECT_FALSE( IsValid( rBad ) );
  }
  ITimecode Late = Good;
  Late.m_TickRemainder = 5399999;
  EXPECT_TRUE( IsValid( Late ) );
  Late.m_TickRemainder = 5400000;
  EXPECT_FALSE( IsValid( Late ) );
}

TEST( Timecode, SteppingOverTheDropAndOverMidnight )
{
  ITimecode Timecode{ 5, 0, 0, 59, 29 };
  AddTicks( Timecode, DropPeriod );
  EXPECT_EQ( ToText( Timecode ), "00:01:00;02" );

  Timecode = { 5, 23, 59, 59, 29 };
  AddTicks( Timecode, DropPeriod + 7 );
  EXPECT_EQ( ToText( Timecode ), "00:00:00;00" );
  EXPECT_EQ( Timecode.m_Days, 1 );
  EXPECT_EQ( Timecode.m_TickRemainder, 7u );
  AddTicks( Timecode, -DropPeriod - 7 );
  EXPECT_EQ( ToText( Timecode ), "23:59:59;29" );
  EXPECT_EQ( Timecode.m_Days, 0 );
}

TEST( Timecode, NegativeTicksGiveTheFloorOfTheDay )
{
  ITimecode Timecode{ 2, 0, 0, 0, 0 };
  const int64_t Day = GetTicksPerDay( Timecode );
  ASSERT_TRUE( FromTicks( Timecode, -1 ) );
  EXPECT_EQ( Timecode.m_Days, -1 );
  EXPECT_EQ( ToText( Timecode ), "23:59:59:24" );
  EXPECT_EQ( Timecode.m_TickRemainder, 5399999u );

  for( const int64_t Ticks : { -Day, -Day - 1, -3 * Day + 12345, std::numeric_limits<int64_t>::min(), std::numeric_limits<int64_t>::max() } )
  {
    ASSERT_TRUE( FromTicks( Timecode, Ticks ) );
    EXPECT_TRUE( IsValid( Timecode ) );
    EXPECT_EQ( ToTicks( Timecode ), Ticks );
  }
}

TEST( Timecode, AnUnknownStandardChangesNothing )
{
  ITimecode Timecode{ 7, 1, 2, 3, 4 };
  const ITimecode Before = Timecode;
  EXPECT_FALSE( FromTicks( Timecode, 1000000000 ) );
  AddTicks( Timecode, 5400000 );
  EXPECT_TRUE( IsSameReading( Timecode, Before ) );
  EXPECT_EQ( ToTicks( Timecode ), 0 );
  EXPECT_EQ( ToText( Timecode ), "none" );

  ITimecode Invalid{ 2, 0, 0, 0, 25 };
  AddTicks( Invalid, 5400000 );
  EXPECT_EQ( Invalid.m_Frames, 25 );
}
