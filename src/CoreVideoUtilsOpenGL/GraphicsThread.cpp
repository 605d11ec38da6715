#include "CoreVideoUtilsOpenGL/GraphicsThread.h"

#include "CoreVideoUtilsOpenGL/GraphicsApplication.h"
#include "StageCoreRuntime/DebugServices.h"

#include <boost/thread/lock_guard.hpp>
#include <boost/thread/lock_types.hpp>

#include <memory>
#include <utility>

namespace CoreVideoUtilsOpenGL
{

namespace
{

// Guards the count and what it counts; held while the thread begins and ends, so that there are never two.
struct VShared
{
  boost::mutex m_Mutex;
  size_t m_Users GUARDED_BY( m_Mutex ) = 0;
  std::unique_ptr<VGraphicsThread> m_pThread GUARDED_BY( m_Mutex );
};

VShared& Shared()
{
  static VShared s_Shared;
  return s_Shared;
}

VGraphicsThread& AddUser()
{
  VShared& rShared = Shared();
  boost::lock_guard<boost::mutex> Lock( rShared.m_Mutex );
  if( !rShared.m_pThread )
  {
    rShared.m_pThread = std::make_unique<VGraphicsThread>();
  }
  ++rShared.m_Users;
  return *rShared.m_pThread;
}

}

VGraphicsThread::VGraphicsThread() : m_Thread( [this] { RunThread(); } ) {}

VGraphicsThread::~VGraphicsThread()
{
  {
    boost::lock_guard<boost::mutex> Lock( m_Mutex );
    m_bEnding = true;
  }
  m_Changed.notify_one();
  m_Thread.join();
}

void VGraphicsThread::Run( std::function<void()> i_Function )
{
  std::packaged_task<void()> Task( std::move( i_Function ) );
  std::future<void> Done = Task.get_future();
  {
    boost::lock_guard<boost::mutex> Lock( m_Mutex );
    m_Tasks.push_back( std::move( Task ) );
  }
  m_Changed.notify_one();
  Done.get();
}

void VGraphicsThread::RunThread()
{
  const DebugServices::VCrashHandlerForThread CrashHandler;
  DebugServices::SetThreadName( "OpenGL" );
  const VGraphicsApplication Application;
  RunTasks();
}

void VGraphicsThread::RunTasks()
{
  for( std::packaged_task<void()> Task; Take( Task ); )
  {
    Task();
  }
}

// Waits for the next one. False once there is none left and the thread ends.
bool VGraphicsThread::Take( std::packaged_task<void()>& o_rTask )
{
  boost::unique_lock<boost::mutex> Lock( m_Mutex );
  while( !m_bEnding && m_Tasks.empty() )
  {
    m_Changed.wait( Lock );
  }
  if( m_Tasks.empty() )
  {
    return false;
  }
  o_rTask = std::move( m_Tasks.front() );
  m_Tasks.pop_front();
  return true;
}

VGraphicsThreadUse::VGraphicsThreadUse() : m_rThread( AddUser() ) {}

VGraphicsThreadUse::~VGraphicsThreadUse()
{
  VShared& rShared = Shared();
  boost::lock_guard<boost::mutex> Lock( rShared.m_Mutex );
  if( --rShared.m_Users == 0 )
  {
    rShared.m_pThread.reset();
  }
}

}
