#include "Flow2/Flow2Utils/ParameterSet.h"

#include "Flow2/Flow2Utils/FlowException.h"

#include <algorithm>

namespace Flow2Utils
{

VParameterSet::~VParameterSet() = default;

std::map<std::string, VParameterAttributes> VParameterSet::Describe() const
{
  std::map<std::string, VParameterAttributes> Attributes;
  for( const auto& rEntry : m_Parameters )
  {
    rEntry.second->Describe( Attributes[rEntry.first] );
  }
  return Attributes;
}

void VParameterSet::Insert( const std::string& i_rName, std::unique_ptr<VParameter> i_pParameter )
{
  if( !i_pParameter )
  {
    throw VFlowException( "Null pointer in ptr_map_adapter::insert()" );
  }
  i_pParameter->m_pChangeCount = &m_ChangeCount;
  m_Parameters.emplace( i_rName, std::move( i_pParameter ) );
}

uint32_t VParameterSet::SetParameter( const std::string& i_rName, const std::string& i_rText )
{
  const auto Found = m_Parameters.find( i_rName );
  return Found == m_Parameters.end() ? static_cast<uint32_t>( EParameterResult::UnknownName ) : Found->second->SetValue( i_rText );
}

const VParameter* VParameterSet::Find( const std::string& i_rName ) const
{
  const auto Found = m_Parameters.find( i_rName );
  return Found == m_Parameters.end() ? nullptr : Found->second.get();
}

void VParameterSet::SetTarget( const KVZ::VFlowTarget& i_rTarget )
{
  for( const auto& rEntry : m_Parameters )
  {
    rEntry.second->SetTarget( i_rTarget );
  }
}

bool VParameterSet::IsAddressed( const KVZ::VFlowTarget& i_rTarget ) const
{
  return i_rTarget.IsEverybody() ||
    std::any_of( m_Parameters.begin(), m_Parameters.end(), [&i_rTarget]( const auto& i_rEntry ) { return i_rEntry.second->Target() == i_rTarget; } );
}

void VParameterSet::BeginUpdate()
{
  m_CountAtStart = m_ChangeCount;
  for( const auto& rEntry : m_Parameters )
  {
    rEntry.second->m_bTouched = false;
    rEntry.second->m_bChanged = false;
  }
}

uint32_t VParameterSet::EndUpdate()
{
  for( const auto& rEntry : m_Parameters )
  {
    if( !rEntry.second->IsTouched() )
    {
      rEntry.second->Finish();
    }
  }
  return HasChanged() ? EParameterResult::Changed : EParameterResult::Unchanged;
}

bool VParameterSet::Validate( std::string& o_rText ) const
{
  o_rText.clear();
  std::string Reason;
  for( const auto& rEntry : m_Parameters )
  {
    if( !rEntry.second->Validate( Reason ) )
    {
      o_rText += "Parameter " + rEntry.first + ": " + Reason + "\n";
    }
  }
  return o_rText.empty();
}

}
