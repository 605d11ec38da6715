// A postal service with several threads of normal priority: what is posted begins in order and runs side by side. Any thread may post.
#pragma once

#include "NotificationSystem/IPostalService.h"
#include "StageCoreRuntime/ThreadAnnotations.h"

#include <boost/thread/condition_variable.hpp>
#include <boost/thread/mutex.hpp>
#include <boost/thread/thread.hpp>

#include <cstddef>
#include <deque>
#include <memory>
#include <string>

namespace VideoInputHAL
{

class VWorkerThreads : public KVZ::IPostalService
{
public:
  // The threads are named by the service's name and their index from 0. Fewer where the system gives no more; it throws where it gives none.
  VWorkerThreads( const std::string& i_rName, size_t i_Count );
  // Everything that was posted before has run when this ends. Not on one of the threads.
  ~VWorkerThreads() override;

  // The function must not throw.
  void Post( std::function<void()> i_Function, unsigned int i_Unused = 0 ) override;

private:
  void Run( const std::string& i_rName );
  bool Take( std::function<void()>& o_rFunction ) NO_LOCK_ANALYSIS;

  boost::mutex m_Mutex;
  boost::condition_variable m_Changed;
  std::deque<std::function<void()>> m_Queue GUARDED_BY( m_Mutex );
  bool m_bEnding GUARDED_BY( m_Mutex ) = false;
  boost::thread_group m_Threads;
};

}
