// One input channel of a Bluefish444 card. It polls the card on a capture thread of its own from the moment it is made, capturing or not, so
// that the signal is always known. Orders to start and stop wait in a queue for that thread.
//
// Any thread may call. A listener that is added without a postal service of its own is called on the driver's.
#pragma once

#include "HardwareSupport/VideoInput/VideoInputDeviceBluefish444/Bluefish444SDKWrapper.h"
#include "HardwareSupport/VideoInput/VideoInputHAL/CaptureDevice.h"

#include <chrono>
#include <cstdint>
#include <functional>
#include <memory>
#include <set>
#include <string>

namespace VideoInputHAL
{

// What the driver has found out about an input.
struct VBluefish444Input
{
  std::shared_ptr<VBluefish444SDKWrapper> m_pCard;   // attached to this input
  int m_CardType = 0;
  int m_CardNumber = 1;
  uint32_t m_Channel = 2;   // 2 to 5
  int32_t m_DeviceIndex = 0;
};

class VBluefish444Device : public VCaptureDevice
{
public:
  // Passes the time on the capture thread while there is no signal. Empty: the device's own wait, which its end cuts short.
  using VPause = std::function<void( std::chrono::milliseconds )>;

  VBluefish444Device( const VBluefish444Input& i_rInput, const std::shared_ptr<KVZ::IPostalService>& i_pPostalService, VPause i_Pause = {} );
  // Closes.
  ~VBluefish444Device() override;

  // Ends the capture thread, which takes a frame at most, and lets the card go. No frame is delivered and nothing fires after this, unless it is
  // called on the capture thread itself: then what is under way there ends first. Orders are taken and have no effect any more.
  void Close();

  std::string GetManufacturerName() const override;
  std::string GetDriverName() const override;
  KVZ::IVideoStandard::Enum GetVideoStandard() const override;
  // Always "Unspecified": the card delivers whatever is asked for.
  KVZ::IPixelFormat::Enum GetPixelFormat() const override;
  void GetSupportedPixelFormats( std::set<KVZ::IPixelFormat::Enum>& o_rFormats ) const override;
  void GetSupportedTimecodeSources( std::set<KVZ::ITimecodeSource::Enum>& o_rSources ) const override;
  void GetSupportedAudioSampleFormats( std::set<KVZ::IAudioSampleFormat::Enum>& o_rFormats ) const override;
  void GetSupportedAudioChannelCounts( std::set<uint32_t>& o_rCounts ) const override;
  // Cannot fail: what the card does not take is told in the log when the capture thread comes to it.
  VDeviceResult StartCapture( KVZ::IPixelFormat::Enum i_PixelFormat, KVZ::ITimecodeSource::Enum i_TimecodeSource,
    KVZ::IAudioSampleFormat::Enum i_AudioFormat, uint32_t i_AudioChannels ) override;
  bool StopCapture() override;
  // By the order given last, so that an order and the next never miss each other. IsCapturing tells how far the capture thread has come.
  EStatus::Enum GetStatus() const override;

  // The capture thread has taken an order to start, and none to stop since.
  bool IsCapturing() const;

private:
  class VImpl;

  explicit VBluefish444Device( const std::shared_ptr<VImpl>& i_pImpl );

  const std::shared_ptr<VImpl> m_pImpl;   // the capture thread holds it too
};

}
