// The state of a Bluefish444 device, and its capture thread.
#pragma once

#include "HardwareSupport/VideoInput/VideoInputDeviceBluefish444/Bluefish444Device.h"
#include "HardwareSupport/VideoInput/VideoInputHAL/VideoInputFrame.h"
#include "StageCoreRuntime/ThreadAnnotations.h"

#include <boost/thread/condition_variable.hpp>
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

// The device lock is held for a few instructions by everybody, and never while the card, the allocator or the receiver is called or a callback fired.
// What is marked "capture thread" has no lock. The thread lives as long as the device, and holds this object until it ends: a receiver may be the
// device's last owner and let it go inside OnVideoInputData.
class VBluefish444Device::VImpl final : public VCaptureDeviceState, public std::enable_shared_from_this<VImpl>
{
public:
  VImpl( const VBluefish444Input& i_rInput, const std::shared_ptr<KVZ::IPostalService>& i_pPostalService, VPause i_Pause );

  void Start();
  void Close() EXCLUDES( m_Mutex );
  void Order( const VCaptureCommand& i_rCommand ) EXCLUDES( m_Mutex );

  int GetCardType() const { return m_CardType; }
  KVZ::IVideoStandard::Enum GetVideoStandard() const { return StandardOf( m_Mode ); }
  bool IsOrderedToCapture() const EXCLUDES( m_Mutex );
  bool IsCapturing() const EXCLUDES( m_Mutex );

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
  bool ReadFrame( uint32_t i_Buffer, VVideoInputDataSourceFrame& io_rFrame );
  void PrepareRecord( uint8_t* o_pSamples );
  void Decode( uint32_t i_Buffer, VVideoInputDataSourceFrame& io_rFrame );
  void ResolveRepeats( KVZ::ITimecode& io_rTimecode ) EXCLUDES( m_Mutex );

  KVZ::IVideoStandard::Enum StandardOf( uint32_t i_Mode ) const;
  bool IsStopping() const EXCLUDES( m_Mutex );

  // Fixed after construction
  const int m_CardType;
  const uint32_t m_Channel;
  const VPause m_Pause;
  const uint32_t m_NoSignalMode;

  std::atomic<uint32_t> m_Mode;   // written by the capture thread
  boost::thread m_Thread;         // started and joined by the device's owner

  boost::condition_variable m_Stopping;
  bool m_bStop GUARDED_BY( m_Mutex ) = false;
  std::deque<VCaptureCommand> m_Commands GUARDED_BY( m_Mutex );
  bool m_bOrdered GUARDED_BY( m_Mutex ) = false;     // the last order's start flag
  bool m_bCapturing GUARDED_BY( m_Mutex ) = false;   // that of the order in force

  // Capture thread
  std::shared_ptr<VBluefish444SDKWrapper> m_pCard;   // let go at the thread's end
  VCaptureCommand m_Command;                         // the order in force
  VCaptureSetup m_Setup;
  bool m_bSetUpDue = true;
  bool m_bSynced = false;                  // the sync that the coming round begins with has been waited for
  uint32_t m_NextBuffer = 0;               // to be named
  std::optional<uint32_t> m_NamedBuffer;   // in the round before, with this set-up
  uint64_t m_LastFieldCount = 0;           // goes on from capture to capture
  uint32_t m_FrameIndex = 0;
  uint8_t* m_pHanc = nullptr;
  BlueVelvet::VHancDecodeRecord m_Record;
};

}
