#include "host/Registries.h"

#include "StageCorePluginInterface/FlowNode.h"

#include <boost/thread/lock_guard.hpp>

#include <algorithm>

using namespace StageCorePluginInterface;

namespace StageHost
{

void VShutdownManager::AddShutdownObject( std::unique_ptr<KVZ::Detail::IShutdownObject> i_pObject )
{
  boost::lock_guard<boost::mutex> Lock( m_Mutex );
  m_Objects.push_back( std::move( i_pObject ) );
}

void VShutdownManager::Shutdown()
{
  std::vector<std::unique_ptr<KVZ::Detail::IShutdownObject>> Objects;
  {
    boost::lock_guard<boost::mutex> Lock( m_Mutex );
    Objects.swap( m_Objects );
  }
  while( !Objects.empty() )
  {
    Objects.pop_back();
  }
}

void VParameterRegistry::AddParameterGroup( std::shared_ptr<IParameterGroup> i_pGroup )
{
  if( m_Arrival )
  {
    m_Arrival( *i_pGroup );
  }
  boost::lock_guard<boost::mutex> Lock( m_Mutex );
  m_Groups.push_back( std::move( i_pGroup ) );
}

// The caller has the group still, so that it does not end under the lock.
void VParameterRegistry::RemoveParameterGroup( const std::shared_ptr<IParameterGroup>& i_pGroup )
{
  boost::lock_guard<boost::mutex> Lock( m_Mutex );
  m_Groups.erase( std::remove( m_Groups.begin(), m_Groups.end(), i_pGroup ), m_Groups.end() );
}

std::vector<std::shared_ptr<IParameterGroup>> VParameterRegistry::GetGroups() const
{
  boost::lock_guard<boost::mutex> Lock( m_Mutex );
  return m_Groups;
}

void VParameterRegistry::Clear()
{
  std::vector<std::shared_ptr<IParameterGroup>> Groups;   // destroyed without the lock
  boost::lock_guard<boost::mutex> Lock( m_Mutex );
  Groups.swap( m_Groups );
}

void VFlowNodeRegistry::AddFactory( std::shared_ptr<IFlowNodeFactory> i_pFactory )
{
  boost::lock_guard<boost::mutex> Lock( m_Mutex );
  m_Factories.push_back( std::move( i_pFactory ) );
}

std::shared_ptr<IFlowNodeFactory> VFlowNodeRegistry::Find( const std::string& i_rNodeName ) const
{
  boost::lock_guard<boost::mutex> Lock( m_Mutex );
  const auto Found = std::find_if( m_Factories.rbegin(), m_Factories.rend(),
    [&i_rNodeName]( const std::shared_ptr<IFlowNodeFactory>& i_pFactory ) { return i_pFactory->NodeInfo().m_Name == i_rNodeName; } );
  return Found == m_Factories.rend() ? nullptr : *Found;
}

size_t VFlowNodeRegistry::Count() const
{
  boost::lock_guard<boost::mutex> Lock( m_Mutex );
  return m_Factories.size();
}

void VFlowNodeRegistry::Clear()
{
  std::vector<std::shared_ptr<IFlowNodeFactory>> Factories;   // destroyed without the lock
  boost::lock_guard<boost::mutex> Lock( m_Mutex );
  Factories.swap( m_Factories );
}

void VHardwareStartEvent::Add( std::function<void()> i_Callback, std::shared_ptr<KVZ::IPostalService> i_pService )
{
  {
    boost::lock_guard<boost::mutex> Lock( m_Mutex );
    if( !m_bFired )
    {
      m_Callbacks.Add( std::move( i_Callback ), std::move( i_pService ) );
      return;
    }
  }
  NotificationSystem::VMultiCallbackPostal<void()> Late;   // a callback that comes too late is treated like the others
  Late.Add( std::move( i_Callback ), std::move( i_pService ) );
  Late();
}

void VHardwareStartEvent::Fire()
{
  {
    boost::lock_guard<boost::mutex> Lock( m_Mutex );
    if( m_bFired )
    {
      return;
    }
    m_bFired = true;
  }
  m_Callbacks();
}

void VHardwareRegistry::RegisterManager( std::shared_ptr<IHardwareManager> i_pManager )
{
  boost::lock_guard<boost::mutex> Lock( m_Mutex );
  m_Managers.push_back( std::move( i_pManager ) );
}

void VHardwareRegistry::UnregisterManager( const std::shared_ptr<IHardwareManager>& i_pManager )
{
  boost::lock_guard<boost::mutex> Lock( m_Mutex );
  m_Managers.erase( std::remove( m_Managers.begin(), m_Managers.end(), i_pManager ), m_Managers.end() );
}

void VHardwareRegistry::ReleaseManagers()
{
  std::vector<std::shared_ptr<IHardwareManager>> Managers;   // destroyed without the lock
  boost::lock_guard<boost::mutex> Lock( m_Mutex );
  Managers.swap( m_Managers );
}

}
