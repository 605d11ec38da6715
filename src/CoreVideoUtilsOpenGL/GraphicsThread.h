// The one thread on which all OpenGL contexts of this module are made, used and freed.
//
// A context is current on one thread at a time, and Qt wants its application object and what belongs to windows on one thread. Frames come from
// threads of captures, several at a time, which come and go: so they wait here for each other.
//
// Where the process has no QGuiApplication this thread makes one, which goes with it.
#pragma once

#include "StageCoreRuntime/ThreadAnnotations.h"

#include <boost/thread/condition_variable.hpp>
#include <boost/thread/mutex.hpp>
#include <boost/thread/thread.hpp>

#include <deque>
#include <functional>
#include <future>

namespace CoreVideoUtilsOpenGL
{

class VGraphicsThread
{
public:
  VGraphicsThread();
  // Everything that was asked for has run when this ends.
  ~VGraphicsThread();

  // Runs the function on the thread and waits for its end. Any other thread. What the function throws is thrown here.
  void Run( std::function<void()> i_Function );

private:
  void RunThread();
  void RunTasks();
  bool Take( std::packaged_task<void()>& o_rTask ) NO_LOCK_ANALYSIS;

  boost::mutex m_Mutex;
  boost::condition_variable m_Changed;
  std::deque<std::packaged_task<void()>> m_Tasks GUARDED_BY( m_Mutex );
  bool m_bEnding GUARDED_BY( m_Mutex ) = false;
  boost::thread m_Thread;
};

// The process's thread, which is there as long as anybody holds one of these. Any thread may make and destroy them, but the thread itself.
class VGraphicsThreadUse
{
public:
  VGraphicsThreadUse();
  ~VGraphicsThreadUse();
  VGraphicsThreadUse( const VGraphicsThreadUse& ) = delete;
  VGraphicsThreadUse& operator=( const VGraphicsThreadUse& ) = delete;

  void Run( std::function<void()> i_Function ) { m_rThread.Run( std::move( i_Function ) ); }

private:
  VGraphicsThread& m_rThread;
};

}
