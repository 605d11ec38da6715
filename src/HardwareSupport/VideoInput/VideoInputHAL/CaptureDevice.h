// What capture devices of every kind of card have in common: their callbacks, their place in the list of devices, who takes their frames, and the
// timecode seen last.
#pragma once

#include "HardwareSupport/VideoInput/VideoInputHAL/VideoInputDevice.h"
#include "NotificationSystem/IPostalService.h"
#include "StageCoreRuntime/Shared.h"
#include "StageCoreRuntime/ThreadAnnotations.h"

#include <boost/thread/mutex.hpp>

#include <cstdint>
#include <memory>
#include <set>
#include <string>

namespace VideoInputHAL
{

// The state behind a device. An implementation derives from it and guards its own state with the same lock, the device lock. It may outlive the
// device: a vendor's callback, or a capture thread, may hold it longer. Any thread may call what is public.
class VCaptureDeviceState
{
public:
  VCaptureDeviceState( const VCaptureDeviceState& ) = delete;
  VCaptureDeviceState& operator=( const VCaptureDeviceState& ) = delete;

  void SetDeviceIndex( int32_t i_Index ) EXCLUDES( m_Mutex );
  void SetDataCallback( std::weak_ptr<IVideoInputDataCallback> i_pCallback ) EXCLUDES( m_Mutex );
  void SetAllocator( std::shared_ptr<IVideoInputAllocator> i_pAllocator ) EXCLUDES( m_Mutex );
  const std::string& GetDeviceName() const { return m_DisplayName; }
  std::string GetDeviceURN() const EXCLUDES( m_Mutex );
  int32_t GetDeviceIndex() const EXCLUDES( m_Mutex );
  KVZ::ITimecode GetTimecode() const EXCLUDES( m_Mutex );

  NotificationSystem::VMultiCallbackPostal<void( unsigned int )> m_DroppedFrames;
  NotificationSystem::VMultiCallbackPostal<void()> m_StatusChanged;
  NotificationSystem::VMultiCallbackPostal<void()> m_PixelFormatsChanged;
  NotificationSystem::VMultiCallbackPostal<void()> m_VideoStandardChanged;
  NotificationSystem::VMultiCallbackPostal<void()> m_TimecodeChanged;

protected:
  // Listeners without a postal service of their own are called on this one.
  VCaptureDeviceState( std::string i_DisplayName, const std::shared_ptr<KVZ::IPostalService>& i_pPostalService );
  ~VCaptureDeviceState() = default;

  // Takes a frame's timecode as it was read, and tells frames apart that carry one label: video may run faster than its timecode, and such frames lie
  // a frame period (ticks) apart within it. True where m_TimecodeChanged is to be fired.
  bool FollowTimecode( KVZ::ITimecode& io_rTimecode, int64_t i_Period ) REQUIRES( m_Mutex );
  // The signal has gone. True where m_TimecodeChanged is to be fired.
  bool LoseTimecode() REQUIRES( m_Mutex );

  const std::string m_DisplayName;

  mutable boost::mutex m_Mutex;
  int32_t m_DeviceIndex GUARDED_BY( m_Mutex ) = 0;
  std::string m_URN GUARDED_BY( m_Mutex );
  std::weak_ptr<IVideoInputDataCallback> m_pDataCallback GUARDED_BY( m_Mutex );
  std::shared_ptr<IVideoInputAllocator> m_pAllocator GUARDED_BY( m_Mutex );
  KVZ::ITimecode m_LastTimecode GUARDED_BY( m_Mutex );   // as read, without the ticks of repeats
  uint32_t m_Repeats GUARDED_BY( m_Mutex ) = 0;          // frames that have carried m_LastTimecode after the first
};

// A device whose card adds to that state. Listeners may be added and taken away at any time.
class VCaptureDevice : public KVZ::VShared, public IVideoInputDevice
{
public:
  void SetDeviceIndex( int32_t i_Index ) override;
  VCountCallback& GetDroppedFramesCallback() override;
  VEventCallback& GetStatusChangedCallback() override;
  VEventCallback& GetPixelFormatsChangedCallback() override;
  VEventCallback& GetVideoStandardChangedCallback() override;
  VEventCallback& GetTimecodeChangedCallback() override;
  void SetDataCallback( std::shared_ptr<IVideoInputDataCallback> i_pCallback ) override;
  void SetAllocator( std::shared_ptr<IVideoInputAllocator> i_pAllocator ) override;
  std::string GetDeviceName() const override;
  std::string GetDeviceURN() const override;
  KVZ::ITimecode GetTimecode() const override;
  // 48000 alone, as SDI carries it.
  void GetSupportedAudioSampleRates( std::set<uint32_t>& o_rRates ) const override;
  int32_t GetDeviceIndex() const override;

protected:
  static constexpr uint32_t AudioSampleRate = 48000;

  // The state lives as long as the device.
  explicit VCaptureDevice( VCaptureDeviceState& i_rState ) : m_rState( i_rState ) {}

private:
  VCaptureDeviceState& m_rState;
};

}
