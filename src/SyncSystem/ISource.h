// A data source as the host's engine sees it: its part in global sync sessions, and its captures.
//
// Global ticks. A started session relates a source to the one timeline of all sources by the start ticks: the readings, at one moment, of
// the GlobalTime clock and of every clock of every source. With C the source's counter clock and G GlobalTime, a global tick T is the
// counter reading  StartTicks[C] + T - StartTicks[G].
#pragma once

#include "NotificationSystem/Callback.h"
#include "SyncSystem/SourceSyncSession.h"
#include "SyncSystem/TypedId.h"

#include <boost/optional.hpp>

#include <cstdint>
#include <map>
#include <memory>
#include <string>
#include <vector>

namespace KVZ
{

// What every source counts against. A source without a trigger only keeps it.
class IBaseLineClock
{
public:
  virtual ~IBaseLineClock() = default;
  virtual std::string GetName() const = 0;
  // Of one beat of the clock.
  virtual VTick GetPeriod() const = 0;
};

struct ITriggerSignal
{
  uint32_t m_Type = 0;
  VTick m_Delay;
  VTick m_Width;
  bool m_bEnabled = false;
};

struct ICaptureHeader
{
  VCaptureSessionId m_CaptureSessionId;
  std::string m_Name;
  int64_t m_Info = 0;   // passed through to the capture targets
  VGlobalSyncSessionId m_GlobalSyncSessionId;
};

struct ICaptureStatus
{
  uint32_t m_State = 1;     // SyncSystem::ECaptureState
  uint32_t m_Failure = 0;   // SyncSystem::ECaptureFailure flags
  std::vector<std::string> m_Errors;
  double m_BufferFill = 0.0;                // used over total memory
  VTick m_RequestedStart = VTick::Open();   // global; Open() while not known
  VTick m_Start = VTick::Open();            // global tick of the capture's first frame
  VTick m_CapturedDuration = VTick::Open();
  VTick m_AvailableDuration = VTick::Open();   // captured and not yet taken by the slowest reader
};

class ISourceTemporal
{
public:
  struct ISourceSyncStatus
  {
    ISourceSyncSession m_Session;   // m_Id 0 while no frame has come
    bool m_bEnabled = false;
    VGlobalSyncSessionId m_LastDeclared;
    uint64_t m_LatestCounterFrames = 0;   // frames of m_Session so far less one: the newest frame's number in it
    uint64_t m_DroppedFrames = 0;         // missed by the card since the source was made; the first count after a start is no loss
    uint64_t m_RefusedFrames = 0;         // delivered and not stored: memory had run out
    double m_BufferFill = 0.0;            // used over total memory; near 1 as soon as old frames are given up for new ones
  };

  struct ISourceTimingInfo
  {
    uint32_t m_SessionId = 0;   // source sync session of the fit
    double m_StartTime = 0.0;   // fitted host time of the session's first frame, seconds
    double m_SecondsPerSample = 0.0;
    double m_MeanOffset = 0.0;   // delivery later than the fit says, seconds
    double m_OffsetVariance = 0.0;
    double m_RecentMaximum = 0.0;   // the window's largest offset but for the few worst
  };

  // Joins the source to a session; empty when the source opts out or has no frames yet.
  virtual boost::optional<ISourceSyncSession> DeclareGlobalSyncSession( VGlobalSyncSessionId i_Id, std::shared_ptr<IBaseLineClock> i_pClock ) = 0;
  virtual std::vector<std::string> ApplyTriggerSignals( const std::map<std::string, ITriggerSignal>& i_rSignals ) = 0;
  // Between declaration and start.
  virtual void ArmGlobalSyncSession() = 0;
  virtual void StartGlobalSyncSession( const ITickInClocks& i_rTicks, VTick i_Offset ) = 0;
  virtual void RunGlobalSyncSessionHook() = 0;
  // Empty until two frames of the session have been timed.
  virtual boost::optional<ISourceTimingInfo> GetSourceTimingInfo() = 0;
  virtual ISourceSyncStatus GetSourceSyncStatus() = 0;
  // Called with the id last declared to the source.
  virtual NotificationSystem::VCallbackPostal<void( VGlobalSyncSessionId )>& OnRequestNewGlobalSyncSession() = 0;
  // The oldest session that the source still needs; 0 for none.
  virtual VGlobalSyncSessionId GetOldestGlobalSyncSession() = 0;
  virtual ~ISourceTemporal() = default;
};

class ISourceCapture
{
public:
  // Frames with global ticks in [Start, End). End may be VTick::Open(). Reserve protects the range without writing it.
  virtual bool StartCapture( const ICaptureHeader& i_rHeader, VTick i_Start, VTick i_End, bool i_bReserve, uint32_t i_Options ) = 0;
  // VTick::Open() means now, at the newest frame.
  virtual void EndCapture( VTick i_End ) = 0;
  virtual void CancelCapture() = 0;
  virtual ICaptureStatus GetCaptureStatus() = 0;
  virtual ~ISourceCapture() = default;
};

// What the register of sources holds.
class ISource
{
public:
  virtual ~ISource() = default;
  // A device's source is named by the device's URN.
  virtual std::string GetSourceName() const = 0;
  virtual ISourceTemporal& Temporal() = 0;
  virtual ISourceCapture& Capture() = 0;
};

}
