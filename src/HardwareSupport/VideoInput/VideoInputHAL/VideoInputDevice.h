// The hardware abstraction: a capture device, the driver that finds it, and what takes its frames.
#pragma once

#include "Core/VideoInterface/AudioSampleFormat.h"
#include "Core/VideoInterface/PixelFormat.h"
#include "Core/VideoInterface/Timecode.h"
#include "Core/VideoInterface/TimecodeSource.h"
#include "Core/VideoInterface/VideoStandard.h"
#include "NotificationSystem/MultiCallback.h"

#include <cstdint>
#include <functional>
#include <memory>
#include <set>
#include <string>
#include <vector>

namespace VideoInputHAL
{

class IVideoInputDevice;
struct VVideoInputDataSourceFrame;

// Gives out the blocks that frames travel in. Delivery thread.
class IVideoInputAllocator
{
public:
  virtual ~IVideoInputAllocator() = default;
  // Null where memory has run out.
  virtual void* Allocate( uint64_t i_Bytes ) = 0;
  virtual void Free( void* i_pBlock ) = 0;
};

// Takes frames. Called on the device's delivery thread and must not block for long.
class IVideoInputDataCallback
{
public:
  virtual ~IVideoInputDataCallback() = default;
  // i_FrameIndex counts from 0; *i_pPeriod is the frame period in ticks. True: the receiver owns the block now. False: the device gives it
  // back to the allocator at once.
  virtual bool OnVideoInputData( uint32_t i_FrameIndex, VVideoInputDataSourceFrame* i_pFrame, const KVZ::ITimecode* i_pTimecode,
    const int64_t* i_pPeriod ) = 0;
};

struct VDeviceControl
{
  int64_t m_Minimum = 0;
  int64_t m_Maximum = 0;
  int64_t m_Default = 0;
  bool m_bSupported = false;
};

struct VDeviceResult
{
  int32_t m_Code = 0;   // negative means failure
  bool Succeeded() const { return m_Code >= 0; }
};

// One capture input. Any thread may call; a device guards its state with a lock of its own.
class IVideoInputDevice
{
public:
  class EStatus
  {
  public:
    enum Enum : int32_t
    {
      EReady = 0,
      ECapturing = 1,
      EUnavailable = 2
    };
  };

  using VCountCallback = KVZ::IMultiCallbackPostal<void( unsigned int )>;
  using VEventCallback = KVZ::IMultiCallbackPostal<void()>;

  // Called once by the manager.
  virtual void SetDeviceIndex( int32_t i_Index ) = 0;
  // Frames missed between two delivered frames. The first count after a start is about the card's running time and no loss.
  virtual VCountCallback& GetDroppedFramesCallback() = 0;
  virtual VEventCallback& GetStatusChangedCallback() = 0;
  virtual VEventCallback& GetPixelFormatsChangedCallback() = 0;
  virtual VEventCallback& GetVideoStandardChangedCallback() = 0;
  // The timecode standard changed, or timecode was lost.
  virtual VEventCallback& GetTimecodeChangedCallback() = 0;
  virtual void SetDataCallback( std::shared_ptr<IVideoInputDataCallback> i_pCallback ) = 0;   // kept weakly
  virtual void SetAllocator( std::shared_ptr<IVideoInputAllocator> i_pAllocator ) = 0;
  // The three names are fixed, and known at once: also while the device is busy with a frame, when all else may wait for its end.
  virtual std::string GetManufacturerName() const = 0;
  virtual std::string GetDriverName() const = 0;
  virtual std::string GetDeviceName() const = 0;
  virtual std::string GetDeviceURN() const = 0;
  // "Unspecified" while nothing is detected.
  virtual KVZ::IVideoStandard::Enum GetVideoStandard() const = 0;
  virtual KVZ::IPixelFormat::Enum GetPixelFormat() const = 0;
  // The last one read from the signal. A copy: the delivery thread goes on changing the original.
  virtual KVZ::ITimecode GetTimecode() const = 0;
  virtual void GetSupportedPixelFormats( std::set<KVZ::IPixelFormat::Enum>& o_rFormats ) const = 0;
  virtual void GetSupportedTimecodeSources( std::set<KVZ::ITimecodeSource::Enum>& o_rSources ) const = 0;
  virtual void GetSupportedAudioSampleFormats( std::set<KVZ::IAudioSampleFormat::Enum>& o_rFormats ) const = 0;
  virtual void GetSupportedAudioSampleRates( std::set<uint32_t>& o_rRates ) const = 0;
  virtual void GetSupportedAudioChannelCounts( std::set<uint32_t>& o_rCounts ) const = 0;
  // While capturing it restarts with the new settings.
  virtual VDeviceResult StartCapture( KVZ::IPixelFormat::Enum i_PixelFormat, KVZ::ITimecodeSource::Enum i_TimecodeSource,
    KVZ::IAudioSampleFormat::Enum i_AudioFormat, uint32_t i_AudioChannels ) = 0;
  virtual std::string GetExtraInformation() const { return {}; }
  virtual bool StopCapture() = 0;
  virtual EStatus::Enum GetStatus() const = 0;
  virtual int32_t GetDeviceIndex() const = 0;
  // Frames come only when triggered.
  virtual bool IsTriggered() const { return false; }
  virtual VDeviceControl GetAutoWhiteBalanceControl() const { return {}; }
  virtual VDeviceControl GetBlackLevelControl() const { return {}; }
  virtual VDeviceControl GetExposureControl() const { return {}; }
  virtual VDeviceControl GetReservedControl() const { return {}; }
  virtual VDeviceControl GetGainControl() const { return {}; }
  virtual VDeviceControl GetGammaControl() const { return {}; }
  virtual void SetAutoWhiteBalance( bool ) {}
  virtual void SetBlackLevel( int32_t ) {}
  virtual void SetExposure( int32_t ) {}   // microseconds
  virtual void SetReserved( int32_t ) {}
  virtual void SetGain( int32_t ) {}   // decibels
  virtual void SetGamma( int32_t ) {}
  virtual ~IVideoInputDevice() = default;
};

// Finds devices of one kind.
class IVideoInputDriver
{
public:
  using VDeviceCallback = KVZ::IMultiCallbackPostal<void( std::shared_ptr<IVideoInputDevice> )>;

  // Fires for each device, from StartDiscovery itself or later from a vendor's thread.
  virtual VDeviceCallback& GetDeviceArrivedCallback() = 0;
  virtual void StartDiscovery() = 0;
  virtual ~IVideoInputDriver() = default;
};

// Makes a driver; the composing place lists these in the order of the device indices.
using VDriverMaker = std::function<std::shared_ptr<IVideoInputDriver>()>;

// "vi:0" for index 0: the key of every per-device map.
std::string MakeDeviceURN( int32_t i_Index );

}
