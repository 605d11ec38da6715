#include "SyncSystem/DriftMonitor.h"
#include "SyncSystem/DriftMonitorSourceTimingInfo.h"

#include <gtest/gtest.h>

#include <cmath>
#include <cstdint>
#include <numeric>
#include <random>
#include <vector>

namespace
{

using Drift::VDriftMonitor;
using Drift::VDriftMonitorConfiguration;
using VTimingMonitor = SyncSystem::VDriftMonitorSourceTimingInfo<Drift::VDriftMonitorFiltered>;

constexpr uint32_t TicksPerSecond = 135000000;
constexpr uint32_t Period25 = 5400000;

// Delivery times of a source with a true rate and a known, repeatable lateness.
struct VDeliveryTimes
{
  double m_Start = 1000.0;
  double m_Rate = 0.04;    // seconds per sample
  double m_Jitter = 0.0;   // seconds, lateness is spread evenly over 0 to this
  std::mt19937_64 m_Random{ 7 };

  double operator()( uint64_t i_Sample )
  {
    const double Late = m_Jitter > 0.0 ? std::uniform_real_distribution<double>( 0.0, m_Jitter )( m_Random ) : 0.0;
    return m_Start + static_cast<double>( i_Sample ) * m_Rate + Late;
  }
};

// The same filter written down a second time, step by step and in wider numbers.
struct VReferenceFilter
{
  VDriftMonitorConfiguration m_Configuration;
  long double m_Period = 0.04L;
  uint64_t m_Sample = 0;
  long double m_X[2] = { 0.0L, 0.0L };
  long double m_P[2][2] = { { 1.0L, 0.0L }, { 0.0L, 1.0L } };
  long double m_FirstTime = 0.0L;
  long double m_LastTime = 0.0L;
  long double m_Start = 0.0L;
  long double m_Best = 1e9L;

  void Begin( uint64_t i_Sample, double i_Time )
  {
    m_Sample = i_Sample;
    m_FirstTime = m_LastTime = m_X[0] = i_Time;
    m_X[1] = m_Period;
    m_P[1][1] = m_Configuration.m_InitialRateVariance;
    m_Start = i_Time - i_Sample * m_Period;
  }

  // F = ((1, n), (0, 1)), and the noise that comes in over so long a step.
  void Step( long double n )
  {
    const long double q = m_Configuration.m_ProcessNoise;
    const long double d = n * m_Period;
    const long double a = d * d / 2.0L;
    m_X[0] += n * m_X[1];
    m_P[0][0] += n * ( m_P[0][1] + m_P[1][0] ) + n * n * m_P[1][1] + q * a * a;
    m_P[0][1] += n * m_P[1][1] + q * a * d;
    m_P[1][0] += n * m_P[1][1] + q * a * d;
    m_P[1][1] += q * d * d;
  }

