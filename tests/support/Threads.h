// Threads of a test.
#pragma once

#include <boost/thread/thread.hpp>

#include <cstdint>

namespace TestSupport
{

// Calls the function with 0, 1 and so on, each on a thread of its own, and waits for all of them.
template<class TFunction>
void RunOnThreads( uint32_t i_Count, const TFunction& i_rFunction )
{
  boost::thread_group Threads;
  for( uint32_t Number = 0; Number < i_Count; ++Number )
  {
    Threads.create_thread( [&i_rFunction, Number] { i_rFunction( Number ); } );
  }
  Threads.join_all();
}

// Returns when the condition holds, asking it again and again. For what other threads bring about and tell nobody.
template<class TCondition>
void WaitUntil( const TCondition& i_rCondition )
{
  while( !i_rCondition() )
  {
    boost::this_thread::yield();
  }
}

}
