// What goes in and out of a capture buffer: stored frames, positions, captures and their status. Plain values.
#pragma once

#include "SyncSystem/TypedId.h"

#include <cstdint>
#include <string>
#include <vector>

namespace SyncSystem
{

// The header of a stored frame. The payload follows it in the same allocation; see Payload.
struct alignas( 16 ) VFrameEntry
{
  VFrameEntry* m_pNext = nullptr;   // the buffer's own, like the next
  VFrameEntry* m_pPrevious = nullptr;
  int64_t m_FrameNumber = 0;   // strictly ascending over the whole buffer, from 1; 0 until the frame is added
};

// The payload right behind the header, 16-byte aligned.
inline void* Payload( VFrameEntry* i_pEntry ) { return i_pEntry + 1; }
inline const void* Payload( const VFrameEntry* i_pEntry ) { return i_pEntry + 1; }

// A position in a buffer: of a frame, of one that has gone or of one to come. The pointer saves a walk; it is used only as long as the
// buffer still has a frame of that number in that session, so a token may be kept for any time.
struct VToken
{
  KVZ::VBufferSessionId m_BufferSession;   // 0: an empty token
  int64_t m_FrameNumber = 0;
  VFrameEntry* m_pFrame = nullptr;

  bool IsValid() const { return m_BufferSession.IsValid(); }
  bool IsSamePosition( const VToken& i_rOther ) const
  {
    return m_BufferSession == i_rOther.m_BufferSession && m_FrameNumber == i_rOther.m_FrameNumber;
  }
};

struct CaptureSessionType
{
  enum Enum : uint32_t
  {
    Reservation = 0,   // protects its range; nobody reads it
    Streamed = 1       // the clients read it
  };
};

// Flag-shaped, so that several can be tested at once.
struct ECaptureState
{
  enum Enum : uint32_t
  {
    Idle = 1,              // no capture; also after a refused start
    WaitingForStart = 2,   // the start lies in the future
    Capturing = 4,         // past the start, the end not reached
    Captured = 16,         // end reached; clients may still be reading
    Complete = 32,         // all clients finished
    Cancelling = 64,       // cancelled; clients finishing
    Cancelled = 128        // cancelled and all clients finished
  };
  // No capture, or none whose frames anybody still waits for
  static constexpr uint32_t NothingToProtect = Idle | WaitingForStart | Complete | Cancelled;
  static constexpr uint32_t CanBeCancelled = WaitingForStart | Capturing | Captured;
};

struct ECaptureFailure
{
  enum Flag : uint32_t
  {
    None = 0,
    StartLost = 1,         // the requested start could not be honoured
    EndedEarly = 2,        // the end was moved because the source stopped earlier than asked
    MemoryExhausted = 4,   // a frame could not be stored, so the capture ended
    ReportedErrors = 8,    // the source's preparation or a client reported errors
    Cancelled = 16
  };
};

struct VCaptureError
{
  uint32_t m_Code = 0;
  std::string m_Text;

  bool operator==( const VCaptureError& ) const = default;
};

// What a client needs to know of the capture it reads.
struct VCaptureSessionInfo
{
  KVZ::VCaptureSessionId m_CaptureSessionId;
  std::string m_Name;
  int64_t m_Info = 0;       // passed through
  uint32_t m_Options = 0;   // passed through
};

struct VCaptureRequest
{
  KVZ::VCaptureSessionId m_Id;
  CaptureSessionType::Enum m_Type = CaptureSessionType::Streamed;
  VCaptureSessionInfo m_Info;
  VToken m_Start;                        // empty: the oldest frame of the current buffer session
  VToken m_End;                          // the last frame of the range; empty: open
  uint32_t m_Failure = 0;                // ECaptureFailure flags known beforehand
  std::vector<VCaptureError> m_Errors;   // of the preparation
};

struct VCaptureEnd
{
  VToken m_End;               // the last frame of the range; empty: open
  uint32_t m_Failure = 0;     // kept if the capture has no failure yet
  bool m_bRequested = true;   // the end is also what the user asked for
};

struct VCaptureSessionStatus
{
  CaptureSessionType::Enum m_CaptureType = CaptureSessionType::Streamed;
  KVZ::VCaptureSessionId m_CaptureSessionId;    // the capture now or last present; 0 before the first
  KVZ::VBufferSessionId m_FirstBufferSession;   // in which it starts
  VToken m_Start;                               // as it is; empty while not known, or if it never began
  VToken m_RequestedStart;
  VToken m_End;   // as it is; empty while open
  VToken m_RequestedEnd;
  ECaptureState::Enum m_State = ECaptureState::Idle;
  uint32_t m_Failure = 0;                // ECaptureFailure flags
  std::vector<VCaptureError> m_Errors;   // the capture's, then each client's in order of client id
  uint64_t m_AvailableFrames = 0;        // in the buffer, within the capture and not yet taken by the slowest client
  uint64_t m_CapturedFrames = 0;         // of the capture so far
};

struct EClientResult
{
  enum Enum : uint32_t
  {
    NoFrameYet = 0,   // nothing more just now: the client is notified
    MoreToCome = 1,
    Finished = 2,   // the range has ended: close what is open, then ask once more to leave the capture
    Cancelled = 3   // the client has left the capture
  };
};

struct VClientRead
{
  EClientResult::Enum m_Result = EClientResult::NoFrameYet;
  KVZ::VCaptureSessionId m_CaptureSessionId;
  std::vector<VCaptureError> m_Errors;   // of this client in this capture
};

}
