// Fits a line through the host times at which a session's samples were delivered: a Kalman filter with the state (time of the sample,
// seconds per sample). It tells when sample n really happened in host time; it changes no frame and moves no tick.
//
// Update is called on the delivery thread for every sample, the rest from any thread. A sample costs at most 32 small matrix steps and
// allocates nothing but, rarely, a segment of the history.
#pragma once

#include "StageCoreRuntime/ThreadAnnotations.h"

#include <boost/thread/lock_guard.hpp>
#include <boost/thread/mutex.hpp>

#include <array>
#include <cstdint>
#include <deque>
#include <string>

namespace Drift
{

struct VDriftMonitorConfiguration
{
  double m_ProcessNoise = 1e-18;        // spectral density
  double m_InitialRateVariance = 1.0;   // (seconds per sample) squared
  double m_MeasurementNoise = 0.0001;   // seconds squared
  double m_SegmentTolerance = 0.005;    // seconds that the history may stand off the filter
  uint32_t m_SettleSeconds = 90;        // search for the best start time
  uint64_t m_MaxSegments = 10000;       // of the history
  double m_GapFactor = 100.0;           // multiples of the expected time above which a gap is a jump
  uint32_t m_PredictMode = 0;           // 0 table by powers of two, 1 stepwise, other direct
};

struct VMatrix2
{
  double m_00 = 0.0, m_01 = 0.0, m_10 = 0.0, m_11 = 0.0;
};

class VDriftMonitor
{
public:
  // A point of the fit: the line goes on from here at this rate.
  struct VPoint
  {
    uint64_t m_Sample = 0;
    double m_Time = 0.0;   // host seconds
    double m_Rate = 0.0;   // seconds per sample
  };

  struct VFit
  {
    uint32_t m_SessionId = 0;
    double m_StartTime = 0.0;      // fitted host time of the first index, seconds
    VPoint m_Last;                 // after the last sample taken in
    uint64_t m_Samples = 0;        // taken into the filter
    uint64_t m_Skipped = 0;        // left out by the gate
    double m_TimeVariance = 0.0;   // of m_Last.m_Time
    uint64_t m_Segments = 0;       // of the history
  };

  explicit VDriftMonitor( const VDriftMonitorConfiguration& i_rConfiguration );
  VDriftMonitor( const VDriftMonitor& ) = delete;
  VDriftMonitor& operator=( const VDriftMonitor& ) = delete;
  virtual ~VDriftMonitor();

  // Forgets the fit. Takes the lock.
  virtual void Reset();

  // Adds a sample to the fit of its session, or begins a fit with it. Sample numbers count frames of the session, time is host seconds.
  // False: a number that is not above the last, or a zero session, rate or period.
  bool Update( uint32_t i_Session, uint32_t i_TicksPerSecond, uint32_t i_Period, uint64_t i_FirstIndex, uint64_t i_Sample, double i_Time );

  // False while there is no fit.
  bool GetFit( VFit& o_rFit ) const;

  // Host time of any sample from the first on, by the history where it reaches and by the running line beyond. False without a fit.
  bool GetSampleTime( uint64_t i_Sample, double& o_rTime ) const;

  // The fit's settings in words.
  std::string Dump() const;

protected:
  virtual bool AddSample( uint32_t i_Session, uint64_t i_Sample, double i_Time ) REQUIRES( m_Mutex );
  // A fit has begun with m_LastAccepted.
  virtual void OnNewSession() REQUIRES( m_Mutex );

  // The running line's value.
  double FittedTime( uint64_t i_Sample ) const REQUIRES( m_Mutex );
  double NominalPeriod() const REQUIRES( m_Mutex ) { return m_NominalSeconds; }   // seconds

  mutable boost::mutex m_Mutex;
  uint32_t m_SessionId GUARDED_BY( m_Mutex ) = 0;   // 0: no fit
  VPoint m_LastAccepted GUARDED_BY( m_Mutex );
  uint64_t m_Samples GUARDED_BY( m_Mutex ) = 0;
  uint64_t m_Skipped GUARDED_BY( m_Mutex ) = 0;
  double m_StartTime GUARDED_BY( m_Mutex ) = 0.0;

private:
  struct VState
  {
    double m_Time = 0.0;
    double m_Rate = 0.0;
  };

  // n steps at once: F to the power n, and the process noise that gathers over them.
  struct VSystemStep
  {
    VMatrix2 m_F;
    VMatrix2 m_Q;
  };

  bool BeginFit( uint32_t i_Session, uint64_t i_FirstIndex, uint64_t i_Sample, double i_Time ) REQUIRES( m_Mutex );
  void BuildSystemModel() REQUIRES( m_Mutex );
  VSystemStep MakeStep( double i_Steps ) const REQUIRES( m_Mutex );
  void ForgiveJump( uint32_t i_Steps, double i_Time ) REQUIRES( m_Mutex );
  void Predict( uint32_t i_Steps ) REQUIRES( m_Mutex );
  void Apply( const VSystemStep& i_rStep ) REQUIRES( m_Mutex );
  void Correct( double i_Time ) REQUIRES( m_Mutex );
  void ImproveStart() REQUIRES( m_Mutex );
  void ExtendHistory() REQUIRES( m_Mutex );
  void PushSegment() REQUIRES( m_Mutex );

  // Fixed after construction
  const VDriftMonitorConfiguration m_Configuration;

  // Guarded by m_Mutex
  uint32_t m_TicksPerSecond GUARDED_BY( m_Mutex ) = 0;
  uint32_t m_NominalSampleRateInTicks GUARDED_BY( m_Mutex ) = 0;
  double m_NominalSeconds GUARDED_BY( m_Mutex ) = 0.0;
  double m_FirstIndex GUARDED_BY( m_Mutex ) = 0.0;
  double m_FirstTime GUARDED_BY( m_Mutex ) = 0.0;
  double m_LastTime GUARDED_BY( m_Mutex ) = 0.0;
  double m_MinUncertaintyToUpdateStartTime GUARDED_BY( m_Mutex ) = 0.0;
  VState m_State GUARDED_BY( m_Mutex );
  VMatrix2 m_Covariance GUARDED_BY( m_Mutex );
  std::array<VSystemStep, 32> m_SystemModel GUARDED_BY( m_Mutex );   // entry k: 2^k steps
  std::deque<VPoint> m_Segments GUARDED_BY( m_Mutex );
};

}
