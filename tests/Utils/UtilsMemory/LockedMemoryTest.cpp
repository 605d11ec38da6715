#include "Utils/UtilsMemory/LockedMemory.h"

#include "tests/support/LogCapture.h"

#include <gtest/gtest.h>

#include <sys/resource.h>
#include <unistd.h>

#include <cstdlib>
#include <cstring>

namespace
{

// A refusal is logged, the memory is used all the same, and the log is not flooded.
TEST( LockedMemory, WorksWhereTheSystemRefusesToLock )
{
  rlimit Former{};
  ASSERT_EQ( getrlimit( RLIMIT_MEMLOCK, &Former ), 0 );
  const rlimit Little{ 0, Former.rlim_max };
  ASSERT_EQ( setrlimit( RLIMIT_MEMLOCK, &Little ), 0 );
  TestSupport::VLogCapture Log( "UtilsMemory" );
  constexpr size_t Size = 1 << 20;
  for( int Attempt = 0; Attempt < 50; ++Attempt )
  {
    void* pMemory = UtilsMemory::AllocateLocked( Size );
    ASSERT_NE( pMemory, nullptr );
    std::memset( pMemory, 1, Size );
    UtilsMemory::FreeLocked( pMemory, Size );
  }
  EXPECT_LE( Log.Lines().size(), 20u );
  ASSERT_EQ( setrlimit( RLIMIT_MEMLOCK, &Former ), 0 );
}

// In a process of its own, for a lowered limit cannot be raised again: exits with 0 where a user without rights gets what he may have.
[[noreturn]] void RaiseAsAUserWithoutRights()
{
  constexpr rlim_t Hard = 1 << 20;
  const rlimit Little{ 0, Hard };
  rlimit Raised{};
  const bool bPrepared = setrlimit( RLIMIT_MEMLOCK, &Little ) == 0 && ( geteuid() != 0 || setresuid( 65534, 65534, 65534 ) == 0 );
  const bool bWithin = bPrepared && UtilsMemory::SetWorkingSet( 4096, Hard / 2 ) && getrlimit( RLIMIT_MEMLOCK, &Raised ) == 0 &&
    Raised.rlim_cur == Hard / 2;
  const bool bRefused = bWithin && !UtilsMemory::SetWorkingSet( 4096, 8 * Hard );
  std::_Exit( bRefused && getrlimit( RLIMIT_MEMLOCK, &Raised ) == 0 && Raised.rlim_cur == Hard ? 0 : 1 );
}

TEST( LockedMemoryDeathTest, WorkingSetRaisesTheLimitAsFarAsItMay )
{
  EXPECT_EXIT( RaiseAsAUserWithoutRights(), testing::ExitedWithCode( 0 ), "Working set could not be set to \\(0 - 8\\) MiB: error 1" );
}

}
