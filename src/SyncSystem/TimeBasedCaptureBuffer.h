// A capture buffer with a time model: it compares what each frame says of its clocks, period and beat with what the running source sync
// session expects, and goes on, opens a new source sync session in the same buffer session, or opens a new buffer session.
//
// A buffer session is a run of frames with one period and one counter clock. A source sync session is a run of frames with one unbroken set
// of clocks and one beat; its id ascends over the buffer's life. A buffer session holds one or more of them.
//
// Every operation takes the buffer's lock and may be called from any thread, but for AddFrame: delivery thread only.
#pragma once

#include "SyncSystem/CaptureBuffer.h"
#include "SyncSystem/Clock.h"
#include "SyncSystem/SourceSyncSession.h"

#include <boost/container/small_vector.hpp>

#include <cstdint>
#include <map>
#include <string>

namespace SyncSystem
{

// What a frame says of its time.
struct VFrameTiming
{
  KVZ::ITickInClocks m_Clocks;   // every clock's reading; the counter clock may be left out, the buffer enters its true reading
  KVZ::VTick m_Period;
  KVZ::IClock m_CounterClock;   // of type CounterFromSessionStart
  int64_t m_Payload = 0;        // kept with the session as the newest frame's value
  KVZ::VTick m_BeatPeriod;      // 0: no beat
  KVZ::VTick m_BeatOffset;
};

struct VSyncSessionRecord
{
  uint32_t m_Id = 0;
  KVZ::ITickInClocks m_StartTime;   // at the first frame; ends with the counter clock at 0
  std::map<KVZ::IClock, uint32_t> m_ContinuousSince;
  KVZ::VTick m_Period;
  KVZ::VTick m_BeatPeriod;
  KVZ::VTick m_BeatOffset;
  VToken m_First;                      // position of the first frame; empty before it
  KVZ::ITickInClocks m_LatestClocks;   // at the newest frame, without the counter clock
  VToken m_Last;                       // position of the newest frame; empty before it
  VToken m_End;                        // m_Last when a later session closed this one; empty while it may go on
  int64_t m_LastPayload = 0;

  // The counter clock's reading at the first frame, and at a position of the session's buffer session.
  KVZ::VTick CounterStart() const;
  KVZ::VTick CounterAt( const VToken& i_rToken ) const;
};

// A frame's clocks are few: such a list lives without the heap.
using VContinuousClocks = boost::container::small_vector<KVZ::IClock, 8>;

class VTimeBasedCaptureBuffer : public VCaptureBuffer
{
public:
  // Use Make.
  explicit VTimeBasedCaptureBuffer( VSettings i_Settings ) : VCaptureBuffer( std::move( i_Settings ) ) {}

  static std::shared_ptr<VTimeBasedCaptureBuffer> Make( VSettings i_Settings )
  {
    return VCaptureBuffer::Make<VTimeBasedCaptureBuffer>( std::move( i_Settings ) );
  }

  // Stores an entry from NewEntry. The counter clock in the timing gets its true reading, and the session id tells the caller whether a new
  // source sync session began. Allocates nothing where the session goes on.
  VToken AddFrame( VFrameEntry* i_pEntry, VFrameTiming& io_rTiming, uint32_t& o_rSessionId );

  // Begins a source sync session before its first frame exists: a frame with the readings given here continues it. False, with nothing
  // changed, unless the period is positive and the counter clock is of type CounterFromSessionStart.
  bool ForceNewSyncSession( const VFrameTiming& i_rTiming, uint32_t& o_rSessionId );
  // The next frame begins a new buffer session, whatever it says of its time.
  void RequestNewBufferSession();

