// One global sync session as a source takes part in it: what relates the source's frames to global ticks, in both directions.
#pragma once

#include "Core/VideoInterface/Timecode.h"
#include "SyncSystem/SourceSyncSession.h"
#include "SyncSystem/TimeBasedCaptureBuffer.h"
#include "SyncSystem/TypedId.h"

namespace SyncSystem
{

// Shared with readers and captures as a const object, so that it stays usable after later sessions have begun.
struct VGlobalSyncSessionInfo
{
  bool m_bStarted = false;
  KVZ::VGlobalSyncSessionId m_Id;
  KVZ::ISourceSyncSession m_Session;    // as it was offered
  VSyncSessionRecord m_Record;          // of the buffer at the declaration
  KVZ::ITickInClocks m_StartTicks;      // given by the engine: every clock of every source at one moment
  KVZ::VTick m_Offset;                  // given by the engine
  KVZ::VTick m_CounterStart;            // the global tick at which the session's counter reads 0
  KVZ::ITimecode m_Timecode;            // at m_CounterStart; standard -1 if the source has no shared timecode
  int32_t m_OffsetTimecodeFrames = 0;   // m_Offset in whole timecode frames, 0 without timecode

  // The global tick at which readers begin.
  KVZ::VTick LiveStart() const;

  // False, and nothing changes, where the readings lack global time or the source's counter.
  bool Start( const KVZ::ITickInClocks& i_rTicks, KVZ::VTick i_Offset );

  // The rest needs a started session with a first frame, which HasPositions tells.
  bool HasPositions() const { return m_bStarted && m_Record.m_First.IsValid(); }
  // The position of the first frame at or after a global tick. It may lie before the first frame of the session, in what its buffer session
  // held earlier, and beyond its newest one.
  VToken PositionAtOrAfter( KVZ::VTick i_Global ) const;
  // False for a position in another buffer session.
  bool TickAt( const VToken& i_rPosition, KVZ::VTick& o_rGlobal ) const;
  // Of the source's shared timecode; standard -1 without one.
  KVZ::ITimecode TimecodeAt( KVZ::VTick i_Global ) const;

private:
  void TakeTimecode( KVZ::VTick i_Counter );
};

}
