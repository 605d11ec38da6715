#include "cards/decklink/Registry.h"

#include "cards/decklink/VirtualDeckLink.h"

#include <boost/thread/lock_guard.hpp>

namespace VirtualCards
{

VRegistry& VRegistry::Instance()
{
  static VRegistry* const s_pInstance = new VRegistry;
  return *s_pInstance;
}

std::shared_ptr<IVirtualCard> VRegistry::MakeCard( VCardId i_Id, const char* i_pText, const VCardOptions& i_rOptions, std::string& o_rError )
{
  return VVirtualDeckLink::Make( i_Id, i_pText, i_rOptions, o_rError );
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

std::vector<std::shared_ptr<VNotifier>> VRegistry::PostToAllLocked( VDeckLinkObject& i_rCard, bool i_bArrived )
{
  for( const std::shared_ptr<VNotifier>& rNotifier : m_Notifiers )
  {
    rNotifier->Post( i_rCard, i_bArrived );
  }
  return m_Notifiers;
}

}
