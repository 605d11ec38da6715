// The newest frames of one source, oldest first, divided into buffer sessions: unbroken runs of frames, of which the last one is growing.
// While no capture runs, the tail is given up when memory runs short. A capture fixes a range of frames, which may begin in the past or in
// the future; they are safe from eviction until the slowest client has taken them. The buffer knows positions, no time.
//
// Every operation may be called from any thread unless it says otherwise, and takes m_Mutex. Protected ones whose names end in Unlocked
// need it held.
//
// Memory. A frame is an allocation of the buffer's allocator that starts with a VFrameEntry; it must be obtained without m_Mutex, because
// the allocator calls the buffer's eviction when it runs short. An evicted frame whose block is pinned leaves its session, so that sessions
// never have holes, but its memory stays until the pins have gone.
//
// Notifications are published with m_Mutex held, so that they keep their order: subscribe through a postal service. A subscriber on the
// publisher's thread, like a client's notify function, may only post. AddFrame allocates nothing where a session goes on.
#pragma once

#include "NotificationSystem/MultiCallback.h"
#include "StageCoreRuntime/ThreadAnnotations.h"
#include "SyncSystem/CaptureBufferAllocator.h"
#include "SyncSystem/CaptureTypes.h"
#include "SyncSystem/RefCountedToken.h"

#include <boost/optional.hpp>
#include <boost/thread/lock_guard.hpp>
#include <boost/thread/mutex.hpp>

#include <cstddef>
#include <cstdint>
#include <functional>
#include <limits>
#include <map>
#include <memory>
#include <string>
#include <utility>
#include <vector>

namespace SyncSystem
{

class VCaptureBuffer : public std::enable_shared_from_this<VCaptureBuffer>
{
public:
  struct VSettings
  {
    std::string m_Name{};   // for log text
    std::shared_ptr<VCaptureBufferAllocator> m_pAllocator{};
    // Destroys what the payload holds; the buffer frees the entry itself afterwards. Called with m_Mutex held.
    std::function<void( VFrameEntry* )> m_DeleteFrame{};
    std::shared_ptr<KVZ::IPostalService> m_pPostalService{};   // default for subscribers
  };

  // Makes a buffer of type T, which is this class or one derived from it, and makes its eviction the allocator's recovery.
  template<class T>
  static std::shared_ptr<T> Make( VSettings i_Settings )
  {
    auto pBuffer = std::make_shared<T>( std::move( i_Settings ) );
    pBuffer->ConnectRecovery();
    return pBuffer;
  }

  // Use Make.
  explicit VCaptureBuffer( VSettings i_Settings );
  VCaptureBuffer( const VCaptureBuffer& ) = delete;
  VCaptureBuffer& operator=( const VCaptureBuffer& ) = delete;
  virtual ~VCaptureBuffer();

  // An entry with room for a payload of this size, not yet part of the buffer; null if there is no memory. Evicts if it must.
  VFrameEntry* NewEntry( size_t i_PayloadSize );
  // Frees an entry that was not added. Does not call m_DeleteFrame.
  void DiscardEntry( VFrameEntry* i_pEntry );
  VCaptureBufferAllocator& Allocator() const { return *m_pAllocator; }

  // Finishes the current buffer session, and with it a capture that is running or waiting in it, and opens the next. Returns the position
  // of that one's first frame.
  VToken StartNewBufferSession();

  // Positions
  bool GetFirstToken( KVZ::VBufferSessionId i_Session, VToken& o_rToken ) const;
  bool GetLastToken( KVZ::VBufferSessionId i_Session, VToken& o_rToken ) const;
  // The newest frame of all; false while the current session has none.
  bool GetNewestToken( VToken& o_rToken ) const;
  // The position that the next frame will have, unless a new buffer session begins.
  VToken GetNextToken() const;
  // The sessions that have frames, ascending, and their number.
  size_t GetBufferSessions( std::vector<KVZ::VBufferSessionId>& o_rSessions ) const;
  KVZ::VBufferSessionId GetCurrentBufferSession() const;
  // Frames from one position to the other; false unless both are in one session.
  static bool Distance( const VToken& i_rFrom, const VToken& i_rTo, int64_t& o_rFrames );
  // Pins the frame at a position. False if there is none, and the pinned token is empty then. Caches the frame in the position.
  bool Read( VToken& io_rToken, VRefCountedToken& o_rFrame );
  // Moves a position within its session, also to where there is no frame.
  void Advance( VToken& io_rToken, int64_t i_Frames ) const;

