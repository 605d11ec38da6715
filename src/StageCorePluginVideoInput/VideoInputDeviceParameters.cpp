// Which parameters a video input has.
#include "Core/VideoInterface/Schemas.h"
#include "HardwareSupport/VideoInput/VideoInputHAL/DeviceStatusSchema.h"
#include "NotificationSystem/WeakBinder.h"
#include "StageCoreDataStore/DataWriter.h"
#include "StageCoreDataStoreTypes/DeviceSchemas.h"
#include "StageCorePluginVideoInput/VideoInputDeviceParameterHandler.h"

#include <algorithm>
#include <cmath>
#include <limits>
#include <set>

using namespace ParameterTraits;
using KVZ::Variant;
using NotificationSystem::BindWeak;
using VideoInputHAL::IVideoInputDevice;
using VideoInputHAL::VDeviceControl;
namespace Keys = DeviceSchemas::VideoInput;

namespace
{

constexpr VParameterText UserIdText = { "General", "User ID", "User assignable number" };
constexpr VParameterText DriverNameText = { "General", "Driver Name", "The name of the driver" };
constexpr VParameterText DeviceNameText = { "General", "Device Name", "The name of the device" };
constexpr VParameterText StatusText = { "General", "Status", "Device status" };
constexpr VParameterText VideoStandardText = { "General", "Video Standard", "The video standard detected on the input" };
constexpr VParameterText TimecodeStandardText = { "General", "Timecode Standard", "The timecode standard from the device" };
constexpr VParameterText PixelFormatText = { "Video Setup", "Pixel Format", "The chosen pixel format for the capture buffer" };
constexpr VParameterText AudioChannelCountText = { "Audio Setup", "Audio Channels", "The number of audio channels" };
constexpr VParameterText AudioSampleFormatText = { "Audio Setup", "Audio Sample Format", "The audio sample format" };
constexpr VParameterText AudioSampleRateText = { "Audio Setup", "Audio Sample Rate", "The audio sample rate" };
constexpr VParameterText TimecodeSourceText = { "Timecode Setup", "Timecode Source", "The timecode format desired" };
constexpr VParameterText TimeOffsetText = { "Timecode Setup", "Time Offset (ms)", "The adjustment to be applied to the timecode in milliseconds" };
constexpr VParameterText UseTimecodeText = { "Timecode Setup", "Use Timecode for Sync",
  "Whether to use timecode for synchronizing data from this device (Recommended)" };
constexpr VParameterText PixelAspectRatioText = { "Video Setup", "Pixel Aspect Ratio", "Width/Height of individual pixels" };
constexpr VParameterText AutoWhiteBalanceText = { "Video Mode", "Auto White Balance", "Enable/disable auto white balance" };

constexpr uint32_t DefaultSampleRate = 48000;

struct VAspectRow
{
  const char* m_pLabel;
  double m_Ratio;
};

// The first PAL label says 59:54, the value is 12:11 all the same.
constexpr VAspectRow AspectRows[] = {
  { "HD 16:9 (1:1)", 1.0 },
  { "SD PAL 4:3 (59:54)", 12.0 / 11.0 },
  { "SD PAL 16:9 (16:11)", 16.0 / 11.0 },
  { "SD NTSC 4:3 (10:11)", 10.0 / 11.0 },
  { "SD NTSC 16:9 (40:33)", 40.0 / 33.0 },
};

struct VStatusRow
{
  IVideoInputDevice::EStatus::Enum m_Status;
  const char* m_pLabel;
};

constexpr VStatusRow StatusRows[] = {
  { IVideoInputDevice::EStatus::EReady, "Ready" },
  { IVideoInputDevice::EStatus::ECapturing, "Streaming" },
  { IVideoInputDevice::EStatus::EUnavailable, "Unavailable" },
};

}

struct VVideoInputDeviceParameterHandler::VControlRow
{
  const std::string& ( *m_pKey )();
  VDataPath ( *m_pPath )( const VDataPath& );
  VParameterText m_Text;
  VDeviceControl ( IVideoInputDevice::*m_pGet )() const;
  void ( IVideoInputDevice::*m_pSet )( int32_t );
  bool m_bUnitDefault;   // 1.0 in place of the device's own default

  double Default( const VDeviceControl& i_rControl ) const { return m_bUnitDefault ? 1.0 : static_cast<double>( i_rControl.m_Default ); }
};

