// A postal service whose queue runs only when a test says so, on the test's own thread.
#pragma once

#include "NotificationSystem/IPostalService.h"
#include "StageCoreRuntime/ThreadAnnotations.h"

#include <boost/thread/lock_guard.hpp>
#include <boost/thread/mutex.hpp>

#include <cstddef>
#include <deque>
#include <functional>
#include <utility>

namespace TestSupport
{
// Every operation may be called from any thread, also from inside a function that runs.
class VManualPostalService : public KVZ::IPostalService
{
public:
  void Post( std::function<void()> i_Function, unsigned int = 0 ) override
  {
    boost::lock_guard<boost::mutex> Lock( m_Mutex );
    m_Queue.push_back( std::move( i_Function ) );
  }

  // Runs the oldest function. False if the queue is empty.
  bool RunOne()
  {
    const std::function<void()> Function = Take();
    if( !Function )
    {
      return false;
    }
    Function();
    return true;
  }

  // Runs until the queue is empty, with all that is posted meanwhile. Returns how many ran.
  size_t RunAll()
  {
    size_t Count = 0;
    while( RunOne() )
    {
      ++Count;
    }
    return Count;
  }

  size_t Pending() const
  {
    boost::lock_guard<boost::mutex> Lock( m_Mutex );
    return m_Queue.size();
  }

private:
  std::function<void()> Take()
  {
    boost::lock_guard<boost::mutex> Lock( m_Mutex );
    if( m_Queue.empty() )
    {
      return {};
    }
    std::function<void()> Function = std::move( m_Queue.front() );
    m_Queue.pop_front();
    return Function;
  }

  mutable boost::mutex m_Mutex;
  std::deque<std::function<void()>> m_Queue GUARDED_BY( m_Mutex );
};
}
