// What a writer knows of its file until it closes it: everything that the tables at the file's end are made from.
#pragma once

#include "Core/VideoInterface/FrameRecords.h"
#include "Core/VideoInterface/VideoAttributes.h"

#include <cstdint>
#include <deque>
#include <string>
#include <vector>

namespace MovIO
{

struct VTrack
{
  // All samples of a track last equally long. The caller has seen to it that the sums fit.
  void AddChunk( uint32_t i_Samples )
  {
    ++m_ChunkCount;
    m_SampleCount += i_Samples;
    m_MediaDuration += i_Samples * m_SamplePeriod;
    m_Duration = m_MediaDuration;
  }

  std::string m_Name;
  uint32_t m_Id = 0;
  uint32_t m_Duration = 0;        // in the movie's timescale, which is the track's too
  uint32_t m_Timescale = 0;       // units a second
  uint32_t m_MediaDuration = 0;   // in the track's timescale
  uint32_t m_SamplePeriod = 0;    // the same
  uint32_t m_SampleCount = 0;
  uint32_t m_ChunkCount = 0;   // samples that lie in the file one after another
};

// One video sample, and the chunk of sound that lies right behind it.
struct VFrameEntry
{
  uint64_t m_Position;
  uint32_t m_Size;           // bytes of the video sample
  uint32_t m_AudioSamples;   // of all channels each; 0: no chunk
  char m_FrameType;          // 'I', 'P' or 'B'
};

// Frames by which those of type I and P are shown later than they are decoded, so that those of type B can come before them.
constexpr uint32_t CompositionFrames = 3;

struct VMovie
{
  bool IsMOV() const { return m_Container == KVZ::IVideoContainer::EMOV; }
  bool IsH264() const { return m_VideoPayload == KVZ::IVideoPayload::EVideoH264; }
  bool HasAudio() const { return m_AudioPayload != KVZ::IAudioPayload::ENone; }
  uint32_t BytesPerSampleFrame() const { return KVZ::GetBytesPerSample( m_AudioInfo.m_SampleFormat ) * m_AudioInfo.m_Channels; }
  // In the video track's own time.
  uint32_t FirstShown() const { return IsH264() ? CompositionFrames * m_Video.m_SamplePeriod + m_TimecodeRemainder : 0; }

  KVZ::IVideoContainer::Enum m_Container = KVZ::IVideoContainer::EMOV;
  KVZ::IVideoPayload::Enum m_VideoPayload = KVZ::IVideoPayload::ENone;
  KVZ::IAudioPayload::Enum m_AudioPayload = KVZ::IAudioPayload::ENone;   // None: the file has no audio track
  KVZ::VideoFrameInfo m_VideoInfo;
  KVZ::AudioFrameInfo m_AudioInfo;
  KVZ::ITimecode m_Timecode;   // of a known standard
  uint32_t m_Timescale = 0;    // units a second, of the movie and of all tracks
  uint32_t m_Duration = 0;
  uint32_t m_TimecodeRemainder = 0;   // units from the start of the first timecode frame to the first image
  uint64_t m_MdatPosition = 0;
  VTrack m_Video{ "Video", 1 };
  VTrack m_Audio{ "Audio", 2 };
  VTrack m_TimecodeTrack{ "Timecode", 3 };
  uint64_t m_TimecodePosition = 0;    // of its one sample
  std::deque<VFrameEntry> m_Frames;   // grows without being moved: hours of them
  std::vector<uint8_t> m_SPS;         // H.264 parameter sets
  std::vector<uint8_t> m_PPS;
  KVZ::IVideoAttributes m_Internal;
  KVZ::IVideoAttributes m_External;
};

}
