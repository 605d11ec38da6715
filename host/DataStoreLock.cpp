#include "host/DataStoreLock.h"

#include <boost/thread/lock_guard.hpp>

namespace StageHost
{

VDataStoreLock::EHeld VDataStoreLock::HeldLocked()
{
  const std::thread::id Self = std::this_thread::get_id();
  if( m_WriterDepth > 0 && m_Writer == Self )
  {
    return EHeld::Exclusive;
  }
  return m_ReaderDepths.count( Self ) > 0 ? EHeld::Shared : EHeld::None;
}

VDataStoreLock::EHeld VDataStoreLock::HeldByThisThread()
{
  boost::lock_guard<boost::mutex> Lock( m_Mutex );
  return HeldLocked();
}

unsigned int VDataStoreLock::WaitingWriters()
{
  boost::lock_guard<boost::mutex> Lock( m_Mutex );
  return m_WaitingWriters;
}

VDataStoreLock::EHeld VDataStoreLock::AcquireShared()
{
  boost::lock_guard<boost::mutex> Lock( m_Mutex );
  const EHeld Held = HeldLocked();
  if( Held == EHeld::Exclusive )
  {
    ++m_WriterDepth;
    return EHeld::Exclusive;
  }
  while( Held == EHeld::None && ( m_WriterDepth > 0 || m_WaitingWriters > 0 ) )
  {
    m_Changed.wait( m_Mutex );
  }
  ++m_ReaderDepths[std::this_thread::get_id()];
  return EHeld::Shared;
}

bool VDataStoreLock::AcquireExclusive()
{
  boost::lock_guard<boost::mutex> Lock( m_Mutex );
  const EHeld Held = HeldLocked();
  if( Held == EHeld::Shared )
  {
    return false;
  }
  ++m_WaitingWriters;
  while( Held == EHeld::None && ( m_WriterDepth > 0 || !m_ReaderDepths.empty() ) )
  {
    m_Changed.wait( m_Mutex );
  }
  --m_WaitingWriters;
  m_Writer = std::this_thread::get_id();
  ++m_WriterDepth;
  return true;
}

VDataStoreLock::EHeld VDataStoreLock::Release( const std::function<void()>& i_rBeforeLastExclusive )
{
  boost::lock_guard<boost::mutex> Lock( m_Mutex );
  const EHeld Held = HeldLocked();
  if( Held == EHeld::Exclusive )
  {
    if( m_WriterDepth == 1 )
    {
      i_rBeforeLastExclusive();
    }
    --m_WriterDepth;
    m_Changed.notify_all();
  }
  else if( Held == EHeld::Shared )
  {
    const auto Reader = m_ReaderDepths.find( std::this_thread::get_id() );
    if( --Reader->second == 0 )
    {
      m_ReaderDepths.erase( Reader );
      m_Changed.notify_all();
    }
  }
  return Held;
}

}
