// Finds DeckLink cards. Without the vendor's runtime library there are none, and that is no failure.
#pragma once

#include "HardwareSupport/VideoInput/VideoInputHAL/VideoInputDevice.h"
#include "StageCoreRuntime/Shared.h"
#include "VendorInterfaces/DeckLinkLoader.h"

#include <boost/smart_ptr/intrusive_ptr.hpp>

#include <functional>

namespace VideoInputHAL
{

// Devices are announced on a thread of the vendor's. Listeners that bring no postal service of their own, those of its devices too, are called on one
// of the driver's. The driver keeps each device as long as its card is there, and closes those that it still has when it ends.
class VBlackmagicDeckLinkDriver : public KVZ::VShared, public IVideoInputDriver
{
public:
  // Gives an object with one reference for the caller, or null.
  using VDiscoveryMaker = std::function<DeckLinkAPI::IDeckLinkDiscovery*()>;

  explicit VBlackmagicDeckLinkDriver( const VDiscoveryMaker& i_rMaker = &DeckLinkAPI::CreateDiscovery );
  ~VBlackmagicDeckLinkDriver() override;

  void PostConstruct() override;

  VDeviceCallback& GetDeviceArrivedCallback() override;
  void StartDiscovery() override;

private:
  class VImpl;
  const boost::intrusive_ptr<VImpl> m_pImpl;   // the vendor holds it too, until its last notification has returned
};

}
