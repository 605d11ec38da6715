// A data source's part in global sync sessions.
#include "SyncSystem/DataSource.h"

#include <boost/thread/lock_guard.hpp>

namespace SyncSystem
{

using KVZ::ISourceSyncSession;
using KVZ::VGlobalSyncSessionId;
using KVZ::VTick;

boost::optional<ISourceSyncSession> VDataSource::DeclareGlobalSyncSession( VGlobalSyncSessionId i_Id, std::shared_ptr<KVZ::IBaseLineClock> i_pClock )
{
  return OnStrand( [this, i_Id, pClock = std::move( i_pClock )] { return Declare( i_Id, pClock ); } );
}

boost::optional<ISourceSyncSession> VDataSource::Declare( VGlobalSyncSessionId i_Id, const std::shared_ptr<KVZ::IBaseLineClock>& i_pClock )
{
  bool bEnabled = false;
  {
    boost::lock_guard<boost::mutex> Lock( m_Mutex );
    m_LastDeclared = i_Id;
    m_pBaseLineClock = i_pClock;
    bEnabled = m_bEnabled;
  }
  VTriggerPlan Plan;
  if( !bEnabled || !PrepareForGlobalSyncSession( i_Id, i_pClock, Plan ) )
  {
    KVZ_LOG( m_rLog, 5, "DeclareGlobalSyncSession(%1%): Source will opt out of this global session", i_Id.Value() );
    return {};
  }
  const VInfoPtr pInfo = EnterSession( i_Id, Plan );
  if( !pInfo )
  {
    KVZ_LOG( m_rLog, 5, "DeclareGlobalSyncSession(%1%): Source will not participate in session as there is no valid source sync session",
      i_Id.Value() );
    return {};
  }
  KVZ_LOG( m_rLog, 5, "DeclareGlobalSyncSession(%1%): Source prepping for %2% session - will use source sync session %3%", i_Id.Value(),
    Plan.IsValid() ? "Triggered" : "Non-Triggered", pInfo->m_Session.m_Id );
  OnGlobalSyncSessionDeclared();
  return pInfo->m_Session;
}

// Empty where there is no valid session to offer.
VDataSource::VInfoPtr VDataSource::EnterSession( VGlobalSyncSessionId i_Id, const VTriggerPlan& i_rPlan )
{
  boost::lock_guard<boost::mutex> Lock( m_Mutex );
  m_TriggerPlan = i_rPlan;
  if( i_rPlan.IsValid() )
  {
    BeginTriggeredSession( i_rPlan );
  }
  auto pInfo = std::make_shared<VGlobalSyncSessionInfo>();
  pInfo->m_Id = i_Id;
  pInfo->m_Session = m_Session;
  if( !m_Session.Validate().empty() || !m_pBuffer->FindRecord( m_Session.m_Id, pInfo->m_Record ) )
  {
    return {};
  }
  m_GlobalSessions[i_Id] = pInfo;
  return pInfo;
}

void VDataSource::BeginTriggeredSession( const VTriggerPlan& i_rPlan )
{
  VFrameTiming Timing;
  Timing.m_Period = i_rPlan.m_FramePeriod;
  Timing.m_CounterClock = m_CounterClock;
  Timing.m_BeatPeriod = i_rPlan.m_BeatPeriod;
  uint32_t SessionId = 0;
  if( m_pBuffer->ForceNewSyncSession( Timing, SessionId ) && TakeSession( SessionId ) )
  {
    KVZ_LOG( m_rLog, 5, "Creating new triggered buffer session %1%", SessionId );
  }
}

bool VDataSource::TakeSession( uint32_t i_SessionId )
{
  ISourceSyncSession Session;
  if( !m_pBuffer->GetSourceSyncSession( i_SessionId, Session ) )
  {
    return false;
  }
  Session.m_NoticePeriod = VTick::FromSeconds( m_NoticeSeconds );
  m_Session = std::move( Session );
  return true;
}

std::vector<std::string> VDataSource::ApplyTriggerSignals( const std::map<std::string, KVZ::ITriggerSignal>& i_rSignals )
{
  return OnStrand( [this, Signals = i_rSignals] { return TriggerSignalsChanged( Signals ); } );
}

void VDataSource::ArmGlobalSyncSession()
{
  OnStrand( [this] { OnArmGlobalSyncSession(); } );
}

void VDataSource::RunGlobalSyncSessionHook()
{
  OnStrand( [this] { OnGlobalSyncSessionHook(); } );
}

void VDataSource::StartGlobalSyncSession( const KVZ::ITickInClocks& i_rTicks, VTick i_Offset )
{
  const VInfoPtr pInfo = StartNewest( i_rTicks, i_Offset );
  if( !pInfo )
  {
    return;
  }
  KVZ_LOG( m_rLog, 5, "StartGlobalSyncSession(%1%): Start tick %2%", pInfo->m_Id.Value(), pInfo->LiveStart().Count() );
  PostToStrand(
    [pWeak = KVZ::WeakFrom( this ), pInfo]
    {
      if( const auto pThis = pWeak.lock() )
      {
        pThis->OnGlobalSyncSessionStarted( pInfo );
      }
    } );
}

// Replaces the info that was declared last by a started copy. Empty where the source had opted out, and where the readings do not do.
VDataSource::VInfoPtr VDataSource::StartNewest( const KVZ::ITickInClocks& i_rTicks, VTick i_Offset )
{
  std::shared_ptr<VGlobalSyncSessionInfo> pStarted;
  VGlobalSyncSessionId Id;
  {
    boost::lock_guard<boost::mutex> Lock( m_Mutex );
    Id = m_LastDeclared;
    const auto Declared = m_GlobalSessions.find( Id );
    if( Declared == m_GlobalSessions.end() )
    {
      return {};
    }
    pStarted = std::make_shared<VGlobalSyncSessionInfo>( *Declared->second );
    if( pStarted->Start( i_rTicks, i_Offset ) )
    {
      Declared->second = pStarted;
      return pStarted;
    }
  }
  KVZ_LOG_ERROR( m_rLog, "StartGlobalSyncSession(%1%): The start ticks lack global time or the source's counter", Id.Value() );
  return {};
}

boost::optional<KVZ::ISourceTemporal::ISourceTimingInfo> VDataSource::GetSourceTimingInfo()
{
  ISourceTimingInfo Info;
  return m_pDrift->GetTimingInfo( Info ) ? boost::make_optional( Info ) : boost::none;
}

KVZ::ISourceTemporal::ISourceSyncStatus VDataSource::GetSourceSyncStatus()
{
  return OnStrand( [this] { return MakeSyncStatus(); } );
}

KVZ::ISourceTemporal::ISourceSyncStatus VDataSource::MakeSyncStatus() const
{
  ISourceSyncStatus Status;
  // Read before the session, so that what a new session has counted is not told beside the old one.
  Status.m_DroppedFrames = m_DroppedFrames.load( std::memory_order_acquire );
  {
    boost::lock_guard<boost::mutex> Lock( m_Mutex );
    Status.m_Session = m_Session;
    Status.m_bEnabled = m_bEnabled;
    Status.m_LastDeclared = m_LastDeclared;
  }
  Status.m_RefusedFrames = m_RefusedFrames.load( std::memory_order_relaxed );
  Status.m_BufferFill = BufferFill();
  VSyncSessionRecord Record;
  int64_t Frames = 0;
  if( m_pBuffer->FindRecord( Status.m_Session.m_Id, Record ) && VCaptureBuffer::Distance( Record.m_First, Record.m_Last, Frames ) )
  {
    Status.m_LatestCounterFrames = static_cast<uint64_t>( Frames );
  }
  return Status;
}

// Sessions whose frames have all gone are forgotten.
VGlobalSyncSessionId VDataSource::GetOldestGlobalSyncSession()
{
  boost::lock_guard<boost::mutex> Lock( m_Mutex );
  const uint32_t OldestSession = m_pBuffer->OldestSessionId();
  while( !m_GlobalSessions.empty() && m_GlobalSessions.begin()->second->m_Session.m_Id < OldestSession )
  {
    m_GlobalSessions.erase( m_GlobalSessions.begin() );
  }
  return m_GlobalSessions.empty() ? VGlobalSyncSessionId() : m_GlobalSessions.begin()->first;
}

bool VDataSource::SetSourceEnabled( bool i_bEnabled )
{
  return OnStrand( [this, i_bEnabled] { return ChangeEnabled( i_bEnabled ); } );
}

bool VDataSource::ChangeEnabled( bool i_bEnabled )
{
  {
    boost::lock_guard<boost::mutex> Lock( m_Mutex );
    if( m_bEnabled == i_bEnabled )
    {
      return false;
    }
    m_bEnabled = i_bEnabled;
  }
  if( i_bEnabled )
  {
    KVZ_LOG( m_rLog, 5, "SetSourceEnabled: Source enabled - Source is guaranteed to start new buffer session and global sync session" );
    BeginAnew();
  }
  else
  {
    KVZ_LOG( m_rLog, 5, "SetSourceEnabled: Source disabled - will request new global session" );
  }
  RequestNewGlobalSyncSession();
  return true;
}

void VDataSource::BeginAnew()
{
  boost::lock_guard<boost::mutex> Lock( m_Mutex );
  m_pBuffer->RequestNewBufferSession();
  m_Session = {};
}

void VDataSource::RequestNewGlobalSyncSession()
{
  VGlobalSyncSessionId LastDeclared;
  {
    boost::lock_guard<boost::mutex> Lock( m_Mutex );
    LastDeclared = m_LastDeclared;
  }
  m_OnRequestNewGlobal( LastDeclared );
}

VDataSource::VInfoPtr VDataSource::NewestInfo() const
{
  boost::lock_guard<boost::mutex> Lock( m_Mutex );
  return m_GlobalSessions.empty() ? VInfoPtr() : m_GlobalSessions.rbegin()->second;
}

VDataSource::VInfoPtr VDataSource::FindInfo( VGlobalSyncSessionId i_Id ) const
{
  boost::lock_guard<boost::mutex> Lock( m_Mutex );
  const auto Found = m_GlobalSessions.find( i_Id );
  return Found == m_GlobalSessions.end() ? VInfoPtr() : Found->second;
}

}
