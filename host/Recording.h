// One recording over several devices: a range of global ticks, a capture on each source, and the account of what came out.
//
// Used by one thread, which polls; nothing here waits.
#pragma once

#include "StageCorePluginInterface/StageCoreHost.h"
#include "SyncSystem/ISource.h"
#include "host/CaptureTargets.h"
#include "host/SyncEngine.h"

#include <boost/optional.hpp>

#include <cstdint>
#include <memory>
#include <string>
#include <vector>

namespace StageHost
{

struct VRecordingRequest
{
  std::vector<std::string> m_DeviceURNs;
  boost::optional<uint64_t> m_Frames;   // so many of each device, or
  KVZ::VTick m_Duration;                // all within this span
  KVZ::VTick m_PreRoll;                 // how far before the request the range begins
  std::string m_Name;
};

struct VLostFrames
{
  uint64_t m_Card = 0;     // the card missed them: they lie between captured frames and were never seen
  uint64_t m_Memory = 0;   // asked for and not in memory: evicted before the start, or refused
  uint64_t m_Signal = 0;   // asked for and never delivered: the signal went away or changed
  uint64_t m_Writer = 0;   // captured and not written

  uint64_t Total() const { return m_Card + m_Memory + m_Signal + m_Writer; }
};

struct VDeviceOutcome
{
  std::string m_DeviceURN;
  uint64_t m_FramesRequested = 0;
  uint64_t m_FramesCaptured = 0;   // while it runs, as the last poll has seen it
  uint64_t m_FramesWritten = 0;    // of the file with the fewest
  VLostFrames m_Lost;
  KVZ::ICaptureStatus m_Status;
  KVZ::VTick m_Period;
  double m_PeakFill = 0.0;      // 0 to 1; a buffer keeps old frames, so full is its usual state
  uint64_t m_PeakBacklog = 0;   // frames captured and not yet written, at most
  boost::optional<KVZ::ISourceTemporal::ISourceTimingInfo> m_Timing;
  std::vector<StageCorePluginInterface::VCaptureFileReport> m_Files;

  bool HasFailed() const;
};

class VRecording
{
public:
  VRecording( VSyncEngine& i_rEngine, VCaptureTargets& i_rTargets, StageCorePluginInterface::ITimeService& i_rTime );

  // Every device takes part in the newest global session, delivers, and has as much in memory as the pre-roll needs.
  bool IsReady( const VRecordingRequest& i_rRequest ) const;

  // Starts the captures; false with the reason in o_rError, and none is left running.
  bool Start( const VRecordingRequest& i_rRequest, std::string& o_rError );

  // Reads every capture's status, and ends captures whose source has stopped delivering.
  void Poll();
  bool IsFinished() const;
  // The request is to end here: what is captured by now is what was asked for.
  void Stop();

  std::vector<VDeviceOutcome> GetOutcomes() const;

private:
  struct VDevice
  {
    std::shared_ptr<KVZ::ISource> m_pSource;
    KVZ::VCaptureSessionId m_CaptureId;
    KVZ::VTick m_Start;   // of the range asked for
    uint64_t m_FramesRequested = 0;
    KVZ::VTick m_Period;
    uint64_t m_DroppedAtStart = 0;
    uint64_t m_DroppedBefore = 0;   // ahead of the newest frame
    uint64_t m_Dropped = 0;         // by the card, since the start and before the capture's end
    uint64_t m_Arrived = 0;         // frames of the range so far, as the polls have seen them
    uint64_t m_NewestFrame = 0;     // progress of delivery, for stalls
    double m_LastProgress = 0.0;    // seconds
    KVZ::ICaptureStatus m_Status;
    KVZ::ISourceTemporal::ISourceSyncStatus m_Sync;
    double m_PeakFill = 0.0;
    uint64_t m_PeakBacklog = 0;
    bool m_bStopped = false;
  };

  const VStartedSource* FindReady( const VStartedSession& i_rSession, const std::string& i_rDeviceURN, KVZ::VTick i_PreRoll ) const;
  VDevice MakeDevice( const VStartedSource& i_rSource, const VRecordingRequest& i_rRequest, KVZ::VTick i_Start ) const;
  void PollDevice( VDevice& io_rDevice );
  static void CountDropped( VDevice& io_rDevice, bool i_bHadEnded, const KVZ::ISourceTemporal::ISourceSyncStatus& i_rBefore );
  static void CountArrivals( VDevice& io_rDevice, const KVZ::ISourceTemporal::ISourceSyncStatus& i_rSync );
  void EndStalled( VDevice& io_rDevice, double i_Now );
  VDeviceOutcome MakeOutcome( const VDevice& i_rDevice ) const;

  VSyncEngine& m_rEngine;
  VCaptureTargets& m_rTargets;
  StageCorePluginInterface::ITimeService& m_rTime;
  std::vector<VDevice> m_Devices;
};

}
