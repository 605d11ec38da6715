#include "bench/Machine.h"

#include <boost/format.hpp>

#include <sys/sysinfo.h>
#include <sys/utsname.h>
#include <sys/vfs.h>

#include <fstream>
#include <thread>

namespace
{

struct VFileSystemRow
{
  long m_Magic;
  const char* m_pName;
};
constexpr VFileSystemRow FileSystems[] = { { 0xEF53, "ext4" }, { 0x58465342, "xfs" }, { 0x9123683E, "btrfs" }, { 0x01021994, "tmpfs" },
  { 0x794C7630, "overlayfs" } };

std::string ProcessorModel()
{
  std::ifstream Info( "/proc/cpuinfo" );
  for( std::string Line; std::getline( Info, Line ); )
  {
    const size_t Colon = Line.find( ": " );
    if( Line.compare( 0, 10, "model name" ) == 0 && Colon != std::string::npos )
    {
      return Line.substr( Colon + 2 );
    }
  }
  return "unknown";
}

std::string FileSystemOf( const std::string& i_rFolder )
{
  struct statfs Status = {};
  if( statfs( i_rFolder.c_str(), &Status ) != 0 )
  {
    return "unknown file system";
  }
  for( const VFileSystemRow& rRow : FileSystems )
  {
    if( rRow.m_Magic == static_cast<long>( Status.f_type ) )
    {
      return rRow.m_pName;
    }
  }
  return ( boost::format( "file system 0x%X" ) % Status.f_type ).str();
}

}

std::string DescribeMachine( const std::string& i_rFolder )
{
  utsname Kernel = {};
  uname( &Kernel );
  struct sysinfo Memory = {};
  sysinfo( &Memory );
  const double GiB = static_cast<double>( Memory.totalram ) * Memory.mem_unit / 1073741824.0;
  return ( boost::format( "processor  %1%, %2% cores\nmemory     %3$.1f GiB\nkernel     %4% %5%\nfiles      %6%, %7%\n" ) % ProcessorModel() %
    std::thread::hardware_concurrency() % GiB % Kernel.sysname % Kernel.release % i_rFolder % FileSystemOf( i_rFolder ) )
    .str();
}