const VVideoInputDeviceParameterHandler::VControlRow VVideoInputDeviceParameterHandler::ControlRows[] = {
  { Keys::ExposureKey, Keys::Exposure, { "Video Mode", "Exposure (us)", "Exposure in microseconds" }, &IVideoInputDevice::GetExposureControl,
    &IVideoInputDevice::SetExposure, false },
  { Keys::GainKey, Keys::Gain, { "Video Mode", "Gain (dB)", "Gain in decibels" }, &IVideoInputDevice::GetGainControl, &IVideoInputDevice::SetGain,
    false },
  { Keys::BlackLevelKey, Keys::BlackLevel, { "Video Mode", "Black Level", "Black Level" }, &IVideoInputDevice::GetBlackLevelControl,
    &IVideoInputDevice::SetBlackLevel, false },
  { Keys::GammaKey, Keys::Gamma, { "Video Mode", "Gamma", "Gamma" }, &IVideoInputDevice::GetGammaControl, &IVideoInputDevice::SetGamma, true },
};

// The mask grid comes first, so that it is there when the device appears in any list.
void VVideoInputDeviceParameterHandler::CreateParameters()
{
  UpdateMaskGrid();
  VCaptureDeviceParameterHandler::CreateParameters();
  CreateIdentity();
  CreateSignal();
  CreateVideoSetup();
  CreateAudioSetup();
  CreateTimecodeSetup();
  CreatePixelAspectRatio();

  // Before the first reading: what changes in between is then read again.
  SubscribeToDevice();
  UpdateStatus();
  OnVideoStandardChanged();
  OnTimecodeChanged();
  UpdatePixelFormats();
  UpdateTimecodeSources();
  UpdateAudioSampleFormats();
  UpdateAudioSampleRates();

  CreateOpticalSettings();
  CreateDeviceControls();
  SubscribeToStartSettings();
  SubscribeToSystem();
  Publish<uint32_t>( DeviceSchemas::ConnectionCountKey(), 1 );   // the first appearance, with or without a signal
}

void VVideoInputDeviceParameterHandler::React( VParameter& io_rParameter, VReaction i_Reaction, bool i_bSaved )
{
  io_rParameter.SubscribeValueChanged( BindWeak( KVZ::WeakFrom( this ), i_Reaction ), PostalService() );
  if( i_bSaved )
  {
    PostLater( *this, i_Reaction );
  }
}

template<class T>
VParameter& VVideoInputDeviceParameterHandler::AddSetting( const VDataPath& i_rPath, const VParameterText& i_rText, uint32_t i_Traits,
  const T& i_rDefault, VReaction i_Reaction )
{
  VParameter& rParameter = AddParameter<T>( i_rPath, i_rText, i_Traits );
  const bool bSaved = rParameter.HasValue();
  rParameter.SetValueDefault( Variant::Make( i_rDefault ) );
  React( rParameter, i_Reaction, bSaved );
  return rParameter;
}

void VVideoInputDeviceParameterHandler::CreateIdentity()
{
  AddParameter<uint32_t>( DeviceSchemas::UserId( m_DevicePath ), UserIdText, ReadOnly | Hidden );
  AssignUserId();
  AddParameter<std::string>( Keys::DriverName( m_DevicePath ), DriverNameText, ReadOnly );
  Publish( Keys::DriverNameKey(), m_pDevice->GetManufacturerName() );
  AddParameter<std::string>( Keys::DeviceName( m_DevicePath ), DeviceNameText, ReadOnly );
  Publish( Keys::DeviceNameKey(), m_pDevice->GetDeviceName() );
}

// The smallest number that no other video input has. One that was saved is kept.
void VVideoInputDeviceParameterHandler::AssignUserId()
{
  uint32_t UserId = 0;
  if( Read( DeviceSchemas::UserIdKey(), UserId ) && UserId <= static_cast<uint32_t>( std::numeric_limits<int32_t>::max() ) )
  {
    return;
  }
  std::set<uint32_t> Taken;
  {
    const VDataReader Reader( DataStore() );
    std::vector<VDataPath> Paths;
    Reader.GetMatches( DeviceSchemas::UserId( Keys::Path() + "*" ), Paths );
    for( const VDataPath& rPath : Paths )
    {
      if( !rPath.BeginsWith( m_DevicePath ) && GetTyped( Reader, rPath, UserId ) )
      {
        Taken.insert( UserId );
      }
    }
  }
  uint32_t Free = 1;
  while( Taken.count( Free ) > 0 )
  {
    ++Free;
  }
  Publish( DeviceSchemas::UserIdKey(), Free );
}

