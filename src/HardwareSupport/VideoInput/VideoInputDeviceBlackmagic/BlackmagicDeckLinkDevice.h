// One DeckLink capture card. It streams from the moment it is found, capturing or not, so that signal and format are always known.
//
// Any thread may call, but neither OnVideoInputData nor a listener that is called on the publisher's thread may call the device: both run
// with the device's lock held. A listener that is added without a postal service of its own is called on the driver's.
#pragma once

#include "HardwareSupport/VideoInput/VideoInputHAL/CaptureDevice.h"
#include "VendorInterfaces/DeckLinkAPI.h"

#include <boost/smart_ptr/intrusive_ptr.hpp>

#include <cstdint>
#include <memory>
#include <set>
#include <string>

namespace VideoInputHAL
{

class VBlackmagicDeckLinkDevice : public VCaptureDevice
{
public:
  VBlackmagicDeckLinkDevice( DeckLinkAPI::IDeckLink* i_pCard, int32_t i_CardNumber, const std::shared_ptr<KVZ::IPostalService>& i_pPostalService );
  // Closes.
  ~VBlackmagicDeckLinkDevice() override;

  // Once, before anything else: asks the card for its modes and starts the streams. A device that fails here is of no use.
  VDeviceResult Initialise();
  // Ends the streams and lets the card go. No frame is delivered and nothing fires after this; StartCapture finds no mode any more.
  void Close();

  std::string GetManufacturerName() const override;
  std::string GetDriverName() const override;
  KVZ::IVideoStandard::Enum GetVideoStandard() const override;
  KVZ::IPixelFormat::Enum GetPixelFormat() const override;
  // With a signal, what was detected in it; without, all that the card can carry.
  void GetSupportedPixelFormats( std::set<KVZ::IPixelFormat::Enum>& o_rFormats ) const override;
  void GetSupportedTimecodeSources( std::set<KVZ::ITimecodeSource::Enum>& o_rSources ) const override;
  void GetSupportedAudioSampleFormats( std::set<KVZ::IAudioSampleFormat::Enum>& o_rFormats ) const override;
  void GetSupportedAudioChannelCounts( std::set<uint32_t>& o_rCounts ) const override;
  // A failure may leave the streams stopped until the format changes or capture is started again.
  VDeviceResult StartCapture( KVZ::IPixelFormat::Enum i_PixelFormat, KVZ::ITimecodeSource::Enum i_TimecodeSource,
    KVZ::IAudioSampleFormat::Enum i_AudioFormat, uint32_t i_AudioChannels ) override;
  // The card goes on streaming.
  bool StopCapture() override;
  EStatus::Enum GetStatus() const override;

private:
  class VImpl;

  explicit VBlackmagicDeckLinkDevice( boost::intrusive_ptr<VImpl> i_pImpl );

  const boost::intrusive_ptr<VImpl> m_pImpl;   // the vendor holds it too, until its last callback has returned
};

}