  // Captures. An id is later than another if its number is higher.
  //
  // False if the request is refused: for id 0, while another capture is active, or if a streamed capture of this id has begun already. A
  // reservation may be turned into a streamed capture of the same id. True with state Idle and failure StartLost if the range cannot be had
  // (any more), or if it is not at least two frames long.
  bool StartCapture( const VCaptureRequest& i_rRequest );
  // Enters a capture that failed before it began: state Idle with the request's failure flags and errors. Refuses like StartCapture.
  bool FailCapture( const VCaptureRequest& i_rRequest );
  // Moves the end of a capture that is waiting or running. In a running one, an end that has passed already becomes the newest frame.
  bool SetCaptureEnd( KVZ::VCaptureSessionId i_Id, const VCaptureEnd& i_rEnd );
  bool CancelCapture( KVZ::VCaptureSessionId i_Id );
  // True if there ever was a capture.
  bool Status( VCaptureSessionStatus& o_rStatus ) const;

  // Clients. A client takes part in the streamed captures that start after its registration. It is notified when it has to read on: it
  // then calls ClientNextFrame until the result is neither MoreToCome nor Finished, and is not notified again before that. The notify function
  // runs with m_Mutex held, on any thread, and may only post. It may still be called once while UnregisterClient has not returned.
  uint32_t RegisterClient( std::function<void()> i_Notify );
  bool UnregisterClient( uint32_t i_ClientId );
  // Gives the next frame of the capture, pinned; the pinned token is cleared first. A frame may come with any result but Cancelled. After
  // Finished the client closes its files and asks once more: only then it counts as finished. False for an unknown client.
  bool ClientNextFrame( uint32_t i_ClientId, VRefCountedToken& io_rFrame, VClientRead& o_rRead, VCaptureSessionInfo* o_pInfo = nullptr );
  // Reports failure flags and an error of a client. With i_bLast it leaves the capture, and the capture goes on without it.
  bool ClientFinished( uint32_t i_ClientId, uint32_t i_Failure, const boost::optional<VCaptureError>& i_rError, bool i_bLast );
  // A waiting client is woken when it is at most this many frames ahead of the slowest one. As it starts, always.
  void SetDataDrainLimit( uint64_t i_Frames );

  // A finished buffer session has lost its last frame
  KVZ::IMultiCallbackPostal<void( KVZ::VBufferSessionId )>& BufferSessionRemovedCallback() { return m_OnBufferSessionRemoved; }
  // At every frame, with its buffer session
  KVZ::IMultiCallbackPostal<void( KVZ::VBufferSessionId )>& NewDataCallback() { return m_OnNewData; }
  // At every change of state or failure
  KVZ::IMultiCallbackPostal<void( VCaptureSessionStatus )>& StatusCallback() { return m_OnStatus; }
  // When a capture's range becomes known or changes: start and end, both empty when there will be no range
  using VCaptureReadySignature = void( KVZ::VCaptureSessionId, CaptureSessionType::Enum, VCaptureSessionInfo, VToken, VToken );
  KVZ::IMultiCallbackPostal<VCaptureReadySignature>& CaptureReadyCallback() { return m_OnCaptureReady; }

protected:
  // A run of frames with consecutive numbers. The list owns no memory; m_Head is the ring's anchor.
  struct VBufferSession
  {
    VBufferSession() { m_Head.m_pNext = m_Head.m_pPrevious = &m_Head; }
    VBufferSession( const VBufferSession& ) = delete;
    VBufferSession& operator=( const VBufferSession& ) = delete;

    bool IsEmpty() const { return m_Head.m_pNext == &m_Head; }
    VFrameEntry* First() const { return m_Head.m_pNext; }
    VFrameEntry* Last() const { return m_Head.m_pPrevious; }
    bool IsHead( const VFrameEntry* i_pEntry ) const { return i_pEntry == &m_Head; }
    bool Contains( int64_t i_FrameNumber ) const
    {
      return !IsEmpty() && i_FrameNumber >= First()->m_FrameNumber && i_FrameNumber <= Last()->m_FrameNumber;
    }

    void Append( VFrameEntry* i_pEntry )
    {
      i_pEntry->m_pNext = &m_Head;
      i_pEntry->m_pPrevious = m_Head.m_pPrevious;
      m_Head.m_pPrevious->m_pNext = i_pEntry;
      m_Head.m_pPrevious = i_pEntry;
    }
    static void Unlink( VFrameEntry* i_pEntry )
    {
      i_pEntry->m_pPrevious->m_pNext = i_pEntry->m_pNext;
      i_pEntry->m_pNext->m_pPrevious = i_pEntry->m_pPrevious;
    }

    VFrameEntry m_Head;
    bool m_bFinished = false;
  };

