// The capture: its range, its states and what is told of it.
#include "SyncSystem/CaptureBuffer.h"

#include <algorithm>

namespace SyncSystem
{

bool VCaptureBuffer::StartCapture( const VCaptureRequest& i_rRequest )
{
  boost::lock_guard<boost::mutex> Lock( m_Mutex );
  if( !AdmitsUnlocked( i_rRequest ) ) return false;
  EnterCaptureUnlocked( i_rRequest );
  VToken Start = m_RequestedStart;
  VToken End = m_RequestedEnd;
  EPosition EndPosition = EPosition::Lost;
  const EPosition StartPosition = ResolveStartUnlocked( Start );
  if( StartPosition == EPosition::Lost || !ResolveEndUnlocked( Start, End, EndPosition ) )
  {
    m_Failure |= ECaptureFailure::StartLost;
    TellStatusUnlocked();
    return true;
  }
  m_CaptureStart = Start;
  m_CaptureEnd = End;
  BeginCaptureUnlocked( StartPosition, EndPosition );
  return true;
}

bool VCaptureBuffer::FailCapture( const VCaptureRequest& i_rRequest )
{
  boost::lock_guard<boost::mutex> Lock( m_Mutex );
  if( !AdmitsUnlocked( i_rRequest ) ) return false;
  EnterCaptureUnlocked( i_rRequest );
  TellStatusUnlocked();
  return true;
}

bool VCaptureBuffer::AdmitsUnlocked( const VCaptureRequest& i_rRequest ) const
{
  if( !i_rRequest.m_Id.IsValid() ) return false;
  if( i_rRequest.m_Id == m_CaptureSessionId ) return !IsStreamedUnlocked() || IsStateUnlocked( ECaptureState::Idle | ECaptureState::WaitingForStart );
  return IsStateUnlocked( ECaptureState::Idle | ECaptureState::Complete | ECaptureState::Cancelled );
}

void VCaptureBuffer::EnterCaptureUnlocked( const VCaptureRequest& i_rRequest )
{
  m_CaptureSessionId = i_rRequest.m_Id;
  m_CaptureType = i_rRequest.m_Type;
  m_CaptureInfo = i_rRequest.m_Info;
  m_RequestedStart = i_rRequest.m_Start;
  if( !m_RequestedStart.IsValid() ) GetFirstTokenUnlocked( m_CurrentBufferSession, m_RequestedStart );
  m_RequestedEnd = i_rRequest.m_End;
  m_CaptureFirstBufferSession = m_RequestedStart.m_BufferSession;
  m_CaptureStart = m_CaptureEnd = VToken();
  m_Failure = i_rRequest.m_Failure;
  m_Errors = i_rRequest.m_Errors;
  m_State = ECaptureState::Idle;
  for( auto& [Id, rClient] : m_Clients ) rClient.m_Errors.clear();
}

// Completes the position with its frame where there is one.
VCaptureBuffer::EPosition VCaptureBuffer::ResolveUnlocked( VToken& io_rToken ) const
{
  const VBufferSession* pSession = FindSessionUnlocked( io_rToken.m_BufferSession );
  if( !pSession ) return io_rToken.m_BufferSession >= m_CurrentBufferSession ? EPosition::Future : EPosition::Lost;
  io_rToken.m_pFrame = FindFrameUnlocked( io_rToken );
  if( io_rToken.m_pFrame ) return EPosition::Inside;
  const int64_t Last = pSession->IsEmpty() ? m_LastFrameNumber : pSession->Last()->m_FrameNumber;
  return io_rToken.m_FrameNumber > Last && !pSession->m_bFinished ? EPosition::Future : EPosition::Lost;
}

// A start that has been evicted becomes the oldest frame of its session, or the next one if the running session has none just now.
VCaptureBuffer::EPosition VCaptureBuffer::ResolveStartUnlocked( VToken& io_rToken ) const
{
  const VBufferSession* pSession = FindSessionUnlocked( io_rToken.m_BufferSession );
  if( pSession && pSession->IsEmpty() && io_rToken.m_FrameNumber <= m_LastFrameNumber ) io_rToken = GetNextTokenUnlocked();
  if( pSession && !pSession->IsEmpty() && io_rToken.m_FrameNumber < pSession->First()->m_FrameNumber )
    GetFirstTokenUnlocked( io_rToken.m_BufferSession, io_rToken );
  return ResolveUnlocked( io_rToken );
}

// False if there can be no such range. An end that a finished session does not have becomes that session's last frame; so does an open one.
bool VCaptureBuffer::ResolveEndUnlocked( const VToken& i_rStart, VToken& io_rEnd, EPosition& o_rPosition ) const
{
  int64_t Frames = 0;
  if( io_rEnd.IsValid() && !( Distance( i_rStart, io_rEnd, Frames ) && Frames > 0 ) ) return false;
  const VBufferSession* pSession = FindSessionUnlocked( i_rStart.m_BufferSession );
  o_rPosition = io_rEnd.IsValid() ? ResolveUnlocked( io_rEnd ) : EPosition::Future;
  if( pSession && pSession->m_bFinished && o_rPosition != EPosition::Inside )
  {
    GetLastTokenUnlocked( i_rStart.m_BufferSession, io_rEnd );
    o_rPosition = EPosition::Inside;
  }
  return o_rPosition != EPosition::Lost;
}

void VCaptureBuffer::BeginCaptureUnlocked( EPosition i_Start, EPosition i_End )
{
  SetStateUnlocked( ECaptureState::WaitingForStart );
  if( i_Start == EPosition::Inside )
  {
    if( IsStreamedUnlocked() ) ActivateClientsUnlocked( m_CaptureStart.m_pFrame );
    SetStateUnlocked( ECaptureState::Capturing );
    if( i_End == EPosition::Inside )
    {
      if( !m_CaptureEnd.IsSamePosition( m_RequestedEnd ) ) m_Failure |= ECaptureFailure::EndedEarly;
      ReachEndUnlocked();
    }
    WakeClientsUnlocked();
  }
  TellCaptureReadyUnlocked();
}

// After every frame.
void VCaptureBuffer::StepCaptureUnlocked( const VToken& i_rNewest )
{
  if( IsStateUnlocked( ECaptureState::WaitingForStart ) && m_CaptureStart.m_BufferSession == i_rNewest.m_BufferSession &&
    m_CaptureStart.m_FrameNumber <= i_rNewest.m_FrameNumber )
  {
    m_CaptureStart = i_rNewest;
    if( IsStreamedUnlocked() ) ActivateClientsUnlocked( i_rNewest.m_pFrame );
    SetStateUnlocked( ECaptureState::Capturing );
    if( IsStreamedUnlocked() ) TellCaptureReadyUnlocked();
  }
  if( !IsStateUnlocked( ECaptureState::Capturing ) ) return;
  OfferFrameUnlocked( i_rNewest.m_pFrame );
  if( m_CaptureEnd.IsValid() && m_CaptureEnd.m_FrameNumber <= i_rNewest.m_FrameNumber )
  {
    m_CaptureEnd = i_rNewest;
    ReachEndUnlocked();
    if( IsStreamedUnlocked() ) TellCaptureReadyUnlocked();
  }
  WakeClientsUnlocked();
}

void VCaptureBuffer::ReachEndUnlocked()
{
  SetStateUnlocked( ECaptureState::Captured );
  if( IsStreamedUnlocked() && !HasActiveClientUnlocked() ) SetStateUnlocked( ECaptureState::Complete );
}

bool VCaptureBuffer::SetCaptureEnd( KVZ::VCaptureSessionId i_Id, const VCaptureEnd& i_rEnd )
{
  boost::lock_guard<boost::mutex> Lock( m_Mutex );
  if( i_Id < m_CaptureSessionId ) return false;
  if( IsStateUnlocked( ECaptureState::WaitingForStart ) ) return SetWaitingEndUnlocked( i_rEnd );
  return IsStateUnlocked( ECaptureState::Capturing ) && SetRunningEndUnlocked( i_rEnd );
}

bool VCaptureBuffer::SetWaitingEndUnlocked( const VCaptureEnd& i_rEnd )
{
  VToken End = i_rEnd.m_End;
  EPosition Position = EPosition::Lost;
  if( !ResolveEndUnlocked( m_CaptureStart, End, Position ) ) return false;
  m_CaptureEnd = End;
  if( i_rEnd.m_bRequested ) m_RequestedEnd = i_rEnd.m_End;
  TellCaptureReadyUnlocked();
  return true;
}

bool VCaptureBuffer::SetRunningEndUnlocked( const VCaptureEnd& i_rEnd )
{
  VToken End = i_rEnd.m_End;
  if( End.IsValid() && End.m_BufferSession != m_CurrentBufferSession ) return false;
  const bool bNewFailure = m_Failure == ECaptureFailure::None && i_rEnd.m_Failure != ECaptureFailure::None;
  if( bNewFailure ) m_Failure = i_rEnd.m_Failure;
  if( i_rEnd.m_bRequested ) m_RequestedEnd = End;
  const bool bReached = End.IsValid() && End.m_FrameNumber <= m_LastFrameNumber;
  if( bReached ) End = NewestUnlocked();
  const bool bChanged = !End.IsSamePosition( m_CaptureEnd );
  m_CaptureEnd = End;
  if( bReached ) ReachEndUnlocked();
  else if( bNewFailure ) TellStatusUnlocked();
  if( bReached || bChanged ) TellCaptureReadyUnlocked();
  WakeClientsUnlocked();
  return true;
}

bool VCaptureBuffer::CancelCapture( KVZ::VCaptureSessionId i_Id )
{
  boost::lock_guard<boost::mutex> Lock( m_Mutex );
  if( i_Id < m_CaptureSessionId || !IsStateUnlocked( ECaptureState::CanBeCancelled ) ) return false;
  m_Failure |= ECaptureFailure::Cancelled;
  if( IsStateUnlocked( ECaptureState::WaitingForStart ) )
  {
    // They wait for a start that will not come, and learn it as readers of a capture without frames.
    if( IsStreamedUnlocked() ) ActivateClientsUnlocked( nullptr );
    m_CaptureStart = m_CaptureEnd = VToken();
  }
  else if( IsStateUnlocked( ECaptureState::Capturing ) )
  {
    m_CaptureEnd = NewestUnlocked();
  }
  if( IsStreamedUnlocked() ) TellNoCaptureUnlocked();
  SetStateUnlocked( HasActiveClientUnlocked() ? ECaptureState::Cancelling : ECaptureState::Cancelled );
  WakeClientsUnlocked();
  return true;
}

// The buffer session in which the capture was to start is over.
void VCaptureBuffer::DropWaitingCaptureUnlocked()
{
  m_CaptureStart = m_CaptureEnd = VToken();
  m_Failure |= ECaptureFailure::StartLost;
  if( IsStreamedUnlocked() ) TellNoCaptureUnlocked();
  SetStateUnlocked( ECaptureState::Idle );
}

// The buffer session that is being captured is over.
void VCaptureBuffer::EndWithSessionUnlocked()
{
  if( m_Failure == ECaptureFailure::None ) m_Failure = ECaptureFailure::EndedEarly;
  m_CaptureEnd = NewestUnlocked();
  ReachEndUnlocked();
  if( IsStreamedUnlocked() ) TellCaptureReadyUnlocked();
  WakeClientsUnlocked();
}

// The newest position of the current session, which has had a frame.
VToken VCaptureBuffer::NewestUnlocked() const
{
  VToken Newest{ m_CurrentBufferSession, m_LastFrameNumber, nullptr };
  Newest.m_pFrame = FindFrameUnlocked( Newest );
  return Newest;
}

void VCaptureBuffer::SetStateUnlocked( ECaptureState::Enum i_State )
{
  m_State = i_State;
  TellStatusUnlocked();
}

void VCaptureBuffer::TellCaptureReadyUnlocked()
{
  m_OnCaptureReady( m_CaptureSessionId, m_CaptureType, m_CaptureInfo, m_CaptureStart, m_CaptureEnd );
}

void VCaptureBuffer::TellNoCaptureUnlocked() { m_OnCaptureReady( m_CaptureSessionId, m_CaptureType, m_CaptureInfo, VToken(), VToken() ); }

void VCaptureBuffer::TellStatusUnlocked()
{
  VCaptureSessionStatus Status;
  FillStatusUnlocked( Status );
  m_OnStatus( std::move( Status ) );
}

bool VCaptureBuffer::Status( VCaptureSessionStatus& o_rStatus ) const
{
  boost::lock_guard<boost::mutex> Lock( m_Mutex );
  FillStatusUnlocked( o_rStatus );
  return m_CaptureSessionId.IsValid();
}

void VCaptureBuffer::FillStatusUnlocked( VCaptureSessionStatus& o_rStatus ) const
{
  o_rStatus.m_CaptureType = m_CaptureType;
  o_rStatus.m_CaptureSessionId = m_CaptureSessionId;
  o_rStatus.m_FirstBufferSession = m_CaptureFirstBufferSession;
  o_rStatus.m_Start = m_CaptureStart;
  o_rStatus.m_RequestedStart = m_RequestedStart;
  o_rStatus.m_End = m_CaptureEnd;
  o_rStatus.m_RequestedEnd = m_RequestedEnd;
  o_rStatus.m_State = m_State;
  o_rStatus.m_Failure = m_Failure;
  o_rStatus.m_Errors = m_Errors;
  for( const auto& [Id, rClient] : m_Clients )
  {
    o_rStatus.m_Errors.insert( o_rStatus.m_Errors.end(), rClient.m_Errors.begin(), rClient.m_Errors.end() );
  }
  o_rStatus.m_AvailableFrames = AvailableFramesUnlocked();
  o_rStatus.m_CapturedFrames = CapturedFramesUnlocked();
}

// The newest frame number of the range so far.
int64_t VCaptureBuffer::LastCapturedUnlocked() const
{
  return m_CaptureEnd.IsValid() ? std::min( m_CaptureEnd.m_FrameNumber, m_LastFrameNumber ) : m_LastFrameNumber;
}

uint64_t VCaptureBuffer::CapturedFramesUnlocked() const
{
  if( IsStateUnlocked( ECaptureState::Idle | ECaptureState::WaitingForStart ) || !m_CaptureStart.IsValid() ) return 0;
  return static_cast<uint64_t>( LastCapturedUnlocked() - m_CaptureStart.m_FrameNumber + 1 );
}

uint64_t VCaptureBuffer::AvailableFramesUnlocked() const
{
  if( !IsStateUnlocked( ECaptureState::Capturing | ECaptureState::Captured ) ) return 0;
  const int64_t First = IsStreamedUnlocked() ? SlowestClientUnlocked() : m_CaptureStart.m_FrameNumber;
  const int64_t Last = LastCapturedUnlocked();
  return First > Last ? 0 : static_cast<uint64_t>( Last - First + 1 );
}

}
