// Lets one thread sleep until another one has something for it. A thin layer over the system's condition variable, because those of the
// libraries bring a second mutex of their own, which costs the threads of a graph one more change of context for each state.
#pragma once

#include "StageCoreRuntime/ThreadAnnotations.h"

#include <boost/thread/mutex.hpp>

#include <cstdint>
#include <ctime>

#include <pthread.h>

namespace StageHost
{

class VFlowCondition
{
public:
  VFlowCondition()
  {
    pthread_condattr_t Attributes;
    pthread_condattr_init( &Attributes );
    pthread_condattr_setclock( &Attributes, CLOCK_MONOTONIC );
    pthread_cond_init( &m_Condition, &Attributes );
    pthread_condattr_destroy( &Attributes );
  }
  ~VFlowCondition() { pthread_cond_destroy( &m_Condition ); }
  VFlowCondition( const VFlowCondition& ) = delete;
  VFlowCondition& operator=( const VFlowCondition& ) = delete;

  // Gives the mutex up meanwhile. May wake up without a reason.
  void Wait( boost::mutex& io_rMutex ) REQUIRES( io_rMutex ) { pthread_cond_wait( &m_Condition, io_rMutex.native_handle() ); }
  // False when this time of the monotonic clock has come.
  bool WaitUntil( boost::mutex& io_rMutex, const timespec& i_rTime ) REQUIRES( io_rMutex )
  {
    return pthread_cond_timedwait( &m_Condition, io_rMutex.native_handle(), &i_rTime ) == 0;
  }
  // With or without the mutex; without it the other thread need not wait for it.
  void Notify() { pthread_cond_broadcast( &m_Condition ); }

private:
  pthread_cond_t m_Condition;
};

// So many milliseconds from now.
inline timespec MonotonicTimeAfter( uint32_t i_Milliseconds )
{
  constexpr long NanosecondsPerSecond = 1000000000;
  timespec Time = {};
  clock_gettime( CLOCK_MONOTONIC, &Time );
  Time.tv_sec += static_cast<time_t>( i_Milliseconds / 1000 );
  Time.tv_nsec += static_cast<long>( i_Milliseconds % 1000 ) * 1000000;
  if( Time.tv_nsec >= NanosecondsPerSecond )
  {
    Time.tv_nsec -= NanosecondsPerSecond;
    ++Time.tv_sec;
  }
  return Time;
}

}
