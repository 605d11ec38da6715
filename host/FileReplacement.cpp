#include "host/FileReplacement.h"

#include <boost/filesystem/operations.hpp>
#include <boost/filesystem/path.hpp>

#include <cerrno>
#include <system_error>

#include <fcntl.h>
#include <sys/file.h>
#include <sys/stat.h>
#include <unistd.h>

namespace StageHost
{

namespace
{

constexpr mode_t AllMayReadAndWrite = 0666;   // less what the user's mask takes
constexpr mode_t Permissions = 07777;

std::string LastReason() { return std::generic_category().message( errno ); }

class VHandle
{
public:
  explicit VHandle( int i_Handle ) : m_Handle( i_Handle ) {}
  ~VHandle() { Close(); }
  VHandle( const VHandle& ) = delete;
  VHandle& operator=( const VHandle& ) = delete;

  bool IsOpen() const { return m_Handle >= 0; }
  int Get() const { return m_Handle; }
  bool Close()
  {
    const int Handle = m_Handle;
    m_Handle = -1;
    return Handle < 0 || close( Handle ) == 0;
  }

private:
  int m_Handle;
};

bool WriteAll( int i_Handle, const std::string& i_rText )
{
  for( size_t Written = 0; Written < i_rText.size(); )
  {
    const ssize_t Count = write( i_Handle, i_rText.data() + Written, i_rText.size() - Written );
    if( Count < 0 && errno != EINTR )
    {
      return false;
    }
    Written += static_cast<size_t>( Count > 0 ? Count : 0 );
  }
  return true;
}

bool ReadAll( int i_Handle, std::string& o_rText )
{
  char Bytes[65536];
  o_rText.clear();
  for( ssize_t Count = 1; Count != 0; )
  {
    Count = read( i_Handle, Bytes, sizeof( Bytes ) );
    if( Count < 0 && errno != EINTR )
    {
      return false;
    }
    o_rText.append( Bytes, static_cast<size_t>( Count > 0 ? Count : 0 ) );
  }
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
  VHandle File( open( i_rPath.c_str(), O_WRONLY | O_CREAT | O_EXCL | O_CLOEXEC, AllMayReadAndWrite ) );
  struct stat Status = {};
  if( !File.IsOpen() || ( stat( i_rLike.c_str(), &Status ) == 0 && !TakeOver( File.Get(), Status ) ) )
  {
    return false;
  }
  return WriteAll( File.Get(), i_rText ) && fsync( File.Get() ) == 0 && File.Close();
}

// So that the name is on the disk too. Not every file system can do that for a folder.
void SynchroniseFolder( const std::string& i_rPath )
{
  const std::string Folder = boost::filesystem::path( i_rPath ).parent_path().string();
  const VHandle Handle( open( Folder.empty() ? "." : Folder.c_str(), O_RDONLY | O_DIRECTORY | O_CLOEXEC ) );
  if( Handle.IsOpen() )
  {
    fsync( Handle.Get() );
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
  const VHandle File( open( i_rPath.c_str(), O_RDONLY | O_CLOEXEC ) );
  if( !File.IsOpen() || !ReadAll( File.Get(), o_rText ) )
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

VFileLock::~VFileLock()
{
  if( m_Handle >= 0 )
  {
    close( m_Handle );
  }
}

bool VFileLock::Acquire( const std::string& i_rPath, std::string& o_rReason )
{
  m_Handle = open( i_rPath.c_str(), O_RDWR | O_CREAT | O_CLOEXEC, AllMayReadAndWrite );
  if( m_Handle < 0 || flock( m_Handle, LOCK_EX ) != 0 )
  {
    o_rReason = LastReason();
    return false;
  }
  return true;
}

}
