#include "bench/Measuring.h"

#include <malloc.h>
#include <time.h>

#include <algorithm>
#include <atomic>
#include <cerrno>
#include <cstdlib>
#include <new>

namespace
{

constexpr int64_t NanosecondsPerSecond = 1000000000;

std::atomic<uint64_t> s_Allocations{ 0 };
std::atomic<uint64_t> s_HeapBytes{ 0 };
std::atomic<uint64_t> s_PeakHeapBytes{ 0 };

void* CountedAllocation( void* i_pMemory )
{
  s_Allocations.fetch_add( 1, std::memory_order_relaxed );
  if( !i_pMemory )
  {
    throw std::bad_alloc();
  }
  const uint64_t Size = malloc_usable_size( i_pMemory );
  const uint64_t Now = s_HeapBytes.fetch_add( Size, std::memory_order_relaxed ) + Size;
  uint64_t Peak = s_PeakHeapBytes.load( std::memory_order_relaxed );
  while( Now > Peak && !s_PeakHeapBytes.compare_exchange_weak( Peak, Now, std::memory_order_relaxed ) )
  {
  }
  return i_pMemory;
}

void Free( void* i_pMemory )
{
  s_HeapBytes.fetch_sub( malloc_usable_size( i_pMemory ), std::memory_order_relaxed );
  std::free( i_pMemory );
}

int64_t ReadNanoseconds( clockid_t i_Clock )
{
  timespec Time = {};
  clock_gettime( i_Clock, &Time );
  return int64_t{ Time.tv_sec } * NanosecondsPerSecond + Time.tv_nsec;
}

}

// The array and nothrow forms end here too.
void* operator new( size_t i_Size ) { return CountedAllocation( std::malloc( i_Size ) ); }

void* operator new( size_t i_Size, std::align_val_t i_Alignment )
{
  const auto Alignment = static_cast<size_t>( i_Alignment );
  return CountedAllocation( std::aligned_alloc( Alignment, ( i_Size + Alignment - 1 ) / Alignment * Alignment ) );
}

void operator delete( void* i_pMemory ) noexcept { Free( i_pMemory ); }

void operator delete( void* i_pMemory, size_t ) noexcept { Free( i_pMemory ); }

void operator delete( void* i_pMemory, std::align_val_t ) noexcept { Free( i_pMemory ); }

void operator delete( void* i_pMemory, size_t, std::align_val_t ) noexcept { Free( i_pMemory ); }

double Median( std::vector<double> i_Values )
{
  if( i_Values.empty() )
  {
    return 0.0;
  }
  const auto Middle = i_Values.begin() + static_cast<std::ptrdiff_t>( i_Values.size() / 2 );
  std::nth_element( i_Values.begin(), Middle, i_Values.end() );
  if( i_Values.size() % 2 != 0 )
  {
    return *Middle;
  }
  return ( *Middle + *std::max_element( i_Values.begin(), Middle ) ) / 2.0;
}

double ProcessorSeconds() { return static_cast<double>( ReadNanoseconds( CLOCK_PROCESS_CPUTIME_ID ) ) * 1e-9; }

double ThreadSeconds() { return static_cast<double>( ReadNanoseconds( CLOCK_THREAD_CPUTIME_ID ) ) * 1e-9; }

uint64_t CountAllocations() { return s_Allocations.load( std::memory_order_relaxed ); }

uint64_t CountHeapBytes() { return s_HeapBytes.load( std::memory_order_relaxed ); }

uint64_t CountPeakHeapBytes() { return s_PeakHeapBytes.load( std::memory_order_relaxed ); }

void ResetPeakHeapBytes() { s_PeakHeapBytes.store( CountHeapBytes(), std::memory_order_relaxed ); }

int64_t NowNanoseconds() { return ReadNanoseconds( CLOCK_MONOTONIC ); }

void WaitUntil( int64_t i_Nanoseconds )
{
  const timespec Time = { i_Nanoseconds / NanosecondsPerSecond, i_Nanoseconds % NanosecondsPerSecond };
  while( clock_nanosleep( CLOCK_MONOTONIC, TIMER_ABSTIME, &Time, nullptr ) == EINTR )
  {
  }
}
