#include "HardwareSupport/VideoInput/VideoInputHAL/VideoInputDeviceManager.h"

#include "NotificationSystem/AsioPostalService.h"
#include "NotificationSystem/WeakBinder.h"
#include "StageCoreRuntime/DebugServices.h"
#include "StageCoreRuntime/GlobalLog.h"

#include <boost/thread/lock_guard.hpp>

#include <utility>

namespace VideoInputHAL
{

VVideoInputDeviceManager::VVideoInputDeviceManager( std::vector<VDriverMaker> i_DriverMakers )
  : m_DriverMakers( std::move( i_DriverMakers ) ),
    m_pPostalService( std::make_shared<NotificationSystem::VAsioPostalService>( "VVideoInputDeviceManager" ) ),
    m_DeviceAdded( m_pPostalService )
{
}

VVideoInputDeviceManager::~VVideoInputDeviceManager() = default;

void VVideoInputDeviceManager::PostConstruct()
{
  const std::weak_ptr<VVideoInputDeviceManager> pWeak = std::static_pointer_cast<VVideoInputDeviceManager>( shared_from_this() );
  for( const VDriverMaker& rMaker : m_DriverMakers )
  {
    std::shared_ptr<IVideoInputDriver> pDriver = rMaker();
    if( KVZ_ASSERT( pDriver ) )
    {
      boost::lock_guard<boost::mutex> Lock( m_Mutex );
      m_Drivers.push_back( std::move( pDriver ) );
    }
  }
  m_DriverMakers.clear();
  for( const auto& pDriver : CopyDrivers() )
  {
    // On the announcing thread: a driver that announces while it discovers has its devices in the list before the next driver begins.
    pDriver->GetDeviceArrivedCallback().AddImmediate( NotificationSystem::BindWeak( pWeak, &VVideoInputDeviceManager::OnDeviceArrived ) );
  }
}

void VVideoInputDeviceManager::StartDiscovery()
{
  for( const auto& pDriver : CopyDrivers() )
  {
    if( pDriver )
    {
      pDriver->StartDiscovery();
    }
  }
}

VVideoInputDeviceManager::VDeviceCallback& VVideoInputDeviceManager::GetDeviceAddedCallback() { return m_DeviceAdded; }

void VVideoInputDeviceManager::GetDevices( std::vector<std::shared_ptr<IVideoInputDevice>>& io_rDevices ) const
{
  boost::lock_guard<boost::mutex> Lock( m_Mutex );
  io_rDevices.insert( io_rDevices.end(), m_Devices.begin(), m_Devices.end() );
}

std::shared_ptr<IVideoInputDevice> VVideoInputDeviceManager::GetDevice( uint32_t i_Index ) const
{
  {
    boost::lock_guard<boost::mutex> Lock( m_Mutex );
    if( i_Index < m_Devices.size() )
    {
      return m_Devices[i_Index];
    }
  }
  KVZ_LOG( "VideoInputHAL", 2, "Device identifier not found." );
  return nullptr;
}

std::string VVideoInputDeviceManager::GetDeviceURN( uint32_t i_Index ) const
{
  const auto pDevice = GetDevice( i_Index );
  return pDevice ? pDevice->GetDeviceURN() : std::string();
}

void VVideoInputDeviceManager::Shutdown()
{
  m_DeviceAdded.Clear();
  for( const auto& pDriver : CopyDrivers() )
  {
    if( pDriver )
    {
      pDriver->GetDeviceArrivedCallback().Clear();
    }
  }
  // They end without the lock: the last owner of a driver waits for the driver's thread, which may be in OnDeviceArrived.
  std::vector<std::shared_ptr<IVideoInputDriver>> Drivers;
  std::vector<std::shared_ptr<IVideoInputDevice>> Devices;
  {
    boost::lock_guard<boost::mutex> Lock( m_Mutex );
    m_bShutDown = true;
    Devices.resize( m_Devices.size() );
    Devices.swap( m_Devices );
    Drivers.resize( m_Drivers.size() );
    Drivers.swap( m_Drivers );
  }
  Devices.clear();
  Drivers.clear();
}

void VVideoInputDeviceManager::OnDeviceArrived( std::shared_ptr<IVideoInputDevice> i_pDevice )
{
  // Two drivers may announce at once; the index stays this device's own until the device is in the list.
  boost::lock_guard<boost::mutex> Arrival( m_ArrivalMutex );
  size_t Index = 0;
  {
    boost::lock_guard<boost::mutex> Lock( m_Mutex );
    if( m_bShutDown )
    {
      return;
    }
    Index = m_Devices.size();
  }
  i_pDevice->SetDeviceIndex( static_cast<int32_t>( Index ) );
  m_DeviceAdded( i_pDevice );
  boost::lock_guard<boost::mutex> Lock( m_Mutex );
  m_Devices.push_back( m_bShutDown ? nullptr : std::move( i_pDevice ) );
}

std::vector<std::shared_ptr<IVideoInputDriver>> VVideoInputDeviceManager::CopyDrivers() const
{
  boost::lock_guard<boost::mutex> Lock( m_Mutex );
  return m_Drivers;
}

}
