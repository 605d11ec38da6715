#include "host/FileReplacement.h"

#include <boost/filesystem/operations.hpp>
#include <boost/filesystem/path.hpp>

#include <cerrno>
#include <system_error>

#include <sys/file.h>
#include <sys/stat.h>
#include <unistd.h>

namespace StageHost
{

namespace
{

using UtilsIO::EOpenMode;
using UtilsIO::VDescriptor;

constexpr mode_t Permissions = 07777;

std::string LastReason() { return std::generic_category().message( errno ); }

bool ReadAll( VDescriptor& io_rFile, std::string& o_rText )
{
  char Bytes[65536];
  size_t Count = 0;
  o_rText.clear();
  do {
    if( !io_rFile.Read( Bytes, sizeof( Bytes ), Count ) )
    {
      return false;
    }
    o_rText.append( Bytes, Count );
  } while( Count == sizeof( Bytes ) );
  return true;
}

// Owner and group are taken over where the system lets this user give them away.
bool TakeOver( int i_Handle, const struct stat& i_rStatus )
{
  constexpr auto Same = static_cast<uid_t>( -1 );
  static_cast<void>( fchown( i_Handle, i_rStatus.st_uid, Same ) == 0 );
  static_cast<void>( fchown( i_Handle, Same, i_rStatus.st_gid ) == 0 );
  return fchmod( i_Handle, i_rStatus.st_mode & Permissions ) == 0;
}

// A new file with the permissions of the one that it is to replace.
bool WriteNewFile( const std::string& i_rPath, const std::string& i_rLike, const std::string& i_rText )
{
  unlink( i_rPath.c_str() );   // what a killed program has left, or a link that would lead elsewhere
  VDescriptor File;
  struct stat Status = {};
  if( !File.Open( i_rPath, EOpenMode::CreateNew ) || ( stat( i_rLike.c_str(), &Status ) == 0 && !TakeOver( File.Handle(), Status ) ) )
  {
    return false;
  }
  return File.Write( i_rText.data(), i_rText.size() ) && fsync( File.Handle() ) == 0 && File.Close();
}

// So that the name is on the disk too. Not every file system can do that for a folder.
void SynchroniseFolder( const std::string& i_rPath )
{
  const std::string Folder = boost::filesystem::path( i_rPath ).parent_path().string();
  VDescriptor Names;
  if( Names.Open( Folder.empty() ? "." : Folder, EOpenMode::Read ) )
  {
    fsync( Names.Handle() );
  }
}

}

EFileRead ReadWholeFile( const std::string& i_rPath, std::string& o_rText, std::string& o_rReason )
{
  struct stat Status = {};
  if( stat( i_rPath.c_str(), &Status ) != 0 )
  {
    o_rReason = LastReason();
    return errno == ENOENT || errno == ENOTDIR ? EFileRead::Missing : EFileRead::Failed;
  }
  if( !S_ISREG( Status.st_mode ) )
  {
    o_rReason = "Not a plain file";
    return EFileRead::Failed;
  }
  VDescriptor File;
  if( !File.Open( i_rPath, EOpenMode::Read ) || !ReadAll( File, o_rText ) )
  {
    o_rReason = LastReason();
    return EFileRead::Failed;
  }
  return EFileRead::Read;
}

bool ReplaceFile( const std::string& i_rPath, const std::string& i_rText, std::string& o_rReason )
{
  const std::string New = i_rPath + ".new";
  if( !WriteNewFile( New, i_rPath, i_rText ) || rename( New.c_str(), i_rPath.c_str() ) != 0 )
  {
    o_rReason = LastReason();
    unlink( New.c_str() );
    return false;
  }
  SynchroniseFolder( i_rPath );
  return true;
}

std::string SetFileAside( const std::string& i_rPath, std::string& o_rReason )
{
  std::string Free = i_rPath + ".damaged";
  struct stat Status = {};
  for( int Number = 2; lstat( Free.c_str(), &Status ) == 0; ++Number )
  {
    Free = i_rPath + ".damaged" + std::to_string( Number );
  }
  if( errno != ENOENT || rename( i_rPath.c_str(), Free.c_str() ) != 0 )
  {
    o_rReason = LastReason();
    return {};
  }
  return Free;
}

bool VFileLock::Acquire( const std::string& i_rPath, std::string& o_rReason )
{
  if( !m_File.Open( i_rPath, UtilsIO::EOpenMode::CreateReadWrite ) || flock( m_File.Handle(), LOCK_EX ) != 0 )
  {
    o_rReason = LastReason();
    return false;
  }
  return true;
}

}
