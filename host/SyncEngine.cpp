#include "host/SyncEngine.h"

#include "NotificationSystem/WeakBinder.h"
#include "StageCoreRuntime/GlobalLog.h"

#include <boost/thread/lock_guard.hpp>

#include <algorithm>
#include <iterator>
#include <utility>

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
  const auto Found = std::find_if( m_Sources.begin(), m_Sources.end(),
    [&]( const VStartedSource& i_rSource ) { return i_rSource.m_pSource.get() == i_pSource; } );
  return Found == m_Sources.end() ? nullptr : &*Found;
}

VSyncEngine::VSyncEngine( std::shared_ptr<KVZ::IPostalService> i_pStrand, std::shared_ptr<IDelayedCalls> i_pDelayed )
  : m_pStrand( std::move( i_pStrand ) ), m_pDelayed( std::move( i_pDelayed ) )
{
}

void VSyncEngine::AddSource( std::shared_ptr<KVZ::ISource> i_pSource )
{
  {
    boost::lock_guard<boost::mutex> Lock( m_Mutex );
    m_Sources.push_back( { i_pSource, {} } );
  }
  // The pointer only names the source.
  const auto Answer = [pSource = i_pSource.get()]( VSyncEngine& i_rEngine, KVZ::VGlobalSyncSessionId i_LastDeclared )
  { i_rEngine.OnRequest( pSource, i_LastDeclared ); };
  i_pSource->Temporal().OnRequestNewGlobalSyncSession().Set( NotificationSystem::BindWeak( weak_from_this(), Answer ), m_pStrand );
}

void VSyncEngine::RemoveSource( const std::shared_ptr<KVZ::ISource>& i_pSource )
{
  i_pSource->Temporal().OnRequestNewGlobalSyncSession().Clear();
  std::shared_ptr<const VStartedSession> pFormer;   // ends without the lock
  boost::lock_guard<boost::mutex> Lock( m_Mutex );
  std::erase_if( m_Sources, [&]( const VEntry& i_rEntry ) { return i_rEntry.m_pSource == i_pSource; } );
  TakeRemoved( m_Sources, m_Candidates );
  if( m_pStarted && m_pStarted->Find( i_pSource.get() ) )
  {
    auto pWithout = std::make_shared<VStartedSession>( *m_pStarted );
    TakeRemoved( m_Sources, pWithout->m_Sources );
    pFormer = std::exchange( m_pStarted, std::move( pWithout ) );
  }
}

std::vector<VStartedSource> VSyncEngine::TakeRemoved( const std::vector<VEntry>& i_rRegistered, std::vector<VStartedSource>& io_rSources )
{
  const auto IsRegistered = [&i_rRegistered]( const VStartedSource& i_rSource )
  {
    return std::any_of( i_rRegistered.begin(), i_rRegistered.end(),
      [&i_rSource]( const VEntry& i_rEntry ) { return i_rEntry.m_pSource == i_rSource.m_pSource; } );
  };
  const auto Removed = std::stable_partition( io_rSources.begin(), io_rSources.end(), IsRegistered );
  std::vector<VStartedSource> Taken( std::make_move_iterator( Removed ), std::make_move_iterator( io_rSources.end() ) );
  io_rSources.erase( Removed, io_rSources.end() );
  return Taken;
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
  std::vector<std::shared_ptr<KVZ::ISource>> Sources;
  boost::lock_guard<boost::mutex> Lock( m_Mutex );
  for( const VEntry& rEntry : m_Sources )
  {
    Sources.push_back( rEntry.m_pSource );
  }
  return Sources;
}

void VSyncEngine::OnRequest( const KVZ::ISource* i_pSource, KVZ::VGlobalSyncSessionId i_LastDeclared )
{
  if( IsUnanswered( i_pSource, i_LastDeclared ) )
  {
    Declare();
  }
}

// A request that a source made before its newest declaration has been answered by that: several at once make one new session.
bool VSyncEngine::IsUnanswered( const KVZ::ISource* i_pSource, KVZ::VGlobalSyncSessionId i_LastDeclared ) const
{
  boost::lock_guard<boost::mutex> Lock( m_Mutex );
  const auto Found = std::find_if( m_Sources.begin(), m_Sources.end(),
    [i_pSource]( const VEntry& i_rEntry ) { return i_rEntry.m_pSource.get() == i_pSource; } );
  return Found != m_Sources.end() && Found->m_LastDeclared <= i_LastDeclared;
}

