// One source of timed frames. A device feeds it on its delivery thread; the host's engine joins it to global sync sessions and takes captures
// over ranges of the global timeline; live readers take the newest frames, thinned evenly where they fall behind.
//
// Threads. Frames arrive on the delivery thread, which never waits for the strand. What changes the source's part in sessions runs on the
// strand, one call after another: those operations wait for their result, and a caller that is on the strand already runs them in place.
// Everything may be called from any thread unless it says otherwise. m_Mutex guards the session state; it is taken before the buffer's lock
// and never held across a hook or a post.
#pragma once

#include "NotificationSystem/Callback.h"
#include "StageCoreRuntime/GlobalLog.h"
#include "StageCoreRuntime/Shared.h"
#include "StageCoreRuntime/ThreadAnnotations.h"
#include "SyncSystem/DataSourceFrames.h"
#include "SyncSystem/DataSourceReader.h"
#include "SyncSystem/DataSourceSession.h"
#include "SyncSystem/DataSourceStrand.h"
#include "SyncSystem/DriftMonitorSourceTimingInfo.h"
#include "SyncSystem/ISource.h"
#include "SyncSystem/TimeBasedCaptureBuffer.h"

#include <boost/thread/mutex.hpp>

#include <atomic>
#include <cstdint>
#include <functional>
#include <map>
#include <memory>
#include <string>
#include <vector>

namespace SyncSystem
{

struct VDataSourceSettings
{
  std::string m_Name{};
  std::shared_ptr<VCaptureBufferAllocator> m_pAllocator{};
  // Destroys what a frame's payload holds. Called with the buffer's lock held.
  std::function<void( VFrameEntry* )> m_DeleteFrame{};
  std::shared_ptr<KVZ::IPostalService> m_pPostalService{};   // the strand's thread; empty: on the caller's
  double m_NoticeSeconds = 0.0;                              // how far ahead the source must hear of a new global session
  std::shared_ptr<VDriftMonitorAnalysis> m_pAnalysis{};      // empty: delivery offsets are not published
};

// How a triggered source wants to be driven.
struct VTriggerPlan
{
  int32_t m_Kind = 0;   // 0: no plan
  KVZ::VTick m_FramePeriod;
  KVZ::VTick m_BeatPeriod;
  std::map<std::string, KVZ::ITriggerSignal> m_Signals;

  bool IsValid() const { return m_Kind != 0; }
};

// A delivered frame, as a subclass hands it to AddFrame.
struct VIncomingFrame
{
  KVZ::ITickInClocks m_Clocks;   // without the counter
  KVZ::VTick m_Period;
  KVZ::VTick m_BeatPeriod;
  KVZ::VTick m_BeatOffset;
  double m_Now = 0.0;          // host seconds of delivery; 0 leaves the drift monitor alone
  void* m_pMemory = nullptr;   // the frame's data, of the buffer's allocator: it leaves the buffer with its entry
};

class VDataSource : public KVZ::VShared, public KVZ::ISourceTemporal, public KVZ::ISourceCapture, public KVZ::ISource
{
public:
  ~VDataSource() override;

  void PostConstruct() override;

  // ISource
  std::string GetSourceName() const override { return m_Name; }
  KVZ::ISourceTemporal& Temporal() override { return *this; }
  KVZ::ISourceCapture& Capture() override { return *this; }

  // ISourceTemporal
  boost::optional<KVZ::ISourceSyncSession> DeclareGlobalSyncSession( KVZ::VGlobalSyncSessionId i_Id,
    std::shared_ptr<KVZ::IBaseLineClock> i_pClock ) override;
  std::vector<std::string> ApplyTriggerSignals( const std::map<std::string, KVZ::ITriggerSignal>& i_rSignals ) override;
  void ArmGlobalSyncSession() override;
  void StartGlobalSyncSession( const KVZ::ITickInClocks& i_rTicks, KVZ::VTick i_Offset ) override;
  void RunGlobalSyncSessionHook() override;
  boost::optional<ISourceTimingInfo> GetSourceTimingInfo() override;
  ISourceSyncStatus GetSourceSyncStatus() override;
  NotificationSystem::VCallbackPostal<void( KVZ::VGlobalSyncSessionId )>& OnRequestNewGlobalSyncSession() override { return m_OnRequestNewGlobal; }
  KVZ::VGlobalSyncSessionId GetOldestGlobalSyncSession() override;

  // ISourceCapture
  bool StartCapture( const KVZ::ICaptureHeader& i_rHeader, KVZ::VTick i_Start, KVZ::VTick i_End, bool i_bReserve, uint32_t i_Options ) override;
  void EndCapture( KVZ::VTick i_End ) override;
  void CancelCapture() override;
  KVZ::ICaptureStatus GetCaptureStatus() override;

  // A disabled source stays out of global sync sessions. Enabling it begins a new buffer session at the next frame. True if that is a change.
  bool SetSourceEnabled( bool i_bEnabled );

