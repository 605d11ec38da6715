// Reads the timecode that a frame carries. Delivery thread.
#pragma once

#include "Core/VideoInterface/Timecode.h"
#include "Core/VideoInterface/TimecodeSource.h"
#include "VendorInterfaces/DeckLinkAPI.h"

#include <cstdint>

namespace VideoInputHAL
{

struct VTimecodeReading
{
  KVZ::ITimecode m_Timecode;   // empty where the frame carries none of the source's; no tick remainder
  int64_t m_FramePeriod = 0;   // ticks; 0 where the card does not tell
};

VTimecodeReading ReadTimecode( DeckLinkAPI::IDeckLinkVideoInputFrame& i_rFrame, KVZ::ITimecodeSource::Enum i_Source );

}
