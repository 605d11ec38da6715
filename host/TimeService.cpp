#include "host/TimeService.h"

#include "NotificationSystem/AsioPostalService.h"

#include <boost/asio/io_context.hpp>
#include <boost/asio/steady_timer.hpp>

#include <chrono>

namespace StageHost
{

double VMonotonicTime::Now() { return std::chrono::duration<double>( std::chrono::steady_clock::now().time_since_epoch() ).count(); }

VAsioDelayedCalls::VAsioDelayedCalls( std::shared_ptr<NotificationSystem::VAsioPostalService> i_pService ) : m_pService( std::move( i_pService ) ) {}

void VAsioDelayedCalls::CallAfter( double i_Seconds, std::function<void()> i_Function )
{
  const auto Delay = std::chrono::duration_cast<std::chrono::steady_clock::duration>( std::chrono::duration<double>( i_Seconds ) );
  auto pTimer = std::make_shared<boost::asio::steady_timer>( *m_pService->IoService(), Delay );
  pTimer->async_wait(
    [pTimer, Function = std::move( i_Function )]( const boost::system::error_code& i_rError )
    {
      if( !i_rError )
      {
        Function();
      }
    } );
}

}
