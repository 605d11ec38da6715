#include "Utils/UtilsMemory/LockedMemory.h"

#include "tests/support/LogCapture.h"

#include <gtest/gtest.h>

#include <sys/resource.h>

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

TEST( LockedMemory, WorkingSetRaisesTheLimitAsFarAsItMay )
{
  rlimit Former{};
  ASSERT_EQ( getrlimit( RLIMIT_MEMLOCK, &Former ), 0 );
  const size_t Within = Former.rlim_max == RLIM_INFINITY ? size_t{ 64 } << 20 : Former.rlim_max;
  EXPECT_TRUE( UtilsMemory::SetWorkingSet( 1 << 20, Within ) );
  rlimit Raised{};
  ASSERT_EQ( getrlimit( RLIMIT_MEMLOCK, &Raised ), 0 );
  EXPECT_GE( Raised.rlim_cur, Within );
  ASSERT_EQ( setrlimit( RLIMIT_MEMLOCK, &Former ), 0 );
}

}
