#include "StageCorePluginVideoInput/FrameRateCheck.h"

#include "Core/VideoInterface/VideoStandard.h"

#include <gtest/gtest.h>

#include <cmath>
#include <limits>

namespace
{

using KVZ::IGenlockStandard;
using KVZ::IVideoStandard;

// A rate in exact frames a second
struct VRate
{
  int64_t m_Numerator;
  int64_t m_Denominator;
};

// By the number of the genlock standard; 0 is none.
constexpr VRate GenlockRates[] = { { 0, 1 }, { 50, 1 }, { 60000, 1001 }, { 24, 1 }, { 24000, 1001 }, { 30, 1 }, { 50, 1 }, { 60, 1 }, { 100, 1 },
  { 120, 1 }, { 200, 1 }, { 24000, 1001 }, { 24, 1 }, { 25, 1 }, { 30000, 1001 }, { 30, 1 }, { 120, 1 } };

bool IsWholeMultiple( const VRate& i_rRate, const VRate& i_rBase )
{
  return ( i_rRate.m_Numerator * i_rBase.m_Denominator ) % ( i_rRate.m_Denominator * i_rBase.m_Numerator ) == 0;
}

// Both rates are whole multiples of one SDI base rate.
bool CanLock( const VRate& i_rA, const VRate& i_rB )
{
  for( const VRate& rBase : { VRate{ 30, 1 }, VRate{ 30000, 1001 }, VRate{ 25, 1 }, VRate{ 24, 1 }, VRate{ 24000, 1001 } } )
  {
    if( IsWholeMultiple( i_rA, rBase ) && IsWholeMultiple( i_rB, rBase ) )
    {
      return true;
    }
  }
  return false;
}

}

TEST( FrameRateCheck, AgreesWithExactArithmeticForAllStandardsAndGenlocks )
{
  int Compatible = 0;
  for( int Value = 0; Value < KVZ::VideoStandardCount; ++Value )
  {
    const auto Standard = static_cast<IVideoStandard::Enum>( Value );
    const KVZ::VVideoStandardRow& rRow = *KVZ::FindVideoStandard( Standard );
    for( int Genlock = 1; Genlock < static_cast<int>( std::size( GenlockRates ) ); ++Genlock )
    {
      SCOPED_TRACE( ToName( Standard ) + " with genlock " + std::to_string( Genlock ) );
      const int64_t GenlockPeriod = FrameRateCheck::GenlockPeriod( static_cast<IGenlockStandard::Enum>( Genlock ) );
      const bool bExpected = rRow.m_Period != 0 && CanLock( { rRow.m_RateNumerator, rRow.m_RateDenominator }, GenlockRates[Genlock] );
      EXPECT_EQ( FrameRateCheck::AreCompatible( GenlockPeriod, KVZ::GetFramePeriod( Standard ) ), bExpected );
      Compatible += bExpected ? 1 : 0;
    }
  }
  EXPECT_GT( Compatible, 100 );
  EXPECT_EQ( FrameRateCheck::GenlockPeriod( static_cast<IGenlockStandard::Enum>( 99 ) ), 2700000 ) << "an unknown one counts as 50 Hz";
}

TEST( FrameRateCheck, AFreeSystemsRateGivesTheNearestPeriod )
{
  EXPECT_EQ( FrameRateCheck::SystemPeriod( 100.0 ), 1350000 );
  EXPECT_EQ( FrameRateCheck::SystemPeriod( 60000.0 / 1001.0 ), 2252250 );
  EXPECT_EQ( FrameRateCheck::SystemPeriod( 24000.0 / 1001.0 ), 5630625 );
  EXPECT_EQ( FrameRateCheck::SystemPeriod( 70000.0 ), 1929 );
  for( const double Unusable : { 0.0, -0.0, std::nan( "" ), std::numeric_limits<double>::infinity(), 1e-300, -1e-300 } )
  {
    EXPECT_EQ( FrameRateCheck::SystemPeriod( Unusable ), 0 ) << Unusable;
  }
  EXPECT_FALSE( FrameRateCheck::AreCompatible( FrameRateCheck::SystemPeriod( -25.0 ), 5400000 ) );
}
