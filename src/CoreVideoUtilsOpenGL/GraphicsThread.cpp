#include "CoreVideoUtilsOpenGL/GraphicsThread.h"

#include "StageCoreRuntime/DebugServices.h"
#include "StageCoreRuntime/GlobalLog.h"

#include <QtCore/QCoreApplication>
#include <QtGui/QGuiApplication>

#include <boost/thread/lock_guard.hpp>
#include <boost/thread/lock_types.hpp>

#include <array>
#include <memory>
#include <utility>

namespace CoreVideoUtilsOpenGL
{

namespace
{

// What Qt has to say is for those who look closely: whether OpenGL can be used is found out and said elsewhere.
void LogQtMessage( QtMsgType, const QMessageLogContext&, const QString& i_rText )
{
  KVZ_LOG_DETAIL( "CoreVideoUtilsOpenGL", "Qt: %1%", i_rText.toStdString() );
}

// An application object of this thread's own, with what it needs to live.
class VOwnApplication
{
public:
  VOwnApplication() : m_pFormerHandler( qInstallMessageHandler( &LogQtMessage ) ), m_Application( m_Count, m_Arguments.data() ) {}
  ~VOwnApplication() { qInstallMessageHandler( m_pFormerHandler ); }

private:
  const QtMessageHandler m_pFormerHandler;
  std::string m_Name = "StageCorePluginVideoInput";
  std::string m_Option = "-platform";
  std::string m_Platform = "offscreen";
  std::array<char*, 4> m_Arguments = { m_Name.data(), m_Option.data(), m_Platform.data(), nullptr };
  int m_Count = 3;
  QGuiApplication m_Application;
};

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
  std::unique_ptr<VOwnApplication> pApplication;
  if( !QCoreApplication::instance() )
  {
    pApplication = std::make_unique<VOwnApplication>();
  }
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
