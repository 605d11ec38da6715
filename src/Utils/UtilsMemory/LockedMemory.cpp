#include "Utils/UtilsMemory/LockedMemory.h"

#include "StageCoreRuntime/GlobalLog.h"

#include <sys/mman.h>
#include <sys/resource.h>

#include <algorithm>
#include <atomic>
#include <cerrno>

namespace UtilsMemory
{

namespace
{

constexpr int MaxLockMessages = 10;   // in the process's life: a refusal repeats at every allocation

void LogLockFailure( int i_Error )
{
  static std::atomic<int> s_Messages{ 0 };
  if( s_Messages.fetch_add( 1 ) < MaxLockMessages )
  {
    KVZ_LOG_ERROR( "UtilsMemory", "Virtual lock failed with error %d (= 0x%x).  Consider increasing working set size.", i_Error, i_Error );
  }
}

}

bool SetWorkingSet( size_t i_Minimum, size_t i_Maximum )
{
  rlimit Limit{};
  bool bDone = getrlimit( RLIMIT_MEMLOCK, &Limit ) == 0;
  if( bDone && Limit.rlim_cur < i_Maximum )
  {
    const rlimit Raised{ i_Maximum, std::max<rlim_t>( i_Maximum, Limit.rlim_max ) };
    bDone = setrlimit( RLIMIT_MEMLOCK, &Raised ) == 0;
  }
  if( !bDone )
  {
    const int Error = errno;
    KVZ_LOG_ERROR( "UtilsMemory", "Working set could not be set to (%d - %d) MiB: error %d.", i_Minimum >> 20, i_Maximum >> 20, Error );
    Limit.rlim_cur = Limit.rlim_max;   // as far as every user may go
    setrlimit( RLIMIT_MEMLOCK, &Limit );
  }
  return bDone;
}

void* AllocateLocked( size_t i_Size )
{
  void* pMemory = mmap( nullptr, i_Size, PROT_READ | PROT_WRITE, MAP_PRIVATE | MAP_ANONYMOUS, -1, 0 );
  if( pMemory == MAP_FAILED ) return nullptr;
  if( mlock( pMemory, i_Size ) != 0 ) LogLockFailure( errno );
  return pMemory;
}

void FreeLocked( void* i_pMemory, size_t i_Size )
{
  if( i_pMemory ) munmap( i_pMemory, i_Size );
}

}
