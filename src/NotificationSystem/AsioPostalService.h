// A postal service on an asio io_context with worker threads of its own, which run at above-normal priority.
#pragma once

#include "NotificationSystem/IPostalService.h"
#include "StageCoreRuntime/ThreadAnnotations.h"

#include <boost/thread/mutex.hpp>

#include <memory>
#include <string>
#include <vector>

namespace boost
{
class thread;
namespace asio
{
class io_context;
}
}

namespace KVZ
{
class IAsioPostalService : public IPostalService
{
public:
  // The io_context that the workers run, for timers and strands. Never null.
  virtual boost::asio::io_context* IoService() = 0;
  virtual std::shared_ptr<boost::asio::io_context> IoServicePtr() = 0;
};
}

namespace NotificationSystem
{
// Every operation may be called from any thread.
class VAsioPostalService : public KVZ::IAsioPostalService
{
public:
  // Starts one worker. Workers are named by the service's name and their index from 0.
  explicit VAsioPostalService( const std::string& i_Name );

  // An exception that leaves a posted function is logged; the worker goes on with the next one.
  void Post( std::function<void()> i_Function, unsigned int i_Unused = 0 ) override;

  // Stops: everything that was posted before has run when this ends.
  ~VAsioPostalService() override;

  boost::asio::io_context* IoService() override;
  std::shared_ptr<boost::asio::io_context> IoServicePtr() override;

  // False if the service is started already or the count is 0.
  bool Start( unsigned int i_ThreadCount );

  // Waits until the queue has run empty and the workers have ended; a worker that calls this itself is not waited for.
  // False if the service is stopped already. What is posted afterwards waits for the next Start.
  bool Stop();

private:
  boost::mutex m_Mutex;
  const std::string m_Name;
  const std::shared_ptr<boost::asio::io_context> m_pIoContext;
  std::shared_ptr<void> m_pWork GUARDED_BY( m_Mutex );   // set exactly while the service is started
  std::vector<std::unique_ptr<boost::thread>> m_Workers GUARDED_BY( m_Mutex );
};
}
