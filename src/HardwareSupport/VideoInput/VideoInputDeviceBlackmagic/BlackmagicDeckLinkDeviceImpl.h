// The state of a DeckLink device, and the object that the vendor calls back.
#pragma once

#include "HardwareSupport/VideoInput/VideoInputDeviceBlackmagic/BlackmagicDeckLinkDevice.h"
#include "HardwareSupport/VideoInput/VideoInputDeviceBlackmagic/ComPointer.h"
#include "HardwareSupport/VideoInput/VideoInputHAL/VideoInputFrame.h"
#include "StageCoreRuntime/ThreadAnnotations.h"

#include <boost/thread/mutex.hpp>

#include <atomic>
#include <set>
#include <span>
#include <vector>

namespace VideoInputHAL
{

constexpr const char* BlackmagicLogCategory = "VideoInputDeviceBlackmagic";

// Counted by the vendor and by the device; every callback holds a reference of its own for as long as it runs. The device closes it before
// letting it go, so a callback that comes late, or has waited for the lock meanwhile, finds it closed and does nothing.
//
// Two locks, and why they cannot stop each other:
//
//   m_Mutex         the device lock. The vendor's thread holds it through a whole frame, the data callback included, and through a change of
//                   format, the vendor calls in it included. Everybody else holds it for a few instructions, or while it enables and starts.
//   m_ControlMutex  one thread at a time brings the streams into another state. It is taken before m_Mutex. The vendor's thread, which has
//                   m_Mutex then, never waits for it: it only tries.
//
//   frame callback, StartCapture on another thread: StartCapture calls StopStreams, which may wait for the callback, holding nothing that the
//     callback waits for; then it waits for m_Mutex, that is, for the frame.
//   change of format, StartCapture on another thread: one of the two has m_ControlMutex. Where it is the change, StartCapture waits until the
//     streams run again. Where it is StartCapture, the change leaves the streams alone: StartCapture has not got m_Mutex yet, and enables
//     the mode that the change has stored once it has. m_ControlMutex is given back before m_Mutex, so that whoever gets m_Mutex next finds
//     it free; otherwise a change that comes right then would leave streams alone that nobody brings up again.
//   Close is like StartCapture, and calls the vendor with m_Mutex held only when no callback can wait any more. It lets the vendor's objects
//     go without m_Mutex.
//   Subscribers are called by postal services; firing with m_Mutex held only queues.
class VBlackmagicDeckLinkDevice::VImpl final : public DeckLinkAPI::IDeckLinkInputCallback, public VCaptureDeviceState
{
public:
  VImpl( DeckLinkAPI::IDeckLink* i_pCard, int32_t i_CardNumber, const std::shared_ptr<KVZ::IPostalService>& i_pPostalService );

  DeckLinkAPI::HRESULT QueryInterface( DeckLinkAPI::REFIID i_Id, void** o_ppObject ) override;
  DeckLinkAPI::ULONG AddRef() override;
  DeckLinkAPI::ULONG Release() override;
  DeckLinkAPI::HRESULT VideoInputFormatChanged( uint32_t i_Events, DeckLinkAPI::IDeckLinkDisplayMode* i_pNewMode,
    uint32_t i_DetectedSignal ) override;
  DeckLinkAPI::HRESULT VideoInputFrameArrived( DeckLinkAPI::IDeckLinkVideoInputFrame* i_pVideo,
    DeckLinkAPI::IDeckLinkAudioInputPacket* i_pAudio ) override;

  VDeviceResult Initialise() EXCLUDES( m_Mutex, m_ControlMutex );
  void Close() EXCLUDES( m_Mutex, m_ControlMutex );
  VDeviceResult StartCapture( KVZ::IPixelFormat::Enum i_PixelFormat, KVZ::ITimecodeSource::Enum i_TimecodeSource,
    KVZ::IAudioSampleFormat::Enum i_AudioFormat, uint32_t i_AudioChannels ) EXCLUDES( m_Mutex, m_ControlMutex );
  void StopCapture() EXCLUDES( m_Mutex );

  KVZ::IVideoStandard::Enum GetVideoStandard() const EXCLUDES( m_Mutex );
  KVZ::IPixelFormat::Enum GetPixelFormat() const EXCLUDES( m_Mutex );
  std::set<KVZ::IPixelFormat::Enum> GetSupportedPixelFormats() const EXCLUDES( m_Mutex );
  bool IsCapturing() const EXCLUDES( m_Mutex );

private:
  struct VCaptureSettings;

