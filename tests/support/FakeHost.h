// A host for the module's engine: real small services where there are some, and fakes that remember what they were asked. A test waits for
// what the module's threads do by WaitUntil, which looks again after every change of a setting and every call that is remembered.
#pragma once

#include "StageCoreDataStore/DataReader.h"
#include "StageCoreDataStore/DataWriter.h"
#include "StageCoreParameters/ParameterGroup.h"
#include "StageCorePluginInterface/StageCoreHost.h"
#include "StageCoreRuntime/DebugServices.h"
#include "StageCoreRuntime/ThreadAnnotations.h"
#include "Utils/UtilsMemory/BalancingAllocator.h"
#include "host/DataStore.h"
#include "host/Registries.h"
#include "tests/support/FakeSettingsHost.h"
#include "tests/support/HandTime.h"

#include <boost/thread/condition_variable.hpp>
#include <boost/thread/lock_guard.hpp>
#include <boost/thread/mutex.hpp>
#include <boost/thread/thread.hpp>

#include <algorithm>
#include <cstdint>
#include <functional>
#include <memory>
#include <string>
#include <typeinfo>
#include <vector>

namespace TestSupport
{

// What happened, in order. Any thread.
class VHappenings
{
public:
  void Add( std::string i_Text )
  {
    boost::lock_guard<boost::mutex> Lock( m_Mutex );
    m_Texts.push_back( std::move( i_Text ) );
    m_Threads.push_back( DebugServices::GetThreadName() );
    ++m_Changes;
    m_Changed.notify_all();
  }
  // Something that is not worth an entry.
  void Touch()
  {
    boost::lock_guard<boost::mutex> Lock( m_Mutex );
    ++m_Changes;
    m_Changed.notify_all();
  }
  // The predicate is called without a lock, once and after every change.
  template<class TPredicate>
  void WaitUntil( TPredicate i_Predicate )
  {
    for( uint64_t Seen = Changes(); !i_Predicate(); Seen = Changes() )
    {
      boost::lock_guard<boost::mutex> Lock( m_Mutex );
      while( m_Changes == Seen )
      {
        m_Changed.wait( m_Mutex );
      }
    }
  }

  std::vector<std::string> Texts() const
  {
    boost::lock_guard<boost::mutex> Lock( m_Mutex );
    return m_Texts;
  }
  bool Has( const std::string& i_rText ) const
  {
    const auto All = Texts();
    return std::find( All.begin(), All.end(), i_rText ) != All.end();
  }
  // The thread that did it first; empty where nobody did.
  std::string ThreadOf( const std::string& i_rText ) const
  {
    boost::lock_guard<boost::mutex> Lock( m_Mutex );
    const auto Found = std::find( m_Texts.begin(), m_Texts.end(), i_rText );
    return Found == m_Texts.end() ? std::string() : m_Threads[static_cast<size_t>( Found - m_Texts.begin() )];
  }
  void Clear()
  {
    boost::lock_guard<boost::mutex> Lock( m_Mutex );
    m_Texts.clear();
    m_Threads.clear();
  }

private:
  uint64_t Changes() const
  {
    boost::lock_guard<boost::mutex> Lock( m_Mutex );
    return m_Changes;
  }

  mutable boost::mutex m_Mutex;
  boost::condition_variable_any m_Changed;
  std::vector<std::string> m_Texts GUARDED_BY( m_Mutex );
  std::vector<std::string> m_Threads GUARDED_BY( m_Mutex );   // the name of each one's
  uint64_t m_Changes GUARDED_BY( m_Mutex ) = 0;
};

class VHeardShutdownManager : public StageHost::VShutdownManager
{
public:
  explicit VHeardShutdownManager( std::shared_ptr<VHappenings> i_pHappenings ) : m_pHappenings( std::move( i_pHappenings ) ) {}

  void AddShutdownObject( std::unique_ptr<KVZ::Detail::IShutdownObject> i_pObject ) override
  {
    const KVZ::Detail::IShutdownObject& rObject = *i_pObject;
    const std::string Type = typeid( rObject ).name();
    const char* pName = "?";
    for( const char* pCandidate : { "VVideoInputDeviceManager", "VVideoInputSystemParameterHandler", "VVideoInputEngine" } )
    {
      pName = Type.find( pCandidate ) != std::string::npos ? pCandidate : pName;
    }
    m_pHappenings->Add( "AddShutdownObject " + std::string( pName ) );
    VShutdownManager::AddShutdownObject( std::move( i_pObject ) );
  }

private:
  const std::shared_ptr<VHappenings> m_pHappenings;
};

class VHeardParameterRegistry : public StageHost::VParameterRegistry
{
public:
  explicit VHeardParameterRegistry( std::shared_ptr<VHappenings> i_pHappenings ) : m_pHappenings( std::move( i_pHappenings ) ) {}

