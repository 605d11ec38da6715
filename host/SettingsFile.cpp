#include "host/SettingsFile.h"

#include "StageCoreDataStore/DataStorePersistence.h"
#include "host/DataStore.h"
#include "host/FileReplacement.h"
#include "host/SettingsDocument.h"

#include <boost/filesystem/operations.hpp>
#include <boost/filesystem/path.hpp>
#include <nlohmann/json.hpp>

#include <cstdlib>
#include <functional>

#include <pwd.h>
#include <unistd.h>

using VJson = nlohmann::ordered_json;
namespace Options = DataStorePersistence::Options;

namespace StageHost
{

namespace
{

// A user's own write is what is kept, so a file never holds what a device alone may say.
constexpr uint32_t KeptValues = Options::CopyForms | Options::SkipReadOnly | Options::SkipNotSerialized;

std::string HomeFolder()
{
  const char* const pHome = std::getenv( "HOME" );
  if( pHome && *pHome != '\0' )
  {
    return pHome;
  }
  const passwd* const pUser = getpwuid( geteuid() );
  return pUser && pUser->pw_dir ? pUser->pw_dir : "";
}

constexpr int MostLinks = 40;   // as the system itself has it

// The file itself where the path is a link to it, be it one that is not there yet, so that the link stays one and all agree on the lock.
std::string FollowLinks( const std::string& i_rPath )
{
  boost::system::error_code Error;
  boost::filesystem::path Path( i_rPath );
  for( int Links = 0; Links < MostLinks && boost::filesystem::symlink_status( Path, Error ).type() == boost::filesystem::symlink_file; ++Links )
  {
    Path = boost::filesystem::absolute( boost::filesystem::read_symlink( Path, Error ), Path.parent_path() );
  }
  const boost::filesystem::path Folder = boost::filesystem::canonical( Path.parent_path(), Error );
  return Error ? Path.string() : ( Folder / Path.filename() ).string();
}

std::string Named( const std::string& i_rPath ) { return "The settings file \"" + i_rPath + "\""; }

// What is in the file, or the reason why that cannot be said
struct VContents
{
  bool m_bUsable = true;
  bool m_bDamaged = false;
  std::string m_Reason;
  VJson m_Document = VJson::object();   // empty where there is no file
};

VContents ReadContents( const std::string& i_rPath )
{
  VContents Contents;
  std::string Text;
  const EFileRead Result = ReadWholeFile( i_rPath, Text, Contents.m_Reason );
  if( Result == EFileRead::Failed )
  {
    Contents.m_bUsable = false;
    Contents.m_Reason = Named( i_rPath ) + " cannot be read (" + Contents.m_Reason + ")";
  }
  if( Result != EFileRead::Read )
  {
    return Contents;
  }
  const ESettingsText Kind = ParseSettings( Text, Contents.m_Document, Contents.m_Reason );
  Contents.m_bUsable = Kind == ESettingsText::Good;
  Contents.m_bDamaged = Kind == ESettingsText::Damaged;
  if( !Contents.m_bUsable )
  {
    Contents.m_Reason = Named( i_rPath ) + ( Contents.m_bDamaged ? " is damaged (" : " cannot be used (" ) + Contents.m_Reason + ")";
  }
  return Contents;
}

bool MakeFolder( const std::string& i_rPath, std::string& o_rReason )
{
  const boost::filesystem::path Folder = boost::filesystem::path( i_rPath ).parent_path();
  boost::system::error_code Error;
  if( !Folder.empty() )
  {
    boost::filesystem::create_directories( Folder, Error );
  }
  o_rReason = Error ? Error.message() : "";
  return !Error;
}

bool Lock( const std::string& i_rPath, VFileLock& o_rLock, std::string& o_rReason ) { return o_rLock.Acquire( i_rPath + ".lock", o_rReason ); }

// Another process may have done so in between, and written a good one: then that one is read.
VContents SetAside( const std::string& i_rPath, std::string& o_rMessage )
{
  VFileLock FileLock;
  std::string Reason;
  VContents Contents = ReadContents( i_rPath );
  const bool bLocked = Lock( i_rPath, FileLock, Reason );
  if( bLocked )
  {
    Contents = ReadContents( i_rPath );
  }
  if( Contents.m_bDamaged )
  {
    const std::string Aside = bLocked ? SetFileAside( i_rPath, Reason ) : std::string();
    o_rMessage = Contents.m_Reason +
      ( Aside.empty() ? " and cannot be set aside: " + Reason + ". Nothing in it is used."
                      : "; it has been set aside as \"" + Aside + "\", and nothing in it is used." );
  }
  return Contents;
}

bool ReadToChange( const std::string& i_rPath, VJson& o_rDocument, std::string& o_rError )
{
  VContents Contents = ReadContents( i_rPath );
  if( !Contents.m_bUsable )
  {
    o_rError = Contents.m_Reason + "; it is not written over.";
    return false;
  }
  o_rDocument = std::move( Contents.m_Document );
  return true;
}

// What is written is what the others have written so far, changed.
bool Change( const std::string& i_rPath, const std::function<bool( VJson&, std::string& )>& i_rChange, std::string& o_rError )
{
  if( i_rPath.empty() )
  {
    o_rError = "There is no file to keep settings in.";
    return false;
  }
  const std::string Path = FollowLinks( i_rPath );
  VJson Before;
  if( !ReadToChange( Path, Before, o_rError ) )
  {
    return false;   // before anything is made beside it
  }
  VFileLock FileLock;
  std::string Reason;
  if( !MakeFolder( Path, Reason ) )
  {
    o_rError = "The folder of the settings file \"" + i_rPath + "\" cannot be made: " + Reason + ".";
    return false;
  }
  if( !Lock( Path, FileLock, Reason ) )
  {
    o_rError = Named( i_rPath ) + " cannot be locked: " + Reason + ".";
    return false;
  }
  if( !ReadToChange( Path, Before, o_rError ) )
  {
    return false;
  }
  VJson Document = Before;
  if( !i_rChange( Document, o_rError ) )
  {
    return false;
  }
  if( Document != Before && !ReplaceFile( Path, Document.dump( 2 ) + "\n", Reason ) )
  {
    o_rError = Named( i_rPath ) + " cannot be written: " + Reason + ". It is as it was.";
    return false;
  }
  return true;
}

}

std::string DefaultSettingsPath()
{
  const char* const pConfig = std::getenv( "XDG_CONFIG_HOME" );
  boost::filesystem::path Folder( pConfig ? pConfig : "" );
  if( !Folder.is_absolute() )
  {
    const std::string Home = HomeFolder();
    if( Home.empty() )
    {
      return {};
    }
    Folder = boost::filesystem::path( Home ) / ".config";
  }
  return ( Folder / "stagehost" / "settings.json" ).string();
}

std::vector<std::string> VSettingsFile::Restore( IDataStore& io_rDataStore )
{
  if( m_Path.empty() )
  {
    return {};
  }
  VContents Contents = ReadContents( m_Path );
  if( Contents.m_bDamaged )
  {
    std::string Message;
    Contents = SetAside( FollowLinks( m_Path ), Message );
    if( !Message.empty() )
    {
      return { Message };
    }
  }
  if( !Contents.m_bUsable )
  {
    return { Contents.m_Reason + "; nothing in it is used." };
  }
  VDataStore Saved;
  std::vector<std::string> Messages;
  {
    VDataVerifyWriter Writer( Saved );
    Messages = ReadSettings( Contents.m_Document, Writer );
  }
  const VDataPath Root;
  VDataVerifyWriter Writer( io_rDataStore );
  if( !DataStorePersistence::CopyValues( { VDataVerifyReader( Saved ), Root }, { Writer, Root }, KeptValues ) )
  {
    Messages.push_back( Named( m_Path ) + " cannot be used to the end." );
  }
  return Messages;
}

bool VSettingsFile::Save( IDataStore& i_rDataStore, const std::vector<VDataPath>& i_rPaths, std::string& o_rError )
{
  VDataStore Kept;
  {
    VDataVerifyWriter Writer( Kept );
    const VDataVerifyReader Reader( i_rDataStore );
    for( const VDataPath& rPath : i_rPaths )
    {
      if( !DataStorePersistence::CopyValue( { Reader, rPath }, { Writer, rPath }, KeptValues ) )
      {
        o_rError = "The value of " + rPath.ToString() + " cannot be read.";
        return false;
      }
    }
  }
  const VDataVerifyReader Reader( Kept );
  try
  {
    return Change(
      m_Path, [&]( VJson& io_rDocument, std::string& o_rReason ) { return WriteSettings( Reader, io_rDocument, o_rReason ); }, o_rError );
  }
  catch( const VJson::exception& )
  {
    o_rError = "A text that is not UTF-8 cannot be kept in a file.";   // the document is text of its own
    return false;
  }
}

bool VSettingsFile::Remove( const std::vector<VDataPath>& i_rPaths, std::string& o_rError )
{
  const auto RemoveAll = [&]( VJson& io_rDocument, std::string& )
  {
    RemoveSettings( i_rPaths, io_rDocument );
    return true;
  };
  return Change( m_Path, RemoveAll, o_rError );
}

std::vector<VDataPath> VSettingsFile::GetPaths() const
{
  return m_Path.empty() ? std::vector<VDataPath>() : GetSettingPaths( ReadContents( m_Path ).m_Document );
}

}
