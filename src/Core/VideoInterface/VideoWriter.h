// The contract of every file format, and what a format can hold.
//
// Calling order: Open, WriteHeader once, WriteFrame once a frame, Close. Operations return false and log under the writer's category;
// no exception leaves a writer. One thread at a time unless a writer says otherwise.
#pragma once

#include "Core/VideoInterface/BufferAllocator.h"
#include "Core/VideoInterface/FrameRecords.h"
#include "Core/VideoInterface/VideoAttributes.h"

#include <cstdint>
#include <functional>
#include <map>
#include <memory>
#include <string>
#include <vector>

namespace VideoEncoding
{
class VVideoFrameEncoder;
}

namespace KVZ
{

class IVideoWriterCapabilities
{
public:
  virtual bool IsAudioSampleFormatSupported( IAudioSampleFormat::Enum i_Format ) const = 0;
  virtual bool IsAudioPayloadSupported( IAudioPayload::Enum i_Payload ) const = 0;
  virtual bool IsPixelFormatSupported( IPixelFormat::Enum i_Format ) const = 0;
  virtual bool IsVideoPayloadSupported( IVideoPayload::Enum i_Payload ) const = 0;
  virtual bool IsChannelCountSupported( uint32_t i_Channels ) const = 0;
  // True for the native container alone; nothing of ours asks.
  virtual bool IsNative() const = 0;
  virtual ~IVideoWriterCapabilities() = default;
};

struct VFrameSet
{
  std::shared_ptr<const IBufferConst> m_pVideo;
  VideoFrameInfo m_VideoInfo;
  VBufferList m_Audio;
  AudioFrameInfo m_AudioInfo;
};

class IVideoWriter
{
public:
  virtual const IVideoWriterCapabilities& GetCapabilities() const = 0;
  // UTF-8. Replaces a file of that name.
  virtual bool Open( const std::string& i_rPath ) = 0;
  virtual bool IsOpen() const = 0;
  virtual bool WriteHeader( const VideoFrameInfo& i_rVideoInfo, const AudioFrameInfo& i_rAudioInfo, const VTimingRecord& i_rTiming,
    const ITimecode& i_rTimecode, const VColourRecord& i_rColour, const IVideoAttributes& i_rAttributes, IVideoPayload::Enum i_VideoPayload,
    IAudioPayload::Enum i_AudioPayload ) = 0;
  virtual bool WriteFrame( const VFrameSet& i_rFrameSet, uint64_t i_FrameKey ) = 0;
  // The lists may be replaced by the writer's encoder. The key counts frames from 0, as a rule upwards.
  virtual bool WriteFrame( VBufferList& io_rVideo, const VideoFrameInfo& i_rVideoInfo, VBufferList& io_rAudio, const AudioFrameInfo& i_rAudioInfo,
    uint64_t i_FrameKey ) = 0;
  virtual bool Close() = 0;
  virtual ~IVideoWriter() = default;
  // Frames of this file whose WriteFrame gave true before it was known that the disk would not take them whole.
  virtual uint64_t CountIncompleteFrames() const { return 0; }
};

// The process-wide capabilities of a container, whether or not its writer is part of the build; all answers are false for a value outside
// the table. Any thread.
const IVideoWriterCapabilities& GetVideoWriterCapabilities( IVideoContainer::Enum i_Container );

// Writers by container, filled by the composing place; read-only afterwards.
class VVideoWriterFactory
{
public:
  using VMaker = std::function<std::shared_ptr<IVideoWriter>( IVideoContainer::Enum, std::shared_ptr<VideoEncoding::VVideoFrameEncoder> )>;

  void Register( IVideoContainer::Enum i_Container, VMaker i_Maker );
  bool IsRegistered( IVideoContainer::Enum i_Container ) const;
  // An empty pointer for a container without a maker. The encoder may be empty: the writer then builds its own.
  std::shared_ptr<IVideoWriter> Make( IVideoContainer::Enum i_Container, std::shared_ptr<VideoEncoding::VVideoFrameEncoder> i_pEncoder = {} ) const;

private:
  std::map<IVideoContainer::Enum, VMaker> m_Makers;
};

}
