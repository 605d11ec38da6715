#include "NotificationSystem/AsioPostalService.h"

#include "StageCoreRuntime/DebugServices.h"
#include "StageCoreRuntime/GlobalLog.h"

#include <boost/asio/executor_work_guard.hpp>
#include <boost/asio/io_context.hpp>
#include <boost/asio/post.hpp>
#include <boost/thread/lock_guard.hpp>
#include <boost/thread/thread.hpp>

#include <exception>
#include <utility>

#include <sys/resource.h>
#include <sys/syscall.h>
#include <unistd.h>

namespace NotificationSystem
{
namespace
{
using VWorkGuard = boost::asio::executor_work_guard<boost::asio::io_context::executor_type>;

constexpr int AboveNormalNice = -5;

// A nice value is a thread's own on Linux. Without the right to raise it the thread stays at normal priority.
void RaisePriority() { setpriority( PRIO_PROCESS, static_cast<id_t>( syscall( SYS_gettid ) ), AboveNormalNice ); }

void RunUntilEmpty( boost::asio::io_context& i_rIoContext )
{
  for( bool bEnded = false; !bEnded; )
  {
    try
    {
      i_rIoContext.run();
      bEnded = true;
    }
    catch( const std::exception& i_rException )
    {
      KVZ_LOG( "NotificationSystem", 2, "A posted function ended with an exception: %1%", i_rException.what() );
    }
  }
}

// Owns all that it uses, because a service may be destroyed by a function that its own worker runs.
void RunWorker( const std::shared_ptr<boost::asio::io_context>& i_pIoContext, const std::string& i_Name )
{
  const DebugServices::VCrashHandlerForThread CrashHandler;
  DebugServices::SetThreadName( i_Name );
  RaisePriority();
  RunUntilEmpty( *i_pIoContext );
}
}

VAsioPostalService::VAsioPostalService( const std::string& i_Name ) : m_Name( i_Name ), m_pIoContext( std::make_shared<boost::asio::io_context>() )
{
  Start( 1 );
}

VAsioPostalService::~VAsioPostalService() { Stop(); }

void VAsioPostalService::Post( std::function<void()> i_Function, unsigned int ) { boost::asio::post( *m_pIoContext, std::move( i_Function ) ); }

boost::asio::io_context* VAsioPostalService::IoService() { return m_pIoContext.get(); }

std::shared_ptr<boost::asio::io_context> VAsioPostalService::IoServicePtr() { return m_pIoContext; }

bool VAsioPostalService::Start( unsigned int i_ThreadCount )
{
  boost::lock_guard<boost::mutex> Lock( m_Mutex );
  if( m_pWork || i_ThreadCount == 0 )
  {
    return false;
  }
  m_pIoContext->restart();   // a worker that stopped its own service ends after Stop and leaves the flag set
  m_pWork = std::make_shared<VWorkGuard>( m_pIoContext->get_executor() );
  for( unsigned int Index = 0; Index < i_ThreadCount; ++Index )
  {
    m_Workers.push_back(
      std::make_unique<boost::thread>( [pIoContext = m_pIoContext, Name = m_Name + std::to_string( Index )] { RunWorker( pIoContext, Name ); } ) );
  }
  return true;
}

bool VAsioPostalService::Stop()
{
  boost::lock_guard<boost::mutex> Lock( m_Mutex );
  if( !m_pWork )
  {
    return false;
  }
  m_pWork.reset();
  for( const auto& pWorker : m_Workers )
  {
    if( pWorker->get_id() != boost::this_thread::get_id() )
    {
      pWorker->join();
    }
  }
  m_Workers.clear();
  m_pIoContext->restart();
  return true;
}
}
