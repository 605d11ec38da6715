// A drift monitor that also keeps how late the recent samples were delivered against the fit.
#pragma once

#include "SyncSystem/DriftMonitorAnalysis.h"
#include "SyncSystem/DriftMonitorFiltered.h"
#include "SyncSystem/ISource.h"

#include <algorithm>
#include <numeric>
#include <vector>

namespace SyncSystem
{

struct VDeliveryStatistics
{
  double m_Mean = 0.0;            // seconds
  double m_Variance = 0.0;        // sample variance, seconds squared; 0 with fewer than two offsets
  double m_RecentMaximum = 0.0;   // the twentieth largest offset; the largest while there are fewer than twenty
};

// All zero for no offsets. Sorts its copy in part.
VDeliveryStatistics ComputeDeliveryStatistics( std::vector<double> i_Offsets );

template<class TMonitor>
class VDriftMonitorSourceTimingInfo : public TMonitor
{
public:
  // Offsets that the statistics reach back over: ten seconds at 60 frames a second.
  static constexpr size_t WindowLength = 600;

  template<class... TArgs>
  explicit VDriftMonitorSourceTimingInfo( const TArgs&... i_rArgs ) : TMonitor( i_rArgs... )
  {
    m_Offsets.reserve( WindowLength );
  }

  // False until two samples of the session have been seen.
  bool GetTimingInfo( KVZ::ISourceTemporal::ISourceTimingInfo& o_rInfo ) const
  {
    std::vector<double> Offsets;
    {
      boost::lock_guard<boost::mutex> Lock( this->m_Mutex );
      if( this->m_SessionId == 0 || m_Offsets.empty() )
      {
        return false;
      }
      o_rInfo.m_SessionId = this->m_SessionId;
      o_rInfo.m_StartTime = this->m_StartTime;
      o_rInfo.m_SecondsPerSample = this->m_LastAccepted.m_Rate;
      Offsets = m_Offsets;
    }
    const VDeliveryStatistics Statistics = ComputeDeliveryStatistics( std::move( Offsets ) );
    o_rInfo.m_MeanOffset = Statistics.m_Mean;
    o_rInfo.m_OffsetVariance = Statistics.m_Variance;
    o_rInfo.m_RecentMaximum = Statistics.m_RecentMaximum;
    return true;
  }

  // How late a sample came that was delivered at this time. False for another session than that of the fit.
  bool GetOffsets( uint32_t i_Session, uint64_t i_Sample, double i_Time, VDeliveryOffsets& o_rOffsets ) const
  {
    boost::lock_guard<boost::mutex> Lock( this->m_Mutex );
    if( i_Session == 0 || i_Session != this->m_SessionId || m_Offsets.empty() )
    {
      return false;
    }
    o_rOffsets.m_Delivery = i_Time - this->FittedTime( i_Sample );
    o_rOffsets.m_Predicted = std::accumulate( m_Offsets.begin(), m_Offsets.end(), 0.0 ) / static_cast<double>( m_Offsets.size() );
    return true;
  }

  // The largest offset of the session so far, seconds.
  double GetLargestOffset() const
  {
    boost::lock_guard<boost::mutex> Lock( this->m_Mutex );
    return m_LargestOffset;
  }

protected:
  bool AddSample( uint32_t i_Session, uint64_t i_Sample, double i_Time ) override REQUIRES( this->m_Mutex )
  {
    if( !TMonitor::AddSample( i_Session, i_Sample, i_Time ) )
    {
      return false;
    }
    const double Offset = i_Time - this->FittedTime( i_Sample );
    m_LargestOffset = m_Offsets.empty() ? Offset : std::max( m_LargestOffset, Offset );
    if( m_Offsets.size() < WindowLength )
    {
      m_Offsets.push_back( Offset );
    }
    else
    {
      m_Offsets[m_NextOffset] = Offset;
      m_NextOffset = ( m_NextOffset + 1 ) % WindowLength;
    }
    return true;
  }

  void OnNewSession() override REQUIRES( this->m_Mutex )
  {
    TMonitor::OnNewSession();
    m_Offsets.clear();
    m_NextOffset = 0;
    m_LargestOffset = 0.0;
  }

private:
  std::vector<double> m_Offsets GUARDED_BY( this->m_Mutex );   // a ring once it is full
  size_t m_NextOffset GUARDED_BY( this->m_Mutex ) = 0;
  double m_LargestOffset GUARDED_BY( this->m_Mutex ) = 0.0;
};

}
