// Which timecode standard a signal's labels count in, and where a card has them.
#pragma once

#include "Core/VideoInterface/Timecode.h"
#include "Core/VideoInterface/TimecodeSource.h"

#include <array>
#include <cstddef>
#include <cstdint>
#include <span>

namespace VideoInputHAL
{

// Of video with this frame period (ticks), whose timecode says whether it drops labels. Video may run at twice the rate of its timecode. 30 frames a
// second where nothing fits, and for a period of 0.
KVZ::ITimecodeStandard::Enum ChooseTimecodeStandard( int64_t i_FramePeriod, bool i_bDropFrame );

// The vendor's numbers of the timecodes that a source stands for, tried in turn.
struct VTimecodeSourceRow
{
  KVZ::ITimecodeSource::Enum m_Source;
  size_t m_Count;
  std::array<uint32_t, 4> m_Numbers;
};

// None for a source that is not listed: it reads nothing.
std::span<const uint32_t> FindTimecodeNumbers( std::span<const VTimecodeSourceRow> i_Rows, KVZ::ITimecodeSource::Enum i_Source );

}
