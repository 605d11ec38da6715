// The movie containers beside the system's own, one row each, and the recordings that their common tests write.
#pragma once

#include "Core/VideoInterface/VideoWriter.h"
#include "FileIO/WriterSupport/WatchedStream.h"

#include <memory>
#include <string>
#include <vector>

namespace Containers
{

using VBytes = std::vector<uint8_t>;

struct VContainerRow
{
  const char* m_pName;   // the extension
  KVZ::IVideoContainer::Enum m_Container;
};

constexpr VContainerRow Movies[] = {
  { "mov", KVZ::IVideoContainer::EMOV },
  { "mp4", KVZ::IVideoContainer::EMP4 },
  { "avi", KVZ::IVideoContainer::EAVI },
  { "mkv", KVZ::IVideoContainer::EMKV },
};

// i_RiffBytes is where an AVI begins its next RIFF; 0 for the usual places.
std::shared_ptr<KVZ::IVideoWriter> MakeWriter( KVZ::IVideoContainer::Enum i_Container,
  WriterSupport::VStreamMaker i_StreamMaker = WriterSupport::MakeFile, uint64_t i_RiffBytes = 0 );

std::shared_ptr<const KVZ::IBufferConst> Buffer( VBytes i_Bytes );

// What WriteHeader is given: 4:2:2 with one channel of 16-bit sound.
struct VRecordingSettings
{
  VRecordingSettings( uint32_t i_Width, uint32_t i_Height );

  bool WriteHeader( KVZ::IVideoWriter& io_rWriter ) const;

  KVZ::VideoFrameInfo m_Video;
  KVZ::AudioFrameInfo m_Audio{ KVZ::IAudioSampleFormat::EInt16, 48000, 1 };
  KVZ::VTimingRecord m_Timing{ 135000000, 5400000, 0 };
  KVZ::ITimecode m_Timecode{ KVZ::ITimecodeStandard::ETimecode25, 1 };
  KVZ::VColourRecord m_Colour{};
  KVZ::IVideoAttributes m_Attributes{};
};

}
