// Which timecode standard a signal's labels count in.
#pragma once

#include "Core/VideoInterface/Timecode.h"

#include <cstdint>

namespace VideoInputHAL
{

// Of video with this frame period (ticks), whose timecode says whether it drops labels. Video may run at twice the rate of its timecode. 30 frames a
// second where nothing fits, and for a period of 0.
KVZ::ITimecodeStandard::Enum ChooseTimecodeStandard( int64_t i_FramePeriod, bool i_bDropFrame );

}