std::vector<VSyncEngine::VEntry> VSyncEngine::BeginDeclaration( KVZ::VGlobalSyncSessionId& o_rId, std::shared_ptr<KVZ::IBaseLineClock>& o_rpMaster )
{
  boost::lock_guard<boost::mutex> Lock( m_Mutex );
  m_Newest = KVZ::VGlobalSyncSessionId( m_Newest.Value() + 1 );
  for( VEntry& rEntry : m_Sources )
  {
    rEntry.m_LastDeclared = m_Newest;
  }
  o_rId = m_Newest;
  o_rpMaster = m_pMasterClock;
  return m_Sources;
}

void VSyncEngine::Declare()
{
  KVZ::VGlobalSyncSessionId Id;
  std::shared_ptr<KVZ::IBaseLineClock> pMaster;
  std::vector<VStartedSource> TakePart;
  for( const VEntry& rEntry : BeginDeclaration( Id, pMaster ) )
  {
    if( const auto Session = rEntry.m_pSource->Temporal().DeclareGlobalSyncSession( Id, pMaster ) )
    {
      TakePart.push_back( { rEntry.m_pSource, *Session, {} } );
    }
  }
  SetCandidates( Id, std::move( TakePart ) );
  TryStart( Id, 0 );
}

// Empty where another session has been declared since.
std::vector<VStartedSource> VSyncEngine::Candidates( KVZ::VGlobalSyncSessionId i_Id ) const
{
  boost::lock_guard<boost::mutex> Lock( m_Mutex );
  return i_Id == m_Newest ? m_Candidates : std::vector<VStartedSource>();
}

void VSyncEngine::SetCandidates( KVZ::VGlobalSyncSessionId i_Id, std::vector<VStartedSource> i_Sources )
{
  std::vector<VStartedSource> Removed;   // end without the lock
  boost::lock_guard<boost::mutex> Lock( m_Mutex );
  if( i_Id == m_Newest )
  {
    Removed = TakeRemoved( m_Sources, i_Sources );
    m_Candidates.swap( i_Sources );
  }
}

void VSyncEngine::TryStart( KVZ::VGlobalSyncSessionId i_Id, int i_Attempt )
{
  const std::vector<VStartedSource> TakePart = Candidates( i_Id );
  if( TakePart.empty() )
  {
    return;
  }
  std::vector<VTimelineSource> Sources;
  std::vector<VStartedSource> Timed;
  for( const VStartedSource& rSource : TakePart )
  {
    auto Timing = rSource.m_pSource->Temporal().GetSourceTimingInfo();
    if( Timing && Timing->m_SessionId == rSource.m_Session.m_Id )
    {
      Timed.push_back( rSource );
    }
    else
    {
      Timing.reset();
    }
    Sources.push_back( { rSource.m_Session, std::move( Timing ) } );
  }
  if( const auto Timeline = LaySources( Sources ) )
  {
    StartSession( i_Id, TakePart, *Timeline );
  }
  else if( i_Attempt < TimingAttempts )
  {
    TryLater( i_Id, i_Attempt + 1 );
  }
  else
  {
    // A source that stopped after its first frame must not hold the others back; it asks again with its next session.
    KVZ_LOG( "SyncEngine", 3, "Global session %1%: not every source has delivery times, going on with those that have.", i_Id.Value() );
    SetCandidates( i_Id, std::move( Timed ) );
    TryStart( i_Id, 0 );
  }
}

void VSyncEngine::TryLater( KVZ::VGlobalSyncSessionId i_Id, int i_Attempt )
{
  m_pDelayed->CallAfter( TimingRetrySeconds,
    [pWeak = weak_from_this(), i_Id, i_Attempt]
    {
      if( const auto pThis = pWeak.lock() )
      {
        pThis->TryStart( i_Id, i_Attempt );
      }
    } );
}

void VSyncEngine::StartSession( KVZ::VGlobalSyncSessionId i_Id, const std::vector<VStartedSource>& i_rSources, const VTimeline& i_rTimeline )
{
  auto pStarted = std::make_shared<VStartedSession>();
  pStarted->m_Id = i_Id;
  pStarted->m_bByTimecode = i_rTimeline.m_bByTimecode;
  pStarted->m_Sources = i_rSources;
  KVZ::ITickInClocks Shared;
  for( size_t Index = 0; Index < pStarted->m_Sources.size(); ++Index )
  {
    pStarted->m_Sources[Index].m_Place = i_rTimeline.m_Sources[Index];
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
  // Both end without the lock.
  std::shared_ptr<const VStartedSession> pFormer;
  std::vector<VStartedSource> Removed;
  boost::lock_guard<boost::mutex> Lock( m_Mutex );
  Removed = TakeRemoved( m_Sources, pStarted->m_Sources );
  pFormer = std::exchange( m_pStarted, std::move( pStarted ) );
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
