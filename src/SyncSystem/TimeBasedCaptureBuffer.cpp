// Storing frames with their time, and converting between ticks and positions.
#include "SyncSystem/TimeBasedCaptureBuffer.h"

#include "StageCoreRuntime/DebugServices.h"

#include <utility>

namespace SyncSystem
{

namespace
{

bool IsCounter( const KVZ::IClock& i_rClock ) { return i_rClock.Type() == KVZ::IClock::CounterFromSessionStart; }

void RemoveCounters( KVZ::ITickInClocks& io_rClocks )
{
  auto& rMap = io_rClocks.m_TickByClock;
  while( !rMap.empty() && IsCounter( rMap.rbegin()->first ) ) rMap.erase( rMap.end() - 1 );   // they sort last
}

int64_t FloorDivide( int64_t i_Value, int64_t i_Divisor ) { return i_Value / i_Divisor - ( i_Value % i_Divisor < 0 ? 1 : 0 ); }

}

KVZ::VTick VSyncSessionRecord::CounterAt( const VToken& i_rToken ) const
{
  return CounterStart() + m_Period * ( i_rToken.m_FrameNumber - m_First.m_FrameNumber );
}

KVZ::VTick VSyncSessionRecord::CounterStart() const
{
  KVZ_ASSERT( m_StartTime.m_TickByClock.rbegin()->first.Type() == KVZ::IClock::CounterFromSessionStart );
  return m_StartTime.m_TickByClock.rbegin()->second;
}

VToken VTimeBasedCaptureBuffer::AddFrame( VFrameEntry* i_pEntry, VFrameTiming& io_rTiming, uint32_t& o_rSessionId )
{
  boost::lock_guard<boost::mutex> Lock( m_Mutex );
  CheckSession( io_rTiming, { .m_bForceBufferSession = std::exchange( m_bBufferSessionRequested, false ) } );
  VSyncSessionRecord& rNewest = NewestUnlocked();
  rNewest.m_LatestClocks = io_rTiming.m_Clocks;
  RemoveCounters( rNewest.m_LatestClocks );
  rNewest.m_Last = AddFrameUnlocked( i_pEntry );
  rNewest.m_LastPayload = io_rTiming.m_Payload;
  if( !rNewest.m_First.IsValid() ) rNewest.m_First = rNewest.m_Last;
  io_rTiming.m_Clocks.Set( m_CounterClock, rNewest.CounterAt( rNewest.m_Last ) );
  o_rSessionId = rNewest.m_Id;
  return rNewest.m_Last;
}

bool VTimeBasedCaptureBuffer::ForceNewSyncSession( const VFrameTiming& i_rTiming, uint32_t& o_rSessionId )
{
  if( i_rTiming.m_Period < KVZ::VTick( 1 ) || !IsCounter( i_rTiming.m_CounterClock ) ) return false;
  boost::lock_guard<boost::mutex> Lock( m_Mutex );
  // A buffer session that was asked for begins here, not again with the first frame.
  CheckSession( i_rTiming, { .m_bForceBufferSession = std::exchange( m_bBufferSessionRequested, false ), .m_bForceSyncSession = true } );
  VSyncSessionRecord& rNewest = NewestUnlocked();
  rNewest.m_LatestClocks = KVZ::Shifted( i_rTiming.m_Clocks, -i_rTiming.m_Period );
  RemoveCounters( rNewest.m_LatestClocks );
  rNewest.m_First = GetNextTokenUnlocked();
  o_rSessionId = rNewest.m_Id;
  return true;
}

void VTimeBasedCaptureBuffer::RequestNewBufferSession()
{
  boost::lock_guard<boost::mutex> Lock( m_Mutex );
  m_bBufferSessionRequested = true;
}

const VSyncSessionRecord* VTimeBasedCaptureBuffer::FindUnlocked( uint32_t i_SessionId ) const
{
  const auto Found = m_SyncSessions.find( i_SessionId );
  return Found == m_SyncSessions.end() ? nullptr : &Found->second;
}

bool VTimeBasedCaptureBuffer::FindRecord( uint32_t i_SessionId, VSyncSessionRecord& o_rRecord ) const
{
  boost::lock_guard<boost::mutex> Lock( m_Mutex );
  const VSyncSessionRecord* pRecord = FindUnlocked( i_SessionId );
  if( pRecord ) o_rRecord = *pRecord;
  return pRecord != nullptr;
}

bool VTimeBasedCaptureBuffer::NewestRecord( VSyncSessionRecord& o_rRecord ) const
{
  boost::lock_guard<boost::mutex> Lock( m_Mutex );
  if( m_SyncSessions.empty() ) return false;
  o_rRecord = m_SyncSessions.rbegin()->second;
  return true;
}

bool VTimeBasedCaptureBuffer::GetSourceSyncSession( uint32_t i_SessionId, KVZ::ISourceSyncSession& o_rSession ) const
{
  boost::lock_guard<boost::mutex> Lock( m_Mutex );
  const VSyncSessionRecord* pRecord = FindUnlocked( i_SessionId );
  if( !pRecord ) return false;
  o_rSession.m_Id = pRecord->m_Id;
  o_rSession.m_StartTime = pRecord->m_StartTime;
  o_rSession.m_ContinuousSince = pRecord->m_ContinuousSince;
  o_rSession.m_Period = pRecord->m_Period;
  o_rSession.m_BeatPeriod = pRecord->m_BeatPeriod;
  o_rSession.m_BeatOffset = pRecord->m_BeatOffset;
  return true;
}

uint32_t VTimeBasedCaptureBuffer::NewestSessionId() const
{
  boost::lock_guard<boost::mutex> Lock( m_Mutex );
  return m_NextSyncSessionId;
}

uint32_t VTimeBasedCaptureBuffer::OldestSessionId() const
{
  boost::lock_guard<boost::mutex> Lock( m_Mutex );
  return m_SyncSessions.empty() ? 0 : m_SyncSessions.begin()->first;
}

bool VTimeBasedCaptureBuffer::LastPayload( uint32_t i_SessionId, int64_t& o_rPayload ) const
{
  boost::lock_guard<boost::mutex> Lock( m_Mutex );
  const VSyncSessionRecord* pRecord = FindUnlocked( i_SessionId );
  if( !pRecord || !pRecord->m_Last.IsValid() ) return false;
  o_rPayload = pRecord->m_LastPayload;
  return true;
}

bool VTimeBasedCaptureBuffer::SessionForToken( const VToken& i_rToken, uint32_t& o_rSessionId ) const
{
  boost::lock_guard<boost::mutex> Lock( m_Mutex );
  for( auto Entry = m_SyncSessions.rbegin(); Entry != m_SyncSessions.rend(); ++Entry )
  {
    const VToken& rFirst = Entry->second.m_First;
    if( !rFirst.IsValid() || rFirst.m_BufferSession != i_rToken.m_BufferSession || rFirst.m_FrameNumber > i_rToken.m_FrameNumber ) continue;
    o_rSessionId = Entry->first;
    return true;
  }
  return false;
}

bool VTimeBasedCaptureBuffer::FirstPosition( uint32_t i_SessionId, VToken& o_rToken, KVZ::ITickInClocks& o_rClocks ) const
{
  boost::lock_guard<boost::mutex> Lock( m_Mutex );
  const VSyncSessionRecord* pRecord = FindUnlocked( i_SessionId );
  return pRecord && PositionUnlocked( *pRecord, pRecord->m_First, o_rToken, o_rClocks );
}

bool VTimeBasedCaptureBuffer::LastPosition( uint32_t i_SessionId, VToken& o_rToken, KVZ::ITickInClocks& o_rClocks ) const
{
  boost::lock_guard<boost::mutex> Lock( m_Mutex );
  const VSyncSessionRecord* pRecord = FindUnlocked( i_SessionId );
  return pRecord && PositionUnlocked( *pRecord, pRecord->m_Last, o_rToken, o_rClocks );
}

bool VTimeBasedCaptureBuffer::PositionUnlocked( const VSyncSessionRecord& i_rRecord, const VToken& i_rPosition, VToken& o_rToken,
  KVZ::ITickInClocks& o_rClocks ) const
{
  if( !i_rPosition.IsValid() || !IsSessionPresentUnlocked( i_rPosition.m_BufferSession ) ) return false;
  o_rToken = i_rPosition;
  o_rClocks = KVZ::Shifted( i_rRecord.m_StartTime, i_rRecord.CounterAt( i_rPosition ) - i_rRecord.CounterStart() );
  return true;
}

bool VTimeBasedCaptureBuffer::TickForToken( uint32_t i_SessionId, const VToken& i_rToken, KVZ::VTick& o_rCounter ) const
{
  boost::lock_guard<boost::mutex> Lock( m_Mutex );
  const VSyncSessionRecord* pRecord = FindUnlocked( i_SessionId );
  if( !pRecord || !i_rToken.IsValid() || pRecord->m_First.m_BufferSession != i_rToken.m_BufferSession ) return false;
  o_rCounter = pRecord->CounterAt( i_rToken );
  return true;
}

bool VTimeBasedCaptureBuffer::TokenForTick( uint32_t i_SessionId, KVZ::VTick i_Counter, VToken& o_rToken, KVZ::VTick& o_rRemainder ) const
{
  boost::lock_guard<boost::mutex> Lock( m_Mutex );
  const VSyncSessionRecord* pRecord = FindUnlocked( i_SessionId );
  if( !pRecord || !pRecord->m_First.IsValid() || pRecord->m_Period < KVZ::VTick( 1 ) ) return false;
  const KVZ::VTick Distance = i_Counter - pRecord->CounterStart();
  const int64_t Frames = FloorDivide( Distance.Count(), pRecord->m_Period.Count() );
  const KVZ::VTick Over = Distance - pRecord->m_Period * Frames;
  o_rToken = { pRecord->m_First.m_BufferSession, pRecord->m_First.m_FrameNumber + Frames, nullptr };
  o_rRemainder = Over == KVZ::VTick( 0 ) ? Over : pRecord->m_Period - Over;
  return true;
}

void VTimeBasedCaptureBuffer::OnBufferSessionRemoved( KVZ::VBufferSessionId i_Session )
{
  std::erase_if( m_SyncSessions, [i_Session]( const auto& i_rEntry ) { return i_rEntry.second.m_First.m_BufferSession == i_Session; } );
}

}
