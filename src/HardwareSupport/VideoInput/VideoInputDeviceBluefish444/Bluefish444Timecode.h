// Reads the timecode that the ancillary data of a frame carries. Capture thread.
#pragma once

#include "Core/VideoInterface/Timecode.h"
#include "Core/VideoInterface/TimecodeSource.h"
#include "VendorInterfaces/BlueVelvet.h"

#include <cstdint>

namespace VideoInputHAL
{

// No label has this form. Stands in the record for a timecode that the decoder has not found.
constexpr uint64_t NoTimecodeWord = ~uint64_t{ 0 };

// A timecode word of the decoder's: SMPTE, in BCD. False, with a record that is not valid, for a word that is no label.
bool ToTimecode( uint64_t i_Word, int64_t i_FramePeriod, KVZ::ITimecode& o_rTimecode );

// The first valid one among those that the source stands for; an empty record where there is none. i_FramePeriod in ticks.
KVZ::ITimecode ReadTimecode( const BlueVelvet::VHancDecodeRecord& i_rRecord, KVZ::ITimecodeSource::Enum i_Source, int64_t i_FramePeriod );

}
