#include "tests/SyncSystem/CaptureBuffer/CaptureBufferModel.h"

#include <algorithm>

using SyncSystem::ECaptureFailure;

bool VCaptureBufferModel::Add()
{
  if( !TakeSlot() ) return false;
  m_Sessions[m_Current].m_Frames.push_back( { ++m_Last, m_CurrentBlock } );
  Step();
  return true;
}

bool VCaptureBufferModel::TakeSlot()
{
  if( m_CurrentBlock == NoBlock || m_SlotsUsed == m_FramesPerBlock )
  {
    m_CurrentBlock = NoBlock;
    while( m_Live.size() == m_Blocks )
    {
      if( !Recover() ) return false;
    }
    m_CurrentBlock = m_NextBlock++;
    m_SlotsUsed = 0;
  }
  ++m_SlotsUsed;
  ++m_Live[m_CurrentBlock];
  return true;
}

// Frees one block, if it can.
bool VCaptureBufferModel::Recover()
{
  const size_t Held = m_Live.size();
  std::deque<VFrame> Retired;
  Retired.swap( m_Retired );
  for( const VFrame& rFrame : Retired )
  {
    if( m_Pins[rFrame.m_Block] == 0 ) Delete( rFrame );
    else m_Retired.push_back( rFrame );
  }
  const int64_t Limit = this->Limit();
  while( m_Live.size() == Held && !m_Sessions.empty() )
  {
    auto& [Id, rSession] = *m_Sessions.begin();
    if( rSession.m_Frames.empty() || rSession.m_Frames.front().m_Number >= Limit ) return false;
    const VFrame Oldest = rSession.m_Frames.front();
    rSession.m_Frames.pop_front();
    if( m_Pins[Oldest.m_Block] == 0 ) Delete( Oldest );
    else m_Retired.push_back( Oldest );
    if( rSession.m_bFinished && rSession.m_Frames.empty() ) RemoveSession( Id );
  }
  return m_Live.size() != Held;
}

void VCaptureBufferModel::Delete( const VFrame& i_rFrame )
{
  if( --m_Live[i_rFrame.m_Block] != 0 ) return;
  m_Live.erase( i_rFrame.m_Block );
  if( m_CurrentBlock == i_rFrame.m_Block ) m_CurrentBlock = NoBlock;
}

void VCaptureBufferModel::RemoveSession( uint32_t i_Session )
{
  m_Sessions.erase( i_Session );
  m_RemovedSessions.push_back( i_Session );
}

int64_t VCaptureBufferModel::Limit() const
{
  if( !Is( EState::Capturing | EState::Captured | EState::Cancelling ) ) return m_Last + 1;
  return m_bStreamed ? Slowest() : m_Start.m_Number;
}

void VCaptureBufferModel::NewSession()
{
  const auto Ending = m_Sessions.find( m_Current );
  if( m_State == EState::WaitingForStart && m_Start.m_Session <= m_Current )
  {
    m_Start = m_End = {};
    m_Failure |= ECaptureFailure::StartLost;
    m_State = EState::Idle;
  }
  if( m_State == EState::Capturing )
  {
    if( m_Failure == 0 ) m_Failure = ECaptureFailure::EndedEarly;
    m_End = { m_Current, m_Last };
    ReachEnd();
  }
  ++m_Current;
  if( Ending == m_Sessions.end() ) return;
  Ending->second.m_bFinished = true;
  if( Ending->second.m_Frames.empty() ) RemoveSession( Ending->first );
}

VCaptureBufferModel::EWhere VCaptureBufferModel::Locate( VPosition i_Position ) const
{
  const auto Found = m_Sessions.find( i_Position.m_Session );
  if( Found == m_Sessions.end() ) return i_Position.m_Session >= m_Current ? EWhere::Future : EWhere::Lost;
  const VSession& rSession = Found->second;
  if( i_Position.m_Number < Low( rSession ) ) return EWhere::Lost;
  if( i_Position.m_Number <= High( rSession ) ) return EWhere::Inside;
  return rSession.m_bFinished ? EWhere::Lost : EWhere::Future;
}