  void AddParameterGroup( std::shared_ptr<IParameterGroup> i_pGroup ) override
  {
    m_pHappenings->Add( "AddParameterGroup " + i_pGroup->GetPath().ToString() );
    VParameterRegistry::AddParameterGroup( std::move( i_pGroup ) );
  }
  void RemoveParameterGroup( const std::shared_ptr<IParameterGroup>& i_pGroup ) override
  {
    m_pHappenings->Add( "RemoveParameterGroup " + i_pGroup->GetPath().ToString() );
    VParameterRegistry::RemoveParameterGroup( i_pGroup );
  }

private:
  const std::shared_ptr<VHappenings> m_pHappenings;
};

// Any thread.
class VHeardSourceRegistry : public VFakeSourceRegistry
{
public:
  explicit VHeardSourceRegistry( std::shared_ptr<VHappenings> i_pHappenings ) : m_pHappenings( std::move( i_pHappenings ) ) {}

  void AddSource( std::shared_ptr<KVZ::ISource> i_pSource ) override
  {
    const std::string Name = i_pSource->GetSourceName();
    {
      boost::lock_guard<boost::mutex> Lock( m_Mutex );
      m_AllSources.push_back( i_pSource );
    }
    m_OnAdd( Name );
    i_pSource->Temporal().OnRequestNewGlobalSyncSession().SetImmediate(
      [pHappenings = m_pHappenings]( KVZ::VGlobalSyncSessionId ) { pHappenings->Touch(); } );
    {
      boost::lock_guard<boost::mutex> Lock( m_Mutex );
      m_Sources.push_back( i_pSource );
    }
    m_pHappenings->Add( "AddSource " + Name );
  }
  void RemoveSource( const std::shared_ptr<KVZ::ISource>& i_pSource ) override
  {
    m_OnRemove( i_pSource->GetSourceName() );
    i_pSource->Temporal().OnRequestNewGlobalSyncSession().Clear();
    m_pHappenings->Add( "RemoveSource " + i_pSource->GetSourceName() );
    boost::lock_guard<boost::mutex> Lock( m_Mutex );
    m_Sources.erase( std::remove( m_Sources.begin(), m_Sources.end(), i_pSource ), m_Sources.end() );
  }

  // Null for a source that is not registered.
  std::shared_ptr<KVZ::ISource> Find( const std::string& i_rName ) const
  {
    boost::lock_guard<boost::mutex> Lock( m_Mutex );
    const auto Found = std::find_if( m_Sources.begin(), m_Sources.end(),
      [&]( const auto& i_pSource ) { return i_pSource->GetSourceName() == i_rName; } );
    return Found == m_Sources.end() ? nullptr : *Found;
  }
  // Of all that ever came here. A call that was posted to a source's thread may be its last owner for a moment.
  std::vector<std::weak_ptr<KVZ::ISource>> AllSources() const
  {
    boost::lock_guard<boost::mutex> Lock( m_Mutex );
    return m_AllSources;
  }

  // Run inside AddSource, before the source is registered, and inside RemoveSource, while it still is. Set before devices come.
  std::function<void( const std::string& i_rName )> m_OnAdd = []( const std::string& ) {};
  std::function<void( const std::string& i_rName )> m_OnRemove = []( const std::string& ) {};

private:
  const std::shared_ptr<VHappenings> m_pHappenings;
  mutable boost::mutex m_Mutex;
  std::vector<std::shared_ptr<KVZ::ISource>> m_Sources GUARDED_BY( m_Mutex );
  std::vector<std::weak_ptr<KVZ::ISource>> m_AllSources GUARDED_BY( m_Mutex );
};

class VFakeHost : public StageCorePluginInterface::IStageCoreHost
{
public:
  VFakeHost()
  {
    m_pAllocator->Configure( 12, 0, 2 );
    VDataWriter( *m_pStore ).GetNode( VDataPath() )->OnBranchChanged().AddImmediate( [pHappenings = m_pHappenings] { pHappenings->Touch(); } );
  }

