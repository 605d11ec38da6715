#include "host/Recording.h"

#include <algorithm>
#include <atomic>
#include <utility>

namespace StageHost
{

namespace
{

// A source that is silent for this long has ended: its capture is closed so that the file is whole.
constexpr double StallSeconds = 3.0;

// A session that begins within a timecode label that two frames share ends with the next label: the second frame of a label is known as such
// only by its first. From this many frames on a session has outlived that.
constexpr uint64_t SettledFrames = 2;

// SyncSystem's capture states and failure flags, as they cross the interface.
constexpr uint32_t StateIdle = 1;
constexpr uint32_t StateWaitingForStart = 2;
constexpr uint32_t StateCapturing = 4;
constexpr uint32_t StateComplete = 32;
constexpr uint32_t StateCancelled = 128;
constexpr uint32_t FailureStart = 1;
constexpr uint32_t FailureEndMoved = 2;
constexpr uint32_t FailureMemory = 4;
constexpr uint32_t FailureErrors = 8;

int64_t CeilDivide( int64_t i_Value, int64_t i_By ) { return i_Value >= 0 ? ( i_Value + i_By - 1 ) / i_By : -( -i_Value / i_By ); }

KVZ::VCaptureSessionId NextCaptureId()
{
  static std::atomic<uint32_t> s_Newest{ 0 };
  return KVZ::VCaptureSessionId( ++s_Newest );
}

// Its range is known, and none of it is still to come.
bool HasEnded( const KVZ::ICaptureStatus& i_rStatus )
{
  return i_rStatus.m_State != StateWaitingForStart && i_rStatus.m_State != StateCapturing && !i_rStatus.m_RequestedStart.IsOpen();
}

bool IsOver( const KVZ::ICaptureStatus& i_rStatus )
{
  return i_rStatus.m_State == StateIdle || i_rStatus.m_State == StateComplete || i_rStatus.m_State == StateCancelled;
}

uint64_t FramesOf( KVZ::VTick i_Duration, KVZ::VTick i_Period )
{
  return i_Duration.IsOpen() || i_Duration.Count() <= 0 ? 0 : static_cast<uint64_t>( i_Duration.Count() / i_Period.Count() );
}

// Changes with each frame, whatever session it belongs to.
uint64_t NewestFrame( const KVZ::ISourceTemporal::ISourceSyncStatus& i_rStatus )
{
  return ( static_cast<uint64_t>( i_rStatus.m_Session.m_Id ) << 40 ) + i_rStatus.m_LatestCounterFrames;
}

uint64_t LessOrZero( uint64_t i_A, uint64_t i_B ) { return i_A > i_B ? i_A - i_B : 0; }

}

bool VDeviceOutcome::HasFailed() const
{
  return ( m_Status.m_Failure & ( FailureStart | FailureErrors ) ) != 0 || m_Files.empty() ||
    std::any_of( m_Files.begin(), m_Files.end(), []( const auto& i_rFile ) { return i_rFile.m_bFailed; } );
}

VRecording::VRecording( VSyncEngine& i_rEngine, VCaptureTargets& i_rTargets, StageCorePluginInterface::ITimeService& i_rTime )
  : m_rEngine( i_rEngine ), m_rTargets( i_rTargets ), m_rTime( i_rTime )
{
}

const VStartedSource* VRecording::FindReady( const VStartedSession& i_rSession, const std::string& i_rDeviceURN, KVZ::VTick i_PreRoll ) const
{
  for( const VStartedSource& rSource : i_rSession.m_Sources )
  {
    if( rSource.m_pSource->GetSourceName() != i_rDeviceURN )
    {
      continue;
    }
    const auto Status = rSource.m_pSource->Temporal().GetSourceSyncStatus();
    const KVZ::VTick InMemory = rSource.m_Session.m_Period * static_cast<int64_t>( Status.m_LatestCounterFrames );
    const bool bSettled = Status.m_bEnabled && Status.m_Session.m_Id == rSource.m_Session.m_Id && Status.m_LatestCounterFrames >= SettledFrames;
    return bSettled && InMemory >= i_PreRoll ? &rSource : nullptr;
  }
  return nullptr;
}

bool VRecording::IsReady( const VRecordingRequest& i_rRequest ) const
{
  const auto pSession = m_rEngine.GetStarted();
  return pSession &&
    std::all_of( i_rRequest.m_DeviceURNs.begin(), i_rRequest.m_DeviceURNs.end(),
      [&]( const std::string& i_rURN ) { return FindReady( *pSession, i_rURN, i_rRequest.m_PreRoll ) != nullptr; } );
}

VRecording::VDevice VRecording::MakeDevice( const VStartedSource& i_rSource, const VRecordingRequest& i_rRequest, KVZ::VTick i_Start ) const
{
  const KVZ::VTick Period = i_rSource.m_Session.m_Period;
  const KVZ::VTick CounterStart = i_rSource.m_Place.m_CounterStart;
  const int64_t First = CeilDivide( ( i_Start - CounterStart ).Count(), Period.Count() );
  VDevice Device;
  Device.m_pSource = i_rSource.m_pSource;
  Device.m_CaptureId = NextCaptureId();
  Device.m_Start = CounterStart + Period * First;
  Device.m_Period = Period;
  Device.m_FramesRequested = i_rRequest.m_Frames
    ? *i_rRequest.m_Frames
    : static_cast<uint64_t>( CeilDivide( ( i_Start + i_rRequest.m_Duration - CounterStart ).Count(), Period.Count() ) - First );
  Device.m_Sync = i_rSource.m_pSource->Temporal().GetSourceSyncStatus();
  Device.m_DroppedAtStart = Device.m_Sync.m_DroppedFrames;
  Device.m_DroppedBefore = Device.m_DroppedAtStart;
  const KVZ::VTick Newest = CounterStart + Period * static_cast<int64_t>( Device.m_Sync.m_LatestCounterFrames );
  Device.m_Arrived = FramesOf( Newest - Device.m_Start + Period, Period );
  Device.m_LastProgress = m_rTime.Now();
  return Device;
}

bool VRecording::Start( const VRecordingRequest& i_rRequest, std::string& o_rError )
{
  const auto pSession = m_rEngine.GetStarted();
  std::vector<const VStartedSource*> Sources;
  KVZ::VTick Now = -KVZ::VTick::Open();
  for( const std::string& rURN : i_rRequest.m_DeviceURNs )
  {
    const VStartedSource* pSource = pSession ? FindReady( *pSession, rURN, i_rRequest.m_PreRoll ) : nullptr;
    if( !pSource )
    {
      o_rError = "Device " + rURN + " is not ready to record.";
      return false;
    }
    const auto Status = pSource->m_pSource->Temporal().GetSourceSyncStatus();
    Now = std::max( Now, pSource->m_Place.m_CounterStart + pSource->m_Session.m_Period * static_cast<int64_t>( Status.m_LatestCounterFrames ) );
    Sources.push_back( pSource );
  }
  for( const VStartedSource* pSource : Sources )
  {
    VDevice Device = MakeDevice( *pSource, i_rRequest, Now - i_rRequest.m_PreRoll );
    const KVZ::ICaptureHeader Header{ Device.m_CaptureId, i_rRequest.m_Name, 0, pSession->m_Id };
    const KVZ::VTick End = Device.m_Start + Device.m_Period * static_cast<int64_t>( Device.m_FramesRequested );
    if( !Device.m_pSource->Capture().StartCapture( Header, Device.m_Start, End, false, 0 ) )
    {
      o_rError = "Device " + Device.m_pSource->GetSourceName() + " refuses to record: another capture is running.";
      for( const VDevice& rStarted : m_Devices )
      {
        rStarted.m_pSource->Capture().CancelCapture();
      }
      return false;
    }
    m_Devices.push_back( std::move( Device ) );
  }
  return true;
}

void VRecording::Poll()
{
  const double Now = m_rTime.Now();
  for( VDevice& rDevice : m_Devices )
  {
    if( !IsOver( rDevice.m_Status ) || rDevice.m_Status.m_RequestedStart.IsOpen() )
    {
      PollDevice( rDevice );
      EndStalled( rDevice, Now );
    }
  }
}

void VRecording::PollDevice( VDevice& io_rDevice )
{
  const bool bHadEnded = HasEnded( io_rDevice.m_Status );
  const auto Sync = io_rDevice.m_pSource->Temporal().GetSourceSyncStatus();   // first: what it counts lies before the status
  io_rDevice.m_Status = io_rDevice.m_pSource->Capture().GetCaptureStatus();
  CountArrivals( io_rDevice, Sync );
  CountDropped( io_rDevice, bHadEnded, std::exchange( io_rDevice.m_Sync, Sync ) );
  io_rDevice.m_PeakFill = std::max( io_rDevice.m_PeakFill, io_rDevice.m_Status.m_BufferFill );
  io_rDevice.m_PeakBacklog = std::max( io_rDevice.m_PeakBacklog, FramesOf( io_rDevice.m_Status.m_AvailableDuration, io_rDevice.m_Period ) );
}

// A signal that comes back makes the card count its absence some time before its first frame ends the capture: what is counted belongs to the range
// once two later frames have come and the capture goes on, or has ended as it was to. The first of them may not have reached the buffer yet.
void VRecording::CountDropped( VDevice& io_rDevice, bool i_bHadEnded, const KVZ::ISourceTemporal::ISourceSyncStatus& i_rBefore )
{
  const bool bEnded = HasEnded( io_rDevice.m_Status );
  if( i_bHadEnded || ( bEnded && ( io_rDevice.m_Status.m_Failure & FailureEndMoved ) != 0 ) )
  {
    return;
  }
  const bool bNewer = NewestFrame( io_rDevice.m_Sync ) != NewestFrame( i_rBefore );
  if( bNewer || bEnded )
  {
    io_rDevice.m_Dropped = ( bNewer && bEnded ? io_rDevice.m_Sync.m_DroppedFrames : io_rDevice.m_DroppedBefore ) - io_rDevice.m_DroppedAtStart;
  }
  if( bNewer )
  {
    io_rDevice.m_DroppedBefore = i_rBefore.m_DroppedFrames;
  }
}

// A new session counts from 0 again; frames that came between the last look at the old one and its end are not seen.
void VRecording::CountArrivals( VDevice& io_rDevice, const KVZ::ISourceTemporal::ISourceSyncStatus& i_rSync )
{
  const bool bSameSession = i_rSync.m_Session.m_Id == io_rDevice.m_Sync.m_Session.m_Id;
  io_rDevice.m_Arrived += bSameSession ? LessOrZero( i_rSync.m_LatestCounterFrames, io_rDevice.m_Sync.m_LatestCounterFrames )
                                       : i_rSync.m_LatestCounterFrames + 1;
}

void VRecording::EndStalled( VDevice& io_rDevice, double i_Now )
{
  const uint64_t Newest = NewestFrame( io_rDevice.m_Sync );
  if( Newest != io_rDevice.m_NewestFrame )
  {
    io_rDevice.m_NewestFrame = Newest;
    io_rDevice.m_LastProgress = i_Now;
  }
  if( i_Now - io_rDevice.m_LastProgress < StallSeconds )
  {
    return;
  }
  if( io_rDevice.m_Status.m_State == StateCapturing )
  {
    io_rDevice.m_pSource->Capture().EndCapture( KVZ::VTick::Open() );
  }
  else if( io_rDevice.m_Status.m_State == StateWaitingForStart )
  {
    io_rDevice.m_pSource->Capture().CancelCapture();
  }
}

bool VRecording::IsFinished() const
{
  return std::all_of( m_Devices.begin(), m_Devices.end(),
    []( const VDevice& i_rDevice ) { return IsOver( i_rDevice.m_Status ) && !i_rDevice.m_Status.m_RequestedStart.IsOpen(); } );
}

void VRecording::Stop()
{
  for( VDevice& rDevice : m_Devices )
  {
    if( rDevice.m_Status.m_State == StateWaitingForStart )
    {
      rDevice.m_pSource->Capture().CancelCapture();
      rDevice.m_bStopped = true;
    }
    else if( rDevice.m_Status.m_State == StateCapturing || rDevice.m_Status.m_RequestedStart.IsOpen() )
    {
      rDevice.m_pSource->Capture().EndCapture( KVZ::VTick::Open() );
      rDevice.m_bStopped = true;
    }
  }
}

VDeviceOutcome VRecording::MakeOutcome( const VDevice& i_rDevice ) const
{
  VDeviceOutcome Outcome;
  Outcome.m_DeviceURN = i_rDevice.m_pSource->GetSourceName();
  Outcome.m_Status = i_rDevice.m_Status;
  Outcome.m_Period = i_rDevice.m_Period;
  Outcome.m_PeakFill = i_rDevice.m_PeakFill;
  Outcome.m_PeakBacklog = i_rDevice.m_PeakBacklog;
  Outcome.m_Timing = i_rDevice.m_pSource->Temporal().GetSourceTimingInfo();
  Outcome.m_Files = m_rTargets.GetReports( i_rDevice.m_CaptureId );
  Outcome.m_FramesCaptured = FramesOf( i_rDevice.m_Status.m_CapturedDuration, i_rDevice.m_Period );
  if( !HasEnded( i_rDevice.m_Status ) )
  {
    // The source tells the length of the whole range, what is still to come included.
    Outcome.m_FramesCaptured = std::min( i_rDevice.m_Arrived, i_rDevice.m_FramesRequested );
  }
  Outcome.m_FramesRequested = i_rDevice.m_bStopped ? std::min( Outcome.m_FramesCaptured, i_rDevice.m_FramesRequested ) : i_rDevice.m_FramesRequested;
  if( !Outcome.m_Files.empty() )
  {
    Outcome.m_FramesWritten = std::min_element( Outcome.m_Files.begin(), Outcome.m_Files.end(),
      []( const auto& i_rA, const auto& i_rB ) {
        return i_rA.m_FramesWritten < i_rB.m_FramesWritten;
      } )->m_FramesWritten;
  }

  const uint64_t Missing = LessOrZero( Outcome.m_FramesRequested, Outcome.m_FramesCaptured );
  const uint64_t Clipped = i_rDevice.m_Status.m_Start.IsOpen() || i_rDevice.m_Status.m_Start <= i_rDevice.m_Start
    ? 0
    : std::min( Missing, FramesOf( i_rDevice.m_Status.m_Start - i_rDevice.m_Start, i_rDevice.m_Period ) );
  Outcome.m_Lost.m_Card = i_rDevice.m_Dropped;
  Outcome.m_Lost.m_Memory = ( i_rDevice.m_Status.m_Failure & FailureMemory ) != 0 ? Missing : Clipped;
  Outcome.m_Lost.m_Writer = LessOrZero( Outcome.m_FramesCaptured, Outcome.m_FramesWritten );
  // A capture that could not be prepared never began: no frame of it is the signal's loss.
  const bool bPrepared = i_rDevice.m_Status.m_State != StateIdle || ( i_rDevice.m_Status.m_Failure & FailureErrors ) == 0;
  ( bPrepared ? Outcome.m_Lost.m_Signal : Outcome.m_Lost.m_Writer ) += Missing - Outcome.m_Lost.m_Memory;
  return Outcome;
}

std::vector<VDeviceOutcome> VRecording::GetOutcomes() const
{
  std::vector<VDeviceOutcome> Outcomes;
  for( const VDevice& rDevice : m_Devices )
  {
    Outcomes.push_back( MakeOutcome( rDevice ) );
  }
  return Outcomes;
}

}
