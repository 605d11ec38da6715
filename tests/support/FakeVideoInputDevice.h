// A capture device without a card: its signal is moved by hand, and it starts, restarts and stops as a real one does.
#pragma once

#include "HardwareSupport/VideoInput/VideoInputHAL/VideoInputDevice.h"
#include "tests/support/ManualPostalService.h"

#include <map>
#include <memory>
#include <set>
#include <string>
#include <utility>
#include <vector>

namespace TestSupport
{

// One thread at a time.
class VFakeVideoInputDevice : public VideoInputHAL::IVideoInputDevice
{
public:
  struct VSettings
  {
    KVZ::IPixelFormat::Enum m_PixelFormat{};
    KVZ::ITimecodeSource::Enum m_TimecodeSource{};
    KVZ::IAudioSampleFormat::Enum m_AudioFormat{};
    uint32_t m_AudioChannels = 0;
    bool operator==( const VSettings& ) const = default;
  };

  explicit VFakeVideoInputDevice( int32_t i_Index = 0 ) : m_Index( i_Index ) {}

  // By hand

  void SetSignal( KVZ::IVideoStandard::Enum i_Standard )
  {
    m_Standard = i_Standard;
    m_StandardChanged();
  }
  void SetTimecode( const KVZ::ITimecode& i_rTimecode )
  {
    m_Timecode = i_rTimecode;
    m_TimecodeChanged();
  }
  void SetPixelFormats( std::set<KVZ::IPixelFormat::Enum> i_Formats )
  {
    m_PixelFormats = std::move( i_Formats );
    m_PixelFormatsChanged();
  }
  void LoseFrames( unsigned int i_Count ) { m_DroppedFrames( i_Count ); }

  // What a test may set before use
  bool m_bRefuseStart = false;
  std::set<KVZ::IPixelFormat::Enum> m_PixelFormats = { KVZ::IPixelFormat::EU8Y8V8Y8, KVZ::IPixelFormat::ER8G8B8 };
  std::set<KVZ::ITimecodeSource::Enum> m_TimecodeSources = { KVZ::ITimecodeSource::ERP188_LTC, KVZ::ITimecodeSource::ERP188_Any,
    KVZ::ITimecodeSource::EAny };
  std::map<std::string, VideoInputHAL::VDeviceControl> m_Controls;   // by the name of the parameter

  // What the device has been told
  std::vector<VSettings> m_Starts;   // refused ones included
  int m_Stops = 0;
  std::vector<std::pair<std::string, int32_t>> m_ControlWrites;
  std::weak_ptr<VideoInputHAL::IVideoInputDataCallback> m_pDataCallback;
  std::shared_ptr<VideoInputHAL::IVideoInputAllocator> m_pAllocator;

  // IVideoInputDevice
  void SetDeviceIndex( int32_t i_Index ) override { m_Index = i_Index; }
  VCountCallback& GetDroppedFramesCallback() override { return m_DroppedFrames; }
  VEventCallback& GetStatusChangedCallback() override { return m_StatusChanged; }
  VEventCallback& GetPixelFormatsChangedCallback() override { return m_PixelFormatsChanged; }
  VEventCallback& GetVideoStandardChangedCallback() override { return m_StandardChanged; }
  VEventCallback& GetTimecodeChangedCallback() override { return m_TimecodeChanged; }
  void SetDataCallback( std::shared_ptr<VideoInputHAL::IVideoInputDataCallback> i_pCallback ) override { m_pDataCallback = i_pCallback; }
  void SetAllocator( std::shared_ptr<VideoInputHAL::IVideoInputAllocator> i_pAllocator ) override { m_pAllocator = std::move( i_pAllocator ); }
  std::string GetManufacturerName() const override { return "Test Maker"; }
  std::string GetDriverName() const override { return "TestDriver"; }
  std::string GetDeviceName() const override { return "Test Card (" + std::to_string( m_Index + 1 ) + ")"; }
  std::string GetDeviceURN() const override { return "vi:" + std::to_string( m_Index ); }
  KVZ::IVideoStandard::Enum GetVideoStandard() const override { return m_Standard; }
  KVZ::IPixelFormat::Enum GetPixelFormat() const override { return m_PixelFormats.empty() ? KVZ::IPixelFormat::Enum{} : *m_PixelFormats.rbegin(); }
  KVZ::ITimecode GetTimecode() const override { return m_Timecode; }
  void GetSupportedPixelFormats( std::set<KVZ::IPixelFormat::Enum>& o_rFormats ) const override { o_rFormats = m_PixelFormats; }
  void GetSupportedTimecodeSources( std::set<KVZ::ITimecodeSource::Enum>& o_rSources ) const override { o_rSources = m_TimecodeSources; }
  void GetSupportedAudioSampleFormats( std::set<KVZ::IAudioSampleFormat::Enum>& o_rFormats ) const override
  {
    o_rFormats = { KVZ::IAudioSampleFormat::EInt16, KVZ::IAudioSampleFormat::EInt32 };
  }
  void GetSupportedAudioSampleRates( std::set<uint32_t>& o_rRates ) const override { o_rRates = { 48000 }; }
  void GetSupportedAudioChannelCounts( std::set<uint32_t>& o_rCounts ) const override { o_rCounts = { 2, 8, 16 }; }

