// Finds the inputs of Bluefish444 cards. Without the vendor's runtime library there are none, and that is no failure.
#pragma once

#include "HardwareSupport/VideoInput/VideoInputHAL/VideoInputDevice.h"
#include "StageCoreRuntime/Shared.h"
#include "VendorInterfaces/BlueVelvetLoader.h"

#include <functional>
#include <memory>

namespace VideoInputHAL
{

// Devices are announced from StartDiscovery. Listeners that bring no postal service of their own, those of its devices too, are called on one of the
// driver's. The driver keeps its devices and closes them when it ends. Cards that come later are not looked for: the vendor's library tells of none.
class VBluefish444Driver : public KVZ::VShared, public IVideoInputDriver
{
public:
  // Null without the library.
  using VFunctionsMaker = std::function<const BlueVelvet::VFlatFunctions*()>;

  explicit VBluefish444Driver( VFunctionsMaker i_Maker = &BlueVelvet::RuntimeFunctions );
  ~VBluefish444Driver() override;

  VDeviceCallback& GetDeviceArrivedCallback() override;
  // The first call counts.
  void StartDiscovery() override;

private:
  class VImpl;
  const std::unique_ptr<VImpl> m_pImpl;
};

}
