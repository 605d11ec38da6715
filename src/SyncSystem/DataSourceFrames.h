// What a live reader of a data source gets, and the rule by which a backlog is thinned.
#pragma once

#include "Core/VideoInterface/Timecode.h"
#include "SyncSystem/DataSourceSession.h"
#include "SyncSystem/RefCountedToken.h"
#include "SyncSystem/Tick.h"
#include "SyncSystem/TypedId.h"

#include <cstddef>
#include <cstdint>
#include <memory>
#include <vector>

namespace SyncSystem
{

// A grid on the timeline; frames on it are the last to be dropped. All zero: none.
struct VBeat
{
  KVZ::VTick m_Period;
  KVZ::VTick m_Offset;
  KVZ::VGlobalSyncSessionId m_Id;
};

struct VFrameRecord
{
  VRefCountedToken m_Frame;   // stays pinned with the record
  KVZ::VTick m_Tick;          // global
  KVZ::VTick m_Period;
  KVZ::VGlobalSyncSessionId m_GlobalSession;
  int64_t m_BeatRank = 0;   // low ranks are dropped first, by beat rank, then by frame rank
  int64_t m_FrameRank = 0;
  int64_t m_DropRun = 0;   // 0: kept; otherwise how many frames from here on are dropped before the next kept one
};

struct VReadFrames
{
  std::vector<VFrameRecord> m_Frames;   // oldest first; pass over those with a drop run
  VBeat m_Beat;
  KVZ::ITimecode m_FirstTimecode;   // at the first position that was looked at; standard -1 without a shared timecode
  std::shared_ptr<const VGlobalSyncSessionInfo> m_pInfo;
};

struct EReadResult
{
  enum Enum : uint32_t
  {
    Frames = 0,
    None = 0x80000007,
    Asleep = 0x80000023   // none, and the reader's token has been left to wake it
  };
};

// Fills the ranks from tick, period and beat. Of n > 0 a rank is the lowest set bit, so the odd-numbered go first, then those with a number
// twice an odd number, and so on; number 0 goes last.
void RankFrame( VFrameRecord& io_rFrame, const VBeat& i_rBeat );

// Marks all frames but the limit (at least 1) by their ranks and returns how many it marked. The frames are in the order of their ticks,
// and stay in the list.
size_t DropEvenly( std::vector<VFrameRecord>& io_rFrames, uint64_t i_Limit );

}
