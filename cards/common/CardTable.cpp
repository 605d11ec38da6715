#include "cards/common/CardTable.h"

#include <boost/thread/lock_guard.hpp>

namespace VirtualCards
{

VCardId VCardTable::AddCard( const char* i_pText, const VCardOptions& i_rOptions, std::string& o_rError )
{
  VCardId Id = 0;
  {
    const boost::lock_guard<boost::mutex> Lock( m_CardsMutex );
    Id = ++m_LastId;
  }
  const std::shared_ptr<IVirtualCard> pCard = MakeCard( Id, i_pText, i_rOptions, o_rError );
  if( !pCard )
  {
    return 0;
  }
  {
    const boost::lock_guard<boost::mutex> Lock( m_CardsMutex );
    m_Cards[Id] = pCard;
  }
  pCard->Begin();
  return Id;
}

bool VCardTable::RemoveCard( VCardId i_Card )
{
  const std::shared_ptr<IVirtualCard> pCard = Find( i_Card );
  if( !pCard || pCard->IsCardThread() )
  {
    return false;
  }
  {
    const boost::lock_guard<boost::mutex> Lock( m_CardsMutex );
    if( m_Cards.erase( i_Card ) == 0 )
    {
      return false;
    }
  }
  pCard->End();
  return true;
}

bool VCardTable::Step( VCardId i_Card, uint64_t i_Frames )
{
  const std::shared_ptr<IVirtualCard> pCard = Find( i_Card );
  return pCard && pCard->Step( i_Frames );
}

bool VCardTable::RunEvent( VCardId i_Card, const char* i_pEvent, std::string& o_rError )
{
  const std::shared_ptr<IVirtualCard> pCard = Find( i_Card );
  o_rError = pCard ? std::string() : "no card has the number " + std::to_string( i_Card );
  return pCard && pCard->RunEvent( i_pEvent, o_rError );
}

bool VCardTable::SetBusy( VCardId i_Card, bool i_bBusy )
{
  const std::shared_ptr<IVirtualCard> pCard = Find( i_Card );
  if( pCard )
  {
    pCard->SetBusy( i_bBusy );
  }
  return pCard != nullptr;
}

uint32_t VCardTable::CountDevices( VCardId i_Card ) const
{
  const std::shared_ptr<IVirtualCard> pCard = Find( i_Card );
  return pCard ? pCard->CountDevices() : 0;
}

bool VCardTable::GetCounters( VCardId i_Card, VCardCounters& o_rCounters ) const
{
  const std::shared_ptr<IVirtualCard> pCard = Find( i_Card );
  if( pCard )
  {
    o_rCounters = pCard->Counters();
  }
  return pCard != nullptr;
}

std::vector<std::shared_ptr<IVirtualCard>> VCardTable::Cards() const
{
  const boost::lock_guard<boost::mutex> Lock( m_CardsMutex );
  std::vector<std::shared_ptr<IVirtualCard>> Cards;
  for( const auto& rCard : m_Cards )
  {
    Cards.push_back( rCard.second );
  }
  return Cards;
}

std::shared_ptr<IVirtualCard> VCardTable::Find( VCardId i_Card ) const
{
  const boost::lock_guard<boost::mutex> Lock( m_CardsMutex );
  const auto Found = m_Cards.find( i_Card );
  return Found != m_Cards.end() ? Found->second : nullptr;
}

}
