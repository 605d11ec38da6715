// Whether a frame goes on with the running source sync session, opens a new one, or opens a new buffer session.
#include "StageCoreRuntime/GlobalLog.h"
#include "SyncSystem/TimeBasedCaptureBuffer.h"

#include <algorithm>

namespace SyncSystem
{

namespace
{

// Compares a session's latest readings with a frame's, both in clock order. What differs goes into a text, of which nothing is written while
// all goes on; the others go into a list.
class VClockComparison
{
public:
  VClockComparison( KVZ::VTick i_Period, VContinuousClocks& o_rContinuous ) : m_Period( i_Period ), m_rContinuous( o_rContinuous ) {}

  void Compare( const KVZ::ITickInClocks::VMap& i_rPrevious, const KVZ::ITickInClocks::VMap& i_rFrame )
  {
    auto Previous = i_rPrevious.begin();
    for( const auto& [Clock, Tick] : i_rFrame )
    {
      if( Clock.Type() == KVZ::IClock::CounterFromSessionStart ) continue;
      for( ; Previous != i_rPrevious.end() && Previous->first < Clock; ++Previous ) Append( Previous->first, " Removed, " );
      if( Previous != i_rPrevious.end() && Previous->first == Clock ) CompareTicks( Clock, ( Previous++ )->second, Tick );
      else Append( Clock, " Added, " );
    }
    for( ; Previous != i_rPrevious.end(); ++Previous ) Append( Previous->first, " Removed, " );
  }

  // Empty if nothing changed.
  const std::string& Changes() const { return m_Changes; }

private:
  // There is no tolerance: whoever makes the readings keeps them on the grid of the period.
  void CompareTicks( const KVZ::IClock& i_rClock, KVZ::VTick i_Previous, KVZ::VTick i_Frame )
  {
    if( i_Frame == i_Previous + m_Period ) m_rContinuous.push_back( i_rClock );
    else Append( i_rClock, " Discontinuity (" + std::to_string( i_Previous.Count() ) + " -> " + std::to_string( i_Frame.Count() ) + "), " );
  }

  void Append( const KVZ::IClock& i_rClock, const std::string& i_rWhat )
  {
    m_Changes += KVZ::ClockName( i_rClock.Type() );
    m_Changes += i_rWhat;
  }