  // Live readers. The frames since the last call; all but i_MaxFrames of them are marked as dropped.
  EReadResult::Enum ReadFrames( uint64_t i_MaxFrames, VReadFrames& o_rRead );
  // The same, but a reader that finds nothing leaves its token (not 0), and the next frame fires OnNewFrames with it.
  EReadResult::Enum ReadFramesOrSleep( uint64_t i_MaxFrames, uint64_t i_WakeToken, VReadFrames& o_rRead );
  NotificationSystem::VCallbackPostal<void( uint64_t )>& OnNewFrames() { return m_OnNewFrames; }

  // Of a frame of the session by its number there. False where the session is not the one that is being timed.
  bool GetDeliveryOffsets( uint32_t i_SessionId, uint64_t i_Frame, double i_Time, VDeliveryOffsets& o_rOffsets ) const
  {
    return m_pDrift->GetOffsets( i_SessionId, i_Frame, i_Time, o_rOffsets );
  }

  const std::shared_ptr<VTimeBasedCaptureBuffer>& Buffer() const { return m_pBuffer; }

protected:
  explicit VDataSource( const VDataSourceSettings& i_rSettings );

  // Stores a frame and tells everybody. i_FillPayload writes the entry's payload, of this size; false refuses the frame. False: not stored,
  // and the memory stays the caller's. Delivery thread only.
  bool AddFrame( const VIncomingFrame& i_rFrame, size_t i_PayloadSize, const std::function<bool( void* )>& i_rFillPayload );
  // The next frame begins a new buffer session, and the source offers no session before it.
  void BeginAnew();
  void RequestNewGlobalSyncSession();
  // Posts to the strand, or calls in place where there is none.
  void PostToStrand( std::function<void()> i_Function );
  const KVZ::VLogCategory& Log() const { return m_rLog; }
  uint64_t SourceId() const { return m_SourceId; }
  void CountDroppedFrames( uint64_t i_Frames ) { m_DroppedFrames.fetch_add( i_Frames, std::memory_order_relaxed ); }

  // Hooks. On the strand, without a lock.
  //
  // False opts out of the session.
  virtual bool PrepareForGlobalSyncSession( KVZ::VGlobalSyncSessionId, const std::shared_ptr<KVZ::IBaseLineClock>&, VTriggerPlan& ) { return true; }
  // True while a triggered source waits for its frames to stop.
  virtual bool OnGlobalSyncSessionDeclared() { return false; }
  virtual std::vector<std::string> TriggerSignalsChanged( const std::map<std::string, KVZ::ITriggerSignal>& ) { return {}; }
  virtual void OnGlobalSyncSessionStarted( const std::shared_ptr<const VGlobalSyncSessionInfo>& ) {}
  virtual void OnArmGlobalSyncSession() {}
  virtual void OnGlobalSyncSessionHook() {}
  // Makes a capture ready, once for each capture that is not a reservation. Errors go to the capture's status; false fails it.
  virtual bool BeginCapture( const KVZ::ICaptureHeader&, const std::shared_ptr<const VGlobalSyncSessionInfo>&, uint32_t /*options*/,
    std::vector<VCaptureError>& )
  {
    return true;
  }
  virtual void OnCaptureStarted( const KVZ::ICaptureHeader&, const KVZ::IClock&, const KVZ::ITickInClocks& /*start*/,
    const KVZ::ITickInClocks& /*end*/, bool /*reserved*/ )
  {
  }
  virtual void OnCaptureEndChanged( KVZ::VCaptureSessionId, const KVZ::IClock&, const KVZ::ITickInClocks& ) {}
  virtual void OnCaptureCancelled( KVZ::VCaptureSessionId ) {}
  virtual void OnBusyChanged( bool ) {}
  // A cancelled capture still has something to close. Any thread.
  virtual bool IsCaptureDraining() { return false; }

private:
  using VInfoPtr = std::shared_ptr<const VGlobalSyncSessionInfo>;
  using VTimingMonitor = VDriftMonitorSourceTimingInfo<Drift::VDriftMonitorFiltered>;

  // What a capture is known by once it has been started.
  struct VCaptureState
  {
    KVZ::VCaptureSessionId m_Id;
    VInfoPtr m_pInfo;                   // outlives later sessions
    KVZ::ICaptureStatus m_LastStatus;   // stands while the buffer tells of another capture
  };

  struct VCaptureCall
  {
    KVZ::ICaptureHeader m_Header;
    KVZ::VTick m_Start;
    KVZ::VTick m_End;
    CaptureSessionType::Enum m_Type;
    uint32_t m_Options;
  };

  struct VCaptureRange
  {
    VToken m_Start;   // empty: none was found
    VToken m_End;     // empty: open
    KVZ::ITickInClocks m_StartTicks;
    KVZ::ITickInClocks m_EndTicks;
  };

  // Runs on the strand and waits for the result.
  template<class TFunction>
  std::invoke_result_t<TFunction&> OnStrand( TFunction i_Function )
  {
    return m_pStrand ? m_pStrand->Run( [pThis = KVZ::SharedFrom( this ), Function = std::move( i_Function )]() mutable { return Function(); } )
                     : i_Function();
  }

