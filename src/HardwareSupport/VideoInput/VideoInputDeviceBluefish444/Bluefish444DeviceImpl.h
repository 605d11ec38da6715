// The state of a Bluefish444 device, and its capture thread.
#pragma once

#include "HardwareSupport/VideoInput/VideoInputDeviceBluefish444/Bluefish444Device.h"
#include "HardwareSupport/VideoInput/VideoInputHAL/VideoInputFrame.h"
#include "StageCoreRuntime/ThreadAnnotations.h"

#include <boost/thread/condition_variable.hpp>
#include <boost/thread/mutex.hpp>
#include <boost/thread/thread.hpp>

#include <atomic>
#include <deque>
#include <optional>

namespace VideoInputHAL
{

// An order to capture or not. As it stands by default, an order to stop.
struct VCaptureCommand
{
  KVZ::ITimecodeSource::Enum m_TimecodeSource = KVZ::ITimecodeSource::EUnspecified;
  KVZ::IPixelFormat::Enum m_PixelFormat = KVZ::IPixelFormat::ER8G8B8;
  KVZ::IAudioSampleFormat::Enum m_AudioFormat = KVZ::IAudioSampleFormat::EInt16;
  uint32_t m_AudioChannels = 0;
  bool m_bStart = false;
};

// What the card was set up for.
struct VCaptureSetup
{
  const KVZ::VVideoStandardRow* m_pStandard = nullptr;
  KVZ::VideoFrameInfo m_Image;
  uint64_t m_ImageBytes = 0;
  uint64_t m_GoldenBytes = 0;   // what the card copies for one image
};

// Two locks, each held for a few instructions by everybody and never together; none while the card, the allocator or the receiver is called.
//
//   m_Mutex          the queue, the order in force, and what callers set
//   m_TimecodeMutex  the last timecode, so that asking for it never meets the rest
//
// What is marked "capture thread" has no lock. The thread lives as long as the device, and holds this object until it ends: a receiver may be the
// device's last owner and let it go inside OnVideoInputData.
class VBluefish444Device::VImpl : public std::enable_shared_from_this<VImpl>
{
public:
  VImpl( const VBluefish444Input& i_rInput, const std::shared_ptr<KVZ::IPostalService>& i_pPostalService, VPause i_Pause );

  void Start();
  void Close() EXCLUDES( m_Mutex );
  void Order( const VCaptureCommand& i_rCommand ) EXCLUDES( m_Mutex );

  void SetDeviceIndex( int32_t i_Index ) EXCLUDES( m_Mutex );
  void SetDataCallback( std::weak_ptr<IVideoInputDataCallback> i_pCallback ) EXCLUDES( m_Mutex );
  void SetAllocator( std::shared_ptr<IVideoInputAllocator> i_pAllocator ) EXCLUDES( m_Mutex );
  const std::string& GetDriverName() const { return m_CardName; }
  const std::string& GetDeviceName() const { return m_DisplayName; }
  std::string GetDeviceURN() const EXCLUDES( m_Mutex );
  int32_t GetDeviceIndex() const EXCLUDES( m_Mutex );
  KVZ::IVideoStandard::Enum GetVideoStandard() const { return StandardOf( m_Mode ); }
  KVZ::ITimecode GetTimecode() const EXCLUDES( m_TimecodeMutex );
  bool IsOrderedToCapture() const EXCLUDES( m_Mutex );
  bool IsCapturing() const EXCLUDES( m_Mutex );

  NotificationSystem::VMultiCallbackPostal<void( unsigned int )> m_DroppedFrames;
  NotificationSystem::VMultiCallbackPostal<void()> m_StatusChanged;
  NotificationSystem::VMultiCallbackPostal<void()> m_PixelFormatsChanged;
  NotificationSystem::VMultiCallbackPostal<void()> m_VideoStandardChanged;
  NotificationSystem::VMultiCallbackPostal<void()> m_TimecodeChanged;

private:
  // The capture thread's
  void Run();
  void RunRound();
  void TakeCommand();
  void SetUp();
  std::optional<uint64_t> WaitUnlessStopping();
  bool BeginRound();
  void LoseCard();
  bool FollowMode();
  void Pause();
  bool WaitForSync();
  void CountDroppedFrames( uint64_t i_FieldCount );
  void SetMode( uint32_t i_Mode );
  uint32_t ReadMode();
  void DeliverFrame( uint32_t i_Buffer );
  VVideoInputDataSourceFrame* MakeFrame( IVideoInputAllocator* i_pAllocator, uint64_t i_AudioBytes );
  bool ReadFrame( uint32_t i_Buffer, VVideoInputDataSourceFrame& io_rFrame );
  void PrepareRecord( uint8_t* o_pSamples );
  void Decode( uint32_t i_Buffer, VVideoInputDataSourceFrame& io_rFrame );
  void StoreTimecode( const KVZ::ITimecode& i_rTimecode );
  void ResolveRepeats( KVZ::ITimecode& io_rTimecode );

  KVZ::IVideoStandard::Enum StandardOf( uint32_t i_Mode ) const;
  bool IsStopping() const EXCLUDES( m_Mutex );

  // Fixed after construction
  const int m_CardType;
  const uint32_t m_Channel;
  const std::string m_CardName;
  const std::string m_DisplayName;
  const VPause m_Pause;
  const std::shared_ptr<VBluefish444SDKWrapper> m_pCard;
  const uint32_t m_NoSignalMode;

  std::atomic<uint32_t> m_Mode;   // written by the capture thread
  boost::thread m_Thread;         // started and joined by the device's owner

  mutable boost::mutex m_Mutex;
  boost::condition_variable m_Stopping;
  bool m_bStop GUARDED_BY( m_Mutex ) = false;
  std::deque<VCaptureCommand> m_Commands GUARDED_BY( m_Mutex );
  bool m_bOrdered GUARDED_BY( m_Mutex ) = false;   // the last order's start flag
  VCaptureCommand m_InForce GUARDED_BY( m_Mutex );
  int32_t m_DeviceIndex GUARDED_BY( m_Mutex );
  std::string m_URN GUARDED_BY( m_Mutex );
  std::weak_ptr<IVideoInputDataCallback> m_pDataCallback GUARDED_BY( m_Mutex );
  std::shared_ptr<IVideoInputAllocator> m_pAllocator GUARDED_BY( m_Mutex );

  mutable boost::mutex m_TimecodeMutex;
  KVZ::ITimecode m_LastTimecode GUARDED_BY( m_TimecodeMutex );   // as read, without the ticks of repeats

  // Capture thread
  VCaptureCommand m_Command;   // the order in force
  VCaptureSetup m_Setup;
  bool m_bSetUpDue = true;
  bool m_bSynced = false;                     // the sync that the coming round begins with has been waited for
  uint32_t m_NextBuffer = 0;                  // to be named
  std::optional<uint32_t> m_NamedBuffer;      // in the round before, with this set-up
  std::optional<uint64_t> m_LastFieldCount;   // goes on from capture to capture
  uint32_t m_Repeats = 0;                     // frames that have carried m_LastTimecode after the first
  uint32_t m_FrameIndex = 0;
  uint8_t* m_pHanc = nullptr;
  BlueVelvet::VHancDecodeRecord m_Record;
};

}
