// Medians, processor time, counted allocations and their bytes.
#pragma once

#include <cstdint>
#include <vector>

// 0 of nothing.
double Median( std::vector<double> i_Values );

// User and system time of this process, all its threads, in seconds.
double ProcessorSeconds();

// The same of the calling thread alone.
double ThreadSeconds();

// Calls of operator new in this process so far, all threads.
uint64_t CountAllocations();

// Bytes that operator new has given out and that are not freed, with what the allocator adds to round them up; and the most there were at
// once since the last reset.
uint64_t CountHeapBytes();
uint64_t CountPeakHeapBytes();
void ResetPeakHeapBytes();

// Nanoseconds of the monotonic clock.
int64_t NowNanoseconds();

// Sleeps until the monotonic clock has come there.
void WaitUntil( int64_t i_Nanoseconds );
