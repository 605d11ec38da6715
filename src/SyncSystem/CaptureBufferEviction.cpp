// Giving memory back: frames leave at the oldest end until a whole block of the allocator is free.
#include "StageCoreRuntime/GlobalLog.h"
#include "SyncSystem/CaptureBuffer.h"

#include <algorithm>

namespace SyncSystem
{

void VCaptureBuffer::ConnectRecovery()
{
  m_pAllocator->SetRecovery(
    [pWeak = weak_from_this()]
    {
      const auto pBuffer = pWeak.lock();
      return pBuffer && pBuffer->RecoverMemory();
    } );
}

bool VCaptureBuffer::RecoverMemory()
{
  boost::lock_guard<boost::mutex> Lock( m_Mutex );
  return SweepRetiredUnlocked() || EvictUnlocked();
}

// True once the allocator got a block back.
bool VCaptureBuffer::EvictUnlocked()
{
  const uint64_t ReleasedBefore = m_pAllocator->GetReleasedBlocks();
  const int64_t Limit = EvictionLimitUnlocked();
  while( !m_Sessions.empty() )
  {
    const VBufferSession& rOldest = *m_Sessions.begin()->second;
    if( rOldest.IsEmpty() || rOldest.First()->m_FrameNumber >= Limit ) return false;
    EvictOldestFrameUnlocked();
    if( m_pAllocator->GetReleasedBlocks() != ReleasedBefore ) return true;
  }
  return false;
}

// Frames at or beyond it stay.
int64_t VCaptureBuffer::EvictionLimitUnlocked() const
{
  const int64_t Nothing = m_LastFrameNumber + 1;
  if( IsStateUnlocked( ECaptureState::NothingToProtect ) ) return Nothing;
  return IsStreamedUnlocked() ? std::min( Nothing, SlowestClientUnlocked() ) : m_CaptureStart.m_FrameNumber;
}

// The frame leaves its session even if its block is pinned, so that sessions have no holes; then only its memory waits for the pins to go.
void VCaptureBuffer::EvictOldestFrameUnlocked()
{
  const auto [Id, pSession] = *m_Sessions.begin();
  VFrameEntry* pEntry = pSession->First();
  VBufferSession::Unlink( pEntry );
  if( m_pAllocator->IsPinned( pEntry ) ) m_Retired.Append( pEntry );
  else DeleteFrame( pEntry );
  // The running session stays, even without frames: the next one goes on from there.
  if( pSession->m_bFinished && pSession->IsEmpty() ) RemoveSessionUnlocked( Id );
}

// Deletes evicted frames whose pins have gone; true if the allocator got a block back.
bool VCaptureBuffer::SweepRetiredUnlocked()
{
  const uint64_t ReleasedBefore = m_pAllocator->GetReleasedBlocks();
  for( VFrameEntry* pEntry = m_Retired.First(); !m_Retired.IsHead( pEntry ); )
  {
    VFrameEntry* pNext = pEntry->m_pNext;
    if( !m_pAllocator->IsPinned( pEntry ) )
    {
      VBufferSession::Unlink( pEntry );
      DeleteFrame( pEntry );
    }
    pEntry = pNext;
  }
  m_pAllocator->ReleaseIfUnpinned();
  return m_pAllocator->GetReleasedBlocks() != ReleasedBefore;
}

void VCaptureBuffer::RemoveSessionUnlocked( KVZ::VBufferSessionId i_Session )
{
  m_Sessions.erase( i_Session );
  OnBufferSessionRemoved( i_Session );
  m_OnBufferSessionRemoved( i_Session );
  KVZ_LOG_DETAIL( "CaptureBuffer", "%1% Buffer:Session %2% has been removed from buffer. There are %3% sessions remaining", m_Name, i_Session.Value(),
    m_Sessions.size() );
}

void VCaptureBuffer::DeleteFrame( VFrameEntry* i_pEntry )
{
  if( m_DeleteFrame ) m_DeleteFrame( i_pEntry );
  m_pAllocator->Free( i_pEntry );
}

void VCaptureBuffer::DeleteFrames( const VBufferSession& i_rSession )
{
  for( VFrameEntry* pEntry = i_rSession.First(); !i_rSession.IsHead( pEntry ); )
  {
    VFrameEntry* pNext = pEntry->m_pNext;
    DeleteFrame( pEntry );
    pEntry = pNext;
  }
}

}