  const KVZ::VTick m_Period;
  VContinuousClocks& m_rContinuous;
  std::string m_Changes;
};

}

void VTimeBasedCaptureBuffer::CheckSession( const VFrameTiming& i_rTiming, VSessionCheck i_Check )
{
  CheckForced( i_Check );
  CheckCounterClock( i_rTiming, i_Check );
  if( !i_Check.m_bNewBufferSession ) CheckAgainstNewest( i_rTiming, i_Check );
  if( !i_Check.m_bNewBufferSession && !i_Check.m_bNewSyncSession ) return;
  if( i_Check.m_bNewBufferSession ) OpenBufferSession();
  OpenSyncSession( i_rTiming, i_Check.m_Continuous );
  DropEvictedRecords();
}

void VTimeBasedCaptureBuffer::CheckForced( VSessionCheck& io_rCheck ) const
{
  io_rCheck.m_bNewBufferSession = m_SyncSessions.empty() || io_rCheck.m_bForceBufferSession;
  io_rCheck.m_bNewSyncSession = io_rCheck.m_bForceSyncSession;
  if( m_SyncSessions.empty() ) KVZ_LOG_DETAIL( "CaptureBuffer", "%1% Buffer: Starting first Buffer Session", m_Name );
  else if( io_rCheck.m_bForceBufferSession ) KVZ_LOG_DETAIL( "CaptureBuffer", "%1% Buffer: Forcing new Buffer Session", m_Name );
  else if( io_rCheck.m_bForceSyncSession ) KVZ_LOG_DETAIL( "CaptureBuffer", "%1% Buffer: Forcing new Sync Session", m_Name );
}

void VTimeBasedCaptureBuffer::CheckCounterClock( const VFrameTiming& i_rTiming, VSessionCheck& io_rCheck )
{
  if( i_rTiming.m_CounterClock == m_CounterClock ) return;
  m_CounterClock = i_rTiming.m_CounterClock;
  io_rCheck.m_bNewBufferSession = true;
  if( m_SyncSessions.empty() ) return;   // the first one is no change
  KVZ_LOG_DETAIL( "CaptureBuffer", "Buffer %1%: New Buffer Session due change in counter clock type", m_Name );
}

void VTimeBasedCaptureBuffer::CheckAgainstNewest( const VFrameTiming& i_rTiming, VSessionCheck& io_rCheck ) const
{
  const VSyncSessionRecord& rNewest = m_SyncSessions.rbegin()->second;
  if( rNewest.m_First.IsValid() && rNewest.m_First.m_BufferSession != GetCurrentBufferSessionUnlocked() )
  {
    io_rCheck.m_bNewSyncSession = true;
    KVZ_LOG_DETAIL( "CaptureBuffer", "%1% Buffer: New Sync Session has been forced by external request", m_Name );
  }
  else if( rNewest.m_Period != i_rTiming.m_Period )
  {
    io_rCheck.m_bNewBufferSession = true;
    KVZ_LOG_DETAIL( "CaptureBuffer", "%1% Buffer: New Buffer Session due to period changing from %2% to %3%", m_Name, rNewest.m_Period.Count(),
      i_rTiming.m_Period.Count() );
  }
  else
  {
    CheckClocks( i_rTiming, rNewest, io_rCheck );
  }
}

void VTimeBasedCaptureBuffer::CheckClocks( const VFrameTiming& i_rTiming, const VSyncSessionRecord& i_rRecord, VSessionCheck& io_rCheck ) const
{
  VClockComparison Comparison( i_rTiming.m_Period, io_rCheck.m_Continuous );
  Comparison.Compare( i_rRecord.m_LatestClocks.m_TickByClock, i_rTiming.m_Clocks.m_TickByClock );
  const bool bChanged = !Comparison.Changes().empty();
  if( bChanged && !io_rCheck.m_Continuous.empty() )
  {
    io_rCheck.m_bNewSyncSession = true;
    KVZ_LOG_DETAIL( "CaptureBuffer", "Buffer %1%: New Sync Session. Clock Changes: %2%(%3% continuous)", m_Name, Comparison.Changes(),
      io_rCheck.m_Continuous.size() );
  }
  else if( bChanged )
  {
    io_rCheck.m_bNewBufferSession = true;
    KVZ_LOG_DETAIL( "CaptureBuffer", "Buffer %1%: New Buffer Session. Clock Changes: %2%(None continuous)", m_Name, Comparison.Changes() );
  }
  else if( i_rRecord.m_BeatPeriod != i_rTiming.m_BeatPeriod || i_rRecord.m_BeatOffset != i_rTiming.m_BeatOffset )
  {
    io_rCheck.m_bNewSyncSession = true;
    KVZ_LOG_DETAIL( "CaptureBuffer", "Buffer %1%: New Sync Session due to change in beat (Beat [Period:Offset] %2%:%3% -> %4%:%5%)", m_Name,
      i_rRecord.m_BeatPeriod.Count(), i_rRecord.m_BeatOffset.Count(), i_rTiming.m_BeatPeriod.Count(), i_rTiming.m_BeatOffset.Count() );
  }
}

// The very first session of a buffer, or one that was begun from outside and has no frame yet, is as good as a new one.
void VTimeBasedCaptureBuffer::OpenBufferSession()
{
  if( !m_SyncSessions.empty() || HasCurrentSessionBegunUnlocked() ) StartNewBufferSessionUnlocked();
}

void VTimeBasedCaptureBuffer::OpenSyncSession( const VFrameTiming& i_rTiming, const VContinuousClocks& i_rContinuous )
{
  VSyncSessionRecord* pPrevious = m_SyncSessions.empty() ? nullptr : &NewestUnlocked();
  if( pPrevious ) pPrevious->m_End = pPrevious->m_Last;
  const uint32_t Id = ++m_NextSyncSessionId;
  VSyncSessionRecord& rRecord = m_SyncSessions[Id];
  rRecord.m_Id = Id;
  rRecord.m_Period = i_rTiming.m_Period;
  rRecord.m_BeatPeriod = i_rTiming.m_BeatPeriod;
  rRecord.m_BeatOffset = i_rTiming.m_BeatOffset;
  for( const auto& [Clock, Tick] : i_rTiming.m_Clocks.m_TickByClock )
  {
    if( Clock.Type() == KVZ::IClock::CounterFromSessionStart ) continue;
    const bool bContinuous = std::find( i_rContinuous.begin(), i_rContinuous.end(), Clock ) != i_rContinuous.end();
    rRecord.m_ContinuousSince[Clock] = pPrevious && bContinuous ? pPrevious->m_ContinuousSince[Clock] : Id;
    rRecord.m_StartTime.Set( Clock, Tick );
  }
  rRecord.m_ContinuousSince[m_CounterClock] = Id;
  rRecord.m_StartTime.Set( m_CounterClock, KVZ::VTick( 0 ) );
  const double Rate = rRecord.m_Period.Count() == 0
    ? 0.0
    : static_cast<double>( KVZ::VTick::TicksPerSecond ) / static_cast<double>( rRecord.m_Period.Count() );
  KVZ_LOG_DETAIL( "CaptureBuffer", "Buffer %1%: New Sync Session Created: Id = %2%. Period = %3% (%4%Hz), Beat = %5%:%6%", m_Name, Id,
    rRecord.m_Period.Count(), Rate, rRecord.m_BeatPeriod.Count(), rRecord.m_BeatOffset.Count() );
}

// A source whose clocks keep breaking opens session after session within one buffer session: those that have no frame left are not kept.
void VTimeBasedCaptureBuffer::DropEvictedRecords()
{
  while( m_SyncSessions.size() > 1 )
  {
    const VSyncSessionRecord& rOldest = m_SyncSessions.begin()->second;
    VToken First;
    const bool bPresent = IsSessionPresentUnlocked( rOldest.m_First.m_BufferSession );
    const bool bHasFrames = bPresent && GetFirstTokenUnlocked( rOldest.m_First.m_BufferSession, First );
    const bool bEvicted = bHasFrames && rOldest.m_Last.IsValid() && rOldest.m_Last.m_FrameNumber < First.m_FrameNumber;
    if( bPresent && !bEvicted ) return;
    m_SyncSessions.erase( m_SyncSessions.begin() );
  }
}

}
