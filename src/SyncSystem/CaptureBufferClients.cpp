// The clients: who reads the capture, what they get next and when they are notified.
#include "SyncSystem/CaptureBuffer.h"

#include <algorithm>

namespace SyncSystem
{

uint32_t VCaptureBuffer::RegisterClient( std::function<void()> i_Notify )
{
  boost::lock_guard<boost::mutex> Lock( m_Mutex );
  m_Clients[++m_NextClientId].m_Notify = std::move( i_Notify );
  return m_NextClientId;
}

bool VCaptureBuffer::UnregisterClient( uint32_t i_ClientId )
{
  decltype( m_Clients )::node_type Removed;   // ends without the lock
  boost::lock_guard<boost::mutex> Lock( m_Mutex );
  Removed = m_Clients.extract( i_ClientId );
  if( Removed.empty() ) return false;
  if( Removed.mapped().m_bActive ) OnClientLeftUnlocked();
  return true;
}

bool VCaptureBuffer::ClientNextFrame( uint32_t i_ClientId, VRefCountedToken& io_rFrame, VClientRead& o_rRead, VCaptureSessionInfo* o_pInfo )
{
  io_rFrame.Clear();
  o_rRead.m_Result = EClientResult::NoFrameYet;
  o_rRead.m_CaptureSessionId = KVZ::VCaptureSessionId();
  boost::lock_guard<boost::mutex> Lock( m_Mutex );
  const auto Found = m_Clients.find( i_ClientId );
  if( Found == m_Clients.end() ) return false;
  VClient& rClient = Found->second;
  o_rRead.m_Errors = rClient.m_Errors;
  if( !rClient.m_bActive )
  {
    rClient.m_bWaiting = true;
    return true;
  }
  o_rRead.m_CaptureSessionId = m_CaptureSessionId;
  if( o_pInfo ) *o_pInfo = m_CaptureInfo;
  o_rRead.m_Result = ReadNextUnlocked( rClient, io_rFrame );
  WakeDrainingClientsUnlocked();
  return true;
}

EClientResult::Enum VCaptureBuffer::ReadNextUnlocked( VClient& io_rClient, VRefCountedToken& o_rFrame )
{
  io_rClient.m_bWaiting = false;
  if( IsStateUnlocked( ECaptureState::Cancelling ) )
  {
    LeaveUnlocked( io_rClient );
    return EClientResult::Cancelled;
  }
  if( io_rClient.m_bToldFinished )
  {
    LeaveUnlocked( io_rClient );
    return EClientResult::Finished;
  }
  if( io_rClient.m_pNextFrame ) TakeFrameUnlocked( io_rClient, o_rFrame );
  if( io_rClient.m_pNextFrame ) return EClientResult::MoreToCome;
  if( IsStateUnlocked( ECaptureState::Captured ) )
  {
    // It leaves only when it asks again: until then it is writing its last frame and closing its files.
    io_rClient.m_bToldFinished = true;
    return EClientResult::Finished;
  }
  io_rClient.m_bWaiting = true;
  return EClientResult::NoFrameYet;
}

// The client's next frame, pinned. The one behind it is next, if it is there and in the range.
void VCaptureBuffer::TakeFrameUnlocked( VClient& io_rClient, VRefCountedToken& o_rFrame )
{
  VFrameEntry* pFrame = io_rClient.m_pNextFrame;
  m_pAllocator->Pin( pFrame, true );
  o_rFrame = VRefCountedToken( shared_from_this(), VToken{ m_CaptureStart.m_BufferSession, pFrame->m_FrameNumber, pFrame } );
  io_rClient.m_pNextFrame = pFrame->m_FrameNumber < LastCapturedUnlocked() ? pFrame->m_pNext : nullptr;
}

bool VCaptureBuffer::ClientFinished( uint32_t i_ClientId, uint32_t i_Failure, const boost::optional<VCaptureError>& i_rError, bool i_bLast )
{
  boost::lock_guard<boost::mutex> Lock( m_Mutex );
  const auto Found = m_Clients.find( i_ClientId );
  if( Found == m_Clients.end() ) return false;
  if( i_rError ) Found->second.m_Errors.push_back( *i_rError );
  m_Failure |= i_Failure;
  TellStatusUnlocked();
  if( i_bLast && Found->second.m_bActive ) LeaveUnlocked( Found->second );
  return true;
}

void VCaptureBuffer::SetDataDrainLimit( uint64_t i_Frames )
{
  boost::lock_guard<boost::mutex> Lock( m_Mutex );
  m_DataDrainLimit = i_Frames;
  WakeDrainingClientsUnlocked();
}

void VCaptureBuffer::ActivateClientsUnlocked( VFrameEntry* i_pFirst )
{
  for( auto& [Id, rClient] : m_Clients )
  {
    rClient.m_bActive = true;
    rClient.m_bToldFinished = false;
    rClient.m_pNextFrame = i_pFirst;
  }
}

// To those that have reached the live end.
void VCaptureBuffer::OfferFrameUnlocked( VFrameEntry* i_pEntry )
{
  for( auto& [Id, rClient] : m_Clients )
  {
    if( rClient.m_bActive && !rClient.m_pNextFrame ) rClient.m_pNextFrame = i_pEntry;
  }
}

// After a change of the capture: those that learn its end or its cancel, and those that have a frame to read. A client at the live end of a
// running capture has nothing to ask for.
void VCaptureBuffer::WakeClientsUnlocked()
{
  for( auto& [Id, rClient] : m_Clients )
  {
    if( !rClient.m_bActive || !rClient.m_bWaiting ) continue;
    const bool bRangeEnded = !rClient.m_pNextFrame && IsStateUnlocked( ECaptureState::Captured );
    if( bRangeEnded || IsStateUnlocked( ECaptureState::Cancelling ) ) WakeUnlocked( rClient );
  }
  WakeDrainingClientsUnlocked();
}

// Those that have a frame to read and are not too far ahead of the slowest one.
void VCaptureBuffer::WakeDrainingClientsUnlocked()
{
  const int64_t Slowest = SlowestClientUnlocked();
  for( auto& [Id, rClient] : m_Clients )
  {
    if( !rClient.m_bActive || !rClient.m_bWaiting || !rClient.m_pNextFrame ) continue;
    if( static_cast<uint64_t>( rClient.m_pNextFrame->m_FrameNumber - Slowest ) <= m_DataDrainLimit ) WakeUnlocked( rClient );
  }
}

void VCaptureBuffer::WakeUnlocked( VClient& io_rClient )
{
  io_rClient.m_bWaiting = false;
  if( io_rClient.m_Notify ) io_rClient.m_Notify();
}

bool VCaptureBuffer::HasActiveClientUnlocked() const
{
  return std::any_of( m_Clients.begin(), m_Clients.end(), []( const auto& i_rEntry ) { return i_rEntry.second.m_bActive; } );
}

// The lowest next frame of the active clients; the highest number if none has one.
int64_t VCaptureBuffer::SlowestClientUnlocked() const
{
  int64_t Slowest = std::numeric_limits<int64_t>::max();
  for( const auto& [Id, rClient] : m_Clients )
  {
    if( rClient.m_bActive && rClient.m_pNextFrame ) Slowest = std::min( Slowest, rClient.m_pNextFrame->m_FrameNumber );
  }
  return Slowest;
}

void VCaptureBuffer::LeaveUnlocked( VClient& io_rClient )
{
  io_rClient.m_bActive = false;
  io_rClient.m_bWaiting = true;
  io_rClient.m_pNextFrame = nullptr;
  OnClientLeftUnlocked();
}

void VCaptureBuffer::OnClientLeftUnlocked()
{
  if( HasActiveClientUnlocked() ) WakeDrainingClientsUnlocked();
  else if( IsStateUnlocked( ECaptureState::Cancelling ) ) SetStateUnlocked( ECaptureState::Cancelled );
  else if( IsStateUnlocked( ECaptureState::Captured ) ) SetStateUnlocked( ECaptureState::Complete );
}

}
