// One unbroken run of frames from one source, at one rate, against one set of clocks.
#pragma once

#include "SyncSystem/Clock.h"

#include <cstdint>
#include <map>
#include <string>

namespace KVZ
{

struct ISourceSyncSession
{
  uint32_t m_Id = 0;                              // 0 means none
  ITickInClocks m_StartTime;                      // every clock at the first frame; the counter clock reads 0 there and comes last
  std::map<IClock, uint32_t> m_ContinuousSince;   // the earliest session from which each clock has run on without a break
  VTick m_Period;                                 // a frame
  VTick m_BeatPeriod;                             // 0: no beat
  VTick m_BeatOffset;
  VTick m_NoticePeriod;   // how far ahead the source must hear of a new global session

  // The first rule that fails, in words; empty when all hold.
  std::string Validate() const;
};

}
