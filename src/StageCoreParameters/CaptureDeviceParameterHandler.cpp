#include "StageCoreParameters/CaptureDeviceParameterHandler.h"

#include "Core/VideoInterface/Schemas.h"
#include "Core/VideoInterface/VideoWriter.h"
#include "NotificationSystem/WeakBinder.h"
#include "StageCoreDataStoreTypes/DeviceSchemas.h"
#include "StageCoreRuntime/GlobalLog.h"

#include <algorithm>

using namespace ParameterTraits;
using KVZ::Variant;
using NotificationSystem::BindWeak;

namespace
{

constexpr VParameterText CaptureDirectoryText = { "Capture", "Capture Folder", "Capture folder alias for this device" };
constexpr VParameterText VideoContainerText = { "Capture", "Container Format", "Type of video container format" };
constexpr VParameterText VideoPayloadText = { "Capture", "Video Payload", "Type of video encoding of the video payload" };
constexpr VParameterText AudioPayloadText = { "Capture", "Audio Payload", "Type of encoding for the audio payload" };
constexpr VParameterText ProcessInRealtimeText = { "Capture", "Process In Realtime",
  "Should this video camera contribute to realtime reconstruction?" };

constexpr const char* NoFolder = "None";
constexpr const char* DefaultFolder = "Default";

// The enumerators that the predicate takes, in their order.
template<class TEnum, class TPredicate>
VParameterChoices ChoicesOf( const TPredicate& i_rPredicate )
{
  VParameterChoices Choices;
  for( const KVZ::VEnumRow& rRow : KVZ::GetEnumTable( TEnum{} ).m_Rows )
  {
    const auto Value = static_cast<TEnum>( rRow.m_Value );
    if( i_rPredicate( Value ) )
    {
      Choices.push_back( { KVZ::NameOrUnspecified( Value ), Variant::Make( Value ) } );
    }
  }
  return Choices;
}

}

VCaptureDeviceParameterHandler::VContainers VCaptureDeviceParameterHandler::AllContainers()
{
  VContainers Containers;
  for( const KVZ::VEnumRow& rRow : KVZ::GetEnumTable( KVZ::IVideoContainer::Enum{} ).m_Rows )
  {
    Containers.push_back( static_cast<KVZ::IVideoContainer::Enum>( rRow.m_Value ) );
  }
  return Containers;
}

VCaptureDeviceParameterHandler::VCaptureDeviceParameterHandler( std::shared_ptr<KVZ::IPostalService> i_pPostalService,
  std::shared_ptr<IDataStore> i_pDataStore, std::shared_ptr<StageCorePluginInterface::IParameterRegistry> i_pParameterRegistry,
  std::shared_ptr<StageCorePluginInterface::ICaptureFolders> i_pCaptureFolders, const VDataPath& i_rDevicePath, const std::string& i_rDeviceURN,
  const std::string& i_rDisplayType, VContainers i_Containers )
  : VDeviceParameterHandler( std::move( i_pPostalService ), std::move( i_pDataStore ), std::move( i_pParameterRegistry ), i_rDevicePath, i_rDeviceURN,
      i_rDisplayType ),
    m_pCaptureFolders( std::move( i_pCaptureFolders ) ),
    m_Containers( std::move( i_Containers ) )
{
}

void VCaptureDeviceParameterHandler::CreateParameters()
{
  VDeviceParameterHandler::CreateParameters();
  CreateCaptureDirectory();
  CreateFormats();
  AddParameter<bool>( DeviceSchemas::ProcessInRealtime( GetPath() ), ProcessInRealtimeText, Advanced );
}

void VCaptureDeviceParameterHandler::CreateCaptureDirectory()
{
  VParameter& rDirectory = AddParameter<std::string>( DeviceSchemas::CaptureDirectory( GetPath() ), CaptureDirectoryText );
  rDirectory.SetValueDefault( Variant::Make( DefaultFolder ) );
  rDirectory.SubscribeValueChanged( BindWeak( KVZ::WeakFrom( this ), &VCaptureDeviceParameterHandler::CheckCaptureFolder ), PostalService() );
  m_pCaptureFolders->GetFolderAliasesChangedCallback().Add( BindWeak( KVZ::WeakFrom( this ), &VCaptureDeviceParameterHandler::UpdateCaptureFolders ),
    PostalService() );
  UpdateCaptureFolders();   // what changes before this is read here
}

