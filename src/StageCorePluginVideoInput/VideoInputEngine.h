// The life of the plug-in: one notification thread, the devices that appear, and for each of them a data source and a parameter handler
// that stay until the engine ends. The engine owns no frame path: frames go from the device to its data source.
#pragma once

#include "StageCorePluginInterface/Plugin.h"

#include <memory>
#include <string>

namespace KVZ
{
class IFlowNodeFactory;
}

namespace StageCorePluginInterface
{
class IStageCoreHost;
}

class VVideoInputEngine : public StageCorePluginInterface::IHardwareManager
{
public:
  // Builds everything and hands the shutdown objects to the host, the engine's own last. The host object must outlive the engine.
  explicit VVideoInputEngine( StageCorePluginInterface::IStageCoreHost& i_rHost );
  // Waits until the engine's thread has run all that was posted and has ended.
  ~VVideoInputEngine() override;

  void OnSystemStarted() override {}
  void OnSystemStopping() override {}
  void OnSettingsLoaded() override {}

  // Subscribes to device arrival and to the host's start of hardware. Nothing looks for hardware before the host fires that event.
  void Start();

  // A new factory of the node "VideoInputDataSource", over the sources of all devices, also of those that come later.
  std::shared_ptr<KVZ::IFlowNodeFactory> GetFlowNodeFactory() const;

  // Capture of one device from its card. False for an unknown URN, which is not reported, and where the device refuses. Not while devices
  // are arriving: the table of devices changes on the engine's thread and has no lock.
  bool StartCapture( const std::string& i_rDeviceURN );
  bool StopCapture( const std::string& i_rDeviceURN );

private:
  class VImpl;
  std::shared_ptr<VImpl> m_pImpl;
};
