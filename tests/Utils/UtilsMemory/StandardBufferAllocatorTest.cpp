#include "Utils/UtilsMemory/StandardBufferAllocator.h"
#include "tests/support/LogCapture.h"
#include "tests/support/Threads.h"

#include <gtest/gtest.h>

#include <cstring>
#include <limits>
#include <vector>

using KVZ::IStandardBufferAllocator;

TEST( StandardBufferAllocator, AThreadGetsBackWhatItReleasedLast )
{
  IStandardBufferAllocator Allocator( "Test" );
  const uint8_t* pMemory = nullptr;
  {
    const auto pOther = Allocator.Allocate( 10 );
    pMemory = Allocator.Allocate( 1000 )->Data();
  }
  const auto pNewest = Allocator.Allocate( 10 );
  const auto pBuffer = Allocator.Allocate( 500 );
  EXPECT_EQ( pBuffer->Data(), pMemory ) << "its memory is kept";
  EXPECT_EQ( pBuffer->Size(), 500u );
}

// A new buffer is empty, so one that still holds what was put into it is one of those released.
TEST( StandardBufferAllocator, BuffersThatOneThreadReleasesReachTheOthers )
{
  constexpr size_t Count = 64;
  constexpr uint8_t Mark = 0x5A;
  IStandardBufferAllocator Allocator( "Test" );
  std::vector<std::shared_ptr<KVZ::IBuffer>> Buffers;
  const auto MarkAll = [&]( uint32_t )
  {
    while( Buffers.size() < Count )
    {
      Buffers.push_back( Allocator.Allocate( 1 ) );
      Buffers.back()->Data()[0] = Mark;
    }
    Buffers.clear();
  };
  TestSupport::RunOnThreads( 1, MarkAll );
  for( size_t Index = 0; Index < 16; ++Index )
  {
    Buffers.push_back( Allocator.Allocate( 1 ) );
    EXPECT_EQ( Buffers.back()->Data()[0], Mark ) << Index;
  }
}

TEST( StandardBufferAllocator, BuffersOutliveTheirAllocatorAndMayBeReleasedByAnyThread )
{
  std::vector<std::shared_ptr<KVZ::IBuffer>> Buffers;
  {
    IStandardBufferAllocator Allocator( "Test" );
    const auto Use = [&Allocator]( uint32_t i_Thread )
    {
      for( size_t Round = 0; Round < 2000; ++Round )
      {
        const size_t Size = 1 + Round % 300;
        const auto pBuffer = Allocator.Allocate( Size );
        std::memset( pBuffer->Data(), static_cast<int>( i_Thread ), Size );
        EXPECT_EQ( pBuffer->Data()[Size - 1], i_Thread );
      }
    };
    TestSupport::RunOnThreads( 4, Use );
    for( size_t Count = 0; Count < 40; ++Count )
    {
      Buffers.push_back( Allocator.Allocate( 100 ) );
    }
  }
  Buffers.clear();
}

TEST( StandardBufferAllocator, ASizeThatCannotBeHadIsAnEmptyPointerAndAMessage )
{
  const TestSupport::VLogCapture Log( "UtilsMemory" );
  IStandardBufferAllocator Allocator( "Test" );
  EXPECT_EQ( Allocator.Allocate( std::numeric_limits<size_t>::max() ), nullptr );
  EXPECT_EQ( Log.Texts(), std::vector<std::string>{ "Could not create buffer of size 18446744073709551615 bytes." } );
}
