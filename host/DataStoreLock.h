// The lock of the data store: shared by readers, or held by one writing thread.
#pragma once

#include "StageCoreRuntime/ThreadAnnotations.h"

#include <boost/thread/condition_variable.hpp>
#include <boost/thread/mutex.hpp>

#include <functional>
#include <map>
#include <thread>

namespace StageHost
{

// A lock belongs to the thread that took it. A thread may nest readers, and readers and writers inside its own writer: the writing lock then
// lasts until the last of them has been given back, in whatever order. A new reader waits behind a waiting writer, so that writers
// come to their turn; a nested one does not. Every operation may be called from any thread.
class VDataStoreLock
{
public:
  enum class EHeld
  {
    None,
    Shared,
    Exclusive
  };

  // Waits. Exclusive where the thread's own writing lock serves.
  EHeld AcquireShared();
  // Waits. False if this thread holds a shared lock.
  bool AcquireExclusive();
  // Gives back one of this thread's locks. The function runs, still under the lock, if the last one of a writing thread goes.
  // Returns what was held; None is the caller's error.
  EHeld Release( const std::function<void()>& i_rBeforeLastExclusive );

  EHeld HeldByThisThread();
  // How many threads wait to write at this moment.
  unsigned int WaitingWriters();

private:
  EHeld HeldLocked() REQUIRES( m_Mutex );

  boost::mutex m_Mutex;
  boost::condition_variable_any m_Changed;
  std::thread::id m_Writer GUARDED_BY( m_Mutex );
  unsigned int m_WriterDepth GUARDED_BY( m_Mutex ) = 0;   // of the writing thread's guards; 0 while nobody writes
  unsigned int m_WaitingWriters GUARDED_BY( m_Mutex ) = 0;
  std::map<std::thread::id, unsigned int> m_ReaderDepths GUARDED_BY( m_Mutex );
};

}
