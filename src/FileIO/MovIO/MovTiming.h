// The exact time of a MOV file: every period is a whole number of units of one timescale, which is a divisor of 1080 MHz. All supported
// frame rates have a whole period at that rate.
#pragma once

#include "Core/VideoInterface/FrameRecords.h"

#include <cstdint>

namespace MovIO
{

constexpr uint32_t BaseTicksPerSecond = 1080000000;

// Brings a timing record to the base rate. False for a tick rate of 0, and for a period that 32 bits cannot hold.
bool ToBaseTicks( const KVZ::VTimingRecord& i_rTiming, KVZ::VTimingRecord& o_rBase );

// In base ticks at first, then in units of the timescale.
struct VPeriods
{
  uint64_t m_Video = 0;      // 0: unknown
  uint64_t m_Timecode = 0;   // of a timecode frame
  uint64_t m_Audio = 0;      // of a sample; 0: no audio
  uint64_t m_Timescale = BaseTicksPerSecond;
};

// Divides all four by their greatest common divisor. False if one of them needs more than 32 bits even so.
bool Reduce( VPeriods& io_rPeriods );

// What the timecode track begins with: the caller's timecode, or, where that is invalid, its counters under the standard that fits the video
// period. The tick remainder counts base ticks here.
KVZ::ITimecode GetStartTimecode( const KVZ::ITimecode& i_rTimecode, uint32_t i_VideoPeriod );

// Base ticks a timecode frame; 0 for an unknown standard.
uint32_t GetTimecodePeriod( int32_t i_Standard );

struct VTimecodeStart
{
  uint32_t m_FrameNumber = 0;   // since midnight of day 0
  uint32_t m_Remainder = 0;     // units of the timescale past that frame's start
};
// False, with a line in the log, if one of the two needs more than 32 bits.
bool GetTimecodeStart( const KVZ::ITimecode& i_rTimecode, uint32_t i_Timescale, VTimecodeStart& o_rStart );

}