bool VCaptureBufferModel::ResolveEnd( VPosition i_Start, VPosition& io_rEnd ) const
{
  if( io_rEnd.m_Session != 0 && ( io_rEnd.m_Session != i_Start.m_Session || io_rEnd.m_Number <= i_Start.m_Number ) ) return false;
  const auto Found = m_Sessions.find( i_Start.m_Session );
  if( Found == m_Sessions.end() || !Found->second.m_bFinished ) return true;
  if( io_rEnd.m_Session == 0 || io_rEnd.m_Number > High( Found->second ) ) io_rEnd = { i_Start.m_Session, High( Found->second ) };
  return true;
}

bool VCaptureBufferModel::Start( const VRequest& i_rRequest )
{
  const bool bAgain = i_rRequest.m_Id == m_Id;
  const bool bAdmitted = bAgain ? !m_bStreamed || Is( EState::Idle | EState::WaitingForStart )
                                : Is( EState::Idle | EState::Complete | EState::Cancelled );
  if( i_rRequest.m_Id == 0 || !bAdmitted ) return false;
  m_Id = i_rRequest.m_Id;
  m_bStreamed = i_rRequest.m_bStreamed;
  m_RequestedStart = i_rRequest.m_Start;
  m_RequestedEnd = i_rRequest.m_End;
  const auto Current = m_Sessions.find( m_Current );
  if( m_RequestedStart.m_Session == 0 && Current != m_Sessions.end() && !Current->second.m_Frames.empty() )
    m_RequestedStart = { m_Current, Low( Current->second ) };
  m_Start = m_End = {};
  m_Failure = i_rRequest.m_Failure;
  m_State = EState::Idle;

  VPosition Start = m_RequestedStart;
  VPosition End = m_RequestedEnd;
  const auto Found = m_Sessions.find( Start.m_Session );
  if( Found != m_Sessions.end() ) Start.m_Number = std::max( Start.m_Number, Low( Found->second ) );
  if( Locate( Start ) == EWhere::Lost || !ResolveEnd( Start, End ) )
  {
    m_Failure |= ECaptureFailure::StartLost;
    return true;
  }
  m_Start = Start;
  m_End = End;
  m_State = EState::WaitingForStart;
  if( Locate( Start ) == EWhere::Future ) return true;
  m_State = EState::Capturing;
  Activate();
  if( m_End.m_Session == 0 || Locate( m_End ) == EWhere::Future ) return true;
  if( !( m_End == m_RequestedEnd ) ) m_Failure |= ECaptureFailure::EndedEarly;
  ReachEnd();
  return true;
}

// After a frame.
void VCaptureBufferModel::Step()
{
  if( m_State == EState::WaitingForStart && m_Start.m_Session == m_Current && m_Start.m_Number <= m_Last )
  {
    m_Start.m_Number = m_Last;
    m_State = EState::Capturing;
    Activate();
  }
  if( m_State == EState::Capturing && m_End.m_Session != 0 && m_End.m_Number <= m_Last )
  {
    m_End.m_Number = m_Last;
    ReachEnd();
  }
}

void VCaptureBufferModel::ReachEnd() { m_State = m_bStreamed && !AnyActive() ? EState::Complete : EState::Captured; }

bool VCaptureBufferModel::SetEnd( uint32_t i_Id, VPosition i_End, uint32_t i_Failure )
{
  if( i_Id < m_Id || !Is( EState::WaitingForStart | EState::Capturing ) ) return false;
  VPosition End = i_End;
  if( m_State == EState::WaitingForStart )
  {
    if( !ResolveEnd( m_Start, End ) ) return false;
    m_End = End;
    m_RequestedEnd = i_End;
    return true;
  }
  if( End.m_Session != 0 && End.m_Session != m_Current ) return false;
  if( m_Failure == 0 ) m_Failure = i_Failure;
  m_RequestedEnd = i_End;
  if( End.m_Session != 0 ) End.m_Number = std::max( End.m_Number, m_Last );
  m_End = End;
  if( End.m_Session != 0 && End.m_Number == m_Last ) ReachEnd();
  return true;
}

bool VCaptureBufferModel::Cancel( uint32_t i_Id )
{
  if( i_Id < m_Id || !Is( EState::WaitingForStart | EState::Capturing | EState::Captured ) ) return false;
  m_Failure |= ECaptureFailure::Cancelled;
  if( m_State == EState::WaitingForStart )
  {
    m_Start = { 0, std::numeric_limits<int64_t>::max() };
    Activate();
    m_Start = m_End = {};
  }
  else if( m_State == EState::Capturing )
  {
    m_End = { m_Current, m_Last };
  }
  m_State = AnyActive() ? EState::Cancelling : EState::Cancelled;
  return true;
}