void VVideoInputDeviceParameterHandler::CreateSignal()
{
  VParameterChoices Choices;
  for( const VStatusRow& rRow : StatusRows )
  {
    Choices.push_back( { rRow.m_pLabel, Variant::Make( rRow.m_Status ) } );
  }
  AddParameter<IVideoInputDevice::EStatus::Enum>( Keys::Status( m_DevicePath ), StatusText, ReadOnly ).SetEnum( Choices );

  Choices.clear();
  for( int32_t Value = 0; Value < KVZ::VideoStandardCount; ++Value )
  {
    const auto Standard = static_cast<KVZ::IVideoStandard::Enum>( Value );
    Choices.push_back( { ToName( Standard ), Variant::Make( Standard ) } );
  }
  AddParameter<KVZ::IVideoStandard::Enum>( Keys::VideoStandard( m_DevicePath ), VideoStandardText, ReadOnly ).SetEnum( Choices );
  AddParameter<std::string>( Keys::TimecodeStandard( m_DevicePath ), TimecodeStandardText, ReadOnly );
}

void VVideoInputDeviceParameterHandler::CreateVideoSetup()
{
  AddParameter<KVZ::IPixelFormat::Enum>( Keys::PixelFormat( m_DevicePath ), PixelFormatText )
    .SetValueDefault( Variant::Make( m_pDevice->GetPixelFormat() ) );
}

void VVideoInputDeviceParameterHandler::CreateAudioSetup()
{
  std::set<uint32_t> Counts;
  m_pDevice->GetSupportedAudioChannelCounts( Counts );
  VParameterChoices Choices;
  for( const uint32_t Count : Counts )
  {
    Choices.push_back( { std::to_string( Count ), Variant::Make( Count ) } );
  }
  VParameter& rChannels = AddParameter<uint32_t>( Keys::AudioChannelCount( m_DevicePath ), AudioChannelCountText );
  if( !Counts.empty() )
  {
    const Variant Most = Variant::Make( *Counts.rbegin() );
    rChannels.SetValueDefault( Most );
    OfferChoicesAndCorrect( Keys::AudioChannelCountKey(), Choices, Most );
  }

  AddParameter<KVZ::IAudioSampleFormat::Enum>( Keys::AudioSampleFormat( m_DevicePath ), AudioSampleFormatText )
    .SetValueDefault( Variant::Make( KVZ::IAudioSampleFormat::EInt16 ) );
  AddParameter<uint32_t>( Keys::AudioSampleRate( m_DevicePath ), AudioSampleRateText ).SetValueDefault( Variant::Make( DefaultSampleRate ) );
}

void VVideoInputDeviceParameterHandler::CreateTimecodeSetup()
{
  AddParameter<KVZ::ITimecodeSource::Enum>( Keys::TimecodeSource( m_DevicePath ), TimecodeSourceText );
  AddSetting<int64_t>( Keys::TimeOffsetTicks( m_DevicePath ), TimeOffsetText, Advanced, 0, &VVideoInputDeviceParameterHandler::ApplyTimeOffset )
    .SetDataConversionHint( Parameter::DataConversionHint::EMillisecondsToTick135 );
  AddSetting( Keys::UseTimecodeForSync( m_DevicePath ), UseTimecodeText, Advanced, true,
    &VVideoInputDeviceParameterHandler::ApplyUseTimecodeForSync );
}

void VVideoInputDeviceParameterHandler::CreatePixelAspectRatio()
{
  VParameterChoices Choices;
  for( const VAspectRow& rRow : AspectRows )
  {
    Choices.push_back( { rRow.m_pLabel, Variant::Make( rRow.m_Ratio ) } );
  }
  AddSetting( Keys::PixelAspectRatio( m_DevicePath ), PixelAspectRatioText, Hidden | Advanced, 1.0,
    &VVideoInputDeviceParameterHandler::ApplyPixelAspectRatio )
    .SetEnum( Choices );
  ApplyPixelAspectRatio();   // the source knows no ratio of its own
}

void VVideoInputDeviceParameterHandler::CreateOpticalSettings()
{
  CreateGreyscaleMode().SetHidden( true );
  CreateThreshold( true, true );
  CreateCircularityThreshold();
  CreateMaximumBlobHeight();
}