void VCaptureDeviceParameterHandler::CreateFormats()
{
  const VDataPath& rDevice = GetPath();
  VParameter& rContainer = AddParameter<KVZ::IVideoContainer::Enum>( DeviceSchemas::VideoContainer( rDevice ), VideoContainerText );
  const bool bHasDefault = m_Containers.empty() || std::count( m_Containers.begin(), m_Containers.end(), KVZ::IVideoContainer::ETVID ) > 0;
  rContainer.SetValueDefault( Variant::Make( bHasDefault ? KVZ::IVideoContainer::ETVID : m_Containers.front() ) );
  VParameterChoices Containers;
  for( const KVZ::IVideoContainer::Enum Container : m_Containers )
  {
    Containers.push_back( { KVZ::NameOrUnspecified( Container ), Variant::Make( Container ) } );
  }
  OfferChoicesAndCorrect( DeviceSchemas::VideoContainerKey(), Containers );
  rContainer.SubscribeValueChanged( BindWeak( KVZ::WeakFrom( this ), &VCaptureDeviceParameterHandler::OnContainerChanged ), PostalService() );

  AddParameter<KVZ::IVideoPayload::Enum>( DeviceSchemas::VideoPayload( rDevice ), VideoPayloadText )
    .SetValueDefault( Variant::Make( KVZ::IVideoPayload::EUncompressed ) );
  AddParameter<KVZ::IAudioPayload::Enum>( DeviceSchemas::AudioPayload( rDevice ), AudioPayloadText )
    .SetValueDefault( Variant::Make( KVZ::IAudioPayload::EUncompressed ) );
  OnContainerChanged();
}

void VCaptureDeviceParameterHandler::OnContainerChanged()
{
  const auto Container = ReadOr( DeviceSchemas::VideoContainerKey(), KVZ::IVideoContainer::ETVID );
  const KVZ::IVideoWriterCapabilities& rCapabilities = KVZ::GetVideoWriterCapabilities( Container );
  OfferChoicesAndCorrect( DeviceSchemas::VideoPayloadKey(),
    ChoicesOf<KVZ::IVideoPayload::Enum>( [&]( KVZ::IVideoPayload::Enum i_Payload ) { return rCapabilities.IsVideoPayloadSupported( i_Payload ); } ) );
  OfferChoicesAndCorrect( DeviceSchemas::AudioPayloadKey(),
    ChoicesOf<KVZ::IAudioPayload::Enum>( [&]( KVZ::IAudioPayload::Enum i_Payload ) { return rCapabilities.IsAudioPayloadSupported( i_Payload ); } ) );
}

void VCaptureDeviceParameterHandler::UpdateCaptureFolders()
{
  std::vector<std::string> Aliases;
  m_pCaptureFolders->GetFolderAliases( Aliases );
  VParameterChoices Choices = { { NoFolder, Variant::Make( NoFolder ) } };
  for( const std::string& rAlias : Aliases )
  {
    const KVZ::VLabelledVariant Choice = { rAlias, Variant::Make( rAlias ) };
    if( std::find( Choices.begin(), Choices.end(), Choice ) == Choices.end() )
    {
      Choices.push_back( Choice );
    }
  }
  OfferChoices( DeviceSchemas::CaptureDirectoryKey(), Choices );
  CheckCaptureFolder();
}

void VCaptureDeviceParameterHandler::CheckCaptureFolder()
{
  std::vector<std::string> Aliases;
  const std::shared_ptr<VParameter> pDirectory = GetParameter( DeviceSchemas::CaptureDirectoryKey() );
  const std::string Alias = ReadOr<std::string>( DeviceSchemas::CaptureDirectoryKey(), DefaultFolder );
  const bool bOffered = pDirectory && pDirectory->GetEnum( Aliases ) && std::count( Aliases.begin(), Aliases.end(), Alias ) > 0;
  if( bOffered || Alias == DefaultFolder )
  {
    return;
  }
  KVZ_LOG_WARNING( "Capture", "Device %1% is using an invalid capture folder [ %2% ], reverting to default capture folder.", GetDeviceURN(), Alias );
  Publish( DeviceSchemas::CaptureDirectoryKey(), std::string( DefaultFolder ) );
}
