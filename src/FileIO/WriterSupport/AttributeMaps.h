// The two attribute maps of a file: the internal one describes the stored pictures and sound, the external one the recording.
#pragma once

#include "Core/VideoInterface/FrameRecords.h"
#include "Core/VideoInterface/VideoAttributes.h"
#include "StageCoreRuntime/GlobalLog.h"

namespace WriterSupport
{

// False if a description is neither empty nor whole.
bool EncodeInternalAttributes( const KVZ::VideoFrameInfo& i_rVideo, const KVZ::AudioFrameInfo& i_rAudio, KVZ::IVideoAttributes& o_rAttributes );

enum class ETimingKeys
{
  Always,
  // Only if the timing record differs from the default. The colour keys ride on that test too, although it says nothing about them.
  WhenNotDefault
};

enum class ETimecodeKeys
{
  Always,
  WhenValid
};

struct VRecordingDescription
{
  const KVZ::IVideoAttributes& m_rAttributes;   // the caller's; its entries give way to the keys below
  const KVZ::VTimingRecord& m_rTiming;
  const KVZ::VColourRecord& m_rColour;
  const KVZ::ITimecode& m_rTimecode;
  ETimingKeys m_TimingKeys = ETimingKeys::Always;
  ETimecodeKeys m_TimecodeKeys = ETimecodeKeys::Always;
};

// Replaces the map.
bool EncodeExternalAttributes( const VRecordingDescription& i_rRecording, KVZ::IVideoAttributes& o_rAttributes );

struct VAttributeMaps
{
  KVZ::IVideoAttributes m_Internal;
  KVZ::IVideoAttributes m_External;
};

// Replaces both maps. False, with a line in the log, where one of them cannot be made.
bool EncodeAttributes( const KVZ::VideoFrameInfo& i_rVideo, const KVZ::AudioFrameInfo& i_rAudio, const VRecordingDescription& i_rRecording,
  const KVZ::VLogCategory& i_rCategory, VAttributeMaps& o_rMaps );

}