  void Add( uint64_t i_Sample, double i_Time )
  {
    const uint64_t Steps = i_Sample - m_Sample;
    if( i_Time - m_X[0] > m_Configuration.m_GapFactor * m_Period * Steps )
    {
      m_P[0][0] = 1.0L;
      m_P[0][1] = m_P[1][0] = 0.0L;
      m_X[0] = i_Time - Steps * m_X[1];
      m_Best = 1e9L;
    }
    const bool bDirect = m_Configuration.m_PredictMode > 1;
    for( uint64_t Index = 0; Index < ( bDirect ? 1 : Steps ); ++Index )
    {
      Step( bDirect ? Steps : 1 );
    }
    m_Sample = i_Sample;
    const long double S = m_P[0][0] + m_Configuration.m_MeasurementNoise;
    const long double K[2] = { m_P[0][0] / S, m_P[1][0] / S };
    const long double Residual = i_Time - m_X[0];
    m_X[0] += K[0] * Residual;
    m_X[1] += K[1] * Residual;
    const long double Row[2] = { m_P[0][0], m_P[0][1] };
    for( int Column = 0; Column < 2; ++Column )
    {
      m_P[0][Column] -= K[0] * Row[Column];
      m_P[1][Column] -= K[1] * Row[Column];
    }
    const long double Back = -static_cast<long double>( m_Sample );
    const long double Uncertainty = m_P[0][0] + Back * ( m_P[0][1] + m_P[1][0] ) + Back * Back * m_P[1][1];
    if( Uncertainty < m_Best && m_LastTime - m_FirstTime < m_Configuration.m_SettleSeconds )
    {
      m_Best = Uncertainty;
      m_Start = m_X[0] + Back * m_X[1];
    }
    m_LastTime = i_Time;
  }
};

VDriftMonitor::VFit FitOf( const VDriftMonitor& i_rMonitor )
{
  VDriftMonitor::VFit Fit;
  EXPECT_TRUE( i_rMonitor.GetFit( Fit ) );
  return Fit;
}

bool Add( VDriftMonitor& io_rMonitor, uint64_t i_Sample, double i_Time, uint32_t i_Session = 1 )
{
  return io_rMonitor.Update( i_Session, TicksPerSecond, Period25, 0, i_Sample, i_Time );
}

void AddMany( VDriftMonitor& io_rMonitor, VDeliveryTimes& io_rTimes, uint64_t i_Count )
{
  for( uint64_t Sample = 0; Sample < i_Count; ++Sample )
  {
    ASSERT_TRUE( Add( io_rMonitor, Sample, io_rTimes( Sample ) ) );
  }
}

TEST( DriftMonitor, FollowsTheFilterWrittenDownStepByStep )
{
  for( const uint32_t Mode : { 0u, 1u, 2u } )
  {
    SCOPED_TRACE( Mode );
    VDriftMonitorConfiguration Configuration;
    Configuration.m_PredictMode = Mode;
    Configuration.m_ProcessNoise = 1e-6;   // large enough to be seen in the result
    VDriftMonitor Monitor( Configuration );
    VReferenceFilter Reference;
    Reference.m_Configuration = Configuration;
    VDeliveryTimes Times{ .m_Rate = 0.0400012, .m_Jitter = 0.004 };
    std::mt19937_64 Random( 3 );

    uint64_t Sample = 4;
    ASSERT_TRUE( Add( Monitor, Sample, Times( Sample ) ) );
    Times.m_Random.seed( 7 );
    Reference.Begin( Sample, Times( Sample ) );
    // Of a sample that comes after 101 periods the jump in time is followed; one after 99 is a disturbance.
    for( int Count = 0; Count < 150; ++Count )
    {
      Sample += Random() % 10 == 0 && Count % 30 != 0 ? Random() % 90 + 1 : 1;
      Times.m_Start += Count == 90 ? 100 * 0.04 : 0.0;
      const double Time = Times( Sample ) + ( Count == 120 ? 98 * 0.04 : 0.0 );
      ASSERT_TRUE( Add( Monitor, Sample, Time ) );
      Reference.Add( Sample, Time );
      const VDriftMonitor::VFit Fit = FitOf( Monitor );
      ASSERT_NEAR( Fit.m_Last.m_Time, static_cast<double>( Reference.m_X[0] ), 1e-9 ) << Count;
      ASSERT_NEAR( Fit.m_Last.m_Rate, static_cast<double>( Reference.m_X[1] ), 1e-12 ) << Count;
      ASSERT_NEAR( Fit.m_TimeVariance, static_cast<double>( Reference.m_P[0][0] ), 1e-12 ) << Count;
      ASSERT_NEAR( Fit.m_StartTime, static_cast<double>( Reference.m_Start ), 1e-7 ) << Count;
    }
    EXPECT_EQ( FitOf( Monitor ).m_Samples, 151u );
  }
}

TEST( DriftMonitor, RefusesWhatCannotBeFitted )
{
  VDriftMonitor Monitor( {} );
  VDriftMonitor::VFit Fit;
  double Time = 0.0;
  EXPECT_FALSE( Monitor.Update( 0, TicksPerSecond, Period25, 0, 0, 1.0 ) );
  EXPECT_FALSE( Monitor.Update( 1, 0, Period25, 0, 0, 1.0 ) );
  EXPECT_FALSE( Monitor.Update( 1, TicksPerSecond, 0, 0, 0, 1.0 ) );
  EXPECT_FALSE( Monitor.GetFit( Fit ) );
  EXPECT_FALSE( Monitor.GetSampleTime( 0, Time ) );

  ASSERT_TRUE( Add( Monitor, 10, 1.0 ) );
  ASSERT_TRUE( Add( Monitor, 12, 1.08 ) );
  const VDriftMonitor::VFit Before = FitOf( Monitor );
  EXPECT_FALSE( Add( Monitor, 12, 1.09 ) );
  EXPECT_FALSE( Add( Monitor, 3, 1.2 ) );
  const VDriftMonitor::VFit After = FitOf( Monitor );
  EXPECT_EQ( After.m_Samples, Before.m_Samples );
  EXPECT_EQ( After.m_Last.m_Sample, 12u );
  EXPECT_EQ( After.m_Last.m_Time, Before.m_Last.m_Time );
  EXPECT_EQ( After.m_StartTime, Before.m_StartTime );
}

TEST( DriftMonitor, ANewSessionBeginsAFreshFit )
{
  VDriftMonitor Monitor( {} );
  VDeliveryTimes Times{ .m_Rate = 0.041 };
  AddMany( Monitor, Times, 100 );
  ASSERT_TRUE( Monitor.Update( 2, TicksPerSecond, Period25, 1, 3, 500.0 ) );
  const VDriftMonitor::VFit Fit = FitOf( Monitor );
  EXPECT_EQ( Fit.m_SessionId, 2u );
  EXPECT_EQ( Fit.m_Samples, 1u );
  EXPECT_DOUBLE_EQ( Fit.m_Last.m_Time, 500.0 );
  EXPECT_DOUBLE_EQ( Fit.m_Last.m_Rate, 0.04 );
  EXPECT_DOUBLE_EQ( Fit.m_StartTime, 499.92 );
  Monitor.Reset();
  VDriftMonitor::VFit None;
  EXPECT_FALSE( Monitor.GetFit( None ) );
}

// The history is checked against every value that the filter had on the way.
TEST( DriftMonitor, HistoryStaysWithinItsToleranceOfTheFilter )
{
  VDriftMonitorConfiguration Configuration;
  Configuration.m_ProcessNoise = 1e-4;
  Configuration.m_SettleSeconds = 10;
  VDriftMonitor Monitor( Configuration );
  std::vector<double> Filtered;
  double Time = 20.0;
  size_t SettledAt = 0;
  for( uint64_t Sample = 0; Sample < 6000; ++Sample )
  {
    ASSERT_TRUE( Add( Monitor, Sample, Time ) );
    Filtered.push_back( FitOf( Monitor ).m_Last.m_Time );
    SettledAt = FitOf( Monitor ).m_Segments == 0 ? Sample + 1 : SettledAt;
    Time += 0.04 * ( 1.0 + 0.001 * std::sin( static_cast<double>( Sample ) / 400.0 ) );
  }
  ASSERT_GT( FitOf( Monitor ).m_Segments, 3u );
  ASSERT_LT( FitOf( Monitor ).m_Segments, 1000u );
  EXPECT_NEAR( static_cast<double>( SettledAt ), 251.0, 1.0 );
  for( uint64_t Sample = SettledAt; Sample < Filtered.size(); ++Sample )
  {
    double FromHistory = 0.0;
    ASSERT_TRUE( Monitor.GetSampleTime( Sample, FromHistory ) );
    ASSERT_NEAR( FromHistory, Filtered[Sample], Configuration.m_SegmentTolerance + 1e-12 ) << Sample;
  }
}

TEST( DriftMonitor, HistoryDropsItsOldestSegmentAtTheLimit )
{
  VDriftMonitorConfiguration Configuration;
  Configuration.m_SettleSeconds = 0;
  Configuration.m_SegmentTolerance = 0.0;
  Configuration.m_MaxSegments = 5;
  VDriftMonitor Monitor( Configuration );
  VDeliveryTimes Times{ .m_Jitter = 0.01 };
  AddMany( Monitor, Times, 50 );
  EXPECT_EQ( FitOf( Monitor ).m_Segments, 5u );
  double Time = 0.0;
  ASSERT_TRUE( Monitor.GetSampleTime( 2, Time ) );
  EXPECT_NEAR( Time, 1000.08, 0.02 );   // the oldest line reaches back
}

class DriftMonitorFiltered : public ::testing::Test
{
protected:
  VTimingMonitor m_Monitor{ Drift::VDriftMonitorConfiguration(), Drift::VDriftMonitorFilteredConfiguration() };
  uint64_t m_Next = 0;

