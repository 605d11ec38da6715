// What a capture buffer does, told with plain numbers: frames in deques, clients that count. Nothing here is fast, pinned or locked.
#pragma once

#include "SyncSystem/CaptureTypes.h"

#include <algorithm>
#include <cstddef>
#include <cstdint>
#include <deque>
#include <limits>
#include <map>
#include <utility>
#include <vector>

class VCaptureBufferModel
{
public:
  using EState = SyncSystem::ECaptureState;
  using EResult = SyncSystem::EClientResult;
  using ECaptureFailure = SyncSystem::ECaptureFailure;

  struct VPosition
  {
    uint32_t m_Session = 0;
    int64_t m_Number = 0;
    bool operator==( const VPosition& ) const = default;
  };

  struct VFrame
  {
    int64_t m_Number;
    size_t m_Block;
  };

  struct VSession
  {
    std::deque<VFrame> m_Frames;
    bool m_bFinished = false;
  };

  struct VRequest
  {
    uint32_t m_Id = 0;
    bool m_bStreamed = true;
    VPosition m_Start, m_End;
    uint32_t m_Failure = 0;
  };

  struct VReading
  {
    EResult::Enum m_Result = EResult::NoFrameYet;
    int64_t m_Frame = 0;
  };

  VCaptureBufferModel( size_t i_Blocks, size_t i_FramesPerBlock ) : m_Blocks( i_Blocks ), m_FramesPerBlock( i_FramesPerBlock ) {}

  // False if the frame is refused for want of memory.
  bool Add()
  {
    if( !TakeSlot() ) return false;
    m_Sessions[m_Current].m_Frames.push_back( { ++m_Last, m_CurrentBlock } );
    Step();
    return true;
  }

  void NewSession()
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

  bool Start( const VRequest& i_rRequest )
  {
    const bool bAgain = i_rRequest.m_Id == m_Id;
    const bool bAdmitted = bAgain ? !m_bStreamed || Is( EState::Idle | EState::WaitingForStart )
                                  : Is( EState::Idle | EState::Complete | EState::Cancelled );
    if( i_rRequest.m_Id == 0 || !bAdmitted ) return false;
    m_Id = i_rRequest.m_Id;
    m_bStreamed = i_rRequest.m_bStreamed;
    m_RequestedStart = i_rRequest.m_Start;
    m_RequestedEnd = i_rRequest.m_End;
    const VSession* pCurrent = FindSession( m_Current );
    if( m_RequestedStart.m_Session == 0 && pCurrent && !pCurrent->m_Frames.empty() ) m_RequestedStart = { m_Current, Low( *pCurrent ) };
    m_Start = m_End = {};
    m_Failure = i_rRequest.m_Failure;
    m_State = EState::Idle;

    VPosition Start = m_RequestedStart;
    VPosition End = m_RequestedEnd;
    if( const VSession* pSession = FindSession( Start.m_Session ) ) Start.m_Number = std::max( Start.m_Number, Low( *pSession ) );
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
    Activate( m_Start.m_Number );
    if( m_End.m_Session == 0 || Locate( m_End ) == EWhere::Future ) return true;
    if( !( m_End == m_RequestedEnd ) ) m_Failure |= ECaptureFailure::EndedEarly;
    ReachEnd();
    return true;
  }

  bool SetEnd( uint32_t i_Id, VPosition i_End, uint32_t i_Failure )
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

  bool Cancel( uint32_t i_Id )
  {
    if( i_Id < m_Id || !Is( EState::WaitingForStart | EState::Capturing | EState::Captured ) ) return false;
    m_Failure |= ECaptureFailure::Cancelled;
    if( m_State == EState::WaitingForStart )
    {
      Activate( std::numeric_limits<int64_t>::max() );
      m_Start = m_End = {};
    }
    else if( m_State == EState::Capturing ) m_End = { m_Current, m_Last };
    m_State = AnyActive() ? EState::Cancelling : EState::Cancelled;
    return true;
  }

  void Register( uint32_t i_Client ) { m_Clients[i_Client] = {}; }

  void Unregister( uint32_t i_Client )
  {
    if( m_Clients[i_Client].m_bActive ) Leave( m_Clients[i_Client] );
    m_Clients.erase( i_Client );
  }

