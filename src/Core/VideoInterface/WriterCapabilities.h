// What each container can hold, answered from one table. A writer names its own: using VWriterCapabilities = KVZ::VContainerCapabilities<...>.
#pragma once

#include "Core/VideoInterface/VideoContainer.h"
#include "Core/VideoInterface/VideoWriter.h"

namespace KVZ
{

template<IVideoContainer::Enum TContainer>
class VContainerCapabilities : public IVideoWriterCapabilities
{
public:
  bool IsAudioSampleFormatSupported( IAudioSampleFormat::Enum i_Format ) const override;
  bool IsAudioPayloadSupported( IAudioPayload::Enum i_Payload ) const override;
  bool IsPixelFormatSupported( IPixelFormat::Enum i_Format ) const override;
  bool IsVideoPayloadSupported( IVideoPayload::Enum i_Payload ) const override;
  bool IsChannelCountSupported( uint32_t i_Channels ) const override;
  bool IsNative() const override;
};

// Stands for a container outside the table: nothing is supported.
class VVideoWriterDummyCapabilities : public IVideoWriterCapabilities
{
public:
  bool IsAudioSampleFormatSupported( IAudioSampleFormat::Enum ) const override { return false; }
  bool IsAudioPayloadSupported( IAudioPayload::Enum ) const override { return false; }
  bool IsPixelFormatSupported( IPixelFormat::Enum ) const override { return false; }
  bool IsVideoPayloadSupported( IVideoPayload::Enum ) const override { return false; }
  bool IsChannelCountSupported( uint32_t ) const override { return false; }
  bool IsNative() const override { return false; }
};

}
