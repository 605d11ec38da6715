#include "StageCorePluginVideoInput/VideoInputDeviceParameterHandler.h"

#include "Core/VideoInterface/Schemas.h"
#include "HardwareSupport/VideoInput/VideoInputHAL/DeviceStatusSchema.h"
#include "StageCoreDataStore/DataVerifyWriter.h"
#include "StageCoreDataStoreTypes/DeviceSchemas.h"
#include "StageCoreDataStoreTypes/MaskGrid.h"
#include "StageCorePluginVideoInput/FrameRateCheck.h"

#include <algorithm>
#include <cmath>
#include <limits>
#include <set>

using KVZ::Variant;
using VideoInputHAL::IVideoInputDevice;
namespace Keys = DeviceSchemas::VideoInput;

namespace
{

constexpr uint32_t MaskTileSize = 4;   // pixels, either way

VMaskGrid EmptyMaskGrid( const std::string& i_rDeviceURN, const KVZ::VVideoStandardRow& i_rStandard )
{
  VMaskGrid Grid;
  Grid.m_DeviceURN = i_rDeviceURN;
  Grid.m_TileSizeX = MaskTileSize;
  Grid.m_TileSizeY = MaskTileSize;
  Grid.m_GridSizeX = ( i_rStandard.m_Width + MaskTileSize - 1 ) / MaskTileSize;
  Grid.m_GridSizeY = ( i_rStandard.m_Height + MaskTileSize - 1 ) / MaskTileSize;
  return Grid;
}

bool HasSameSizes( const VMaskGrid& i_rA, const VMaskGrid& i_rB )
{
  return i_rA.m_TileSizeX == i_rB.m_TileSizeX && i_rA.m_TileSizeY == i_rB.m_TileSizeY && i_rA.m_GridSizeX == i_rB.m_GridSizeX &&
    i_rA.m_GridSizeY == i_rB.m_GridSizeY;
}

template<class TEnum>
VParameterChoices ChoicesOf( const std::set<TEnum>& i_rValues )
{
  VParameterChoices Choices;
  for( const TEnum Value : i_rValues )
  {
    Choices.push_back( { KVZ::NameOrUnspecified( Value ), Variant::Make( Value ) } );
  }
  return Choices;
}

}

VVideoInputDeviceParameterHandler::VVideoInputDeviceParameterHandler( std::shared_ptr<KVZ::IPostalService> i_pPostalService,
  std::shared_ptr<IDataStore> i_pDataStore, std::shared_ptr<StageCorePluginInterface::IParameterRegistry> i_pParameterRegistry,
  std::shared_ptr<StageCorePluginInterface::ICaptureTargets> i_pCaptureTargets,
  std::shared_ptr<StageCorePluginInterface::ISourceRegistry> i_pSourceRegistry, std::shared_ptr<IVideoInputDevice> i_pDevice,
  std::shared_ptr<VideoInputHAL::IVideoInputSourceControl> i_pDataSource, VContainers i_Containers )
  : VCaptureDeviceParameterHandler( std::move( i_pPostalService ), std::move( i_pDataStore ), std::move( i_pParameterRegistry ),
      std::move( i_pCaptureTargets ), Keys::Path( i_pDevice->GetDeviceURN() ), i_pDevice->GetDeviceURN(), i_pDevice->GetDriverName(),
      std::move( i_Containers ) ),
    m_DevicePath( GetPath() ),
    m_pDevice( std::move( i_pDevice ) ),
    m_pDataSource( std::move( i_pDataSource ) ),
    m_pSourceRegistry( std::move( i_pSourceRegistry ) )
{
}

bool VVideoInputDeviceParameterHandler::StartCapture()
{
  KVZ::IPixelFormat::Enum PixelFormat{};
  if( !Read( Keys::PixelFormatKey(), PixelFormat ) )
  {
    return false;
  }
  const auto TimecodeSource = ReadOr( Keys::TimecodeSourceKey(), KVZ::ITimecodeSource::EUnspecified );
  const auto AudioFormat = ReadOr( Keys::AudioSampleFormatKey(), KVZ::IAudioSampleFormat::Enum{} );
  const auto Channels = ReadOr<uint32_t>( Keys::AudioChannelCountKey(), 0 );
  return m_pDevice->StartCapture( PixelFormat, TimecodeSource, AudioFormat, Channels ).Succeeded();
}

bool VVideoInputDeviceParameterHandler::StopCapture()
{
  m_pDevice->StopCapture();
  return true;
}

