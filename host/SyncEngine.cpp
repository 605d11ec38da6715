#include "host/SyncEngine.h"

#include "NotificationSystem/WeakBinder.h"
#include "StageCoreRuntime/GlobalLog.h"

#include <boost/thread/lock_guard.hpp>

#include <algorithm>

namespace StageHost
{

namespace
{

// How long a session waits for delivery times of its sources: one frame of the slowest standard is 67 ms.
constexpr double TimingRetrySeconds = 0.02;
constexpr int TimingAttempts = 100;

KVZ::VTick NewestTick( const VStartedSource& i_rSource )
{
  const auto Status = i_rSource.m_pSource->Temporal().GetSourceSyncStatus();
  const int64_t Frames = Status.m_Session.m_Id == i_rSource.m_Session.m_Id ? static_cast<int64_t>( Status.m_LatestCounterFrames ) : 0;
  return i_rSource.m_Place.m_CounterStart + i_rSource.m_Session.m_Period * Frames;
}

// What the source's own clocks read at a global tick.
void AddReadings( const VStartedSource& i_rSource, KVZ::VTick i_Global, KVZ::ITickInClocks& io_rTicks )
{
  const KVZ::VTick Counter = i_Global - i_rSource.m_Place.m_CounterStart;
  for( const auto& rEntry : i_rSource.m_Session.m_StartTime.m_TickByClock )
  {
    io_rTicks.Set( rEntry.first, rEntry.second + Counter );
  }
}

}

const VStartedSource* VStartedSession::Find( const KVZ::ISource* i_pSource ) const
{
  const auto Found =
    std::find_if( m_Sources.begin(), m_Sources.end(), [&]( const VStartedSource& i_rSource ) { return i_rSource.m_pSource.get() == i_pSource; } );
  return Found == m_Sources.end() ? nullptr : &*Found;
}

VSyncEngine::VSyncEngine( std::shared_ptr<KVZ::IPostalService> i_pStrand, std::shared_ptr<IDelayedCalls> i_pDelayed )
  : m_pStrand( std::move( i_pStrand ) )
  , m_pDelayed( std::move( i_pDelayed ) )
{
}

void VSyncEngine::AddSource( std::shared_ptr<KVZ::ISource> i_pSource )
{
  {
    boost::lock_guard<boost::mutex> Lock( m_Mutex );
    m_Sources.push_back( i_pSource );
  }
  i_pSource->Temporal().OnRequestNewGlobalSyncSession().Set( NotificationSystem::BindWeak( weak_from_this(), &VSyncEngine::OnRequest ), m_pStrand );
}

void VSyncEngine::RemoveSource( const std::shared_ptr<KVZ::ISource>& i_pSource )
{
  i_pSource->Temporal().OnRequestNewGlobalSyncSession().Clear();
  boost::lock_guard<boost::mutex> Lock( m_Mutex );
  m_Sources.erase( std::remove( m_Sources.begin(), m_Sources.end(), i_pSource ), m_Sources.end() );
  if( m_pStarted && m_pStarted->Find( i_pSource.get() ) )
  {
    auto pWithout = std::make_shared<VStartedSession>( *m_pStarted );
    pWithout->m_Sources.erase(
      pWithout->m_Sources.begin() + ( m_pStarted->Find( i_pSource.get() ) - m_pStarted->m_Sources.data() ) );
    m_pStarted = std::move( pWithout );
  }
}

std::shared_ptr<KVZ::IBaseLineClock> VSyncEngine::GetMasterClock()
{
  boost::lock_guard<boost::mutex> Lock( m_Mutex );
  return m_pMasterClock;
}

std::shared_ptr<const VStartedSession> VSyncEngine::GetStarted() const
{
  boost::lock_guard<boost::mutex> Lock( m_Mutex );
  return m_pStarted;
}

std::vector<std::shared_ptr<KVZ::ISource>> VSyncEngine::GetSources() const
{
  boost::lock_guard<boost::mutex> Lock( m_Mutex );
  return m_Sources;
}

// A request that was made before the newest declaration has been answered by it: several at once make one new session.
void VSyncEngine::OnRequest( KVZ::VGlobalSyncSessionId i_LastDeclared )
{
  {
    boost::lock_guard<boost::mutex> Lock( m_Mutex );
    if( i_LastDeclared.Value() < m_NewestId && i_LastDeclared.IsValid() )
    {
      return;
    }
  }
  Declare();
}

void VSyncEngine::Declare()
{
  auto pDeclared = std::make_shared<VDeclared>();
  std::shared_ptr<KVZ::IBaseLineClock> pMaster;
  std::vector<std::shared_ptr<KVZ::ISource>> Sources;
  {
    boost::lock_guard<boost::mutex> Lock( m_Mutex );
    pDeclared->m_Id = KVZ::VGlobalSyncSessionId( ++m_NewestId );
    pMaster = m_pMasterClock;
    Sources = m_Sources;
  }
  for( const std::shared_ptr<KVZ::ISource>& pSource : Sources )
  {
    if( const auto Session = pSource->Temporal().DeclareGlobalSyncSession( pDeclared->m_Id, pMaster ) )
    {
      pDeclared->m_Sources.push_back( { pSource, *Session, {} } );
    }
  }
  TryStart( pDeclared, 0 );
}

bool VSyncEngine::IsNewest( const VDeclared& i_rDeclared ) const
{
  boost::lock_guard<boost::mutex> Lock( m_Mutex );
  return i_rDeclared.m_Id.Value() == m_NewestId;
}

void VSyncEngine::TryStart( const std::shared_ptr<VDeclared>& i_pDeclared, int i_Attempt )
{
  if( !IsNewest( *i_pDeclared ) || i_pDeclared->m_Sources.empty() )
  {
    return;
  }
  std::vector<VTimelineSource> Sources;
  for( const VStartedSource& rSource : i_pDeclared->m_Sources )
  {
    auto Timing = rSource.m_pSource->Temporal().GetSourceTimingInfo();
    if( Timing && Timing->m_SessionId != rSource.m_Session.m_Id )
    {
      Timing.reset();
    }
    Sources.push_back( { rSource.m_Session, std::move( Timing ) } );
  }
  if( const auto Timeline = LaySources( Sources ) )
  {
    StartSession( *i_pDeclared, *Timeline );
  }
  else if( i_Attempt < TimingAttempts )
  {
    m_pDelayed->CallAfter( TimingRetrySeconds,
      [pWeak = weak_from_this(), i_pDeclared, i_Attempt] {
        if( const auto pThis = pWeak.lock() )
        {
          pThis->TryStart( i_pDeclared, i_Attempt + 1 );
        }
      } );
  }
  else
  {
    // A source that stopped after its first frame must not hold the others back; it asks again with its next session.
    KVZ_LOG( "SyncEngine", 3, "Global session %1%: not every source has delivery times, going on with those that have.", i_pDeclared->m_Id.Value() );
    auto pTimed = std::make_shared<VDeclared>();
    pTimed->m_Id = i_pDeclared->m_Id;
    for( size_t Index = 0; Index < Sources.size(); ++Index )
    {
      if( Sources[ Index ].m_Timing )
      {
        pTimed->m_Sources.push_back( i_pDeclared->m_Sources[ Index ] );
      }
    }
    TryStart( pTimed, 0 );
  }
}

void VSyncEngine::StartSession( const VDeclared& i_rDeclared, const VTimeline& i_rTimeline )
{
  auto pStarted = std::make_shared<VStartedSession>();
  pStarted->m_Id = i_rDeclared.m_Id;
  pStarted->m_bByTimecode = i_rTimeline.m_bByTimecode;
  pStarted->m_Sources = i_rDeclared.m_Sources;
  KVZ::ITickInClocks Shared;
  for( size_t Index = 0; Index < pStarted->m_Sources.size(); ++Index )
  {
    pStarted->m_Sources[ Index ].m_Place = i_rTimeline.m_Sources[ Index ];
  }
  pStarted->m_LiveEdge = NewestTick( pStarted->m_Sources.front() );
  Shared.Set( KVZ::IClock( KVZ::IClock::GlobalTime, 0, 0 ), pStarted->m_LiveEdge );
  for( const VStartedSource& rSource : pStarted->m_Sources )
  {
    AddReadings( rSource, pStarted->m_LiveEdge, Shared );
  }

  for( const VStartedSource& rSource : pStarted->m_Sources )
  {
    rSource.m_pSource->Temporal().ArmGlobalSyncSession();
  }
  for( const VStartedSource& rSource : pStarted->m_Sources )
  {
    // Its own clocks last: a timecode clock that two sources share may have been read from the other.
    KVZ::ITickInClocks Ticks = Shared;
    AddReadings( rSource, pStarted->m_LiveEdge, Ticks );
    rSource.m_pSource->Temporal().StartGlobalSyncSession( Ticks, KVZ::VTick() );
  }
  SetMasterPeriod( pStarted->m_Sources.front().m_Session.m_Period );
  boost::lock_guard<boost::mutex> Lock( m_Mutex );
  m_pStarted = std::move( pStarted );
}

void VSyncEngine::SetMasterPeriod( KVZ::VTick i_Period )
{
  {
    boost::lock_guard<boost::mutex> Lock( m_Mutex );
    if( m_pMasterClock && m_pMasterClock->GetPeriod() == i_Period )
    {
      return;
    }
    m_pMasterClock = std::make_shared<VMasterClock>( i_Period );
  }
  m_MasterPeriodChanged();
}

}
