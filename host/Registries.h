// The registers that a module fills at its start. Plain lists behind one lock each; any thread may call.
#pragma once

#include "StageCorePluginInterface/HardwareRegistry.h"
#include "StageCorePluginInterface/StageCoreHost.h"
#include "StageCoreRuntime/ThreadAnnotations.h"

#include <boost/thread/mutex.hpp>

#include <functional>
#include <memory>
#include <string>
#include <vector>

namespace StageHost
{

class VShutdownManager : public StageCorePluginInterface::IShutdownManager
{
public:
  ~VShutdownManager() override { Shutdown(); }

  void AddShutdownObject( std::unique_ptr<KVZ::Detail::IShutdownObject> i_pObject ) override;
  // Destroys the objects, the last one first, on the calling thread.
  void Shutdown();

private:
  boost::mutex m_Mutex;
  std::vector<std::unique_ptr<KVZ::Detail::IShutdownObject>> m_Objects GUARDED_BY( m_Mutex );
};

class VParameterRegistry : public StageCorePluginInterface::IParameterRegistry
{
public:
  using VArrival = std::function<void( const IParameterGroup& )>;

  VParameterRegistry() = default;
  // The function sees each group before it is in the list, on the thread that adds it.
  explicit VParameterRegistry( VArrival i_Arrival ) : m_Arrival( std::move( i_Arrival ) ) {}

  void AddParameterGroup( std::shared_ptr<IParameterGroup> i_pGroup ) override;
  void RemoveParameterGroup( const std::shared_ptr<IParameterGroup>& i_pGroup ) override;

  // In the order of arrival.
  std::vector<std::shared_ptr<IParameterGroup>> GetGroups() const;
  void Clear();

private:
  const VArrival m_Arrival;   // may be empty
  mutable boost::mutex m_Mutex;
  std::vector<std::shared_ptr<IParameterGroup>> m_Groups GUARDED_BY( m_Mutex );
};

class VFlowNodeRegistry : public StageCorePluginInterface::IFlowNodeRegistry
{
public:
  void RegisterFactory( std::shared_ptr<StageCorePluginInterface::IFlowNodeFactory> i_pFactory ) override { AddFactory( std::move( i_pFactory ) ); }
  void AddFactory( std::shared_ptr<StageCorePluginInterface::IFlowNodeFactory> i_pFactory ) override;
  // Of the nodes with this name, the newest; an empty pointer where there is none.
  std::shared_ptr<StageCorePluginInterface::IFlowNodeFactory> Find( const std::string& i_rNodeName ) const;
  size_t Count() const;
  void Clear();

private:
  mutable boost::mutex m_Mutex;
  std::vector<std::shared_ptr<StageCorePluginInterface::IFlowNodeFactory>> m_Factories GUARDED_BY( m_Mutex );
};

// Fires each callback once: at Fire, or at once when it is added after that.
class VHardwareStartEvent : public StageCorePluginInterface::IHardwareStartEvent
{
public:
  void Add( std::function<void()> i_Callback, std::shared_ptr<KVZ::IPostalService> i_pService ) override;
  void Fire();

private:
  boost::mutex m_Mutex;
  NotificationSystem::VMultiCallbackPostal<void()> m_Callbacks;
  bool m_bFired GUARDED_BY( m_Mutex ) = false;
};

class VHardwareRegistry : public StageCorePluginInterface::IHardwareRegistry
{
public:
  void RegisterManager( std::shared_ptr<StageCorePluginInterface::IHardwareManager> i_pManager ) override;
  void UnregisterManager( const std::shared_ptr<StageCorePluginInterface::IHardwareManager>& i_pManager ) override;
  // Sections and commands are for a window, and this host has none.
  void SetSectionRoot( const std::string&, const VDataPath& ) override {}
  void AddSection( const std::string&, VSectionPredicate, int ) override {}
  void AddCommand( const std::string&, const std::vector<std::string>&, const std::string&, const std::string& ) override {}

  void ReleaseManagers();

private:
  boost::mutex m_Mutex;
  std::vector<std::shared_ptr<StageCorePluginInterface::IHardwareManager>> m_Managers GUARDED_BY( m_Mutex );
};

class VHardwareHost : public StageCorePluginInterface::IHardwareHost
{
public:
  explicit VHardwareHost( std::shared_ptr<VHardwareRegistry> i_pRegistry ) : m_pRegistry( std::move( i_pRegistry ) ) {}
  std::shared_ptr<StageCorePluginInterface::IHardwareRegistry> GetHardwareRegistry() override { return m_pRegistry; }

private:
  const std::shared_ptr<VHardwareRegistry> m_pRegistry;
};

// A service that only has a name: what the host offers where its own plug-ins would find more.
class VNamedService : public StageCorePluginInterface::IServiceObject
{
public:
  explicit VNamedService( std::string i_Name ) : m_Name( std::move( i_Name ) ) {}
  std::string GetServiceName() const override { return m_Name; }
  void Release() override {}

private:
  const std::string m_Name;
};

}
