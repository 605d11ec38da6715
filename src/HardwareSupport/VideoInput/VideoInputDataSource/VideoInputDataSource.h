// Turns a device's frames into the frames of a data source: decides what each frame's clocks read, stores it without a copy, and makes
// captures into files.
#pragma once

#include "Core/VideoInterface/VideoWriter.h"
#include "FileIO/VideoEncoding/EncoderParts.h"
#include "HardwareSupport/VideoInput/VideoInputDataSource/DeadlineTimer.h"
#include "HardwareSupport/VideoInput/VideoInputDataSource/VideoInputDataSourceAllocator.h"
#include "HardwareSupport/VideoInput/VideoInputDataSource/VideoInputSourceControl.h"
#include "HardwareSupport/VideoInput/VideoInputHAL/VideoInputDevice.h"
#include "HardwareSupport/VideoInput/VideoInputHAL/VideoInputFrame.h"
#include "SyncSystem/DataSource.h"

#include <atomic>
#include <functional>
#include <memory>

namespace StageCorePluginInterface
{
class ICaptureTargets;
class IServiceObject;
class ITimeService;
struct VCaptureTarget;
}

namespace VideoInputHAL
{

class VVideoInputBufferClient;
class VVideoInputDeviceManager;

// How the frame encoders of captures are set up.
struct VVideoEncoderSettings
{
  VideoEncoding::EConverter m_Converter = VideoEncoding::EConverter::Software;
  int m_JPEGQuality = 90;   // 1 to 100
  VideoEncoding::VBurnInSettings m_BurnIn{};
};

struct VVideoInputDataSourceOptions
{
  std::shared_ptr<const KVZ::VVideoWriterFactory> m_pWriterFactory{};
  VVideoEncoderSettings m_Encoder{};
  double m_NoticeSeconds = 0.0;
  std::shared_ptr<SyncSystem::VDriftMonitorAnalysis> m_pAnalysis{};
  // Empty: the source makes a service with one thread of its own, and one more for each capture.
  std::shared_ptr<KVZ::IPostalService> m_pPostalService{};
  std::function<std::shared_ptr<KVZ::IPostalService>()> m_MakeWriterService{};
  // For files that take several frames at once. Empty: threads of the capture's own, as many as the machine has cores.
  std::function<std::shared_ptr<KVZ::IPostalService>()> m_MakeFrameService{};
  std::function<std::unique_ptr<IDeadlineTimer>()> m_MakeTimer{};   // of a triggered source; empty: on the source's service
};

// Made by MakeShared. Its name is the device's URN. The two service objects of the host are given back when it has been made; without capture
// targets captures make no files, and without a time service frames are not timed.
class VVideoInputDataSource : public SyncSystem::VDataSource, public IVideoInputDataCallback, public IVideoInputSourceControl
{
public:
  VVideoInputDataSource( std::shared_ptr<VVideoInputDeviceManager> i_pManager, std::shared_ptr<IVideoInputDevice> i_pDevice,
    const std::shared_ptr<VVideoInputDataSourceAllocator>& i_pAllocator,
    const std::shared_ptr<StageCorePluginInterface::IServiceObject>& i_pFirstService,
    const std::shared_ptr<StageCorePluginInterface::IServiceObject>& i_pSecondService,
    std::shared_ptr<StageCorePluginInterface::ICaptureTargets> i_pCaptureTargets, std::shared_ptr<StageCorePluginInterface::ITimeService> i_pTime,
    VVideoInputDataSourceOptions i_Options );
  ~VVideoInputDataSource() override;

  void PostConstruct() override;

  bool OnVideoInputData( uint32_t i_FrameIndex, VVideoInputDataSourceFrame* i_pFrame, const KVZ::ITimecode* i_pTimecode,
    const int64_t* i_pPeriod ) override;

  // IVideoInputSourceControl
  bool SetSourceEnabled( bool i_bEnabled ) override { return VDataSource::SetSourceEnabled( i_bEnabled ); }
  void SetUseTimecodeForSync( bool i_bUse ) override;
  void SetPixelAspectRatio( double i_Ratio ) override { m_PixelAspectRatio.store( i_Ratio, std::memory_order_relaxed ); }
  void SetTimecodeAdjustment( KVZ::VTick i_Adjustment ) override;

  // For a flow node: the newest frames, of which at most ten are not marked as dropped. Asleep: the next frame fires the callback with the token.
  virtual SyncSystem::EReadResult::Enum GetFrames( uint64_t i_WakeToken, SyncSystem::VReadFrames& o_rRead );
  virtual NotificationSystem::VCallbackPostal<void( uint64_t )>& OnNewFramesCallback() { return OnNewFrames(); }
  // Where the device of a frame is looked up.
  const std::shared_ptr<VVideoInputDeviceManager>& DeviceManager() const { return m_pDeviceManager; }

  // The frame of an entry of the source's buffer.
  static const VVideoInputDataSourceFrame* FrameOf( const SyncSystem::VFrameEntry* i_pEntry );

protected:
  struct VDelivered
  {
    uint32_t m_Index = 0;
    const KVZ::ITimecode* m_pTimecode = nullptr;
  };

  // Says what the frame's clocks read; the period is known. False refuses the frame. Delivery thread.
  virtual bool ReadClocks( const VDelivered& i_rDelivered, SyncSystem::VIncomingFrame& io_rFrame );

  bool BeginCapture( const KVZ::ICaptureHeader& i_rHeader, const std::shared_ptr<const SyncSystem::VGlobalSyncSessionInfo>& i_pInfo,
    uint32_t i_Options, std::vector<SyncSystem::VCaptureError>& io_rErrors ) override;
  bool IsCaptureDraining() override;

  const VVideoInputDataSourceOptions& Options() const { return m_Options; }

private:
  void OnDroppedFrames( unsigned int i_Count );
  void StopClient();
  void StartClient( const KVZ::ICaptureHeader& i_rHeader, const std::shared_ptr<const SyncSystem::VGlobalSyncSessionInfo>& i_pInfo,
    const std::vector<StageCorePluginInterface::VCaptureTarget>& i_rTargets );

  // Fixed after construction
  const VVideoInputDataSourceOptions m_Options;
  const std::shared_ptr<VVideoInputDeviceManager> m_pDeviceManager;
  const std::shared_ptr<IVideoInputDevice> m_pDevice;
  const std::shared_ptr<StageCorePluginInterface::ICaptureTargets> m_pCaptureTargets;
  const std::shared_ptr<StageCorePluginInterface::ITimeService> m_pTime;
  const double m_FrameScale = 1.0;
  const uint64_t m_LocalTimecodeSource;   // the source that the timecode belongs to while it is not shared

  std::atomic<int64_t> m_TimecodeAdjustment{ 0 };   // ticks
  std::atomic<bool> m_bUseGlobalTimecode{ true };
  std::atomic<double> m_PixelAspectRatio{ 0.0 };
  std::atomic<bool> m_bCountIsLoss{ false };   // the first count after a start is about the card's running time

  boost::mutex m_ClientMutex;                                                             // never held with another
  std::shared_ptr<VVideoInputBufferClient> m_pBufferClient GUARDED_BY( m_ClientMutex );   // of the present or last capture
};

}