  // A copy of the newest record, of the one of an id; false if there is none.
  bool NewestRecord( VSyncSessionRecord& o_rRecord ) const;
  bool FindRecord( uint32_t i_SessionId, VSyncSessionRecord& o_rRecord ) const;
  // The session as the source reports it, but for m_NoticePeriod, which is the source's.
  bool GetSourceSyncSession( uint32_t i_SessionId, KVZ::ISourceSyncSession& o_rSession ) const;
  uint32_t NewestSessionId() const;   // 0 before the first
  uint32_t OldestSessionId() const;   // of the records still kept; 0 for none
  // The value given with the session's newest frame.
  bool LastPayload( uint32_t i_SessionId, int64_t& o_rPayload ) const;
  // The session that a position belongs to.
  bool SessionForToken( const VToken& i_rToken, uint32_t& o_rSessionId ) const;

  // Position and clock readings of the session's first and newest frame. False for an unknown id, if there is no such position yet, or if
  // its buffer session has gone. The first frame itself may have been evicted, or be still to come where the session was forced.
  bool FirstPosition( uint32_t i_SessionId, VToken& o_rToken, KVZ::ITickInClocks& o_rClocks ) const;
  bool LastPosition( uint32_t i_SessionId, VToken& o_rToken, KVZ::ITickInClocks& o_rClocks ) const;

  // The counter's reading at a position of the session's buffer session.
  bool TickForToken( uint32_t i_SessionId, const VToken& i_rToken, KVZ::VTick& o_rCounter ) const;
  // The last position at or before a counter reading, which may have no frame, and the distance from the reading to the next frame: 0 where
  // the reading is exactly on a frame, and otherwise that frame is one position further.
  bool TokenForTick( uint32_t i_SessionId, KVZ::VTick i_Counter, VToken& o_rToken, KVZ::VTick& o_rRemainder ) const;

protected:
  void OnBufferSessionRemoved( KVZ::VBufferSessionId i_Session ) override REQUIRES( m_Mutex );

private:
  struct VSessionCheck
  {
    bool m_bForceBufferSession = false;
    bool m_bForceSyncSession = false;
    bool m_bNewBufferSession = false;
    bool m_bNewSyncSession = false;
    VContinuousClocks m_Continuous{};
  };

  void CheckSession( const VFrameTiming& i_rTiming, VSessionCheck i_Check ) REQUIRES( m_Mutex );
  void CheckForced( VSessionCheck& io_rCheck ) const REQUIRES( m_Mutex );
  void CheckCounterClock( const VFrameTiming& i_rTiming, VSessionCheck& io_rCheck ) REQUIRES( m_Mutex );
  void CheckAgainstNewest( const VFrameTiming& i_rTiming, VSessionCheck& io_rCheck ) const REQUIRES( m_Mutex );
  void CheckClocks( const VFrameTiming& i_rTiming, const VSyncSessionRecord& i_rRecord, VSessionCheck& io_rCheck ) const REQUIRES( m_Mutex );
  void OpenBufferSession() REQUIRES( m_Mutex );
  void OpenSyncSession( const VFrameTiming& i_rTiming, const VContinuousClocks& i_rContinuous ) REQUIRES( m_Mutex );
  void DropEvictedRecords() REQUIRES( m_Mutex );
  VSyncSessionRecord& NewestUnlocked() REQUIRES( m_Mutex ) { return m_SyncSessions.rbegin()->second; }
  const VSyncSessionRecord* FindUnlocked( uint32_t i_SessionId ) const REQUIRES( m_Mutex );
  bool PositionUnlocked( const VSyncSessionRecord& i_rRecord, const VToken& i_rPosition, VToken& o_rToken, KVZ::ITickInClocks& o_rClocks ) const
    REQUIRES( m_Mutex );

  std::map<uint32_t, VSyncSessionRecord> m_SyncSessions GUARDED_BY( m_Mutex );
  uint32_t m_NextSyncSessionId GUARDED_BY( m_Mutex ) = 0;   // of the newest record
  KVZ::IClock m_CounterClock GUARDED_BY( m_Mutex );
  bool m_bBufferSessionRequested GUARDED_BY( m_Mutex ) = false;
};

}
