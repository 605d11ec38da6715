#include "HardwareSupport/VideoInput/VideoInputDataSource/WorkerThreads.h"

#include "StageCoreRuntime/DebugServices.h"

#include <boost/thread/lock_guard.hpp>
#include <boost/thread/lock_types.hpp>

#include <utility>

namespace VideoInputHAL
{

VWorkerThreads::VWorkerThreads( const std::string& i_rName, size_t i_Count )
{
  for( size_t Index = 0; Index < i_Count; ++Index )
  {
    try
    {
      m_Threads.create_thread( [this, Name = i_rName + " " + std::to_string( Index )] { Run( Name ); } );
    }
    catch( const boost::thread_resource_error& )
    {
      if( Index == 0 )
      {
        throw;
      }
      return;   // those that there are do the work
    }
  }
}

VWorkerThreads::~VWorkerThreads()
{
  {
    boost::lock_guard<boost::mutex> Lock( m_Mutex );
    m_bEnding = true;
  }
  m_Changed.notify_all();
  m_Threads.join_all();
}

void VWorkerThreads::Post( std::function<void()> i_Function, unsigned int )
{
  {
    boost::lock_guard<boost::mutex> Lock( m_Mutex );
    m_Queue.push_back( std::move( i_Function ) );
  }
  m_Changed.notify_one();
}

void VWorkerThreads::Run( const std::string& i_rName )
{
  const DebugServices::VCrashHandlerForThread CrashHandler;
  DebugServices::SetThreadName( i_rName );
  for( std::function<void()> Function; Take( Function ); Function = nullptr )
  {
    Function();
  }
}

// Waits for the next one. False once the queue is empty and the service ends.
bool VWorkerThreads::Take( std::function<void()>& o_rFunction )
{
  boost::unique_lock<boost::mutex> Lock( m_Mutex );
  while( !m_bEnding && m_Queue.empty() )
  {
    m_Changed.wait( Lock );
  }
  if( m_Queue.empty() )
  {
    return false;
  }
  o_rFunction = std::move( m_Queue.front() );
  m_Queue.pop_front();
  return true;
}

}