void VVideoInputDeviceParameterHandler::CreateDeviceControls()
{
  const auto pThis = KVZ::WeakFrom( this );
  for( const VControlRow& rRow : ControlRows )
  {
    const VDeviceControl Control = ( *m_pDevice.*rRow.m_pGet )();
    if( !Control.m_bSupported )
    {
      continue;
    }
    const auto Apply = [&rRow]( VVideoInputDeviceParameterHandler& i_rHandler ) { i_rHandler.ApplyControl( rRow ); };
    VParameter& rParameter = AddParameter<double>( rRow.m_pPath( m_DevicePath ), rRow.m_Text, Advanced );
    rParameter.SetPresentationHint( Parameter::PresentationHint::ESlider );
    rParameter.SetRange( Variant::Make( static_cast<double>( Control.m_Minimum ) ), Variant::Make( static_cast<double>( Control.m_Maximum ) ) );
    const bool bSaved = rParameter.HasValue();
    rParameter.SetValueDefault( Variant::Make( rRow.Default( Control ) ) );
    rParameter.SubscribeValueChanged( BindWeak( pThis, Apply ), PostalService() );
    if( bSaved )
    {
      PostLater( *this, Apply );
    }
  }
  if( m_pDevice->GetAutoWhiteBalanceControl().m_bSupported )
  {
    AddSetting( Keys::AutoWhiteBalance( m_DevicePath ), AutoWhiteBalanceText, Advanced, true,
      &VVideoInputDeviceParameterHandler::ApplyAutoWhiteBalance );
  }
}

void VVideoInputDeviceParameterHandler::ApplyControl( const VControlRow& i_rRow )
{
  const double Value = ReadOr( i_rRow.m_pKey(), i_rRow.Default( ( *m_pDevice.*i_rRow.m_pGet )() ) );
  const double Lowest = std::numeric_limits<int32_t>::min();
  const double Highest = std::numeric_limits<int32_t>::max();
  ( *m_pDevice.*i_rRow.m_pSet )( static_cast<int32_t>( std::lround( std::clamp( Value, Lowest, Highest ) ) ) );
}

// A device reads these at its start, so that neither a saved value nor what has been written until now needs a reaction.
void VVideoInputDeviceParameterHandler::SubscribeToStartSettings()
{
  for( const std::string* pKey : { &Keys::PixelFormatKey(), &Keys::AudioChannelCountKey(), &Keys::AudioSampleFormatKey(), &Keys::AudioSampleRateKey(),
         &Keys::TimecodeSourceKey() } )
  {
    React( *GetParameter( *pKey ), &VVideoInputDeviceParameterHandler::RestartIfStreaming, false );
  }
}

void VVideoInputDeviceParameterHandler::SubscribeToDevice()
{
  using VHandler = VVideoInputDeviceParameterHandler;
  const auto Bind = [pThis = KVZ::WeakFrom( this )]( VReaction i_Reaction ) { return BindWeak( pThis, i_Reaction ); };
  m_pDevice->GetStatusChangedCallback().Add( Bind( &VHandler::UpdateStatus ), PostalService() );
  m_pDevice->GetVideoStandardChangedCallback().Add( Bind( &VHandler::OnVideoStandardChanged ), PostalService() );
  m_pDevice->GetTimecodeChangedCallback().Add( Bind( &VHandler::OnTimecodeChanged ), PostalService() );
  m_pDevice->GetPixelFormatsChangedCallback().Add( Bind( &VHandler::UpdatePixelFormats ), PostalService() );
}

void VVideoInputDeviceParameterHandler::SubscribeToSystem()
{
  const auto pThis = KVZ::WeakFrom( this );
  VDataWriter Writer( DataStore() );
  for( const VDataPath* pPath : { &DeviceSchemas::Gn6System::GenlockStandard(), &DeviceSchemas::Gn6System::FrameRateActual() } )
  {
    if( IDataNode* pNode = Writer.GetNode( *pPath ) )
    {
      pNode->OnValueChanged().Add( BindWeak( pThis, &VVideoInputDeviceParameterHandler::CheckFrameRates ), PostalService() );
    }
  }
  m_pSourceRegistry->GetMasterPeriodChangedCallback().Add( BindWeak( pThis, &VVideoInputDeviceParameterHandler::ApplyTimeOffset ), PostalService() );
}
