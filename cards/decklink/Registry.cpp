#include "cards/decklink/Registry.h"

#include "cards/decklink/VirtualDeckLink.h"

#include <boost/thread/lock_guard.hpp>

#include <algorithm>

namespace VirtualCards
{

VRegistry& VRegistry::Instance()
{
  static VRegistry* const s_pInstance = new VRegistry;
  return *s_pInstance;
}

VCardId VRegistry::AddCard( const char* i_pText, const VCardOptions& i_rOptions, std::string& o_rError )
{
  VCardId Id = 0;
  {
    const boost::lock_guard<boost::mutex> Lock( m_Mutex );
    Id = ++m_LastId;
  }
  const std::shared_ptr<VVirtualDeckLink> pCard = VVirtualDeckLink::Make( Id, i_pText, i_rOptions, o_rError );
  if( !pCard )
  {
    return 0;
  }
  {
    const boost::lock_guard<boost::mutex> Lock( m_Mutex );
    m_Cards[Id] = pCard;
  }
  pCard->Begin();
  return Id;
}

bool VRegistry::RemoveCard( VCardId i_Card )
{
  const std::shared_ptr<VVirtualDeckLink> pCard = Find( i_Card );
  if( !pCard || pCard->Runner().IsCardThread() )
  {
    return false;
  }
  {
    const boost::lock_guard<boost::mutex> Lock( m_Mutex );
    if( m_Cards.erase( i_Card ) == 0 )
    {
      return false;
    }
  }
  pCard->End();
  return true;
}

bool VRegistry::Step( VCardId i_Card, uint64_t i_Frames )
{
  const std::shared_ptr<VVirtualDeckLink> pCard = Find( i_Card );
  return pCard && pCard->Runner().Step( i_Frames );
}

bool VRegistry::RunEvent( VCardId i_Card, const char* i_pEvent, std::string& o_rError )
{
  const std::shared_ptr<VVirtualDeckLink> pCard = Find( i_Card );
  o_rError = pCard ? std::string() : "no card has the number " + std::to_string( i_Card );
  return pCard && pCard->RunEvent( i_pEvent, o_rError );
}

bool VRegistry::SetBusy( VCardId i_Card, bool i_bBusy )
{
  const std::shared_ptr<VVirtualDeckLink> pCard = Find( i_Card );
  if( pCard )
  {
    pCard->SetBusy( i_bBusy );
  }
  return pCard != nullptr;
}

bool VRegistry::GetCounters( VCardId i_Card, VCardCounters& o_rCounters ) const
{
  const std::shared_ptr<VVirtualDeckLink> pCard = Find( i_Card );
  if( pCard )
  {
    o_rCounters = pCard->Counters();
  }
  return pCard != nullptr;
}

int64_t VRegistry::ReferencesHeld() const { return VirtualCards::ReferencesHeld(); }

int64_t VRegistry::ReleaseErrors() const { return VirtualCards::ReleaseErrors(); }

int32_t VRegistry::CallbacksInFlight() const { return VirtualCards::CallbacksInFlight(); }

void VRegistry::Subscribe( const std::shared_ptr<VNotifier>& i_rNotifier )
{
  {
    const boost::lock_guard<boost::mutex> Lock( m_Mutex );
    m_Notifiers.push_back( i_rNotifier );
    for( VDeckLinkObject* pCard : m_Present )
    {
      i_rNotifier->Post( *pCard, true );
    }
  }
  i_rNotifier->Deliver();
}

void VRegistry::Unsubscribe( const VNotifier& i_rNotifier )
{
  const boost::lock_guard<boost::mutex> Lock( m_Mutex );
  std::erase_if( m_Notifiers, [&]( const std::shared_ptr<VNotifier>& i_rOne ) { return i_rOne.get() == &i_rNotifier; } );
}

void VRegistry::CardArrived( VDeckLinkObject& i_rCard )
{
  std::vector<std::shared_ptr<VNotifier>> Notifiers;
  {
    const boost::lock_guard<boost::mutex> Lock( m_Mutex );
    m_Present.push_back( &i_rCard );
    Notifiers = PostToAllLocked( i_rCard, true );
  }
  for( const std::shared_ptr<VNotifier>& rNotifier : Notifiers )
  {
    rNotifier->Deliver();
  }
}

void VRegistry::CardRemoved( VDeckLinkObject& i_rCard )
{
  std::vector<std::shared_ptr<VNotifier>> Notifiers;
  {
    const boost::lock_guard<boost::mutex> Lock( m_Mutex );
    std::erase( m_Present, &i_rCard );
    Notifiers = PostToAllLocked( i_rCard, false );
  }
  for( const std::shared_ptr<VNotifier>& rNotifier : Notifiers )
  {
    rNotifier->Deliver();
  }
}

std::vector<VDeckLinkObject*> VRegistry::PresentCards()
{
  const boost::lock_guard<boost::mutex> Lock( m_Mutex );
  for( VDeckLinkObject* pCard : m_Present )
  {
    pCard->AddRef();
  }
  return m_Present;
}

std::shared_ptr<VVirtualDeckLink> VRegistry::Find( VCardId i_Card ) const
{
  const boost::lock_guard<boost::mutex> Lock( m_Mutex );
  const auto Found = m_Cards.find( i_Card );
  return Found != m_Cards.end() ? Found->second : nullptr;
}

std::vector<std::shared_ptr<VNotifier>> VRegistry::PostToAllLocked( VDeckLinkObject& i_rCard, bool i_bArrived )
{
  for( const std::shared_ptr<VNotifier>& rNotifier : m_Notifiers )
  {
    rNotifier->Post( i_rCard, i_bArrived );
  }
  return m_Notifiers;
}

}