  VideoInputHAL::VDeviceResult StartCapture( KVZ::IPixelFormat::Enum i_PixelFormat, KVZ::ITimecodeSource::Enum i_TimecodeSource,
    KVZ::IAudioSampleFormat::Enum i_AudioFormat, uint32_t i_AudioChannels ) override
  {
    m_Starts.push_back( { i_PixelFormat, i_TimecodeSource, i_AudioFormat, i_AudioChannels } );
    if( m_bRefuseStart )
    {
      return { -1 };
    }
    SetStatus( EStatus::ECapturing );
    return { 0 };
  }
  bool StopCapture() override
  {
    ++m_Stops;
    SetStatus( EStatus::EReady );
    return true;
  }
  EStatus::Enum GetStatus() const override { return m_Status; }
  int32_t GetDeviceIndex() const override { return m_Index; }
  VideoInputHAL::VDeviceControl GetAutoWhiteBalanceControl() const override { return Control( "AutoWhiteBalance" ); }
  VideoInputHAL::VDeviceControl GetBlackLevelControl() const override { return Control( "BlackLevel" ); }
  VideoInputHAL::VDeviceControl GetExposureControl() const override { return Control( "Exposure" ); }
  VideoInputHAL::VDeviceControl GetGainControl() const override { return Control( "Gain" ); }
  VideoInputHAL::VDeviceControl GetGammaControl() const override { return Control( "Gamma" ); }
  void SetAutoWhiteBalance( bool i_bOn ) override { m_ControlWrites.emplace_back( "AutoWhiteBalance", i_bOn ? 1 : 0 ); }
  void SetBlackLevel( int32_t i_Value ) override { m_ControlWrites.emplace_back( "BlackLevel", i_Value ); }
  void SetExposure( int32_t i_Value ) override { m_ControlWrites.emplace_back( "Exposure", i_Value ); }
  void SetGain( int32_t i_Value ) override { m_ControlWrites.emplace_back( "Gain", i_Value ); }
  void SetGamma( int32_t i_Value ) override { m_ControlWrites.emplace_back( "Gamma", i_Value ); }

private:
  VideoInputHAL::VDeviceControl Control( const std::string& i_rName ) const
  {
    const auto Found = m_Controls.find( i_rName );
    return Found == m_Controls.end() ? VideoInputHAL::VDeviceControl() : Found->second;
  }
  void SetStatus( EStatus::Enum i_Status )
  {
    m_Status = i_Status;
    m_StatusChanged();
  }

  int32_t m_Index;
  KVZ::IVideoStandard::Enum m_Standard = KVZ::IVideoStandard::EUnspecified;
  KVZ::ITimecode m_Timecode;
  EStatus::Enum m_Status = EStatus::EReady;
  NotificationSystem::VMultiCallbackPostal<void( unsigned int )> m_DroppedFrames;
  NotificationSystem::VMultiCallbackPostal<void()> m_StatusChanged;
  NotificationSystem::VMultiCallbackPostal<void()> m_PixelFormatsChanged;
  NotificationSystem::VMultiCallbackPostal<void()> m_StandardChanged;
  NotificationSystem::VMultiCallbackPostal<void()> m_TimecodeChanged;
};

// Announces on the caller's thread. The service of its own, which nothing runs here, must not come between it and the manager: devices of the first
// driver have their places before the second begins.
class VFakeVideoInputDriver : public VideoInputHAL::IVideoInputDriver
{
public:
  VDeviceCallback& GetDeviceArrivedCallback() override { return m_DeviceArrived; }
  void StartDiscovery() override
  {
    for( const auto& pDevice : m_OnDiscovery )
    {
      m_DeviceArrived( pDevice );
    }
  }

  std::vector<std::shared_ptr<VideoInputHAL::IVideoInputDevice>> m_OnDiscovery;
  NotificationSystem::VMultiCallbackPostal<void( std::shared_ptr<VideoInputHAL::IVideoInputDevice> )> m_DeviceArrived{
    std::make_shared<VManualPostalService>()
  };
};

}