  // Frames
  void Store( VFrameEntry* i_pEntry, const VIncomingFrame& i_rFrame, uint32_t i_SessionBefore );
  void TimeFrame( const VIncomingFrame& i_rFrame, uint32_t i_SessionId, KVZ::VTick i_Counter );
  bool IsDrainingAfterExhaustion();
  VToken NewestPosition() const;
  void OnMemoryExhausted();
  void OnNewSyncSession( uint32_t i_SessionId );
  void WakeReader();
  void TakeBackToken( uint64_t i_WakeToken );

  // Sessions, on the strand
  boost::optional<KVZ::ISourceSyncSession> Declare( KVZ::VGlobalSyncSessionId i_Id, const std::shared_ptr<KVZ::IBaseLineClock>& i_pClock );
  VInfoPtr EnterSession( KVZ::VGlobalSyncSessionId i_Id, const VTriggerPlan& i_rPlan );
  void BeginTriggeredSession( const VTriggerPlan& i_rPlan ) REQUIRES( m_Mutex );
  bool TakeSession( uint32_t i_SessionId ) REQUIRES( m_Mutex );
  VInfoPtr StartNewest( const KVZ::ITickInClocks& i_rTicks, KVZ::VTick i_Offset );
  ISourceSyncStatus MakeSyncStatus() const;
  bool ChangeEnabled( bool i_bEnabled );
  VInfoPtr NewestInfo() const;
  VInfoPtr FindInfo( KVZ::VGlobalSyncSessionId i_Id ) const;

  // Captures
  bool Begin( const VCaptureCall& i_rCall );
  bool IsAdmitted( KVZ::VCaptureSessionId i_Id ) const;
  bool Prepare( const VCaptureCall& i_rCall, const VInfoPtr& i_pInfo, VCaptureRequest& io_rRequest );
  void LogStart( const VGlobalSyncSessionInfo& i_rInfo, const VCaptureCall& i_rCall, const VToken& i_rPosition ) const;
  void LogReserved( const VGlobalSyncSessionInfo& i_rInfo ) const;
  void RememberCapture( KVZ::VCaptureSessionId i_Id, VInfoPtr i_pInfo, KVZ::VTick i_RequestedStart );
  static VCaptureRange MakeRange( const VGlobalSyncSessionInfo& i_rInfo, KVZ::VTick i_Start, KVZ::VTick i_End );
  void FillStatus( const VCaptureSessionStatus& i_rBuffer, const VGlobalSyncSessionInfo* i_pInfo, KVZ::ICaptureStatus& io_rStatus ) const;
  double BufferFill() const;
  KVZ::ICaptureStatus ReadCaptureStatus();
  void UpdateBusy( uint32_t i_State );
  void TellBusy();
  VCaptureState CurrentCapture() const;

  // Fixed after construction
  const std::string m_Name;
  const KVZ::VLogCategory& m_rLog;   // "Hal." and the name
  const uint64_t m_SourceId;         // random: the clocks of two sources are never taken for one
  const double m_NoticeSeconds;
  const KVZ::IClock m_CounterClock;
  const std::shared_ptr<VStrand> m_pStrand;   // empty: calls run on the caller's thread
  const std::shared_ptr<VTimeBasedCaptureBuffer> m_pBuffer;
  const std::shared_ptr<VTimingMonitor> m_pDrift;
  const std::shared_ptr<VDriftMonitorAnalysis> m_pAnalysis;   // may be empty
  VDataSourceReader m_Reader;
  NotificationSystem::VCallbackPostal<void( KVZ::VGlobalSyncSessionId )> m_OnRequestNewGlobal;
  NotificationSystem::VCallbackPostal<void( uint64_t )> m_OnNewFrames;

  std::atomic<uint64_t> m_DroppedFrames{ 0 };
  std::atomic<uint64_t> m_RefusedFrames{ 0 };
  std::atomic<bool> m_bBusyTold{ false };   // by the strand

  // Delivery thread only
  KVZ::VCaptureSessionId m_ExhaustedCapture;   // ended for want of memory; frames are refused until its readers have finished

  // Strand only
  KVZ::VCaptureSessionId m_PreparedCapture;   // BeginCapture has run for it

  mutable boost::mutex m_Mutex;
  KVZ::ISourceSyncSession m_Session GUARDED_BY( m_Mutex );   // to be offered; m_Id 0 for none
  std::map<KVZ::VGlobalSyncSessionId, VInfoPtr> m_GlobalSessions GUARDED_BY( m_Mutex );
  KVZ::VGlobalSyncSessionId m_LastDeclared GUARDED_BY( m_Mutex );
  std::shared_ptr<KVZ::IBaseLineClock> m_pBaseLineClock GUARDED_BY( m_Mutex );
  VTriggerPlan m_TriggerPlan GUARDED_BY( m_Mutex );
  bool m_bEnabled GUARDED_BY( m_Mutex ) = true;
  VCaptureState m_Capture GUARDED_BY( m_Mutex );

  boost::mutex m_WakeMutex;                             // never held with another
  uint64_t m_WakeToken GUARDED_BY( m_WakeMutex ) = 0;   // left by a reader that found nothing
};

}