void VCaptureBufferModel::Activate()
{
  if( !m_bStreamed ) return;
  for( auto& [Id, rClient] : m_Clients ) rClient = { true, false, m_Start.m_Number };
}

void VCaptureBufferModel::Unregister( uint32_t i_Client )
{
  const bool bActive = m_Clients[i_Client].m_bActive;
  m_Clients.erase( i_Client );
  if( bActive ) OnLeft();
}

VCaptureBufferModel::VReading VCaptureBufferModel::Next( uint32_t i_Client )
{
  VClient& rClient = m_Clients[i_Client];
  if( !rClient.m_bActive ) return {};
  if( m_State == EState::Cancelling || rClient.m_bTold )
  {
    const EResult::Enum Result = m_State == EState::Cancelling ? EResult::Cancelled : EResult::Finished;
    Leave( rClient );
    return { Result, 0 };
  }
  VReading Reading;
  if( rClient.m_Next <= LastCaptured() ) Reading.m_Frame = rClient.m_Next++;
  if( rClient.m_Next <= LastCaptured() ) Reading.m_Result = EResult::MoreToCome;
  else if( m_State == EState::Captured ) Reading.m_Result = EResult::Finished;
  rClient.m_bTold = Reading.m_Result == EResult::Finished;
  return Reading;
}

void VCaptureBufferModel::Finish( uint32_t i_Client, uint32_t i_Failure, bool i_bLast )
{
  m_Failure |= i_Failure;
  if( i_bLast && m_Clients[i_Client].m_bActive ) Leave( m_Clients[i_Client] );
}

bool VCaptureBufferModel::HasNews( uint32_t i_Client ) const
{
  const VClient& rClient = m_Clients.at( i_Client );
  if( !rClient.m_bActive ) return false;
  if( rClient.m_Next <= LastCaptured() && m_State != EState::Cancelling ) return static_cast<uint64_t>( rClient.m_Next - Slowest() ) <= m_DrainLimit;
  return Is( EState::Captured | EState::Cancelling );
}

bool VCaptureBufferModel::AnyActive() const
{
  return std::any_of( m_Clients.begin(), m_Clients.end(), []( const auto& i_rEntry ) { return i_rEntry.second.m_bActive; } );
}

void VCaptureBufferModel::Leave( VClient& i_rClient )
{
  i_rClient.m_bActive = false;
  OnLeft();
}

void VCaptureBufferModel::OnLeft()
{
  if( AnyActive() ) return;
  if( m_State == EState::Cancelling ) m_State = EState::Cancelled;
  if( m_State == EState::Captured ) m_State = EState::Complete;
}

bool VCaptureBufferModel::Find( VPosition i_Position, size_t& o_rBlock ) const
{
  if( !m_Sessions.count( i_Position.m_Session ) || Locate( i_Position ) != EWhere::Inside ) return false;
  const VSession& rSession = m_Sessions.at( i_Position.m_Session );
  o_rBlock = rSession.m_Frames[static_cast<size_t>( i_Position.m_Number - Low( rSession ) )].m_Block;
  return true;
}

int64_t VCaptureBufferModel::LastCaptured() const { return m_End.m_Session != 0 ? std::min( m_End.m_Number, m_Last ) : m_Last; }

int64_t VCaptureBufferModel::Slowest() const
{
  int64_t Slowest = std::numeric_limits<int64_t>::max();
  for( const auto& [Id, rClient] : m_Clients )
  {
    if( rClient.m_bActive && rClient.m_Next <= LastCaptured() ) Slowest = std::min( Slowest, rClient.m_Next );
  }
  return Slowest;
}

uint64_t VCaptureBufferModel::Captured() const
{
  if( Is( EState::Idle | EState::WaitingForStart ) || m_Start.m_Session == 0 ) return 0;
  return static_cast<uint64_t>( LastCaptured() - m_Start.m_Number + 1 );
}

uint64_t VCaptureBufferModel::Available() const
{
  if( !Is( EState::Capturing | EState::Captured ) ) return 0;
  const int64_t First = m_bStreamed ? Slowest() : m_Start.m_Number;
  return First > LastCaptured() ? 0 : static_cast<uint64_t>( LastCaptured() - First + 1 );
}
