// A stand-alone host that writes down, in the category "Host" of the log, what the engine hands over and takes back. Its sources are in no session.
#pragma once

#include "StageCoreParameters/ParameterGroup.h"
#include "StageCoreRuntime/GlobalLog.h"
#include "host/StandAloneHost.h"
#include "tests/support/ManualPostalService.h"

#include <boost/algorithm/string/join.hpp>
#include <boost/core/demangle.hpp>

#include <functional>
#include <memory>
#include <string>
#include <typeinfo>
#include <vector>

class VListeningShutdownManager : public StageHost::VShutdownManager
{
public:
  void AddShutdownObject( std::unique_ptr<KVZ::Detail::IShutdownObject> i_pObject ) override
  {
    const KVZ::Detail::IShutdownObject& rObject = *i_pObject;
    KVZ_LOG_DETAIL( "Host", "AddShutdownObject %1%", boost::core::demangle( typeid( rObject ).name() ) );
    VShutdownManager::AddShutdownObject( std::move( i_pObject ) );
  }
};

class VListeningParameterRegistry : public StageHost::VParameterRegistry
{
public:
  void AddParameterGroup( std::shared_ptr<IParameterGroup> i_pGroup ) override
  {
    KVZ_LOG_DETAIL( "Host", "AddParameterGroup %1%", i_pGroup->GetPath().ToString() );
    VParameterRegistry::AddParameterGroup( std::move( i_pGroup ) );
  }
  void RemoveParameterGroup( const std::shared_ptr<IParameterGroup>& i_pGroup ) override
  {
    KVZ_LOG_DETAIL( "Host", "RemoveParameterGroup %1%", i_pGroup->GetPath().ToString() );
    VParameterRegistry::RemoveParameterGroup( i_pGroup );
  }
};

// Its strand never runs.
class VListeningSourceRegistry : public StageHost::VSyncEngine
{
public:
  VListeningSourceRegistry() : VSyncEngine( std::make_shared<TestSupport::VManualPostalService>(), nullptr ) {}

  void AddSource( std::shared_ptr<KVZ::ISource> i_pSource ) override
  {
    m_All.push_back( i_pSource );
    m_OnAdd( i_pSource->GetSourceName() );
    VSyncEngine::AddSource( i_pSource );
    KVZ_LOG_DETAIL( "Host", "AddSource %1%", i_pSource->GetSourceName() );
  }
  void RemoveSource( const std::shared_ptr<KVZ::ISource>& i_pSource ) override
  {
    m_OnRemove( i_pSource->GetSourceName() );
    KVZ_LOG_DETAIL( "Host", "RemoveSource %1%", i_pSource->GetSourceName() );
    VSyncEngine::RemoveSource( i_pSource );
  }

  // Run before a source is registered, and while it still is. Set before devices come.
  std::function<void( const std::string& i_rName )> m_OnAdd = []( const std::string& ) {};
  std::function<void( const std::string& i_rName )> m_OnRemove = []( const std::string& ) {};
  // That ever came here. The engine's thread, until it has ended.
  std::vector<std::weak_ptr<KVZ::ISource>> m_All;
};

class VListeningHost : public StageHost::VStandAloneHost
{
public:
  VListeningHost() : VStandAloneHost( {} ) {}

  std::shared_ptr<StageCorePluginInterface::IShutdownManager> GetShutdownManager() override { return m_pShutdown; }
  std::shared_ptr<StageCorePluginInterface::IParameterRegistry> GetParameterRegistry() override { return m_pParameters; }
  std::shared_ptr<StageCorePluginInterface::IHardwareStartEvent> GetHardwareStartEvent() override { return m_pHardwareStart; }
  std::shared_ptr<StageCorePluginInterface::ISourceRegistry> GetSourceRegistry() override { return m_pSources; }
  void SetFileFilters( int i_Kind, const std::vector<std::string>& i_rFilters ) override
  {
    KVZ_LOG_DETAIL( "Host", "SetFileFilters %1% %2%", i_Kind, boost::join( i_rFilters, " " ) );
  }

  const std::shared_ptr<VListeningShutdownManager> m_pShutdown = std::make_shared<VListeningShutdownManager>();
  const std::shared_ptr<VListeningParameterRegistry> m_pParameters = std::make_shared<VListeningParameterRegistry>();
  const std::shared_ptr<StageHost::VHardwareStartEvent> m_pHardwareStart = std::make_shared<StageHost::VHardwareStartEvent>();
  const std::shared_ptr<VListeningSourceRegistry> m_pSources = std::make_shared<VListeningSourceRegistry>();
};
