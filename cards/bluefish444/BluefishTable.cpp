#include "cards/bluefish444/BluefishTable.h"

#include <boost/thread/lock_guard.hpp>

namespace VirtualCards
{

using BlueVelvet::VHandle;

VBluefishTable& VBluefishTable::Instance()
{
  static VBluefishTable* const s_pInstance = new VBluefishTable;
  return *s_pInstance;
}

std::shared_ptr<IVirtualCard> VBluefishTable::MakeCard( VCardId i_Id, const char* i_pText, const VCardOptions& i_rOptions, std::string& o_rError )
{
  return VVirtualBluefish::Make( i_Id, i_pText, i_rOptions, o_rError );
}

int64_t VBluefishTable::ReferencesHeld() const
{
  const boost::lock_guard<boost::mutex> Lock( m_Mutex );
  return static_cast<int64_t>( m_Objects.size() );
}

int64_t VBluefishTable::ReleaseErrors() const
{
  const boost::lock_guard<boost::mutex> Lock( m_Mutex );
  return m_ReleaseErrors;
}

VHandle VBluefishTable::MakeObject()
{
  const boost::lock_guard<boost::mutex> Lock( m_Mutex );
  const VHandle Handle = reinterpret_cast<VHandle>( ++m_LastHandle );
  m_Objects[Handle];
  return Handle;
}

void VBluefishTable::DestroyObject( VHandle i_Handle )
{
  const bool bAttached = Detach( i_Handle );
  const boost::lock_guard<boost::mutex> Lock( m_Mutex );
  m_ReleaseErrors += m_Objects.erase( i_Handle ) == 0 || bAttached ? 1 : 0;   // an object is to be detached first
}

std::optional<VCardObject> VBluefishTable::Find( VHandle i_Handle ) const
{
  const boost::lock_guard<boost::mutex> Lock( m_Mutex );
  const auto Found = m_Objects.find( i_Handle );
  return Found != m_Objects.end() ? std::optional( Found->second ) : std::nullopt;
}

bool VBluefishTable::Attach( VHandle i_Handle, int i_Device )
{
  const auto Cards = PresentCards();
  if( i_Device < 1 || static_cast<size_t>( i_Device ) > Cards.size() || Cards[static_cast<size_t>( i_Device ) - 1]->IsBusy() )
  {
    return false;
  }
  const boost::lock_guard<boost::mutex> Lock( m_Mutex );
  const auto Found = m_Objects.find( i_Handle );
  if( Found == m_Objects.end() || Found->second.m_pCard )
  {
    return false;
  }
  Found->second.m_pCard = Cards[static_cast<size_t>( i_Device ) - 1];
  return true;
}

bool VBluefishTable::Detach( VHandle i_Handle )
{
  VCardObject Former;
  {
    const boost::lock_guard<boost::mutex> Lock( m_Mutex );
    const auto Found = m_Objects.find( i_Handle );
    if( Found != m_Objects.end() )
    {
      std::swap( Former, Found->second );
    }
  }
  if( VBluefishInput* const pInput = Former.Input() )
  {
    pInput->Leave();
  }
  return Former.m_pCard != nullptr;
}

bool VBluefishTable::SelectInput( VHandle i_Handle, uint32_t i_Input )
{
  const boost::lock_guard<boost::mutex> Lock( m_Mutex );
  const auto Found = m_Objects.find( i_Handle );
  if( Found == m_Objects.end() || !Found->second.m_pCard || !Found->second.m_pCard->Input( i_Input ) )
  {
    return false;
  }
  Found->second.m_Input = i_Input;
  return true;
}

std::vector<std::shared_ptr<VVirtualBluefish>> VBluefishTable::PresentCards() const
{
  std::vector<std::shared_ptr<VVirtualBluefish>> Present;
  for( const std::shared_ptr<IVirtualCard>& rCard : Cards() )
  {
    const auto pCard = std::static_pointer_cast<VVirtualBluefish>( rCard );
    if( pCard->IsPresent() )
    {
      Present.push_back( pCard );
    }
  }
  return Present;
}

}
