#include "StageCoreDataStoreTypes/DeviceSchemas.h"

#include "StageCoreRuntime/GlobalLog.h"

#include <atomic>
#include <chrono>
#include <limits>

namespace
{

constexpr const char* InvalidDeviceClass = "InvalidDeviceClass";
constexpr const char* DefaultDeviceURN = "qx:000000";
constexpr const char* AnalogueCardClass = "AnalogueCard";
constexpr double SecondsBetweenLines = 30.0;

double MonotonicSeconds() { return std::chrono::duration<double>( std::chrono::steady_clock::now().time_since_epoch() ).count(); }

// Two threads that fail at once may both write a line.
struct VThrottle
{
  std::function<double()> m_Clock = MonotonicSeconds;
  std::atomic<double> m_NextLine = std::numeric_limits<double>::lowest();   // seconds
  std::atomic<uint64_t> m_Count = 0;
};

VThrottle& Throttle()
{
  static VThrottle s_Throttle;
  return s_Throttle;
}

void ReportFailure( const VDataPath& i_rClassPath, const std::string& i_rDeviceURN )
{
  VThrottle& rThrottle = Throttle();
  const uint64_t Count = ++rThrottle.m_Count;
  const double Now = rThrottle.m_Clock();
  if( Now < rThrottle.m_NextLine )
  {
    return;
  }
  rThrottle.m_NextLine = Now + SecondsBetweenLines;
  const std::string ClassText = i_rClassPath.ToString();
  const KVZ::VLogArgument Arguments[] = { ClassText, i_rDeviceURN };
  const std::string Text = KVZ::FormatLogMessage( "Failed to create device schema: [%1%] [%2%]", Arguments, 2 );
  KVZ_LOG_ERROR( "DataStore", "%1% (total log count = %2%)", Text, Count );
}

}

namespace DeviceSchemas
{

VDataPath DevicePath( const VDataPath& i_rClassPath, const std::string& i_rDeviceURN )
{
  if( i_rClassPath.IsEmpty() || i_rDeviceURN.empty() )
  {
    ReportFailure( i_rClassPath, i_rDeviceURN );
  }
  const VDataPath ClassPath = i_rClassPath.IsEmpty() ? VDataPath{ InvalidDeviceClass } : i_rClassPath;
  return ClassPath + ( i_rDeviceURN.empty() ? std::string_view( DefaultDeviceURN ) : std::string_view( i_rDeviceURN ) );
}

void SetLogClock( std::function<double()> i_Clock )
{
  VThrottle& rThrottle = Throttle();
  rThrottle.m_Clock = i_Clock ? std::move( i_Clock ) : MonotonicSeconds;
  rThrottle.m_NextLine = std::numeric_limits<double>::lowest();
  rThrottle.m_Count = 0;
}

VDataPath AnalogueCard::Path( unsigned int i_Card ) { return { AnalogueCardClass + std::to_string( i_Card ) }; }

VDataPath AnalogueCard::Path( unsigned int i_Card, const std::string& i_rDeviceURN ) { return DevicePath( Path( i_Card ), i_rDeviceURN ); }

}
