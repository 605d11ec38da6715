#include "host/CaptureTargets.h"

#include "Core/VideoInterface/Schemas.h"
#include "Core/VideoInterface/VideoContainer.h"
#include "Core/VideoInterface/VideoWriter.h"
#include "StageCoreDataStore/DataReader.h"
#include "StageCoreDataStoreTypes/DeviceSchemas.h"
#include "StageCoreRuntime/GlobalLog.h"

#include <boost/filesystem/operations.hpp>
#include <boost/filesystem/path.hpp>
#include <boost/thread/lock_guard.hpp>

#include <algorithm>

using StageCorePluginInterface::VCaptureFileReport;
using StageCorePluginInterface::VCaptureTarget;

namespace StageHost
{

namespace
{

constexpr uint32_t AllChannels = 0xFFFFFFFF;
constexpr uint32_t MostChannels = 16;

uint32_t ChannelsOf( int32_t i_Container, uint32_t i_Wanted )
{
  if( i_Wanted != AllChannels )
  {
    return i_Wanted;
  }
  const KVZ::IVideoWriterCapabilities& rCapabilities = KVZ::GetVideoWriterCapabilities( static_cast<KVZ::IVideoContainer::Enum>( i_Container ) );
  uint32_t Channels = MostChannels;
  while( Channels > 0 && !rCapabilities.IsChannelCountSupported( Channels ) )
  {
    --Channels;
  }
  return Channels;
}

template<class T>
T ReadOr( const VDataReader& i_rReader, const VDataPath& i_rPath, T i_Default )
{
  GetTyped( i_rReader, i_rPath, i_Default );
  return i_Default;
}

std::string Stem( const VCaptureTarget& i_rTarget ) { return i_rTarget.m_BaseName + "_" + i_rTarget.m_DeviceLabel; }

bool IsSequence( const VCaptureTarget& i_rTarget ) { return i_rTarget.m_Container == KVZ::IVideoContainer::EIMAGES; }

// What must not be there yet: the file, or the folder of an image sequence with anything in it.
std::string TakenPath( const VCaptureTarget& i_rTarget )
{
  const std::string Name = i_rTarget.m_Extension.empty() ? Stem( i_rTarget ) : Stem( i_rTarget ) + "." + i_rTarget.m_Extension;
  return IsSequence( i_rTarget ) ? i_rTarget.m_Folder : ( boost::filesystem::path( i_rTarget.m_Folder ) / Name ).string();
}

// A frame of this sequence or its side file, from an earlier capture of the same name.
bool IsOfSequence( const boost::filesystem::path& i_rFile, const VCaptureTarget& i_rTarget )
{
  static const std::string Extensions[] = { ".jpg", ".png", ".tiff" };
  const std::string Start = Stem( i_rTarget ) + "_";
  const std::string Name = i_rFile.stem().string();
  if( Name.compare( 0, Start.size(), Start ) != 0 )
  {
    return false;
  }
  const std::string Rest = Name.substr( Start.size() );
  const bool bNumber = std::all_of( Rest.begin(), Rest.end(), []( char i_Digit ) { return i_Digit >= '0' && i_Digit <= '9'; } );
  const std::string Extension = i_rFile.extension().string();
  return Rest.empty() ? Extension == ".tarvovideoattributes"
                      : bNumber && std::count( std::begin( Extensions ), std::end( Extensions ), Extension ) > 0;
}

// A sequence is replaced as a whole: frames of a longer one before it must not stay behind its end.
void RemoveSequence( const VCaptureTarget& i_rTarget )
{
  boost::system::error_code Error;
  std::vector<boost::filesystem::path> Old;
  for( boost::filesystem::directory_iterator File( i_rTarget.m_Folder, Error ), End; !Error && File != End; File.increment( Error ) )
  {
    if( IsOfSequence( File->path(), i_rTarget ) )
    {
      Old.push_back( File->path() );
    }
  }
  for( const boost::filesystem::path& rPath : Old )
  {
    boost::filesystem::remove( rPath, Error );
  }
}

// A name as one component of a path.
std::string FileNamePart( std::string i_Text )
{
  std::replace_if(
    i_Text.begin(), i_Text.end(),
    []( char i_Character ) { return i_Character == '/' || i_Character == ':' || static_cast<unsigned char>( i_Character ) < 0x20; }, '-' );
  return i_Text;
}

}

std::string MakeDeviceLabel( const std::string& i_rDeviceURN, const std::string& i_rName )
{
  if( !i_rName.empty() )
  {
    return FileNamePart( i_rName );
  }
  std::string Label = i_rDeviceURN;
  Label.erase( std::remove( Label.begin(), Label.end(), ':' ), Label.end() );
  return Label;
}

VCaptureTargets::VCaptureTargets( std::shared_ptr<IDataStore> i_pDataStore ) : m_pDataStore( std::move( i_pDataStore ) ) {}

void VCaptureTargets::Configure( VCaptureTargetOptions i_Options )
{
  boost::lock_guard<boost::mutex> Lock( m_Mutex );
  m_Options = std::move( i_Options );
}

std::vector<int32_t> VCaptureTargets::GetContainers( const std::string& i_rDeviceURN )
{
  const VDataReader Reader( *m_pDataStore );
  const auto Path = DeviceSchemas::VideoContainer( DeviceSchemas::VideoInput::Path( i_rDeviceURN ) );
  return { ReadOr( Reader, Path, KVZ::IVideoContainer::ETVID ) };
}

VCaptureTarget VCaptureTargets::MakeTarget( const std::string& i_rName, const std::string& i_rDeviceURN, int32_t i_Container ) const
{
  const VDataPath Device = DeviceSchemas::VideoInput::Path( i_rDeviceURN );
  VCaptureTarget Target;
  {
    const VDataReader Reader( *m_pDataStore );
    Target.m_DeviceLabel = MakeDeviceLabel( i_rDeviceURN, ReadOr( Reader, DeviceSchemas::Name( Device ), std::string() ) );
    Target.m_VideoPayload = ReadOr( Reader, DeviceSchemas::VideoPayload( Device ), KVZ::IVideoPayload::EUncompressed );
    Target.m_AudioPayload = ReadOr( Reader, DeviceSchemas::AudioPayload( Device ), KVZ::IAudioPayload::EUncompressed );
  }
  Target.m_Container = i_Container;
  Target.m_BaseName = FileNamePart( i_rName );
  Target.m_Extension = KVZ::GetFileExtension( static_cast<KVZ::IVideoContainer::Enum>( i_Container ) );
  boost::lock_guard<boost::mutex> Lock( m_Mutex );
  Target.m_Folder = m_Options.m_Folder;
  if( IsSequence( Target ) && !Target.m_Folder.empty() )
  {
    Target.m_Folder = ( boost::filesystem::path( Target.m_Folder ) / Stem( Target ) ).string();
  }
  Target.m_AudioChannels = ChannelsOf( i_Container, m_Options.m_AudioChannels );
  if( Target.m_VideoPayload == KVZ::IVideoPayload::EUncompressed )
  {
    Target.m_PixelFormat = m_Options.m_PixelFormat;
  }
  Target.m_JPEGQuality = m_Options.m_JPEGQuality;
  Target.m_bBurnInTimecode = m_Options.m_bBurnInTimecode;
  Target.m_Converter = m_Options.m_Converter;
  Target.m_bCorrectLens = m_Options.m_bCorrectLens;
  Target.m_Lens = m_Options.m_Lens;
  return Target;
}

bool VCaptureTargets::MayOverwrite() const
{
  boost::lock_guard<boost::mutex> Lock( m_Mutex );
  return m_Options.m_bOverwrite;
}

std::string VCaptureTargets::WhyRefused( const VCaptureTarget& i_rTarget ) const
{
  if( i_rTarget.m_Folder.empty() )
  {
    return "There is no folder for captures.";
  }
  boost::system::error_code Error;
  const std::string Path = TakenPath( i_rTarget );
  const boost::filesystem::file_type Type = boost::filesystem::status( Path, Error ).type();
  if( Type == boost::filesystem::file_not_found )
  {
    return {};
  }
  if( Type == boost::filesystem::status_error )
  {
    return "The file \"" + Path + "\" cannot be made: " + Error.message() + ".";
  }
  if( !IsSequence( i_rTarget ) )
  {
    return MayOverwrite() ? "" : "The file \"" + Path + "\" is there already; --overwrite replaces it.";
  }
  if( Type != boost::filesystem::directory_file )
  {
    return "The images need the folder \"" + Path + "\", and a file of that name is there.";
  }
  const bool bFree = MayOverwrite() || boost::filesystem::is_empty( Path, Error );
  return bFree ? "" : "The folder \"" + Path + "\" is not empty; --overwrite replaces the images in it.";
}

bool VCaptureTargets::GetTarget( const KVZ::ICaptureHeader& i_rHeader, const std::string& i_rDeviceURN, int32_t i_Container,
  VCaptureTarget& o_rTarget )
{
  VCaptureTarget Target = MakeTarget( i_rHeader.m_Name, i_rDeviceURN, i_Container );
  const std::string Refusal = WhyRefused( Target );
  if( !Refusal.empty() )
  {
    KVZ_LOG_ERROR( "Capture", "%1%", Refusal );
    return false;
  }
  if( IsSequence( Target ) )
  {
    RemoveSequence( Target );
  }
  o_rTarget = std::move( Target );
  return true;
}

std::string VCaptureTargets::WhyRefused( const std::string& i_rName, const std::string& i_rDeviceURN )
{
  for( const int32_t Container : GetContainers( i_rDeviceURN ) )
  {
    std::string Refusal = WhyRefused( MakeTarget( i_rName, i_rDeviceURN, Container ) );
    if( !Refusal.empty() )
    {
      return Refusal;
    }
  }
  return {};
}

void VCaptureTargets::GetFolderAliases( std::vector<std::string>& o_rAliases ) { o_rAliases = { "Default" }; }

void VCaptureTargets::OnFileFinished( const VCaptureFileReport& i_rReport )
{
  boost::lock_guard<boost::mutex> Lock( m_Mutex );
  m_Reports.push_back( i_rReport );
}

std::vector<VCaptureFileReport> VCaptureTargets::GetReports( KVZ::VCaptureSessionId i_Id ) const
{
  std::vector<VCaptureFileReport> Reports;
  boost::lock_guard<boost::mutex> Lock( m_Mutex );
  std::copy_if( m_Reports.begin(), m_Reports.end(), std::back_inserter( Reports ),
    [&]( const VCaptureFileReport& i_rReport ) { return i_rReport.m_CaptureSessionId == i_Id; } );
  return Reports;
}

}
