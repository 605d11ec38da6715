// A drift monitor with an outlier gate in front of the filter.
//
// The gate holds each sample back until the next one comes: a sample that the next follows at once was delivered late and is left out.
// Once a whole window has passed without an outlier, the gate locks and leaves out what comes late by more than the limit. When outliers
// fill their fraction of the window, delivery has really changed: the gate unlocks, takes everything and lets the fit follow.
#pragma once

#include "SyncSystem/DriftMonitor.h"

#include <vector>

namespace Drift
{

struct VDriftMonitorFilteredConfiguration
{
  uint64_t m_OutlierWindow = 600;   // samples
  double m_OutlierFraction = 0.5;   // of the window, unlocks the gate
  double m_OutlierLimit = 0.005;    // seconds above the fit
  double m_MinSpacing = 0.01;       // fraction of a sample period
};

class VDriftMonitorFiltered : public VDriftMonitor
{
public:
  VDriftMonitorFiltered( const VDriftMonitorConfiguration& i_rConfiguration, const VDriftMonitorFilteredConfiguration& i_rFiltered );
  ~VDriftMonitorFiltered() override;

  bool IsGateLocked() const;

protected:
  bool AddSample( uint32_t i_Session, uint64_t i_Sample, double i_Time ) override REQUIRES( m_Mutex );
  void OnNewSession() override REQUIRES( m_Mutex );

private:
  void PassGate() REQUIRES( m_Mutex );
  void CountOutlier( bool i_bOutlier ) REQUIRES( m_Mutex );
  void TurnLock() REQUIRES( m_Mutex );

  // Fixed after construction
  const VDriftMonitorFilteredConfiguration m_Filtered;

  // Guarded by m_Mutex
  struct VHeldSample
  {
    uint64_t m_Sample = 0;
    double m_Time = 0.0;
    bool m_bFirst = true;   // the fit began with it, so the filter has it already
  };
  VHeldSample m_Held GUARDED_BY( m_Mutex );
  std::vector<bool> m_Ring GUARDED_BY( m_Mutex );   // reserved for the whole window
  size_t m_RingNext GUARDED_BY( m_Mutex ) = 0;
  uint64_t m_Outliers GUARDED_BY( m_Mutex ) = 0;   // set bits of the ring
  bool m_bLocked GUARDED_BY( m_Mutex ) = false;
};

}
