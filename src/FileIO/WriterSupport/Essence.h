// What a file stores of pictures and sound: the payloads, and the descriptions with the formats that these give. Brings each frame to that
// form. One thread at a time.
#pragma once

#include "FileIO/VideoEncoding/VideoFrameEncoder.h"
#include "FileIO/WriterSupport/WriterBase.h"

#include <memory>

namespace WriterSupport
{

class VEssence
{
public:
  // Without an encoder it makes its own, with the software converter.
  explicit VEssence( std::shared_ptr<VideoEncoding::VVideoFrameEncoder> i_pEncoder );

  void Store( const VHeader& i_rHeader );

  // The payload's pixel format stands in place of the source's.
  const KVZ::VideoFrameInfo& Video() const { return m_Video; }
  KVZ::IVideoPayload::Enum VideoPayload() const { return m_VideoPayload; }
  // The same for the sample format; empty where no sound is stored.
  const KVZ::AudioFrameInfo& Audio() const { return m_Audio; }

  // Replaces the frame's lists by what the file stores; without sound in the file the audio list becomes empty. False, with a line in the
  // log, where a frame cannot be brought to that form.
  bool Encode( VFrame& io_rFrame, const KVZ::VLogCategory& i_rCategory );

  // Whether a frame's picture has the width and height of the header; otherwise a line goes to the log.
  bool HasStoredSize( const VFrame& i_rFrame, const KVZ::VLogCategory& i_rCategory ) const;

private:
  const std::shared_ptr<KVZ::IBufferAllocator> m_pAllocator;
  const std::shared_ptr<VideoEncoding::VVideoFrameEncoder> m_pEncoder;
  KVZ::IVideoPayload::Enum m_VideoPayload = KVZ::IVideoPayload::ENone;
  KVZ::IAudioPayload::Enum m_AudioPayload = KVZ::IAudioPayload::ENone;
  KVZ::VideoFrameInfo m_Video;
  KVZ::AudioFrameInfo m_Audio;
};

}
