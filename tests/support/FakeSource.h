// A data source that is moved by hand: frames come when told, captures follow the frames, every order of the engine is recorded.
#pragma once

#include "SyncSystem/ISource.h"

#include <algorithm>
#include <string>
#include <vector>

namespace TestSupport
{

class VFakeSource : public KVZ::ISource, public KVZ::ISourceTemporal, public KVZ::ISourceCapture
{
public:
  VFakeSource( std::string i_Name, int64_t i_Period ) : m_Name( std::move( i_Name ) ), m_Period( i_Period ) {}

  // Begins a source sync session whose first frame was delivered at i_HostTime; without a timecode where i_Timecode is invalid.
  void BeginSession( double i_HostTime, KVZ::VTick i_Timecode = KVZ::VTick::Invalid(), int32_t i_TimecodeIndex = 3 )
  {
    const uint32_t Id = m_Session.m_Id + 1;
    m_Session = {};
    m_Session.m_Id = Id;
    m_Session.m_Period = m_Period;
    m_Counter = KVZ::IClock( KVZ::IClock::CounterFromSessionStart, 0, std::hash<std::string>()( m_Name ) );
    m_Session.m_StartTime.Set( m_Counter, KVZ::VTick( 0 ) );
    m_Session.m_ContinuousSince[m_Counter] = Id;
    if( i_Timecode.IsValid() )
    {
      const KVZ::IClock Timecode( KVZ::IClock::Timecode, i_TimecodeIndex, 0 );
      m_Session.m_StartTime.Set( Timecode, i_Timecode );
      m_Session.m_ContinuousSince[Timecode] = Id;
    }
    m_HostTime = i_HostTime;
    m_Newest = 0;
    m_bTimed = false;
    m_Request( m_LastDeclared );
  }

  // The newest frame's number in the session; delivery times are known from here on.
  void SetNewest( uint64_t i_Frame )
  {
    m_Newest = i_Frame;
    m_bTimed = true;
  }
  void SetEnabled( bool i_bEnabled ) { m_bEnabled = i_bEnabled; }

  // What the engine has told
  std::vector<uint32_t> m_Declared;
  KVZ::ITickInClocks m_StartTicks;
  int m_Started = 0;
  int m_Armed = 0;
  KVZ::VTick m_CaptureStart;
  KVZ::VTick m_CaptureEnd;
  KVZ::ICaptureStatus m_Status;
  int m_EndCalls = 0;
  int m_CancelCalls = 0;
  bool m_bRefuseCapture = false;

  const KVZ::IClock& Counter() const { return m_Counter; }

  // ISource
  std::string GetSourceName() const override { return m_Name; }
  KVZ::ISourceTemporal& Temporal() override { return *this; }
  KVZ::ISourceCapture& Capture() override { return *this; }

  // ISourceTemporal
  boost::optional<KVZ::ISourceSyncSession> DeclareGlobalSyncSession( KVZ::VGlobalSyncSessionId i_Id, std::shared_ptr<KVZ::IBaseLineClock> ) override
  {
    m_LastDeclared = i_Id;
    m_Declared.push_back( i_Id.Value() );
    return m_bEnabled && m_Session.m_Id != 0 ? boost::optional<KVZ::ISourceSyncSession>( m_Session ) : boost::none;
  }
  std::vector<std::string> ApplyTriggerSignals( const std::map<std::string, KVZ::ITriggerSignal>& ) override { return {}; }
  void ArmGlobalSyncSession() override { ++m_Armed; }
  void StartGlobalSyncSession( const KVZ::ITickInClocks& i_rTicks, KVZ::VTick ) override
  {
    m_StartTicks = i_rTicks;
    ++m_Started;
  }
  void RunGlobalSyncSessionHook() override {}
  boost::optional<ISourceTimingInfo> GetSourceTimingInfo() override
  {
    if( !m_bTimed )
    {
      return {};
    }
    ISourceTimingInfo Info;
    Info.m_SessionId = m_Session.m_Id;
    Info.m_StartTime = m_HostTime;
    Info.m_SecondsPerSample = m_Period.Seconds();
    return Info;
  }
  ISourceSyncStatus GetSourceSyncStatus() override
  {
    ISourceSyncStatus Status;
    Status.m_Session = m_Session;
    Status.m_bEnabled = m_bEnabled;
    Status.m_LastDeclared = m_LastDeclared;
    Status.m_LatestCounterFrames = m_Newest;
    Status.m_DroppedFrames = m_Dropped;
    return Status;
  }
  NotificationSystem::VCallbackPostal<void( KVZ::VGlobalSyncSessionId )>& OnRequestNewGlobalSyncSession() override { return m_Request; }
  KVZ::VGlobalSyncSessionId GetOldestGlobalSyncSession() override { return {}; }

  // ISourceCapture
  bool StartCapture( const KVZ::ICaptureHeader&, KVZ::VTick i_Start, KVZ::VTick i_End, bool, uint32_t ) override
  {
    m_CaptureStart = i_Start;
    m_CaptureEnd = i_End;
    m_Status = {};
    m_Status.m_State = 4;
    m_Status.m_RequestedStart = i_Start;
    m_Status.m_Start = i_Start;
    return !m_bRefuseCapture;
  }
  void EndCapture( KVZ::VTick ) override { ++m_EndCalls; }
  void CancelCapture() override { ++m_CancelCalls; }
  KVZ::ICaptureStatus GetCaptureStatus() override { return m_Status; }

  uint64_t m_Dropped = 0;

private:
  const std::string m_Name;
  const KVZ::VTick m_Period;
  KVZ::IClock m_Counter;
  KVZ::ISourceSyncSession m_Session;
  KVZ::VGlobalSyncSessionId m_LastDeclared;
  NotificationSystem::VCallbackPostal<void( KVZ::VGlobalSyncSessionId )> m_Request;
  double m_HostTime = 0.0;
  uint64_t m_Newest = 0;
  bool m_bTimed = false;
  bool m_bEnabled = true;
};

}