void VVideoInputDeviceParameterHandler::RestartIfStreaming()
{
  if( m_pDevice->GetStatus() == IVideoInputDevice::EStatus::ECapturing )
  {
    StartCapture();
  }
}

// The verified value tells the wish even where the device refuses; "Status" tells the fact.
void VVideoInputDeviceParameterHandler::OnEnabledChanged()
{
  const std::shared_ptr<VParameter> pEnabled = GetParameter( DeviceSchemas::EnabledKey() );
  if( !pEnabled )
  {
    return;
  }
  Variant Wish;
  bool bEnabled = false;
  if( pEnabled->GetProposedValue( Wish ) || pEnabled->GetValue( Wish ) )   // what was brought back may be the verified form alone
  {
    Wish.Get( bEnabled );
  }
  const IVideoInputDevice::EStatus::Enum Status = m_pDevice->GetStatus();
  if( bEnabled && Status == IVideoInputDevice::EStatus::EReady )
  {
    StartCapture();
  }
  else if( !bEnabled && Status == IVideoInputDevice::EStatus::ECapturing )
  {
    m_pDevice->StopCapture();
  }
  pEnabled->SetVerifiedValue( Variant::Make( bEnabled ) );
  CheckFrameRates();
  UpdateSourceEnabled();
}

void VVideoInputDeviceParameterHandler::UpdateStatus() { Publish( Keys::StatusKey(), m_pDevice->GetStatus() ); }

void VVideoInputDeviceParameterHandler::OnVideoStandardChanged()
{
  const KVZ::IVideoStandard::Enum Standard = m_pDevice->GetVideoStandard();
  Publish( Keys::VideoStandardKey(), Standard );
  SetConnected( Standard != KVZ::IVideoStandard::EUnspecified );
  UpdateMaskGrid();
  CheckFrameRates();
  UpdateSourceEnabled();
}

// A mask that was drawn stays as long as the image's size does.
void VVideoInputDeviceParameterHandler::UpdateMaskGrid()
{
  const KVZ::VVideoStandardRow* pStandard = KVZ::FindVideoStandard( m_pDevice->GetVideoStandard() );
  if( !pStandard || pStandard->m_Standard == KVZ::IVideoStandard::EUnspecified )
  {
    return;
  }
  const VMaskGrid Grid = EmptyMaskGrid( GetDeviceURN(), *pStandard );
  const VDataPath Path = DeviceSchemas::MaskGrid( m_DevicePath );
  VMaskGrid Stored;
  if( GetTyped( VDataVerifyReader( DataStore() ), Path, Stored ) && HasSameSizes( Stored, Grid ) )
  {
    return;
  }
  VDataWriter( DataStore() ).SetValue( Path, Variant::Make( Grid ) );
}

void VVideoInputDeviceParameterHandler::OnTimecodeChanged()
{
  const KVZ::ITimecode Timecode = m_pDevice->GetTimecode();
  const std::string Text = KVZ::IsValid( Timecode ) ? "Receiving " + KVZ::GetTimecodeStandardLabel( Timecode.m_Standard, false )
                                                    : std::string( "Not Detected" );
  Publish( Keys::TimecodeStandardKey(), Text );
}

void VVideoInputDeviceParameterHandler::UpdatePixelFormats()
{
  std::set<KVZ::IPixelFormat::Enum> Formats;
  m_pDevice->GetSupportedPixelFormats( Formats );
  OfferChoicesAndCorrect( Keys::PixelFormatKey(), ChoicesOf( Formats ) );
}

// The current value stays, whether or not the signal can carry it: the signal may come back.
void VVideoInputDeviceParameterHandler::UpdateTimecodeSources()
{
  std::set<KVZ::ITimecodeSource::Enum> Sources;
  m_pDevice->GetSupportedTimecodeSources( Sources );
  if( Sources.empty() )
  {
    return;
  }
  OfferChoices( Keys::TimecodeSourceKey(), ChoicesOf( Sources ) );
  KVZ::ITimecodeSource::Enum Default = *Sources.begin();
  for( const KVZ::ITimecodeSource::Enum Better : { KVZ::ITimecodeSource::ERP188_Any, KVZ::ITimecodeSource::EAny } )
  {
    Default = Sources.count( Better ) > 0 ? Better : Default;
  }
  GetParameter( Keys::TimecodeSourceKey() )->SetValueDefault( Variant::Make( Default ) );
}

