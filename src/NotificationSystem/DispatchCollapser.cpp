#include "NotificationSystem/DispatchCollapser.h"

#include <boost/thread/lock_guard.hpp>

#include <utility>

namespace NotificationSystem
{
std::shared_ptr<VDispatchCollapserDontPostIfAnotherQueued> VDispatchCollapserDontPostIfAnotherQueued::Create(
  std::shared_ptr<KVZ::IPostalService> i_pService )
{
  using VCollapser = VDispatchCollapserDontPostIfAnotherQueued;
  return i_pService ? std::shared_ptr<VCollapser>( new VCollapser( std::move( i_pService ) ) ) : nullptr;
}

VDispatchCollapserDontPostIfAnotherQueued::VDispatchCollapserDontPostIfAnotherQueued( std::shared_ptr<KVZ::IPostalService> i_pService )
  : m_pService( std::move( i_pService ) )
{
}

void VDispatchCollapserDontPostIfAnotherQueued::Post( std::function<void()> i_Function, unsigned int i_Arg )
{
  boost::lock_guard<boost::mutex> Lock( m_Mutex );
  if( m_bQueued )
  {
    return;
  }
  m_bQueued = true;
  m_pService->Post( [pThis = shared_from_this(), Function = std::move( i_Function )] { pThis->Dispatch( Function ); }, i_Arg );
}

void VDispatchCollapserDontPostIfAnotherQueued::Dispatch( const std::function<void()>& i_rFunction )
{
  {
    boost::lock_guard<boost::mutex> Lock( m_Mutex );
    m_bQueued = false;   // before the call: a notification that arises during it queues one more
  }
  i_rFunction();
}
}
