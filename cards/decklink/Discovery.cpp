#include "cards/decklink/Discovery.h"

#include "cards/decklink/DeckLinkObject.h"
#include "cards/decklink/Registry.h"

#include <boost/thread/lock_guard.hpp>
#include <boost/thread/lock_types.hpp>

namespace VirtualCards
{

using namespace DeckLinkAPI;

VNotifier::VNotifier( IDeckLinkDeviceNotificationCallback* i_pCallback ) : m_Callback( i_pCallback ) {}

VNotifier::~VNotifier() { DropAll(); }

void VNotifier::Post( VDeckLinkObject& i_rCard, bool i_bArrived )
{
  const boost::lock_guard<boost::mutex> Lock( m_Mutex );
  if( !m_bClosed )
  {
    i_rCard.AddRef();
    m_Notices.push_back( { &i_rCard, i_bArrived } );
  }
}

bool VNotifier::BeginNext( VNotice& o_rNotice )
{
  const boost::lock_guard<boost::mutex> Lock( m_Mutex );
  if( m_Notices.empty() || m_bClosed )
  {
    m_bDelivering = false;
    return false;
  }
  o_rNotice = m_Notices.front();
  m_Notices.pop_front();
  return true;
}

void VNotifier::Deliver()
{
  {
    const boost::lock_guard<boost::mutex> Lock( m_Mutex );
    if( m_bDelivering )
    {
      return;
    }
    m_bDelivering = true;
    m_Deliverer = boost::this_thread::get_id();
  }
  for( VNotice Notice{}; BeginNext( Notice ); )
  {
    if( Notice.m_bArrived )
    {
      m_Callback->DeckLinkDeviceArrived( Notice.m_pCard );
    }
    else
    {
      m_Callback->DeckLinkDeviceRemoved( Notice.m_pCard );
    }
    Notice.m_pCard->Release();
  }
  m_Idle.notify_all();
}

void VNotifier::Close() NO_LOCK_ANALYSIS
{
  {
    boost::unique_lock<boost::mutex> Lock( m_Mutex );
    m_bClosed = true;
    const auto IsOver = [this]() NO_LOCK_ANALYSIS { return !m_bDelivering || m_Deliverer == boost::this_thread::get_id(); };
    m_Idle.wait( Lock, IsOver );
  }
  DropAll();
}

void VNotifier::DropAll()
{
  std::deque<VNotice> Notices;
  {
    const boost::lock_guard<boost::mutex> Lock( m_Mutex );
    Notices.swap( m_Notices );
  }
  for( const VNotice& rNotice : Notices )
  {
    rNotice.m_pCard->Release();
  }
}

HRESULT VDiscovery::InstallDeviceNotifications( IDeckLinkDeviceNotificationCallback* i_pCallback )
{
  if( !i_pCallback )
  {
    return E_INVALIDARG;
  }
  std::shared_ptr<VNotifier> pNotifier;
  {
    const boost::lock_guard<boost::mutex> Lock( m_Mutex );
    if( m_pNotifier )
    {
      return E_ACCESSDENIED;
    }
    pNotifier = m_pNotifier = std::make_shared<VNotifier>( i_pCallback );
  }
  VRegistry::Instance().Subscribe( pNotifier );
  return S_OK;
}

HRESULT VDiscovery::UninstallDeviceNotifications()
{
  std::shared_ptr<VNotifier> pNotifier;
  {
    const boost::lock_guard<boost::mutex> Lock( m_Mutex );
    pNotifier.swap( m_pNotifier );
  }
  if( !pNotifier )
  {
    return S_FALSE;
  }
  VRegistry::Instance().Unsubscribe( *pNotifier );
  pNotifier->Close();
  return S_OK;
}

VDiscovery::~VDiscovery() { UninstallDeviceNotifications(); }

}