void VVideoInputDeviceParameterHandler::UpdateAudioSampleFormats()
{
  std::set<KVZ::IAudioSampleFormat::Enum> Formats;
  m_pDevice->GetSupportedAudioSampleFormats( Formats );
  if( OfferChoicesAndCorrect( Keys::AudioSampleFormatKey(), ChoicesOf( Formats ) ) )
  {
    GetParameter( Keys::AudioSampleFormatKey() )->SetValueDefault( Variant::Make( *Formats.begin() ) );
  }
}

void VVideoInputDeviceParameterHandler::UpdateAudioSampleRates()
{
  std::set<uint32_t> Rates;
  m_pDevice->GetSupportedAudioSampleRates( Rates );
  VParameterChoices Choices;
  for( const uint32_t Rate : Rates )
  {
    Choices.push_back( { std::to_string( Rate ) + " Hz", Variant::Make( Rate ) } );
  }
  if( OfferChoicesAndCorrect( Keys::AudioSampleRateKey(), Choices ) )
  {
    GetParameter( Keys::AudioSampleRateKey() )->SetValueDefault( Choices.front().m_Value );
  }
}

void VVideoInputDeviceParameterHandler::UpdateSourceEnabled()
{
  const bool bEnabled = ReadOr( DeviceSchemas::EnabledKey(), false );
  const auto Standard = ReadOr( Keys::VideoStandardKey(), KVZ::IVideoStandard::EUnspecified );
  m_pDataSource->SetSourceEnabled( bEnabled && Standard != KVZ::IVideoStandard::EUnspecified );
}

// Rounds to whole beats of the master clock.
void VVideoInputDeviceParameterHandler::ApplyTimeOffset()
{
  const std::shared_ptr<KVZ::IBaseLineClock> pClock = m_pSourceRegistry->GetMasterClock();
  if( !pClock || pClock->GetPeriod().Count() <= 0 )
  {
    return;
  }
  constexpr int64_t Furthest = std::numeric_limits<int64_t>::max() / 4;   // sums with times stay in 64 bits
  const int64_t Offset = std::clamp( ReadOr<int64_t>( Keys::TimeOffsetTicksKey(), 0 ), -Furthest, Furthest );
  const int64_t Period = pClock->GetPeriod().Count();
  const int64_t Beats = std::llround( static_cast<double>( Offset ) / static_cast<double>( Period ) );
  m_pDataSource->SetTimecodeAdjustment( KVZ::VTick( Beats * Period ) );
}

void VVideoInputDeviceParameterHandler::ApplyUseTimecodeForSync()
{
  m_pDataSource->SetUseTimecodeForSync( ReadOr( Keys::UseTimecodeForSyncKey(), true ) );
}

void VVideoInputDeviceParameterHandler::ApplyPixelAspectRatio() { m_pDataSource->SetPixelAspectRatio( ReadOr( Keys::PixelAspectRatioKey(), 1.0 ) ); }

void VVideoInputDeviceParameterHandler::ApplyAutoWhiteBalance() { m_pDevice->SetAutoWhiteBalance( ReadOr( Keys::AutoWhiteBalanceKey(), true ) ); }

void VVideoInputDeviceParameterHandler::CheckFrameRates()
{
  const auto Standard = ReadOr( Keys::VideoStandardKey(), KVZ::IVideoStandard::EUnspecified );
  if( !ReadOr( DeviceSchemas::EnabledKey(), false ) || Standard == KVZ::IVideoStandard::EUnspecified )
  {
    ClearWarning( Keys::IncompatibleVideoStandardKey() );
    return;
  }
  KVZ::IGenlockStandard::Enum Genlock = KVZ::IGenlockStandard::EGenlockStandardNone;
  double Rate = 0.0;
  {
    const VDataReader Reader( DataStore() );
    GetTyped( Reader, DeviceSchemas::Gn6System::GenlockStandard(), Genlock );
    GetTyped( Reader, DeviceSchemas::Gn6System::FrameRateActual(), Rate );
  }
  const bool bGenlock = Genlock != KVZ::IGenlockStandard::EGenlockStandardNone;
  const int64_t SystemPeriod = bGenlock ? FrameRateCheck::GenlockPeriod( Genlock ) : FrameRateCheck::SystemPeriod( Rate );
  const int64_t VideoPeriod = KVZ::GetFramePeriod( Standard );
  if( FrameRateCheck::AreCompatible( SystemPeriod, VideoPeriod ) )
  {
    ClearWarning( Keys::IncompatibleVideoStandardKey() );
    return;
  }
  const auto MakeText = bGenlock ? FrameRateCheck::GenlockWarning : FrameRateCheck::SystemWarning;
  SetWarning( Keys::IncompatibleVideoStandardKey(), MakeText( SystemPeriod, VideoPeriod ) );
}