  bool Add( double i_Late = 0.0 )
  {
    const uint64_t Sample = m_Next++;
    return m_Monitor.Update( 1, TicksPerSecond, Period25, 0, Sample, 1000.0 + static_cast<double>( Sample ) * 0.04 + i_Late );
  }
  void AddMany( uint64_t i_Count, double i_Late = 0.0 )
  {
    for( uint64_t Count = 0; Count < i_Count; ++Count )
    {
      ASSERT_TRUE( Add( i_Late ) );
    }
  }
};

TEST_F( DriftMonitorFiltered, HoldsEachSampleUntilTheNextComes )
{
  AddMany( 2 );
  EXPECT_EQ( FitOf( m_Monitor ).m_Samples, 1u );
  AddMany( 1 );
  EXPECT_EQ( FitOf( m_Monitor ).m_Samples, 2u );
  EXPECT_EQ( FitOf( m_Monitor ).m_Last.m_Sample, 1u );
  m_Next = 2;
  EXPECT_FALSE( Add() ) << "the held sample is the last one seen";
  EXPECT_EQ( FitOf( m_Monitor ).m_Samples, 2u );
}

TEST_F( DriftMonitorFiltered, LeavesOutTheFirstOfTwoThatComeTogether )
{
  AddMany( 10 );
  ASSERT_TRUE( Add( 0.0399 ) );   // delivered 0.1 ms before the next
  AddMany( 2 );
  EXPECT_EQ( FitOf( m_Monitor ).m_Skipped, 1u );
  EXPECT_EQ( FitOf( m_Monitor ).m_Samples, 11u );
  EXPECT_NEAR( FitOf( m_Monitor ).m_Last.m_Time, 1000.0 + 11 * 0.04, 1e-9 );
}

TEST_F( DriftMonitorFiltered, LocksAfterACleanWindowAndOpensWhenOutliersFillHalf )
{
  AddMany( 601 );   // the first is in the filter from the start, the last is held
  EXPECT_FALSE( m_Monitor.IsGateLocked() );
  AddMany( 1 );
  EXPECT_TRUE( m_Monitor.IsGateLocked() );

  AddMany( 1, 0.020 );
  AddMany( 1 );
  EXPECT_EQ( FitOf( m_Monitor ).m_Skipped, 1u ) << "one late sample is left out";
  AddMany( 299, 0.020 );
  EXPECT_TRUE( m_Monitor.IsGateLocked() );
  EXPECT_NEAR( FitOf( m_Monitor ).m_Last.m_Time, 1000.0 + static_cast<double>( FitOf( m_Monitor ).m_Last.m_Sample ) * 0.04, 1e-6 );
  AddMany( 1, 0.020 );   // the 300th outlier passes the gate
  EXPECT_FALSE( m_Monitor.IsGateLocked() );
  EXPECT_EQ( FitOf( m_Monitor ).m_Skipped, 300u );

  AddMany( 4000, 0.020 );
  EXPECT_EQ( FitOf( m_Monitor ).m_Skipped, 300u );
  EXPECT_NEAR( FitOf( m_Monitor ).m_Last.m_Time, 1000.0 + static_cast<double>( FitOf( m_Monitor ).m_Last.m_Sample ) * 0.04 + 0.020, 0.008 )
    << "the fit follows, with the overshoot of a long memory";
}

TEST_F( DriftMonitorFiltered, ANewSessionOpensTheGate )
{
  AddMany( 700 );
  ASSERT_TRUE( m_Monitor.IsGateLocked() );
  ASSERT_TRUE( m_Monitor.Update( 2, TicksPerSecond, Period25, 0, 0, 2000.0 ) );
  EXPECT_FALSE( m_Monitor.IsGateLocked() );
  KVZ::ISourceTemporal::ISourceTimingInfo Info;
  EXPECT_FALSE( m_Monitor.GetTimingInfo( Info ) ) << "one sample has no delivery offset";
}

TEST_F( DriftMonitorFiltered, TellsTheDeliveryOffsetsOfTheWindow )
{
  KVZ::ISourceTemporal::ISourceTimingInfo Info;
  EXPECT_FALSE( m_Monitor.GetTimingInfo( Info ) );
  AddMany( 1 );
  EXPECT_FALSE( m_Monitor.GetTimingInfo( Info ) );
  AddMany( 700 );   // locked: what follows does not touch the fit
  for( int Count = 0; Count < 30; ++Count )
  {
    Add( 0.010 + Count * 0.001 );
    AddMany( 9 );
  }
  ASSERT_TRUE( m_Monitor.GetTimingInfo( Info ) );
  EXPECT_EQ( Info.m_SessionId, 1u );
  EXPECT_NEAR( Info.m_StartTime, 1000.0, 1e-6 );
  EXPECT_NEAR( Info.m_SecondsPerSample, 0.04, 1e-9 );
  std::vector<double> Expected( VTimingMonitor::WindowLength, 0.0 );
  for( size_t Count = 0; Count < 30; ++Count )
  {
    Expected[Count] = 0.010 + static_cast<double>( Count ) * 0.001;
  }
  const double Mean = std::accumulate( Expected.begin(), Expected.end(), 0.0 ) / 600.0;
  double Variance = 0.0;
  for( const double Offset : Expected )
  {
    Variance += ( Offset - Mean ) * ( Offset - Mean ) / 599.0;
  }
  EXPECT_NEAR( Info.m_MeanOffset, Mean, 1e-6 );
  EXPECT_NEAR( Info.m_OffsetVariance, Variance, 1e-7 );
  EXPECT_NEAR( Info.m_RecentMaximum, 0.020, 1e-6 ) << "the twentieth largest of 0.010 to 0.039";
  EXPECT_NEAR( m_Monitor.GetLargestOffset(), 0.039, 1e-6 );

  AddMany( 600 );
  ASSERT_TRUE( m_Monitor.GetTimingInfo( Info ) );
  EXPECT_NEAR( Info.m_RecentMaximum, 0.0, 1e-6 ) << "the window has moved on";
  EXPECT_NEAR( m_Monitor.GetLargestOffset(), 0.039, 1e-6 );
}

}
