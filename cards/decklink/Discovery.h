// Tells clients of cards that come and go.
#pragma once

#include "StageCoreRuntime/ThreadAnnotations.h"
#include "VendorInterfaces/DeckLinkAPI.h"
#include "cards/decklink/Held.h"
#include "cards/decklink/References.h"

#include <boost/thread/condition_variable.hpp>
#include <boost/thread/mutex.hpp>
#include <boost/thread/thread.hpp>

#include <deque>
#include <memory>

namespace VirtualCards
{

class VDeckLinkObject;

// One client's notifications, in order and one at a time. Whoever has something to tell delivers it on its own thread, unless another
// thread is at it already: then that one goes on with it.
class VNotifier
{
public:
  explicit VNotifier( DeckLinkAPI::IDeckLinkDeviceNotificationCallback* i_pCallback );
  ~VNotifier();

  // Any lock may be held: nothing is called.
  void Post( VDeckLinkObject& i_rCard, bool i_bArrived );
  void Deliver();
  // No notification begins after this; one that runs on another thread is waited for.
  void Close();

private:
  struct VNotice
  {
    VDeckLinkObject* m_pCard;   // with a reference
    bool m_bArrived;
  };
  bool BeginNext( VNotice& o_rNotice );
  void DropAll();

  VHeld<DeckLinkAPI::IDeckLinkDeviceNotificationCallback> m_Callback;

  boost::mutex m_Mutex;
  boost::condition_variable m_Idle;
  std::deque<VNotice> m_Notices GUARDED_BY( m_Mutex );
  bool m_bClosed GUARDED_BY( m_Mutex ) = false;
  bool m_bDelivering GUARDED_BY( m_Mutex ) = false;
  boost::thread::id m_Deliverer GUARDED_BY( m_Mutex );
};

class VDiscovery final : public VHeapObject<DeckLinkAPI::IDeckLinkDiscovery, DeckLinkAPI::IID_IDeckLinkDiscovery>
{
public:
  // Cards that are there already are reported before this returns. E_ACCESSDENIED if a callback is installed.
  DeckLinkAPI::HRESULT InstallDeviceNotifications( DeckLinkAPI::IDeckLinkDeviceNotificationCallback* i_pCallback ) override;
  DeckLinkAPI::HRESULT UninstallDeviceNotifications() override;

private:
  ~VDiscovery() override;

  boost::mutex m_Mutex;
  std::shared_ptr<VNotifier> m_pNotifier GUARDED_BY( m_Mutex );
};

}
