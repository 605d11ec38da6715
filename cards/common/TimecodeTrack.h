// The timecode that a signal carries beside its pictures.
#pragma once

#include "Core/VideoInterface/Timecode.h"

#include <cstdint>
#include <optional>
#include <string>
#include <string_view>

namespace VirtualCards
{

// A label as a person writes it. Which rate it counts at follows from the signal.
struct VTimecodeLabel
{
  uint8_t m_Hours = 1;
  uint8_t m_Minutes = 0;
  uint8_t m_Seconds = 0;
  uint8_t m_Frames = 0;
  bool m_bDropFrame = false;
};

// "HH:MM:SS:FF", or "HH:MM:SS;FF" for drop-frame; empty for anything else.
std::optional<VTimecodeLabel> ParseTimecodeLabel( std::string_view i_Text );

// Why this label cannot occur in video of this period; empty if it can.
std::string WhyNotAt( const VTimecodeLabel& i_rLabel, int64_t i_VideoPeriod );

struct VSignalTimecode
{
  KVZ::ITimecode m_Label;
  bool m_bFieldMark = false;   // the second frame that carries this label
};

// Counts labels along the frames of a signal. From 47.95 frames a second on, timecode counts at half the rate of the video: each
// label comes on two frames (SMPTE ST 12-1). Not for several threads at once.
class VTimecodeTrack
{
public:
  // No labels come before this.
  void Start( const VTimecodeLabel& i_rLabel, int64_t i_VideoPeriod, uint64_t i_Frame );

  // The video's rate changes at this frame: goes on from the label reached, at the new rate.
  void ChangeRate( int64_t i_VideoPeriod, uint64_t i_Frame );

  std::optional<VSignalTimecode> At( uint64_t i_Frame ) const;

private:
  bool m_bRunning = false;
  bool m_bDropFrame = false;   // as asked for at the start; counts only at rates that have it
  KVZ::ITimecode m_StartLabel;
  uint64_t m_StartFrame = 0;
  uint32_t m_FramesPerLabel = 1;
};

}