  std::shared_ptr<StageCorePluginInterface::IShutdownManager> GetShutdownManager() override { return m_pShutdown; }
  std::shared_ptr<UtilsMemory::VBalancingAllocator> GetBalancingAllocator() override
  {
    m_OnGetAllocator();
    return m_pAllocator;
  }
  std::shared_ptr<IDataStore> GetDataStore() override { return m_pStore; }
  std::shared_ptr<StageCorePluginInterface::ITimeService> GetTimeService() override { return m_pTime; }
  std::shared_ptr<StageCorePluginInterface::IFlowNodeRegistry> GetFlowNodeRegistry() override { return m_pFlowNodes; }
  std::shared_ptr<StageCorePluginInterface::IParameterRegistry> GetParameterRegistry() override { return m_pParameters; }
  std::shared_ptr<StageCorePluginInterface::IHardwareStartEvent> GetHardwareStartEvent() override { return m_pHardwareStart; }
  std::shared_ptr<StageCorePluginInterface::IServiceObject> GetTriggerService() override { return m_pService; }
  std::shared_ptr<StageCorePluginInterface::IServiceObject> GetFirstSourceService() override { return m_pService; }
  std::shared_ptr<StageCorePluginInterface::IServiceObject> GetSecondSourceService() override { return m_pService; }
  std::shared_ptr<StageCorePluginInterface::ICaptureTargets> GetCaptureTargetService() override { return m_pTargets; }
  std::shared_ptr<StageCorePluginInterface::ISourceRegistry> GetSourceRegistry() override { return m_pSources; }
  std::shared_ptr<StageCorePluginInterface::ICaptureTargets> GetCaptureTargets() override { return m_pTargets; }
  void SetFileFilters( int i_Kind, const std::vector<std::string>& i_rFilters ) override
  {
    std::string Text = "SetFileFilters " + std::to_string( i_Kind );
    for( const std::string& rFilter : i_rFilters )
    {
      Text += " " + rFilter;
    }
    m_pHappenings->Add( Text );
  }

  // Waits until these have gone: see AllSources.
  static void WaitForEnd( const std::vector<std::weak_ptr<KVZ::ISource>>& i_rSources )
  {
    for( const auto& pSource : i_rSources )
    {
      while( !pSource.expired() )
      {
        boost::this_thread::yield();
      }
    }
  }

  // The setting that counts; a default-made value where there is none.
  template<class T>
  T Setting( const VDataPath& i_rPath ) const
  {
    T Value{};
    GetTyped( VDataReader( *m_pStore ), i_rPath, Value );
    return Value;
  }

  const std::shared_ptr<VHappenings> m_pHappenings = std::make_shared<VHappenings>();
  std::function<void()> m_OnGetAllocator = [] {};   // the engine's first call for a device. Set before devices come
  const std::shared_ptr<VHeardShutdownManager> m_pShutdown = std::make_shared<VHeardShutdownManager>( m_pHappenings );
  // Blocks of 4 MiB: room for a few frames of standard definition each.
  const std::shared_ptr<UtilsMemory::VBalancingAllocator> m_pAllocator = std::make_shared<UtilsMemory::VBalancingAllocator>( 4u << 20 );
  const std::shared_ptr<StageHost::VDataStore> m_pStore = std::make_shared<StageHost::VDataStore>();
  const std::shared_ptr<VHandTime> m_pTime = std::make_shared<VHandTime>();
  const std::shared_ptr<StageHost::VFlowNodeRegistry> m_pFlowNodes = std::make_shared<StageHost::VFlowNodeRegistry>();
  const std::shared_ptr<VHeardParameterRegistry> m_pParameters = std::make_shared<VHeardParameterRegistry>( m_pHappenings );
  const std::shared_ptr<StageHost::VHardwareStartEvent> m_pHardwareStart = std::make_shared<StageHost::VHardwareStartEvent>();
  const std::shared_ptr<StageHost::VNamedService> m_pService = std::make_shared<StageHost::VNamedService>( "Service" );
  const std::shared_ptr<VFakeCaptureTargets> m_pTargets = std::make_shared<VFakeCaptureTargets>();
  const std::shared_ptr<VHeardSourceRegistry> m_pSources = std::make_shared<VHeardSourceRegistry>( m_pHappenings );
};

}
