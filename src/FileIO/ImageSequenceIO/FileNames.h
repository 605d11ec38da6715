// How the files of an image sequence are named: by a pattern that may hold the keywords "%FRAME%" and "%TIMECODE%". Any thread; no state.
#pragma once

#include "Core/VideoInterface/FrameRecords.h"

#include <cstdint>
#include <limits>
#include <string>

namespace ImageSequenceIO
{

// What no frame has.
constexpr uint64_t NoFrameNumber = std::numeric_limits<uint64_t>::max();

// "jpg", "png" or "tiff"; empty for a payload that is no image.
const char* GetImageExtension( KVZ::IVideoPayload::Enum i_Payload );

struct VFrameName
{
  uint64_t m_Number = 0;
  uint32_t m_Digits = 8;         // padded with zeros to that many
  KVZ::ITimecode m_Timecode{};   // of the frame
};

// Every keyword replaced; the timecode without its separators, "none" for one that is not valid.
std::string MakeFileName( const std::string& i_rPattern, const VFrameName& i_rFrame );

// The pattern without its keywords and with the extension "tarvovideoattributes".
std::string MakeSideFileName( const std::string& i_rPattern );

// The timecode of a frame, from that of frame 0 and the sequence's timing; that of frame 0 where the period is no whole number of ticks.
KVZ::ITimecode TimecodeOfFrame( const KVZ::ITimecode& i_rStart, const KVZ::VTimingRecord& i_rTiming, uint64_t i_FrameNumber );

// The number that stands where the pattern has its first "%FRAME%", in a name that may go on with an extension. A timecode is taken for ten
// digits. NoFrameNumber for a name that does not follow the pattern.
uint64_t FindFrameNumber( const std::string& i_rFileName, const std::string& i_rPattern );

}
