// Lays the sources of a global session on one timeline, in global ticks.
//
// The first source with a shared timecode clock is the reference: its timecode, in ticks since midnight, is the global time. Others with a
// shared timecode are laid by theirs where that agrees with their delivery times; the rest by their fitted delivery times. With no
// timecode at all the global time is the host's clock.
#pragma once

#include "SyncSystem/ISource.h"

#include <boost/optional.hpp>

#include <vector>

namespace StageHost
{

struct VTimelineSource
{
  KVZ::ISourceSyncSession m_Session;
  boost::optional<KVZ::ISourceTemporal::ISourceTimingInfo> m_Timing;   // of m_Session; empty while two frames have not come
};

struct VLaidSource
{
  KVZ::VTick m_CounterStart;   // the global tick at which the source's counter reads 0
  bool m_bByTimecode = false;
};

struct VTimeline
{
  std::vector<VLaidSource> m_Sources;   // in the order of the input
  bool m_bByTimecode = false;           // the global time is a timecode
};

// Timecodes that lie further than this from what the delivery times say belong to another world: the source is laid by delivery.
constexpr KVZ::VTick TimecodeTolerance = KVZ::MillisecondsToTick135( 500 );

// The session's timecode clock that sources share; a null pointer where it has none.
const KVZ::IClock* FindSharedTimecode( const KVZ::ISourceSyncSession& i_rSession );

// Empty while a delivery time is needed that is not there yet. A single source with timecode needs none.
boost::optional<VTimeline> LaySources( const std::vector<VTimelineSource>& i_rSources );

}
