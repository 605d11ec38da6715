// What "record" stores: the words of the command line, checked against what the containers can hold, and the settings of a device that they
// stand for.
#pragma once

#include "Core/VideoInterface/VideoWriter.h"
#include "host/CaptureTargets.h"
#include "host/DeviceSettings.h"

#include <cstdint>
#include <string>
#include <vector>

namespace CLI
{
class App;
}

struct VFormatOptions
{
  std::string m_Container = "tvid";
  std::string m_Video;   // empty: what the container takes, uncompressed before all else
  std::string m_Audio;   // likewise
  uint32_t m_AudioChannels = 0;
  bool m_bAudioChannels = false;
  std::string m_AudioFormat;
  std::string m_PixelFormat;
  int m_Quality = 0;   // of JPEG; 0 where none was given
  std::string m_BurnIn;
};

void AddFormatOptions( CLI::App& io_rCommand, VFormatOptions& io_rOptions );

// One setting of a device, and the part of the command line that it comes from.
struct VWantedSetting
{
  const char* m_pKey;
  std::string m_Value;
  std::string m_Option;
};

class VRecordFormat
{
public:
  explicit VRecordFormat( const VFormatOptions& i_rOptions );

  // Why this cannot be recorded, whatever the device: one line that names what would be accepted. Empty where nothing is wrong.
  std::string WhyRefused() const;
  // The same for one device.
  std::string WhyRefused( const StageHost::VDeviceInfo& i_rDevice ) const;

  // The container comes first: it says which payloads the device offers.
  VWantedSetting Container() const;
  std::vector<VWantedSetting> Settings( const StageHost::VDeviceInfo& i_rDevice ) const;
  // What a payload's setting offers once the device has this container.
  std::vector<std::string> OfferedVideoPayloads() const;

  // What goes beside the settings.
  void Apply( StageHost::VCaptureTargetOptions& o_rTargets ) const;

private:
  std::string WhyVideoRefused() const;
  std::string WhyPixelFormatRefused() const;
  std::string WhyAudioRefused() const;
  bool IsCaptured( const StageHost::VDeviceInfo& i_rDevice ) const;
  const KVZ::IVideoWriterCapabilities& Capabilities() const;

  const VFormatOptions m_Options;
  const KVZ::IVideoContainer::Enum m_Container;
  const KVZ::IVideoPayload::Enum m_Video;
  const KVZ::IAudioPayload::Enum m_Audio;
};