  // Links an entry from NewEntry at the live end, steps the capture and wakes clients.
  VToken AddFrameUnlocked( VFrameEntry* i_pEntry ) REQUIRES( m_Mutex );
  VToken StartNewBufferSessionUnlocked() REQUIRES( m_Mutex );
  VToken GetNextTokenUnlocked() const REQUIRES( m_Mutex );
  bool GetFirstTokenUnlocked( KVZ::VBufferSessionId i_Session, VToken& o_rToken ) const REQUIRES( m_Mutex );
  bool GetLastTokenUnlocked( KVZ::VBufferSessionId i_Session, VToken& o_rToken ) const REQUIRES( m_Mutex );
  // True while the session is the current one or has frames.
  bool IsSessionPresentUnlocked( KVZ::VBufferSessionId i_Session ) const REQUIRES( m_Mutex );
  // True if the current session has had a frame.
  bool HasCurrentSessionBegunUnlocked() const REQUIRES( m_Mutex );
  KVZ::VBufferSessionId GetCurrentBufferSessionUnlocked() const REQUIRES( m_Mutex ) { return m_CurrentBufferSession; }
  // Called with m_Mutex held when a session leaves the buffer.
  virtual void OnBufferSessionRemoved( KVZ::VBufferSessionId i_Session ) REQUIRES( m_Mutex );

  // Fixed after construction
  const std::string m_Name;

  mutable boost::mutex m_Mutex;

private:
  struct VClient
  {
    std::function<void()> m_Notify;
    std::vector<VCaptureError> m_Errors;
    VFrameEntry* m_pNextFrame = nullptr;   // empty at the live end and past the range
    bool m_bActive = false;                // takes part in the capture
    bool m_bWaiting = true;                // is to be notified
    bool m_bToldFinished = false;          // has been given Finished, and leaves at its next call
  };

  // Where a position lies as seen from the buffer
  enum class EPosition
  {
    Inside = 0,
    Future = 1,
    Lost = 2
  };

  void ConnectRecovery();

  // Frames
  VBufferSession& CurrentSessionUnlocked() REQUIRES( m_Mutex );
  VBufferSession* FindSessionUnlocked( KVZ::VBufferSessionId i_Session ) const REQUIRES( m_Mutex );
  VFrameEntry* FindFrameUnlocked( const VToken& i_rToken ) const REQUIRES( m_Mutex );
  static VFrameEntry* Walk( const VBufferSession& i_rSession, int64_t i_FrameNumber, VFrameEntry* i_pHint );

  // Eviction
  bool RecoverMemory();
  bool EvictUnlocked() REQUIRES( m_Mutex );
  int64_t EvictionLimitUnlocked() const REQUIRES( m_Mutex );
  bool SweepRetiredUnlocked() REQUIRES( m_Mutex );
  void EvictOldestFrameUnlocked() REQUIRES( m_Mutex );
  void RemoveSessionUnlocked( KVZ::VBufferSessionId i_Session ) REQUIRES( m_Mutex );
  void DeleteFrame( VFrameEntry* i_pEntry );
  void DeleteFrames( const VBufferSession& i_rSession );

  // Captures
  bool AdmitsUnlocked( const VCaptureRequest& i_rRequest ) const REQUIRES( m_Mutex );
  void EnterCaptureUnlocked( const VCaptureRequest& i_rRequest ) REQUIRES( m_Mutex );
  EPosition ResolveUnlocked( VToken& io_rToken ) const REQUIRES( m_Mutex );
  EPosition ResolveStartUnlocked( VToken& io_rToken ) const REQUIRES( m_Mutex );
  bool ResolveEndUnlocked( const VToken& i_rStart, VToken& io_rEnd, EPosition& o_rPosition ) const REQUIRES( m_Mutex );
  void BeginCaptureUnlocked( EPosition i_Start, EPosition i_End ) REQUIRES( m_Mutex );
  void StepCaptureUnlocked( const VToken& i_rNewest ) REQUIRES( m_Mutex );
  void ReachEndUnlocked() REQUIRES( m_Mutex );
  bool SetWaitingEndUnlocked( const VCaptureEnd& i_rEnd ) REQUIRES( m_Mutex );
  bool SetRunningEndUnlocked( const VCaptureEnd& i_rEnd ) REQUIRES( m_Mutex );
  void DropWaitingCaptureUnlocked() REQUIRES( m_Mutex );
  void EndWithSessionUnlocked() REQUIRES( m_Mutex );
  VToken NewestUnlocked() const REQUIRES( m_Mutex );
  void SetStateUnlocked( ECaptureState::Enum i_State ) REQUIRES( m_Mutex );
  bool IsStateUnlocked( uint32_t i_Mask ) const REQUIRES( m_Mutex ) { return ( m_State & i_Mask ) != 0; }
  bool IsStreamedUnlocked() const REQUIRES( m_Mutex ) { return m_CaptureType == CaptureSessionType::Streamed; }
  void TellStatusUnlocked() REQUIRES( m_Mutex );
  void TellCaptureReadyUnlocked() REQUIRES( m_Mutex );
  void TellNoCaptureUnlocked() REQUIRES( m_Mutex );
  void FillStatusUnlocked( VCaptureSessionStatus& o_rStatus ) const REQUIRES( m_Mutex );
  uint64_t CapturedFramesUnlocked() const REQUIRES( m_Mutex );
  uint64_t AvailableFramesUnlocked() const REQUIRES( m_Mutex );
  int64_t LastCapturedUnlocked() const REQUIRES( m_Mutex );

