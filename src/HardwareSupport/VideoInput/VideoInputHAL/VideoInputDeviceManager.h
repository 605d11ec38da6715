// Owns the drivers and the list of devices, and announces each new device.
#pragma once

#include "HardwareSupport/VideoInput/VideoInputHAL/VideoInputDevice.h"
#include "NotificationSystem/MultiCallback.h"
#include "StageCoreRuntime/Shared.h"
#include "StageCoreRuntime/ThreadAnnotations.h"

#include <boost/thread/mutex.hpp>

#include <cstdint>
#include <memory>
#include <string>
#include <vector>

namespace NotificationSystem
{
class VAsioPostalService;
}

namespace VideoInputHAL
{

// Made through MakeShared. Indices are never reused while the manager lives: a device that goes away keeps its place.
// Any thread may call. Drivers announce from StartDiscovery or on a vendor's thread, so the two lists have a lock, which is never held while a
// listener, a driver or a device is called.
class VVideoInputDeviceManager : public KVZ::VShared
{
public:
  using VDeviceCallback = KVZ::IMultiCallbackPostal<void( std::shared_ptr<IVideoInputDevice> )>;

  // Drivers are made in the order of the list once the shared owner exists.
  explicit VVideoInputDeviceManager( std::vector<VDriverMaker> i_DriverMakers );
  ~VVideoInputDeviceManager() override;

  void PostConstruct() override;

  // On every driver, in list order.
  void StartDiscovery();
  // Listeners are called on the postal service's thread; one that comes late gets no replay and asks GetDevices.
  VDeviceCallback& GetDeviceAddedCallback();
  // Appends every device in index order.
  void GetDevices( std::vector<std::shared_ptr<IVideoInputDevice>>& io_rDevices ) const;
  // A null pointer and a line in the log for an index beyond the list; a null pointer alone after Shutdown.
  std::shared_ptr<IVideoInputDevice> GetDevice( uint32_t i_Index ) const;
  // The empty string and a line in the log for an index beyond the list.
  std::string GetDeviceURN( uint32_t i_Index ) const;
  // No device is announced and no driver kept after this.
  void Shutdown();

private:
  // The device is announced before it joins the list.
  void OnDeviceArrived( std::shared_ptr<IVideoInputDevice> i_pDevice );
  std::vector<std::shared_ptr<IVideoInputDriver>> CopyDrivers() const;

  std::vector<VDriverMaker> m_DriverMakers;   // until PostConstruct
  boost::mutex m_ArrivalMutex;                // one arrival at a time; taken before m_Mutex
  mutable boost::mutex m_Mutex;
  std::vector<std::shared_ptr<IVideoInputDriver>> m_Drivers GUARDED_BY( m_Mutex );
  std::vector<std::shared_ptr<IVideoInputDevice>> m_Devices GUARDED_BY( m_Mutex );   // a device's position is its index
  bool m_bShutDown GUARDED_BY( m_Mutex ) = false;
  std::shared_ptr<NotificationSystem::VAsioPostalService> m_pPostalService;
  NotificationSystem::VMultiCallbackPostal<void( std::shared_ptr<IVideoInputDevice> )> m_DeviceAdded;
};

}