  VReading Next( uint32_t i_Client )
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

  void Finish( uint32_t i_Client, uint32_t i_Failure, bool i_bLast )
  {
    m_Failure |= i_Failure;
    if( i_bLast && m_Clients[i_Client].m_bActive ) Leave( m_Clients[i_Client] );
  }

  // A sleeping client that has news must have been woken, and nobody else.
  bool HasNews( uint32_t i_Client ) const
  {
    const VClient& rClient = m_Clients.at( i_Client );
    if( !rClient.m_bActive ) return false;
    if( rClient.m_Next <= LastCaptured() && m_State != EState::Cancelling )
      return static_cast<uint64_t>( rClient.m_Next - Slowest() ) <= m_DrainLimit;
    return Is( EState::Captured | EState::Cancelling );
  }

  // The block of a frame in the buffer; false if there is no such frame.
  bool Find( VPosition i_Position, size_t& o_rBlock ) const
  {
    if( Locate( i_Position ) != EWhere::Inside ) return false;
    const VSession* pSession = FindSession( i_Position.m_Session );
    o_rBlock = pSession->m_Frames[static_cast<size_t>( i_Position.m_Number - Low( *pSession ) )].m_Block;
    return true;
  }

  const VSession* FindSession( uint32_t i_Session ) const
  {
    const auto Found = m_Sessions.find( i_Session );
    return Found == m_Sessions.end() ? nullptr : &Found->second;
  }

  // Numbers of the oldest and newest frame; of a session without frames, those around the live end
  int64_t Low( const VSession& i_rSession ) const { return i_rSession.m_Frames.empty() ? m_Last + 1 : i_rSession.m_Frames.front().m_Number; }
  int64_t High( const VSession& i_rSession ) const { return i_rSession.m_Frames.empty() ? m_Last : i_rSession.m_Frames.back().m_Number; }

  void Pin( size_t i_Block ) { ++m_Pins[i_Block]; }
  void Unpin( size_t i_Block ) { --m_Pins[i_Block]; }

  uint64_t Captured() const
  {
    if( Is( EState::Idle | EState::WaitingForStart ) || m_Start.m_Session == 0 ) return 0;
    return static_cast<uint64_t>( LastCaptured() - m_Start.m_Number + 1 );
  }

  uint64_t Available() const
  {
    if( !Is( EState::Capturing | EState::Captured ) ) return 0;
    const int64_t First = m_bStreamed ? Slowest() : m_Start.m_Number;
    return First > LastCaptured() ? 0 : static_cast<uint64_t>( LastCaptured() - First + 1 );
  }

  size_t HeldBlocks() const { return m_Live.size(); }

  std::map<uint32_t, VSession> m_Sessions;
  std::vector<uint32_t> m_RemovedSessions;
  uint32_t m_Current = 1;
  int64_t m_Last = 0;

  uint32_t m_Id = 0;
  bool m_bStreamed = true;
  VPosition m_Start, m_End, m_RequestedStart, m_RequestedEnd;
  EState::Enum m_State = EState::Idle;
  uint32_t m_Failure = 0;
  uint64_t m_DrainLimit = std::numeric_limits<uint64_t>::max();

private:
  struct VClient
  {
    bool m_bActive = false;
    bool m_bTold = false;
    int64_t m_Next = 0;
  };

  enum class EWhere
  {
    Inside,
    Future,
    Lost
  };

  static constexpr size_t NoBlock = ~size_t{ 0 };

  // Memory
  bool TakeSlot()
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
  bool Recover()
  {
    const size_t Held = m_Live.size();
    for( const VFrame& rFrame : std::exchange( m_Retired, {} ) ) Drop( rFrame );
    const int64_t Protected = m_bStreamed ? Slowest() : m_Start.m_Number;
    const int64_t Limit = Is( EState::Capturing | EState::Captured | EState::Cancelling ) ? Protected : m_Last + 1;
    while( m_Live.size() == Held && !m_Sessions.empty() )
    {
      auto& [Id, rSession] = *m_Sessions.begin();
      if( rSession.m_Frames.empty() || rSession.m_Frames.front().m_Number >= Limit ) return false;
      const VFrame Oldest = rSession.m_Frames.front();
      rSession.m_Frames.pop_front();
      Drop( Oldest );
      if( rSession.m_bFinished && rSession.m_Frames.empty() ) RemoveSession( Id );
    }
    return m_Live.size() != Held;
  }

