#include "SyncSystem/DriftMonitorFiltered.h"

namespace Drift
{

VDriftMonitorFiltered::VDriftMonitorFiltered( const VDriftMonitorConfiguration& i_rConfiguration,
  const VDriftMonitorFilteredConfiguration& i_rFiltered )
  : VDriftMonitor( i_rConfiguration ), m_Filtered( i_rFiltered )
{
  m_Ring.reserve( m_Filtered.m_OutlierWindow );
}

VDriftMonitorFiltered::~VDriftMonitorFiltered() = default;

bool VDriftMonitorFiltered::IsGateLocked() const
{
  boost::lock_guard<boost::mutex> Lock( m_Mutex );
  return m_bLocked;
}

bool VDriftMonitorFiltered::AddSample( uint32_t i_Session, uint64_t i_Sample, double i_Time )
{
  if( i_Session == 0 || i_Session != m_SessionId || i_Sample <= m_Held.m_Sample )
  {
    return false;
  }
  if( !m_Held.m_bFirst )
  {
    if( i_Time - m_Held.m_Time >= NominalPeriod() * m_Filtered.m_MinSpacing )
    {
      PassGate();
    }
    else
    {
      ++m_Skipped;
    }
  }
  m_Held = { i_Sample, i_Time, false };
  return true;
}

void VDriftMonitorFiltered::OnNewSession()
{
  m_Held = { m_LastAccepted.m_Sample, m_LastAccepted.m_Time, true };
  m_Ring.clear();
  m_RingNext = 0;
  m_Outliers = 0;
  m_bLocked = false;
}

void VDriftMonitorFiltered::PassGate()
{
  const bool bOutlier = m_bLocked && m_Held.m_Time - FittedTime( m_Held.m_Sample ) > m_Filtered.m_OutlierLimit;
  CountOutlier( bOutlier );
  TurnLock();
  if( bOutlier )
  {
    ++m_Skipped;
  }
  else
  {
    VDriftMonitor::AddSample( m_SessionId, m_Held.m_Sample, m_Held.m_Time );
  }
}

void VDriftMonitorFiltered::CountOutlier( bool i_bOutlier )
{
  m_Outliers += i_bOutlier ? 1 : 0;
  if( m_Ring.size() < m_Filtered.m_OutlierWindow )
  {
    m_Ring.push_back( i_bOutlier );
  }
  else if( !m_Ring.empty() )
  {
    m_Outliers -= m_Ring[m_RingNext] ? 1 : 0;
    m_Ring[m_RingNext] = i_bOutlier;
    m_RingNext = ( m_RingNext + 1 ) % m_Ring.size();
  }
}

void VDriftMonitorFiltered::TurnLock()
{
  if( m_Ring.empty() || m_Ring.size() < m_Filtered.m_OutlierWindow )
  {
    return;
  }
  if( m_Outliers == 0 )
  {
    m_bLocked = true;
  }
  else if( static_cast<double>( m_Outliers ) >= static_cast<double>( m_Filtered.m_OutlierWindow ) * m_Filtered.m_OutlierFraction )
  {
    m_bLocked = false;
  }
}

}
