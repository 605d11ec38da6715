// The frames: storing, finding and pinning them.
#include "SyncSystem/CaptureBuffer.h"

#include <cstdlib>
#include <new>

namespace SyncSystem
{

VCaptureBuffer::VCaptureBuffer( VSettings i_Settings )
  : m_Name( std::move( i_Settings.m_Name ) ),
    m_pAllocator( std::move( i_Settings.m_pAllocator ) ),
    m_DeleteFrame( std::move( i_Settings.m_DeleteFrame ) ),
    m_OnBufferSessionRemoved( i_Settings.m_pPostalService ),
    m_OnNewData( i_Settings.m_pPostalService ),
    m_OnStatus( i_Settings.m_pPostalService ),
    m_OnCaptureReady( i_Settings.m_pPostalService )
{
}

VCaptureBuffer::~VCaptureBuffer()
{
  DeleteFrames( m_Retired );
  for( const auto& [Id, pSession] : m_Sessions ) DeleteFrames( *pSession );
}

VFrameEntry* VCaptureBuffer::NewEntry( size_t i_PayloadSize )
{
  void* pMemory = m_pAllocator->Allocate( sizeof( VFrameEntry ) + i_PayloadSize );
  return pMemory ? new( pMemory ) VFrameEntry : nullptr;
}

void VCaptureBuffer::DiscardEntry( VFrameEntry* i_pEntry ) { m_pAllocator->Free( i_pEntry ); }

VToken VCaptureBuffer::AddFrameUnlocked( VFrameEntry* i_pEntry )
{
  VBufferSession& rSession = CurrentSessionUnlocked();
  i_pEntry->m_FrameNumber = ++m_LastFrameNumber;
  rSession.Append( i_pEntry );
  const VToken Newest{ m_CurrentBufferSession, m_LastFrameNumber, i_pEntry };
  m_OnNewData( m_CurrentBufferSession );
  StepCaptureUnlocked( Newest );
  return Newest;
}

VCaptureBuffer::VBufferSession& VCaptureBuffer::CurrentSessionUnlocked()
{
  auto& rpSession = m_Sessions[m_CurrentBufferSession];
  if( !rpSession ) rpSession = std::make_shared<VBufferSession>();
  return *rpSession;
}

VToken VCaptureBuffer::StartNewBufferSession()
{
  boost::lock_guard<boost::mutex> Lock( m_Mutex );
  return StartNewBufferSessionUnlocked();
}

VToken VCaptureBuffer::StartNewBufferSessionUnlocked()
{
  const KVZ::VBufferSessionId Ending = m_CurrentBufferSession;
  VBufferSession* pEnding = FindSessionUnlocked( Ending );
  if( pEnding ) pEnding->m_bFinished = true;
  if( IsStateUnlocked( ECaptureState::WaitingForStart ) && m_CaptureStart.m_BufferSession <= Ending ) DropWaitingCaptureUnlocked();
  else if( IsStateUnlocked( ECaptureState::Capturing ) ) EndWithSessionUnlocked();
  m_CurrentBufferSession = KVZ::VBufferSessionId( Ending.Value() + 1 );
  if( pEnding && pEnding->IsEmpty() ) RemoveSessionUnlocked( Ending );
  return GetNextTokenUnlocked();
}

VCaptureBuffer::VBufferSession* VCaptureBuffer::FindSessionUnlocked( KVZ::VBufferSessionId i_Session ) const
{
  const auto Found = m_Sessions.find( i_Session );
  return Found == m_Sessions.end() ? nullptr : Found->second.get();
}

bool VCaptureBuffer::IsSessionPresentUnlocked( KVZ::VBufferSessionId i_Session ) const
{
  return i_Session == m_CurrentBufferSession || FindSessionUnlocked( i_Session );
}

bool VCaptureBuffer::HasCurrentSessionBegunUnlocked() const { return FindSessionUnlocked( m_CurrentBufferSession ) != nullptr; }

bool VCaptureBuffer::GetFirstToken( KVZ::VBufferSessionId i_Session, VToken& o_rToken ) const
{
  boost::lock_guard<boost::mutex> Lock( m_Mutex );
  return GetFirstTokenUnlocked( i_Session, o_rToken );
}

bool VCaptureBuffer::GetFirstTokenUnlocked( KVZ::VBufferSessionId i_Session, VToken& o_rToken ) const
{
  const VBufferSession* pSession = FindSessionUnlocked( i_Session );
  if( !pSession || pSession->IsEmpty() ) return false;
  o_rToken = { i_Session, pSession->First()->m_FrameNumber, pSession->First() };
  return true;
}

bool VCaptureBuffer::GetLastToken( KVZ::VBufferSessionId i_Session, VToken& o_rToken ) const
{
  boost::lock_guard<boost::mutex> Lock( m_Mutex );
  return GetLastTokenUnlocked( i_Session, o_rToken );
}

bool VCaptureBuffer::GetLastTokenUnlocked( KVZ::VBufferSessionId i_Session, VToken& o_rToken ) const
{
  const VBufferSession* pSession = FindSessionUnlocked( i_Session );
  if( !pSession || pSession->IsEmpty() ) return false;
  o_rToken = { i_Session, pSession->Last()->m_FrameNumber, pSession->Last() };
  return true;
}

bool VCaptureBuffer::GetNewestToken( VToken& o_rToken ) const
{
  boost::lock_guard<boost::mutex> Lock( m_Mutex );
  return GetLastTokenUnlocked( m_CurrentBufferSession, o_rToken );
}

VToken VCaptureBuffer::GetNextToken() const
{
  boost::lock_guard<boost::mutex> Lock( m_Mutex );
  return GetNextTokenUnlocked();
}

VToken VCaptureBuffer::GetNextTokenUnlocked() const { return { m_CurrentBufferSession, m_LastFrameNumber + 1, nullptr }; }

size_t VCaptureBuffer::GetBufferSessions( std::vector<KVZ::VBufferSessionId>& o_rSessions ) const
{
  boost::lock_guard<boost::mutex> Lock( m_Mutex );
  o_rSessions.clear();
  for( const auto& [Id, pSession] : m_Sessions )
  {
    if( !pSession->IsEmpty() ) o_rSessions.push_back( Id );
  }
  return o_rSessions.size();
}

KVZ::VBufferSessionId VCaptureBuffer::GetCurrentBufferSession() const
{
  boost::lock_guard<boost::mutex> Lock( m_Mutex );
  return m_CurrentBufferSession;
}

bool VCaptureBuffer::Distance( const VToken& i_rFrom, const VToken& i_rTo, int64_t& o_rFrames )
{
  if( !i_rFrom.IsValid() || i_rFrom.m_BufferSession != i_rTo.m_BufferSession ) return false;
  o_rFrames = i_rTo.m_FrameNumber - i_rFrom.m_FrameNumber;
  return true;
}

bool VCaptureBuffer::Read( VToken& io_rToken, VRefCountedToken& o_rFrame )
{
  o_rFrame.Clear();
  boost::lock_guard<boost::mutex> Lock( m_Mutex );
  io_rToken.m_pFrame = FindFrameUnlocked( io_rToken );
  if( !io_rToken.m_pFrame ) return false;
  m_pAllocator->Pin( io_rToken.m_pFrame, true );
  o_rFrame = VRefCountedToken( shared_from_this(), io_rToken );
  return true;
}

void VCaptureBuffer::Advance( VToken& io_rToken, int64_t i_Frames ) const
{
  boost::lock_guard<boost::mutex> Lock( m_Mutex );
  const VBufferSession* pSession = FindSessionUnlocked( io_rToken.m_BufferSession );
  const bool bInside = pSession && pSession->Contains( io_rToken.m_FrameNumber ) && pSession->Contains( io_rToken.m_FrameNumber + i_Frames );
  io_rToken.m_FrameNumber += i_Frames;
  io_rToken.m_pFrame = bInside ? Walk( *pSession, io_rToken.m_FrameNumber, io_rToken.m_pFrame ) : nullptr;
}

// A number within the session's range names one frame for good, so the cached pointer is good as well.
VFrameEntry* VCaptureBuffer::FindFrameUnlocked( const VToken& i_rToken ) const
{
  const VBufferSession* pSession = FindSessionUnlocked( i_rToken.m_BufferSession );
  if( !pSession || !pSession->Contains( i_rToken.m_FrameNumber ) ) return nullptr;
  return i_rToken.m_pFrame ? i_rToken.m_pFrame : Walk( *pSession, i_rToken.m_FrameNumber, nullptr );
}

// From the nearest of both ends and the hint, which is a frame of the session or null. The session contains the number.
VFrameEntry* VCaptureBuffer::Walk( const VBufferSession& i_rSession, int64_t i_FrameNumber, VFrameEntry* i_pHint )
{
  VFrameEntry* pEntry = i_rSession.First();
  for( VFrameEntry* pOther : { i_rSession.Last(), i_pHint } )
  {
    if( pOther && std::abs( pOther->m_FrameNumber - i_FrameNumber ) < std::abs( pEntry->m_FrameNumber - i_FrameNumber ) ) pEntry = pOther;
  }
  while( pEntry->m_FrameNumber < i_FrameNumber ) pEntry = pEntry->m_pNext;
  while( pEntry->m_FrameNumber > i_FrameNumber ) pEntry = pEntry->m_pPrevious;
  return pEntry;
}

void VCaptureBuffer::OnBufferSessionRemoved( KVZ::VBufferSessionId ) {}

}