  // A frame that has left its session goes when its block is not pinned.
  void Drop( const VFrame& i_rFrame )
  {
    if( m_Pins[i_rFrame.m_Block] != 0 )
    {
      m_Retired.push_back( i_rFrame );
      return;
    }
    if( --m_Live[i_rFrame.m_Block] != 0 ) return;
    m_Live.erase( i_rFrame.m_Block );
    if( m_CurrentBlock == i_rFrame.m_Block ) m_CurrentBlock = NoBlock;
  }

  void RemoveSession( uint32_t i_Session )
  {
    m_Sessions.erase( i_Session );
    m_RemovedSessions.push_back( i_Session );
  }

  // Capture
  bool Is( uint32_t i_Mask ) const { return ( m_State & i_Mask ) != 0; }

  EWhere Locate( VPosition i_Position ) const
  {
    const VSession* pSession = FindSession( i_Position.m_Session );
    if( !pSession ) return i_Position.m_Session >= m_Current ? EWhere::Future : EWhere::Lost;
    if( i_Position.m_Number < Low( *pSession ) ) return EWhere::Lost;
    if( i_Position.m_Number <= High( *pSession ) ) return EWhere::Inside;
    return pSession->m_bFinished ? EWhere::Lost : EWhere::Future;
  }

  bool ResolveEnd( VPosition i_Start, VPosition& io_rEnd ) const
  {
    if( io_rEnd.m_Session != 0 && ( io_rEnd.m_Session != i_Start.m_Session || io_rEnd.m_Number <= i_Start.m_Number ) ) return false;
    const VSession* pSession = FindSession( i_Start.m_Session );
    if( !pSession || !pSession->m_bFinished ) return true;
    if( io_rEnd.m_Session == 0 || io_rEnd.m_Number > High( *pSession ) ) io_rEnd = { i_Start.m_Session, High( *pSession ) };
    return true;
  }

  // After a frame.
  void Step()
  {
    if( m_State == EState::WaitingForStart && m_Start.m_Session == m_Current && m_Start.m_Number <= m_Last )
    {
      m_Start.m_Number = m_Last;
      m_State = EState::Capturing;
      Activate( m_Start.m_Number );
    }
    if( m_State == EState::Capturing && m_End.m_Session != 0 && m_End.m_Number <= m_Last )
    {
      m_End.m_Number = m_Last;
      ReachEnd();
    }
  }

  void ReachEnd() { m_State = m_bStreamed && !AnyActive() ? EState::Complete : EState::Captured; }

  void Activate( int64_t i_First )
  {
    if( !m_bStreamed ) return;
    for( auto& [Id, rClient] : m_Clients ) rClient = { true, false, i_First };
  }

  bool AnyActive() const
  {
    return std::ranges::any_of( m_Clients, []( const auto& i_rEntry ) { return i_rEntry.second.m_bActive; } );
  }

  void Leave( VClient& i_rClient )
  {
    i_rClient.m_bActive = false;
    if( AnyActive() ) return;
    if( m_State == EState::Cancelling ) m_State = EState::Cancelled;
    if( m_State == EState::Captured ) m_State = EState::Complete;
  }

  int64_t LastCaptured() const { return m_End.m_Session != 0 ? std::min( m_End.m_Number, m_Last ) : m_Last; }

  int64_t Slowest() const
  {
    int64_t Slowest = std::numeric_limits<int64_t>::max();
    for( const auto& [Id, rClient] : m_Clients )
    {
      if( rClient.m_bActive && rClient.m_Next <= LastCaptured() ) Slowest = std::min( Slowest, rClient.m_Next );
    }
    return Slowest;
  }

  const size_t m_Blocks;
  const size_t m_FramesPerBlock;
  std::map<size_t, size_t> m_Live;   // frames by block
  std::map<size_t, size_t> m_Pins;   // by block
  std::deque<VFrame> m_Retired;
  size_t m_CurrentBlock = NoBlock;
  size_t m_NextBlock = 0;
  size_t m_SlotsUsed = 0;
  std::map<uint32_t, VClient> m_Clients;
};