  ~VImpl() override = default;   // Release

  // Streams
  void ReadCapabilities() REQUIRES( m_Mutex, m_ControlMutex );
  bool ReadModes() REQUIRES( m_Mutex, m_ControlMutex );
  bool StartStreaming() REQUIRES( m_Mutex, m_ControlMutex );
  VDeviceResult Restart( const VCaptureSettings& i_rSettings ) REQUIRES( m_Mutex, m_ControlMutex );
  bool EnableAudio() REQUIRES( m_Mutex, m_ControlMutex );
  bool HasCurrentMode() const REQUIRES( m_Mutex );
  void FollowFormat() REQUIRES( m_Mutex, m_ControlMutex );
  void SetMode( uint32_t i_Mode ) REQUIRES( m_Mutex );

  // Frames
  std::shared_ptr<IVideoInputDataCallback> HandleFrame( DeckLinkAPI::IDeckLinkVideoInputFrame& i_rVideo,
    DeckLinkAPI::IDeckLinkAudioInputPacket* i_pAudio ) REQUIRES( m_Mutex );
  void UpdateSignal( bool i_bHasSignal ) REQUIRES( m_Mutex );
  void CountDroppedFrames( DeckLinkAPI::IDeckLinkVideoInputFrame& i_rVideo ) REQUIRES( m_Mutex );
  VVideoInputDataSourceFrame* CopyFrame( DeckLinkAPI::IDeckLinkVideoInputFrame& i_rVideo, DeckLinkAPI::IDeckLinkAudioInputPacket* i_pAudio,
    KVZ::IPixelFormat::Enum i_PixelFormat ) REQUIRES( m_Mutex );
  bool FindAudio( DeckLinkAPI::IDeckLinkAudioInputPacket& i_rAudio, std::span<const uint8_t>& o_rAudio ) REQUIRES( m_Mutex );

  std::atomic<DeckLinkAPI::ULONG> m_References{ 1 };

  boost::mutex m_ControlMutex;
  VComPointer<DeckLinkAPI::IDeckLinkInput> m_pInput GUARDED_BY( m_ControlMutex );

  bool m_bClosed GUARDED_BY( m_Mutex ) = false;
  VComPointer<DeckLinkAPI::IDeckLink> m_pCard GUARDED_BY( m_Mutex );
  std::vector<VComPointer<DeckLinkAPI::IDeckLinkDisplayMode>> m_Modes GUARDED_BY( m_Mutex );
  bool m_bDetectsFormat GUARDED_BY( m_Mutex ) = false;

  // Chosen for capture
  bool m_bCapturing GUARDED_BY( m_Mutex ) = false;
  KVZ::IPixelFormat::Enum m_PixelFormat GUARDED_BY( m_Mutex ) = KVZ::IPixelFormat::EU8Y8V8Y8;
  KVZ::ITimecodeSource::Enum m_TimecodeSource GUARDED_BY( m_Mutex ) = KVZ::ITimecodeSource::EAny;
  KVZ::AudioFrameInfo m_Audio GUARDED_BY( m_Mutex );

  // Seen in the signal
  bool m_bHasSignal GUARDED_BY( m_Mutex ) = false;
  uint32_t m_Mode GUARDED_BY( m_Mutex ) = DeckLinkAPI::DisplayModeUnknown;
  KVZ::IInterlacedFormat::Enum m_InterlacedFormat GUARDED_BY( m_Mutex ) = KVZ::IInterlacedFormat::EUnspecified;   // m_Mode's
  std::set<KVZ::IPixelFormat::Enum> m_DetectedFormats GUARDED_BY( m_Mutex );
  int64_t m_LastHardwareTime GUARDED_BY( m_Mutex ) = 0;   // ticks; goes on from capture to capture
  uint32_t m_FrameIndex GUARDED_BY( m_Mutex ) = 0;
};

struct VBlackmagicDeckLinkDevice::VImpl::VCaptureSettings
{
  KVZ::IPixelFormat::Enum m_PixelFormat;
  KVZ::ITimecodeSource::Enum m_TimecodeSource;
  KVZ::IAudioSampleFormat::Enum m_AudioFormat;
  uint32_t m_AudioChannels;
};

}
