// What "record" stores of a device: the words of the command line, and for the others the device's own settings, checked against what the
// containers can hold.
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

// Of sound, on any card.
inline constexpr uint32_t MostChannels = 16;

struct VFormatOptions
{
  // Empty words leave the choice to the device's settings. A payload that the container does not take gives way to the first that it takes,
  // uncompressed before all else; so does a pixel format that it does not take uncompressed, U8Y8V8Y8 before the device's others.
  std::string m_Container;
  std::string m_Video;
  std::string m_Audio;
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

// What goes beside the settings, for all devices.
void ApplyFormat( const VFormatOptions& i_rOptions, StageHost::VCaptureTargetOptions& o_rTargets );

class VRecordFormat
{
public:
  VRecordFormat( const VFormatOptions& i_rOptions, const StageHost::VDeviceInfo& i_rDevice );

  // Why this cannot be recorded: one line that names what would be accepted. Empty where nothing is wrong.
  std::string WhyRefused() const;
  // The same as far as it can be said without a device.
  static std::string WhyRefused( const VFormatOptions& i_rOptions );

  // A line for the user where the device's own pixel format cannot be stored, and another is captured that nobody asked for. Empty otherwise.
  std::string WhatGaveWay() const;

  // The container comes first: it says which payloads the device offers.
  VWantedSetting Container() const;
  std::vector<VWantedSetting> Settings() const;
  // What a payload's setting offers once the device has this container.
  std::vector<std::string> OfferedVideoPayloads() const;

private:
  std::string WhyNotStored() const;
  std::string WhyNotCaptured() const;
  std::string WhyVideoRefused() const;
  std::string WhyPixelFormatRefused() const;
  std::string WhyAudioRefused() const;
  bool IsCaptured( const std::string& i_rPixelFormat ) const;
  bool IsStored( const std::string& i_rPixelFormat ) const;
  std::string CapturedPixelFormat() const;
  const KVZ::IVideoWriterCapabilities& Capabilities() const;

  const VFormatOptions m_Options;
  const StageHost::VDeviceInfo m_Device;
  const KVZ::IVideoContainer::Enum m_Container;
  const KVZ::IVideoPayload::Enum m_Video;
  const KVZ::IAudioPayload::Enum m_Audio;
};
