#include "Utils/UtilsMemory/PooledBufferAllocator.h"
#include "tests/support/LogCapture.h"

#include <gtest/gtest.h>

#include <boost/thread/thread.hpp>

#include <cstring>
#include <limits>
#include <new>

using UtilsMemory::VPooledBufferAllocator;

TEST( PooledBufferAllocator, GivesReturnedBuffersOutAgainByTheirRoom )
{
  VPooledBufferAllocator Allocator( "Test" );
  const uint8_t* pLarge = nullptr;
  const uint8_t* pSmall = nullptr;
  {
    const auto pLargeBuffer = Allocator.AllocateBuffer( 1000 );
    const auto pSmallBuffer = Allocator.AllocateBuffer( 10 );
    pLarge = pLargeBuffer->Data();
    pSmall = pSmallBuffer->Data();
  }
  const auto pFirst = Allocator.AllocateBuffer( 5 );
  const auto pSecond = Allocator.AllocateBuffer( 5 );
  const auto pThird = Allocator.AllocateBuffer( 5 );
  EXPECT_EQ( pFirst->Data(), pSmall );
  EXPECT_EQ( pSecond->Data(), pLarge );
  EXPECT_EQ( pSecond->Size(), 5u );
  EXPECT_NE( pThird->Data(), pSmall );
}

TEST( PooledBufferAllocator, BuffersOutliveTheirAllocatorAndMayBeReleasedByAnyThread )
{
  std::vector<std::shared_ptr<KVZ::IBuffer>> Buffers;
  {
    VPooledBufferAllocator Allocator( "Test" );
    boost::thread_group Threads;
    for( uint8_t Thread = 0; Thread < 4; ++Thread )
    {
      Threads.create_thread(
        [&Allocator, Thread]
        {
          for( size_t Round = 0; Round < 2000; ++Round )
          {
            const size_t Size = 1 + Round % 300;
            const auto pBuffer = Allocator.AllocateBuffer( Size );
            std::memset( pBuffer->Data(), Thread, Size );
            EXPECT_EQ( pBuffer->Data()[Size - 1], Thread );
          }
        } );
    }
    Threads.join_all();
    for( size_t Count = 0; Count < 40; ++Count )
    {
      Buffers.push_back( Allocator.AllocateBuffer( 100 ) );
    }
  }
  Buffers.clear();
}

TEST( PooledBufferAllocator, ASizeThatCannotBeHadIsBadAllocWithAMessage )
{
  const TestSupport::VLogCapture Log( "UtilsMemory" );
  VPooledBufferAllocator Allocator( "Test" );
  EXPECT_THROW( Allocator.AllocateBuffer( std::numeric_limits<size_t>::max() ), std::bad_alloc );
  EXPECT_EQ( Log.Texts(), std::vector<std::string>{ "Could not create buffer of size 18446744073709551615 bytes." } );
}
