// Joins all data sources to global sync sessions, one timeline for all of them, and renews the session whenever a source asks.
#pragma once

#include "NotificationSystem/IPostalService.h"
#include "NotificationSystem/MultiCallback.h"
#include "StageCorePluginInterface/StageCoreHost.h"
#include "StageCoreRuntime/ThreadAnnotations.h"
#include "SyncSystem/ISource.h"
#include "host/TimeService.h"
#include "host/Timeline.h"

#include <boost/thread/mutex.hpp>

#include <memory>
#include <vector>

namespace StageHost
{

// A source's place in a started session.
struct VStartedSource
{
  std::shared_ptr<KVZ::ISource> m_pSource;
  KVZ::ISourceSyncSession m_Session;
  VLaidSource m_Place;
};

struct VStartedSession
{
  KVZ::VGlobalSyncSessionId m_Id;
  KVZ::VTick m_LiveEdge;   // global tick at which readers began
  bool m_bByTimecode = false;
  std::vector<VStartedSource> m_Sources;

  // A null pointer for a source that takes no part.
  const VStartedSource* Find( const KVZ::ISource* i_pSource ) const;
};

// The clock that the host counts in: the frame period of the first source of the session.
class VMasterClock : public KVZ::IBaseLineClock
{
public:
  explicit VMasterClock( KVZ::VTick i_Period ) : m_Period( i_Period ) {}
  std::string GetName() const override { return "Master"; }
  KVZ::VTick GetPeriod() const override { return m_Period; }

private:
  const KVZ::VTick m_Period;
};

// The register of sources and the engine over it. Requests are answered on the strand; every operation may be called from any thread.
class VSyncEngine : public StageCorePluginInterface::ISourceRegistry, public std::enable_shared_from_this<VSyncEngine>
{
public:
  // The strand runs one call at a time; delayed calls come back on it.
  VSyncEngine( std::shared_ptr<KVZ::IPostalService> i_pStrand, std::shared_ptr<IDelayedCalls> i_pDelayed );

  void AddSource( std::shared_ptr<KVZ::ISource> i_pSource ) override;
  // No new session takes the source up after this; one that is being started on the strand right now may still call it.
  void RemoveSource( const std::shared_ptr<KVZ::ISource>& i_pSource ) override;
  // Empty until the first session has started.
  std::shared_ptr<KVZ::IBaseLineClock> GetMasterClock() override;
  KVZ::IMultiCallbackPostal<void()>& GetMasterPeriodChangedCallback() override { return m_MasterPeriodChanged; }

  // The newest started session; an empty pointer before the first.
  std::shared_ptr<const VStartedSession> GetStarted() const;
  std::vector<std::shared_ptr<KVZ::ISource>> GetSources() const;

private:
  struct VEntry
  {
    std::shared_ptr<KVZ::ISource> m_pSource;
    KVZ::VGlobalSyncSessionId m_LastDeclared;   // to this source; invalid before the first
  };

  void OnRequest( const KVZ::ISource* i_pSource, KVZ::VGlobalSyncSessionId i_LastDeclared );
  void Declare();
  std::vector<VEntry> BeginDeclaration( KVZ::VGlobalSyncSessionId& o_rId, std::shared_ptr<KVZ::IBaseLineClock>& o_rpMaster );
  void TryStart( KVZ::VGlobalSyncSessionId i_Id, int i_Attempt );
  void TryLater( KVZ::VGlobalSyncSessionId i_Id, int i_Attempt );
  void StartSession( KVZ::VGlobalSyncSessionId i_Id, const std::vector<VStartedSource>& i_rSources, const VTimeline& i_rTimeline );
  void SetMasterPeriod( KVZ::VTick i_Period );
  bool IsUnanswered( const KVZ::ISource* i_pSource, KVZ::VGlobalSyncSessionId i_LastDeclared ) const;
  std::vector<VStartedSource> Candidates( KVZ::VGlobalSyncSessionId i_Id ) const;
  void SetCandidates( KVZ::VGlobalSyncSessionId i_Id, std::vector<VStartedSource> i_Sources );
  // Takes out what is no longer registered, for the caller to let go.
  static std::vector<VStartedSource> TakeRemoved( const std::vector<VEntry>& i_rRegistered, std::vector<VStartedSource>& io_rSources );

  // Fixed after construction
  const std::shared_ptr<KVZ::IPostalService> m_pStrand;
  const std::shared_ptr<IDelayedCalls> m_pDelayed;
  NotificationSystem::VMultiCallbackPostal<void()> m_MasterPeriodChanged;

  mutable boost::mutex m_Mutex;
  std::vector<VEntry> m_Sources GUARDED_BY( m_Mutex );              // in the order of arrival
  std::vector<VStartedSource> m_Candidates GUARDED_BY( m_Mutex );   // what takes part in the newest declaration; no places yet
  std::shared_ptr<const VStartedSession> m_pStarted GUARDED_BY( m_Mutex );
  std::shared_ptr<VMasterClock> m_pMasterClock GUARDED_BY( m_Mutex );
  KVZ::VGlobalSyncSessionId m_Newest GUARDED_BY( m_Mutex );   // declared
};

}
