#include "SyncSystem/DriftMonitor.h"

#include <algorithm>
#include <cmath>
#include <iomanip>
#include <limits>
#include <sstream>

namespace Drift
{

namespace
{

constexpr double NoStartYet = 1000000000.0;

VMatrix2 operator*( const VMatrix2& i_rA, const VMatrix2& i_rB )
{
  return { i_rA.m_00 * i_rB.m_00 + i_rA.m_01 * i_rB.m_10, i_rA.m_00 * i_rB.m_01 + i_rA.m_01 * i_rB.m_11,
    i_rA.m_10 * i_rB.m_00 + i_rA.m_11 * i_rB.m_10, i_rA.m_10 * i_rB.m_01 + i_rA.m_11 * i_rB.m_11 };
}

VMatrix2 operator+( const VMatrix2& i_rA, const VMatrix2& i_rB )
{
  return { i_rA.m_00 + i_rB.m_00, i_rA.m_01 + i_rB.m_01, i_rA.m_10 + i_rB.m_10, i_rA.m_11 + i_rB.m_11 };
}

VMatrix2 Transposed( const VMatrix2& i_rA ) { return { i_rA.m_00, i_rA.m_10, i_rA.m_01, i_rA.m_11 }; }

// F P F transposed + Q
VMatrix2 Propagated( const VMatrix2& i_rF, const VMatrix2& i_rP, const VMatrix2& i_rQ ) { return i_rF * i_rP * Transposed( i_rF ) + i_rQ; }

std::ostream& operator<<( std::ostream& o_rStream, const VMatrix2& i_rA )
{
  return o_rStream << "((" << i_rA.m_00 << ", " << i_rA.m_01 << "), (" << i_rA.m_10 << ", " << i_rA.m_11 << "))";
}

double Distance( uint64_t i_From, uint64_t i_To )
{
  return i_To >= i_From ? static_cast<double>( i_To - i_From ) : -static_cast<double>( i_From - i_To );
}

double TimeOnLine( const VDriftMonitor::VPoint& i_rPoint, uint64_t i_Sample )
{
  return i_rPoint.m_Time + Distance( i_rPoint.m_Sample, i_Sample ) * i_rPoint.m_Rate;
}

}

VDriftMonitor::VDriftMonitor( const VDriftMonitorConfiguration& i_rConfiguration ) : m_Configuration( i_rConfiguration ) {}

VDriftMonitor::~VDriftMonitor() = default;

void VDriftMonitor::Reset()
{
  boost::lock_guard<boost::mutex> Lock( m_Mutex );
  m_SessionId = 0;
  m_Samples = 0;
  m_Skipped = 0;
  m_Segments.clear();
}

bool VDriftMonitor::Update( uint32_t i_Session, uint32_t i_TicksPerSecond, uint32_t i_Period, uint64_t i_FirstIndex, uint64_t i_Sample,
  double i_Time )
{
  boost::lock_guard<boost::mutex> Lock( m_Mutex );
  if( i_Session != 0 && i_Session == m_SessionId )
  {
    return AddSample( i_Session, i_Sample, i_Time );
  }
  if( i_Session == 0 || i_TicksPerSecond == 0 || i_Period == 0 )
  {
    return false;
  }
  m_TicksPerSecond = i_TicksPerSecond;
  m_NominalSampleRateInTicks = i_Period;
  return BeginFit( i_Session, i_FirstIndex, i_Sample, i_Time );
}

bool VDriftMonitor::GetFit( VFit& o_rFit ) const
{
  boost::lock_guard<boost::mutex> Lock( m_Mutex );
  if( m_SessionId == 0 )
  {
    return false;
  }
  o_rFit = { m_SessionId, m_StartTime, m_LastAccepted, m_Samples, m_Skipped, m_Covariance.m_00, m_Segments.size() };
  return true;
}

bool VDriftMonitor::GetSampleTime( uint64_t i_Sample, double& o_rTime ) const
{
  boost::lock_guard<boost::mutex> Lock( m_Mutex );
  if( m_SessionId == 0 )
  {
    return false;
  }
  if( m_Segments.empty() || i_Sample >= m_LastAccepted.m_Sample )
  {
    o_rTime = FittedTime( i_Sample );
    return true;
  }
  const auto Next = std::upper_bound( m_Segments.begin(), m_Segments.end(), i_Sample,
    []( uint64_t i_Value, const VPoint& i_rPoint ) { return i_Value < i_rPoint.m_Sample; } );
  o_rTime = TimeOnLine( Next == m_Segments.begin() ? *Next : *std::prev( Next ), i_Sample );
  return true;
}

std::string VDriftMonitor::Dump() const
{
  boost::lock_guard<boost::mutex> Lock( m_Mutex );
  std::ostringstream Text;
  Text << std::setprecision( std::numeric_limits<double>::max_digits10 );
  Text << "NominalSampleRateInTicks = " << m_NominalSampleRateInTicks << "\n";
  Text << "ObservationModel = (1, 0)\n";
  Text << "SystemModel = " << m_SystemModel[0].m_F << "\n";
  Text << "MeasurementNoise = " << m_Configuration.m_MeasurementNoise << "\n";
  Text << "ProcessNoise = " << m_SystemModel[0].m_Q << "\n";
  Text << "MinUncertaintyToUpdateStartTime = " << m_MinUncertaintyToUpdateStartTime << "\n";
  return Text.str();
}

bool VDriftMonitor::AddSample( uint32_t i_Session, uint64_t i_Sample, double i_Time )
{
  if( i_Session == 0 || i_Session != m_SessionId || i_Sample <= m_LastAccepted.m_Sample )
  {
    return false;
  }
  const uint32_t Steps = static_cast<uint32_t>( i_Sample - m_LastAccepted.m_Sample );
  if( m_NominalSeconds * Steps * m_Configuration.m_GapFactor < i_Time - m_LastAccepted.m_Time )
  {
    ForgiveJump( Steps, i_Time );
  }
  Predict( Steps );
  Correct( i_Time );
  m_LastAccepted = { m_LastAccepted.m_Sample + Steps, m_State.m_Time, m_State.m_Rate };
  if( m_Segments.empty() )
  {
    ImproveStart();
  }
  else
  {
    ExtendHistory();
  }
  ++m_Samples;
  m_LastTime = i_Time;
  return true;
}

void VDriftMonitor::OnNewSession() {}

double VDriftMonitor::FittedTime( uint64_t i_Sample ) const { return TimeOnLine( m_LastAccepted, i_Sample ); }

bool VDriftMonitor::BeginFit( uint32_t i_Session, uint64_t i_FirstIndex, uint64_t i_Sample, double i_Time )
{
  m_SessionId = i_Session;
  m_NominalSeconds = static_cast<double>( m_NominalSampleRateInTicks ) / m_TicksPerSecond;
  m_Samples = 1;
  m_Skipped = 0;
  m_FirstTime = i_Time;
  m_LastTime = i_Time;
  m_MinUncertaintyToUpdateStartTime = NoStartYet;
  m_FirstIndex = static_cast<double>( i_FirstIndex );
  m_StartTime = i_Time - Distance( i_FirstIndex, i_Sample ) * m_NominalSeconds;
  m_State = { i_Time, m_NominalSeconds };
  m_Covariance = { 1.0, 0.0, 0.0, m_Configuration.m_InitialRateVariance };
  BuildSystemModel();
  m_LastAccepted = { i_Sample, m_State.m_Time, m_State.m_Rate };
  m_Segments.clear();
  OnNewSession();
  return true;
}

void VDriftMonitor::BuildSystemModel()
{
  m_SystemModel[0] = MakeStep( 1.0 );
  for( size_t Index = 1; Index < m_SystemModel.size(); ++Index )
  {
    const VSystemStep& rHalf = m_SystemModel[Index - 1];
    m_SystemModel[Index] = { rHalf.m_F * rHalf.m_F, Propagated( rHalf.m_F, rHalf.m_Q, rHalf.m_Q ) };
  }
}

// White noise on the rate's change, held over the steps: G = (t squared over 2, t), Q = q G G transposed.
VDriftMonitor::VSystemStep VDriftMonitor::MakeStep( double i_Steps ) const
{
  const double Seconds = i_Steps * m_NominalSeconds;
  const double G0 = Seconds * Seconds / 2.0;
  const double G1 = Seconds;
  const double q = m_Configuration.m_ProcessNoise;
  return { { 1.0, i_Steps, 0.0, 1.0 }, { q * G0 * G0, q * G0 * G1, q * G1 * G0, q * G1 * G1 } };
}

// Time is unknown again, so that the prediction lands on the sample; the rate stays.
void VDriftMonitor::ForgiveJump( uint32_t i_Steps, double i_Time )
{
  m_Covariance.m_00 = 1.0;
  m_Covariance.m_01 = 0.0;
  m_Covariance.m_10 = 0.0;
  m_State.m_Time = i_Time - i_Steps * m_LastAccepted.m_Rate;
  m_MinUncertaintyToUpdateStartTime = NoStartYet;
}

void VDriftMonitor::Predict( uint32_t i_Steps )
{
  if( m_Configuration.m_PredictMode == 0 )
  {
    for( size_t Bit = 0; Bit < m_SystemModel.size(); ++Bit )
    {
      if( i_Steps >> Bit & 1u )
      {
        Apply( m_SystemModel[Bit] );
      }
    }
  }
  else if( m_Configuration.m_PredictMode == 1 )
  {
    for( uint32_t Step = 0; Step < i_Steps; ++Step )
    {
      Apply( m_SystemModel[0] );
    }
  }
  else
  {
    Apply( MakeStep( i_Steps ) );
  }
}

void VDriftMonitor::Apply( const VSystemStep& i_rStep )
{
  const VMatrix2& rF = i_rStep.m_F;
  m_State = { rF.m_00 * m_State.m_Time + rF.m_01 * m_State.m_Rate, rF.m_10 * m_State.m_Time + rF.m_11 * m_State.m_Rate };
  m_Covariance = Propagated( rF, m_Covariance, i_rStep.m_Q );
}

// The observation is the time alone, H = (1, 0).
void VDriftMonitor::Correct( double i_Time )
{
  const double S = m_Covariance.m_00 + m_Configuration.m_MeasurementNoise;
  const double K0 = m_Covariance.m_00 / S;
  const double K1 = m_Covariance.m_10 / S;
  const double Residual = i_Time - m_State.m_Time;
  m_State.m_Time += K0 * Residual;
  m_State.m_Rate += K1 * Residual;
  m_Covariance = VMatrix2{ 1.0 - K0, 0.0, -K1, 1.0 } * m_Covariance;
}

// The start time is the one seen from the moment at which it was known best.
void VDriftMonitor::ImproveStart()
{
  if( m_LastTime - m_FirstTime >= m_Configuration.m_SettleSeconds )
  {
    PushSegment();
    return;
  }
  const double Back = m_FirstIndex - static_cast<double>( m_LastAccepted.m_Sample );
  const VMatrix2& rP = m_Covariance;
  const double Uncertainty = rP.m_00 + Back * ( rP.m_01 + rP.m_10 ) + Back * Back * rP.m_11;
  if( Uncertainty < m_MinUncertaintyToUpdateStartTime )
  {
    m_MinUncertaintyToUpdateStartTime = Uncertainty;
    m_StartTime = m_State.m_Time + Back * m_State.m_Rate;
  }
}

void VDriftMonitor::ExtendHistory()
{
  if( std::abs( m_State.m_Time - TimeOnLine( m_Segments.back(), m_LastAccepted.m_Sample ) ) > m_Configuration.m_SegmentTolerance )
  {
    PushSegment();
  }
}

void VDriftMonitor::PushSegment()
{
  if( !m_Segments.empty() && m_Segments.size() >= m_Configuration.m_MaxSegments )
  {
    m_Segments.pop_front();
  }
  m_Segments.push_back( m_LastAccepted );
}

}
