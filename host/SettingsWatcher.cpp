#include "host/SettingsWatcher.h"

#include "NotificationSystem/WeakBinder.h"
#include "StageCoreParameters/ParameterGroup.h"

#include <boost/thread/lock_guard.hpp>

#include <algorithm>

namespace StageHost
{

// Filled on the threads that write.
class VSettingsWatcher::VHeard
{
public:
  void Add( const IParameter& i_rParameter )
  {
    KVZ::Variant Value;
    i_rParameter.GetValue( Value );
    boost::lock_guard<boost::mutex> Lock( m_Mutex );
    m_Changes.push_back( { i_rParameter.GetHandle().Path().ToString(), Value.ToText() } );
  }

  std::vector<VSettingChange> Take()
  {
    std::vector<VSettingChange> Changes;
    boost::lock_guard<boost::mutex> Lock( m_Mutex );
    Changes.swap( m_Changes );
    return Changes;
  }

private:
  boost::mutex m_Mutex;
  std::vector<VSettingChange> m_Changes GUARDED_BY( m_Mutex );
};

VSettingsWatcher::VSettingsWatcher( const VParameterRegistry& i_rRegistry, const std::string& i_rPath )
  : m_rRegistry( i_rRegistry ), m_Branch( VDataPath::FromString( i_rPath ) ), m_pHeard( std::make_shared<VHeard>() )
{
  WatchNew();
}

std::vector<VSettingChange> VSettingsWatcher::Take()
{
  WatchNew();
  return m_pHeard->Take();
}

void VSettingsWatcher::WatchNew()
{
  for( const std::shared_ptr<IParameterGroup>& pGroup : m_rRegistry.GetGroups() )
  {
    const auto IsThis = [&]( const std::weak_ptr<IParameterGroup>& i_rGroup ) { return i_rGroup.lock() == pGroup; };
    if( std::any_of( m_Groups.begin(), m_Groups.end(), IsThis ) )
    {
      continue;
    }
    m_Groups.push_back( pGroup );
    for( const std::shared_ptr<IParameter>& pParameter : pGroup->GetParameters() )
    {
      if( pParameter->GetHandle().Path().BeginsWith( m_Branch ) )
      {
        Watch( pParameter );
      }
    }
  }
}

void VSettingsWatcher::Watch( const std::shared_ptr<IParameter>& i_pParameter )
{
  ++m_Count;
  i_pParameter->GetValueChangedCallback().AddImmediate( NotificationSystem::BindWeak( m_pHeard,
    [pWeak = std::weak_ptr<IParameter>( i_pParameter )]( VHeard& i_rHeard )
    {
      if( const auto pChanged = pWeak.lock() )
      {
        i_rHeard.Add( *pChanged );
      }
    } ) );
}

}
