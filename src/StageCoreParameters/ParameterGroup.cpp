#include "StageCoreParameters/ParameterGroup.h"

#include <boost/thread/lock_guard.hpp>

#include <algorithm>

VParameterGroup::VParameterGroup( std::shared_ptr<IDataStore> i_pDataStore, VDataPath i_Path, VDataPath i_AttributePath )
  : m_pDataStore( std::move( i_pDataStore ) ), m_Path( std::move( i_Path ) ), m_AttributePath( std::move( i_AttributePath ) )
{
}

std::shared_ptr<IParameter> VParameterGroup::GetParameter( std::string_view i_Key ) const
{
  boost::lock_guard<boost::mutex> Lock( m_Mutex );
  const auto Found = m_Parameters.find( i_Key );
  return Found == m_Parameters.end() ? nullptr : Found->second;
}

std::shared_ptr<IParameter> VParameterGroup::GetParameter( const VDataPathHandle& i_rHandle ) const
{
  std::shared_ptr<IParameter> pParameter = GetParameter( i_rHandle.Path().Name() );
  return pParameter && pParameter->GetHandle().Path() == i_rHandle.Path() ? pParameter : nullptr;
}

bool VParameterGroup::RemoveParameter( std::string_view i_Key )
{
  std::shared_ptr<IParameter> pRemoved;   // ends without the lock
  boost::lock_guard<boost::mutex> Lock( m_Mutex );
  const auto Found = m_Parameters.find( i_Key );
  if( Found == m_Parameters.end() )
  {
    return false;
  }
  pRemoved = Found->second;
  m_Order.erase( std::find( m_Order.begin(), m_Order.end(), i_Key ) );
  m_Parameters.erase( Found );
  return true;
}

bool VParameterGroup::RemoveParameter( const VDataPathHandle& i_rHandle )
{
  return GetParameter( i_rHandle ) && RemoveParameter( i_rHandle.Path().Name() );
}

bool VParameterGroup::AddParameter( std::shared_ptr<IParameter> i_pParameter )
{
  boost::lock_guard<boost::mutex> Lock( m_Mutex );
  const std::string Key = i_pParameter->GetName();
  if( !m_Parameters.emplace( Key, std::move( i_pParameter ) ).second )
  {
    return false;
  }
  m_Order.push_back( Key );
  return true;
}

std::vector<std::shared_ptr<IParameter>> VParameterGroup::GetParameters() const
{
  boost::lock_guard<boost::mutex> Lock( m_Mutex );
  std::vector<std::shared_ptr<IParameter>> Parameters;
  for( const std::string& rKey : m_Order )
  {
    Parameters.push_back( m_Parameters.find( rKey )->second );
  }
  return Parameters;
}