  // Clients
  void ActivateClientsUnlocked( VFrameEntry* i_pFirst ) REQUIRES( m_Mutex );
  void OfferFrameUnlocked( VFrameEntry* i_pEntry ) REQUIRES( m_Mutex );
  void WakeClientsUnlocked() REQUIRES( m_Mutex );
  void WakeDrainingClientsUnlocked() REQUIRES( m_Mutex );
  void WakeUnlocked( VClient& io_rClient ) REQUIRES( m_Mutex );
  bool HasActiveClientUnlocked() const REQUIRES( m_Mutex );
  int64_t SlowestClientUnlocked() const REQUIRES( m_Mutex );
  void LeaveUnlocked( VClient& io_rClient ) REQUIRES( m_Mutex );
  void OnClientLeftUnlocked() REQUIRES( m_Mutex );
  EClientResult::Enum ReadNextUnlocked( VClient& io_rClient, VRefCountedToken& o_rFrame ) REQUIRES( m_Mutex );
  void TakeFrameUnlocked( VClient& io_rClient, VRefCountedToken& o_rFrame ) REQUIRES( m_Mutex );

  // Fixed after construction
  const std::shared_ptr<VCaptureBufferAllocator> m_pAllocator;
  const std::function<void( VFrameEntry* )> m_DeleteFrame;

  // Frames
  KVZ::VBufferSessionId m_CurrentBufferSession GUARDED_BY( m_Mutex ){ 1 };
  int64_t m_LastFrameNumber GUARDED_BY( m_Mutex ) = 0;
  std::map<KVZ::VBufferSessionId, std::shared_ptr<VBufferSession>> m_Sessions GUARDED_BY( m_Mutex );
  VBufferSession m_Retired GUARDED_BY( m_Mutex );   // evicted frames whose block is pinned, oldest first

  // Capture
  VToken m_CaptureStart GUARDED_BY( m_Mutex );
  VToken m_RequestedStart GUARDED_BY( m_Mutex );
  VToken m_CaptureEnd GUARDED_BY( m_Mutex );
  VToken m_RequestedEnd GUARDED_BY( m_Mutex );
  KVZ::VCaptureSessionId m_CaptureSessionId GUARDED_BY( m_Mutex );
  VCaptureSessionInfo m_CaptureInfo GUARDED_BY( m_Mutex );
  CaptureSessionType::Enum m_CaptureType GUARDED_BY( m_Mutex ) = CaptureSessionType::Streamed;
  KVZ::VBufferSessionId m_CaptureFirstBufferSession GUARDED_BY( m_Mutex );
  ECaptureState::Enum m_State GUARDED_BY( m_Mutex ) = ECaptureState::Idle;
  uint32_t m_Failure GUARDED_BY( m_Mutex ) = 0;
  std::vector<VCaptureError> m_Errors GUARDED_BY( m_Mutex );

  // Clients
  std::map<uint32_t, VClient> m_Clients GUARDED_BY( m_Mutex );
  uint32_t m_NextClientId GUARDED_BY( m_Mutex ) = 0;
  uint64_t m_DataDrainLimit GUARDED_BY( m_Mutex ) = std::numeric_limits<uint64_t>::max();

  NotificationSystem::VMultiCallbackPostal<void( KVZ::VBufferSessionId )> m_OnBufferSessionRemoved;
  NotificationSystem::VMultiCallbackPostal<void( KVZ::VBufferSessionId )> m_OnNewData;
  NotificationSystem::VMultiCallbackPostal<void( VCaptureSessionStatus )> m_OnStatus;
  NotificationSystem::VMultiCallbackPostal<VCaptureReadySignature> m_OnCaptureReady;
};

}
