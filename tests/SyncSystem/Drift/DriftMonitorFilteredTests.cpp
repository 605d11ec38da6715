#include "SyncSystem/DriftMonitorSourceTimingInfo.h"

#include "tests/SyncSystem/Drift/DeliveryTimes.h"

#include <gtest/gtest.h>

#include <numeric>
#include <vector>

namespace
{

using Drift::VDriftMonitorFiltered;
using VTimingMonitor = SyncSystem::VDriftMonitorSourceTimingInfo<VDriftMonitorFiltered>;

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
  Drift::VDriftMonitor::VFit Fit() const
  {
    Drift::VDriftMonitor::VFit Fit;
    EXPECT_TRUE( m_Monitor.GetFit( Fit ) );
    return Fit;
  }
};

TEST_F( DriftMonitorFiltered, HoldsEachSampleUntilTheNextComes )
{
  AddMany( 2 );
  EXPECT_EQ( Fit().m_Samples, 1u );
  AddMany( 1 );
  EXPECT_EQ( Fit().m_Samples, 2u );
  EXPECT_EQ( Fit().m_Last.m_Sample, 1u );
  m_Next = 2;
  EXPECT_FALSE( Add() ) << "the held sample is the last one seen";
  EXPECT_EQ( Fit().m_Samples, 2u );
}

TEST_F( DriftMonitorFiltered, LeavesOutTheFirstOfTwoThatComeTogether )
{
  AddMany( 10 );
  ASSERT_TRUE( Add( 0.0399 ) );   // delivered 0.1 ms before the next
  AddMany( 2 );
  EXPECT_EQ( Fit().m_Skipped, 1u );
  EXPECT_EQ( Fit().m_Samples, 11u );
  EXPECT_NEAR( Fit().m_Last.m_Time, 1000.0 + 11 * 0.04, 1e-9 );
}

TEST_F( DriftMonitorFiltered, LocksAfterACleanWindowAndOpensWhenOutliersFillHalf )
{
  AddMany( 601 );   // the first is in the filter from the start, the last is held
  EXPECT_FALSE( m_Monitor.IsGateLocked() );
  AddMany( 1 );
  EXPECT_TRUE( m_Monitor.IsGateLocked() );

  AddMany( 1, 0.020 );
  AddMany( 1 );
  EXPECT_EQ( Fit().m_Skipped, 1u ) << "one late sample is left out";
  AddMany( 299, 0.020 );
  EXPECT_TRUE( m_Monitor.IsGateLocked() );
  EXPECT_NEAR( Fit().m_Last.m_Time, 1000.0 + static_cast<double>( Fit().m_Last.m_Sample ) * 0.04, 1e-6 );
  AddMany( 1, 0.020 );   // the 300th outlier passes the gate
  EXPECT_FALSE( m_Monitor.IsGateLocked() );
  EXPECT_EQ( Fit().m_Skipped, 300u );

  AddMany( 4000, 0.020 );
  EXPECT_EQ( Fit().m_Skipped, 300u );
  EXPECT_NEAR( Fit().m_Last.m_Time, 1000.0 + static_cast<double>( Fit().m_Last.m_Sample ) * 0.04 + 0.020, 0.008 )
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
