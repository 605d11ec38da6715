#include "StageCoreParameters/DeviceParameterHandler.h"

#include "NotificationSystem/WeakBinder.h"
#include "StageCoreDataStore/DataWriter.h"
#include "StageCoreDataStoreTypes/DeviceSchemas.h"
#include "StageCoreDataStoreTypes/GreyscaleMode.h"

using namespace ParameterTraits;
using CoreTarvoTypesUtils::EGreyscaleMode;
using KVZ::Variant;

namespace
{

constexpr VParameterText DisplayTypeText = { "General", "Device Type", "The model name of the device" };
constexpr VParameterText ConnectedText = { "General", "Connected", "Device connection state" };
constexpr VParameterText ConnectionCountText = { "General", "ConnectionCount", "Device connection count since the application started." };
constexpr VParameterText EnabledText = { "General", "Enabled", "Device enabled state." };
constexpr VParameterText NameText = { "General", "Name", "User assignable device name." };
constexpr VParameterText GreyscaleModeText = { "Optical Mode", "Grayscale Mode", "The grayscale mode." };
constexpr VParameterText ThresholdText = { "Optical Mode", "Threshold", "The global threshold value." };
constexpr VParameterText CircularityThresholdText = { "Centroid Fitting", "Circularity Threshold",
  "How circular a blob must be before a centroid is calculated." };
constexpr VParameterText MaximumBlobHeightText = { "Centroid Fitting", "Maximum Blob Height", "The blob pixel height limit." };

}

VDeviceParameterHandler::VDeviceParameterHandler( std::shared_ptr<KVZ::IPostalService> i_pPostalService, std::shared_ptr<IDataStore> i_pDataStore,
  std::shared_ptr<StageCorePluginInterface::IParameterRegistry> i_pParameterRegistry, const VDataPath& i_rDevicePath, const std::string& i_rDeviceURN,
  const std::string& i_rDisplayType )
  : VStageCoreParameterHandler( std::move( i_pPostalService ), std::move( i_pDataStore ), std::move( i_pParameterRegistry ), i_rDevicePath,
      VDataPath{ "Attributes" } + i_rDevicePath ),
    m_DeviceURN( i_rDeviceURN ),
    m_DisplayType( i_rDisplayType )
{
}

void VDeviceParameterHandler::CreateParameters()
{
  const VDataPath& rDevice = GetPath();
  AddParameter<std::string>( DeviceSchemas::DisplayType( rDevice ), DisplayTypeText, ReadOnly | Advanced );
  Publish( DeviceSchemas::DisplayTypeKey(), m_DisplayType );
  AddParameter<bool>( DeviceSchemas::Connected( rDevice ), ConnectedText, ReadOnly | Hidden );
  AddParameter<uint32_t>( DeviceSchemas::ConnectionCount( rDevice ), ConnectionCountText, ReadOnly | Hidden );

  VParameter& rEnabled = AddParameter<bool>( DeviceSchemas::Enabled( rDevice ), EnabledText, VerifyRequired );
  const bool bSaved = rEnabled.HasValue();
  rEnabled.SubscribeProposedValue( NotificationSystem::BindWeak( KVZ::WeakFrom( this ), &VDeviceParameterHandler::OnEnabledChanged ),
    PostalService() );
  rEnabled.SetValueDefault( Variant::Make( true ) );
  if( bSaved )
  {
    PostLater( *this, &VDeviceParameterHandler::OnEnabledChanged );   // it was proposed before there was anyone to answer
  }
  AddParameter<std::string>( DeviceSchemas::Name( rDevice ), NameText ).SetValueDefault( Variant::Make( "" ) );
}

void VDeviceParameterHandler::SetConnected( bool i_bConnected )
{
  const bool bBefore = ReadOr( DeviceSchemas::ConnectedKey(), false );
  if( !Publish( DeviceSchemas::ConnectedKey(), i_bConnected ) )
  {
    return;
  }
  if( i_bConnected && !bBefore )
  {
    Publish( DeviceSchemas::ConnectionCountKey(), ReadOr<uint32_t>( DeviceSchemas::ConnectionCountKey(), 0 ) + 1 );
  }
  OnConnectedChanged();
}

void VDeviceParameterHandler::SetWarning( const std::string& i_rKey, const std::string& i_rText )
{
  VDataWriter( DataStore() ).SetValue( DeviceSchemas::Warnings( GetPath() ).Add( i_rKey ), Variant::Make( i_rText ) );
}

void VDeviceParameterHandler::ClearWarning( const std::string& i_rKey )
{
  VDataWriter( DataStore() ).RemoveValue( DeviceSchemas::Warnings( GetPath() ).Add( i_rKey ) );
}

VParameter& VDeviceParameterHandler::CreateGreyscaleMode()
{
  VParameter& rParameter = AddParameter<EGreyscaleMode::Enum>( DeviceSchemas::GreyscaleMode( GetPath() ), GreyscaleModeText, VerifyRequired );
  VParameterChoices Choices;
  for( const KVZ::ISchema::VEntry& rEntry : rParameter.GetSchema()->Entries() )
  {
    Choices.push_back( { rEntry.m_Name, Variant::MakeEnumeration( rParameter.GetSchema(), rEntry.m_Value ) } );
  }
  rParameter.SetEnum( Choices );
  return rParameter;
}

VParameter& VDeviceParameterHandler::CreateThreshold( bool i_bGreyscale, bool i_bVideo )
{
  VParameter& rParameter = AddParameter<double>( DeviceSchemas::Threshold( GetPath() ), ThresholdText, VerifyRequired );
  rParameter.SetPresentationHint( Parameter::PresentationHint::ESlider );
  rParameter.SetRange( Variant::Make( 0.0 ), Variant::Make( 1.0 ) );
  rParameter.SetValueDefault( Variant::Make( i_bVideo ? 0.6 : i_bGreyscale ? 0.3 : 0.2 ) );
  return rParameter;
}

VParameter& VDeviceParameterHandler::CreateCircularityThreshold()
{
  VParameter& rParameter = AddParameter<double>( DeviceSchemas::CircularityThreshold( GetPath() ), CircularityThresholdText,
    Advanced | VerifyRequired );
  rParameter.SetPresentationHint( Parameter::PresentationHint::ESlider );
  rParameter.SetRange( Variant::Make( 0.0 ), Variant::Make( 1.0 ) );
  return rParameter;
}

VParameter& VDeviceParameterHandler::CreateMaximumBlobHeight()
{
  VParameter& rParameter = AddParameter<uint32_t>( DeviceSchemas::MaximumBlobHeight( GetPath() ), MaximumBlobHeightText, Advanced | VerifyRequired );
  rParameter.SetPresentationHint( Parameter::PresentationHint::ESlider );
  rParameter.SetRange( Variant::Make<uint32_t>( 1 ), Variant::Make<uint32_t>( 500 ) );
  rParameter.SetValueDefault( Variant::Make<uint32_t>( 50 ) );
  return rParameter;
}
