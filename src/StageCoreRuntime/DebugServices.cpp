#include "StageCoreRuntime/DebugServices.h"

#include "StageCoreRuntime/GlobalLog.h"
#include "StageCoreRuntime/ThreadAnnotations.h"

#include <boost/thread/lock_guard.hpp>
#include <boost/thread/mutex.hpp>

#include <algorithm>
#include <utility>

#include <pthread.h>

namespace DebugServices
{
namespace
{
constexpr size_t SystemNameLength = 15;

void LogAssertion( const char* i_pExpression, const char* i_pFile, int i_Line )
{
  const KVZ::VLogCategory& rCategory = KVZ::LogCategory( "DebugServices" );
  KVZ::Detail::FormatAndWriteLog( rCategory, { i_pFile, i_Line, KVZ::LogLevel::Error }, "Assertion failed: %1%", i_pExpression );
}

struct VHandlerSlot
{
  boost::mutex m_Mutex;
  std::shared_ptr<const VAssertFailHandler> m_pHandler GUARDED_BY( m_Mutex );   // empty for the default
};

// Never destroyed: static objects of other modules may still assert while they end.
VHandlerSlot& HandlerSlot()
{
  static VHandlerSlot* const s_pSlot = new VHandlerSlot;
  return *s_pSlot;
}

std::string& ThisThreadsName()
{
  thread_local std::string t_Name;
  return t_Name;
}
}

void CallAssertFailHandler( const char* i_pExpression, const char* i_pFile, int i_Line )
{
  VHandlerSlot& rSlot = HandlerSlot();
  std::shared_ptr<const VAssertFailHandler> pHandler;
  {
    boost::lock_guard<boost::mutex> Lock( rSlot.m_Mutex );
    pHandler = rSlot.m_pHandler;
  }
  if( pHandler )
  {
    ( *pHandler )( i_pExpression, i_pFile, i_Line );
  }
  else
  {
    LogAssertion( i_pExpression, i_pFile, i_Line );
  }
}

VAssertFailHandler SetAssertFailHandler( VAssertFailHandler i_Handler )
{
  VHandlerSlot& rSlot = HandlerSlot();
  auto pHandler = i_Handler ? std::make_shared<const VAssertFailHandler>( std::move( i_Handler ) ) : nullptr;
  {
    boost::lock_guard<boost::mutex> Lock( rSlot.m_Mutex );
    pHandler.swap( rSlot.m_pHandler );
  }
  return pHandler ? *pHandler : VAssertFailHandler();
}

void SetThreadName( const std::string& i_Name )
{
  ThisThreadsName() = i_Name;
  std::string Short = i_Name;
  if( Short.size() > SystemNameLength )
  {
    const size_t LastText = Short.find_last_not_of( "0123456789" );
    const std::string Index = LastText == std::string::npos ? "" : Short.substr( LastText + 1 );
    const size_t Kept = SystemNameLength - std::min( Index.size(), SystemNameLength );
    Short = ( Short.substr( 0, Kept ) + Index ).substr( 0, SystemNameLength );
  }
  pthread_setname_np( pthread_self(), Short.c_str() );
}

const std::string& GetThreadName() { return ThisThreadsName(); }
}
