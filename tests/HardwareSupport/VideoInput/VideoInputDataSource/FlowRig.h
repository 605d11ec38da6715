// A video data source whose device is known to a manager, as flow nodes need it.
#pragma once

#include "HardwareSupport/VideoInput/VideoInputHAL/VideoInputDeviceManager.h"
#include "tests/HardwareSupport/VideoInput/VideoInputDataSource/VideoRig.h"

#include <memory>
#include <utility>
#include <vector>

class VOneDeviceDriver : public VideoInputHAL::IVideoInputDriver
{
public:
  explicit VOneDeviceDriver( std::shared_ptr<VideoInputHAL::IVideoInputDevice> i_pDevice ) : m_pDevice( std::move( i_pDevice ) ) {}
  VDeviceCallback& GetDeviceArrivedCallback() override { return m_Arrived; }
  void StartDiscovery() override { m_Arrived( m_pDevice ); }

private:
  const std::shared_ptr<VideoInputHAL::IVideoInputDevice> m_pDevice;
  NotificationSystem::VMultiCallbackPostal<void( std::shared_ptr<VideoInputHAL::IVideoInputDevice> )> m_Arrived;
};

// A rig whose device is known to a manager.
class VFlowRig : public VVideoRig
{
public:
  using VVideoRig::VVideoRig;

  std::shared_ptr<VTestVideoSource> MakeManaged() { return MakeManaged( m_pDevice ); }
  std::shared_ptr<VTestVideoSource> MakeManaged( const std::shared_ptr<VideoInputHAL::IVideoInputDevice>& i_pDevice )
  {
    std::vector<VideoInputHAL::VDriverMaker> Makers = { [i_pDevice] { return std::make_shared<VOneDeviceDriver>( i_pDevice ); } };
    m_pManager = KVZ::MakeShared<VideoInputHAL::VVideoInputDeviceManager>( std::move( Makers ) );
    m_pManager->StartDiscovery();
    m_pFrames = std::make_shared<VideoInputHAL::VVideoInputDataSourceAllocator>( m_Memory.m_pAllocator );
    VideoInputHAL::VVideoInputDataSourceOptions Options;
    auto pFactory = std::make_shared<KVZ::VVideoWriterFactory>();
    pFactory->Register( KVZ::IVideoContainer::ETVID, [pDisk = m_pDisk]( auto, auto ) { return std::make_shared<VFakeWriter>( pDisk ); } );
    Options.m_pWriterFactory = pFactory;
    Options.m_pPostalService = m_pStrand;
    Options.m_MakeWriterService = [pService = m_pWriterService] { return pService; };
    const auto pSource = KVZ::MakeShared<VTestVideoSource>( m_pManager, i_pDevice, m_pFrames, nullptr, nullptr, m_pTargets, m_pTime, Options );
    m_pSource = pSource;
    return pSource;
  }

  std::shared_ptr<VideoInputHAL::VVideoInputDeviceManager> m_pManager;
};
