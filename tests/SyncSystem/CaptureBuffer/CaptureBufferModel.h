// What a capture buffer does, told with plain numbers: frames in deques, clients that count. Nothing here is fast, pinned or locked.
#pragma once

#include "SyncSystem/CaptureTypes.h"

#include <cstddef>
#include <cstdint>
#include <deque>
#include <limits>
#include <map>
#include <vector>

class VCaptureBufferModel
{
public:
  using EState = SyncSystem::ECaptureState;
  using EResult = SyncSystem::EClientResult;

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
    VPosition m_Start;
    VPosition m_End;
    uint32_t m_Failure = 0;
  };

  struct VReading
  {
    EResult::Enum m_Result = EResult::NoFrameYet;
    int64_t m_Frame = 0;
  };

  VCaptureBufferModel( size_t i_Blocks, size_t i_FramesPerBlock ) : m_Blocks( i_Blocks ), m_FramesPerBlock( i_FramesPerBlock ) {}

  // False if the frame is refused for want of memory.
  bool Add();
  void NewSession();
  bool Start( const VRequest& i_rRequest );
  bool SetEnd( uint32_t i_Id, VPosition i_End, uint32_t i_Failure );
  bool Cancel( uint32_t i_Id );

  void Register( uint32_t i_Client ) { m_Clients[i_Client] = {}; }
  void Unregister( uint32_t i_Client );
  VReading Next( uint32_t i_Client );
  void Finish( uint32_t i_Client, uint32_t i_Failure, bool i_bLast );
  // A sleeping client that has news must have been woken, and nobody else.
  bool HasNews( uint32_t i_Client ) const;

  // The block of a frame in the buffer; false if there is no such frame.
  bool Find( VPosition i_Position, size_t& o_rBlock ) const;
  void Pin( size_t i_Block ) { ++m_Pins[i_Block]; }
  void Unpin( size_t i_Block ) { --m_Pins[i_Block]; }

  uint64_t Captured() const;
  uint64_t Available() const;
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
  bool TakeSlot();
  bool Recover();
  void Delete( const VFrame& i_rFrame );
  void RemoveSession( uint32_t i_Session );
  int64_t Limit() const;
  // Numbers of the oldest and newest frame; of a session without frames, those around the live end
  int64_t Low( const VSession& i_rSession ) const { return i_rSession.m_Frames.empty() ? m_Last + 1 : i_rSession.m_Frames.front().m_Number; }
  int64_t High( const VSession& i_rSession ) const { return i_rSession.m_Frames.empty() ? m_Last : i_rSession.m_Frames.back().m_Number; }

  // Capture
  bool Is( uint32_t i_Mask ) const { return ( m_State & i_Mask ) != 0; }
  EWhere Locate( VPosition i_Position ) const;
  bool ResolveEnd( VPosition i_Start, VPosition& io_rEnd ) const;
  void Step();
  void ReachEnd();
  void Activate();
  bool AnyActive() const;
  void Leave( VClient& i_rClient );
  void OnLeft();
  int64_t LastCaptured() const;
  int64_t Slowest() const;

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
