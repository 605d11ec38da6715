#include "HardwareSupport/VideoInput/VideoInputDeviceBlackmagic/BlackmagicDeckLinkDriver.h"

#include "HardwareSupport/VideoInput/VideoInputDeviceBlackmagic/BlackmagicDeckLinkDevice.h"
#include "HardwareSupport/VideoInput/VideoInputDeviceBlackmagic/ComPointer.h"
#include "NotificationSystem/AsioPostalService.h"
#include "StageCoreRuntime/ThreadAnnotations.h"

#include <boost/thread/lock_guard.hpp>
#include <boost/thread/mutex.hpp>

#include <atomic>
#include <map>

namespace VideoInputHAL
{

using namespace DeckLinkAPI;

// What the vendor notifies, on threads of its own. The map has a lock, which is never held while the vendor or a device is called.
class VBlackmagicDeckLinkDriver::VImpl final : public IDeckLinkDeviceNotificationCallback
{
public:
  explicit VImpl( IDeckLinkDiscovery* i_pDiscovery )
    : m_pPostalService( std::make_shared<NotificationSystem::VAsioPostalService>( "VBlackmagicDeckLinkDriver" ) ),
      m_DeviceArrived( m_pPostalService ),
      m_pDiscovery( TakeReference( i_pDiscovery ) )
  {
  }
  VImpl( const VImpl& ) = delete;
  VImpl& operator=( const VImpl& ) = delete;

  HRESULT QueryInterface( REFIID i_Id, void** o_ppObject ) override;
  ULONG AddRef() override;
  ULONG Release() override;
  HRESULT DeckLinkDeviceArrived( IDeckLink* i_pCard ) override;
  HRESULT DeckLinkDeviceRemoved( IDeckLink* i_pCard ) override;

  void StartDiscovery();
  void Close();

  const std::shared_ptr<NotificationSystem::VAsioPostalService> m_pPostalService;
  NotificationSystem::VMultiCallbackPostal<void( std::shared_ptr<IVideoInputDevice> )> m_DeviceArrived;
  std::weak_ptr<VBlackmagicDeckLinkDriver> m_pDriver;   // set before discovery starts

private:
  using VDeviceMap = std::map<VComPointer<IDeckLink>, std::shared_ptr<VBlackmagicDeckLinkDevice>>;

  ~VImpl() override = default;   // Release

  VComPointer<IDeckLinkDiscovery> m_pDiscovery;   // null without the vendor's library
  std::atomic<ULONG> m_References{ 1 };
  std::atomic<int32_t> m_NextCard{ 1 };
  boost::mutex m_Mutex;
  VDeviceMap m_Devices GUARDED_BY( m_Mutex );
};

HRESULT VBlackmagicDeckLinkDriver::VImpl::QueryInterface( REFIID i_Id, void** o_ppObject )
{
  if( !o_ppObject )
  {
    return E_POINTER;
  }
  if( !( i_Id == IID_IUnknown ) && !( i_Id == IID_IDeckLinkDeviceNotificationCallback ) )
  {
    *o_ppObject = nullptr;
    return E_NOINTERFACE;
  }
  AddRef();
  *o_ppObject = static_cast<IDeckLinkDeviceNotificationCallback*>( this );
  return S_OK;
}

ULONG VBlackmagicDeckLinkDriver::VImpl::AddRef() { return ++m_References; }

ULONG VBlackmagicDeckLinkDriver::VImpl::Release()
{
  const ULONG References = --m_References;
  if( References == 0 )
  {
    delete this;
  }
  return References;
}

void VBlackmagicDeckLinkDriver::VImpl::StartDiscovery()
{
  if( m_pDiscovery )
  {
    m_pDiscovery->InstallDeviceNotifications( this );
  }
}

HRESULT VBlackmagicDeckLinkDriver::VImpl::DeckLinkDeviceArrived( IDeckLink* i_pCard )
{
  const VComPointer<VImpl> pSelf( this );
  const auto pDriver = m_pDriver.lock();
  if( !pDriver )
  {
    return S_OK;
  }
  const VComPointer<IDeckLink> pCard( i_pCard );
  const auto pDevice = KVZ::MakeShared<VBlackmagicDeckLinkDevice>( i_pCard, m_NextCard++, m_pPostalService );
  if( !pDevice->Initialise().Succeeded() )
  {
    return S_OK;
  }
  {
    boost::lock_guard<boost::mutex> Lock( m_Mutex );
    m_Devices.emplace( pCard, pDevice );
  }
  m_DeviceArrived( pDevice );
  return S_OK;
}

// The device stays with whoever else has it.
HRESULT VBlackmagicDeckLinkDriver::VImpl::DeckLinkDeviceRemoved( IDeckLink* i_pCard )
{
  const VComPointer<VImpl> pSelf( this );
  VDeviceMap::node_type Removed;   // ends without the lock
  boost::lock_guard<boost::mutex> Lock( m_Mutex );
  Removed = m_Devices.extract( VComPointer<IDeckLink>( i_pCard ) );
  return S_OK;
}

void VBlackmagicDeckLinkDriver::VImpl::Close()
{
  if( m_pDiscovery )
  {
    m_pDiscovery->UninstallDeviceNotifications();
    m_pDiscovery.reset();
  }
  VDeviceMap Devices;
  {
    boost::lock_guard<boost::mutex> Lock( m_Mutex );
    Devices.swap( m_Devices );
  }
  for( const auto& [pCard, pDevice] : Devices )
  {
    pDevice->Close();
  }
}

VBlackmagicDeckLinkDriver::VBlackmagicDeckLinkDriver( const VDiscoveryMaker& i_rMaker ) : m_pImpl( TakeReference( new VImpl( i_rMaker() ) ) ) {}

VBlackmagicDeckLinkDriver::~VBlackmagicDeckLinkDriver() { m_pImpl->Close(); }

void VBlackmagicDeckLinkDriver::PostConstruct() { m_pImpl->m_pDriver = KVZ::WeakFrom( this ); }

IVideoInputDriver::VDeviceCallback& VBlackmagicDeckLinkDriver::GetDeviceArrivedCallback() { return m_pImpl->m_DeviceArrived; }

void VBlackmagicDeckLinkDriver::StartDiscovery() { m_pImpl->StartDiscovery(); }

}
