#include "HardwareSupport/VideoInput/VideoInputDataSource/DeadlineTimer.h"

#include <boost/asio/io_context.hpp>
#include <boost/asio/steady_timer.hpp>

#include <chrono>
#include <utility>

namespace VideoInputHAL
{

namespace
{

class VAsioTimer : public IDeadlineTimer
{
public:
  explicit VAsioTimer( std::shared_ptr<boost::asio::io_context> i_pContext ) : m_pContext( std::move( i_pContext ) ), m_Timer( *m_pContext ) {}

  void Set( int64_t i_Microseconds, std::function<void()> i_Function ) override
  {
    m_Timer.expires_after( std::chrono::microseconds( i_Microseconds ) );
    m_Timer.async_wait(
      [Function = std::move( i_Function )]( const boost::system::error_code& i_rError )
      {
        if( !i_rError )
        {
          Function();
        }
      } );
  }

  void Cancel() override { m_Timer.cancel(); }

private:
  const std::shared_ptr<boost::asio::io_context> m_pContext;
  boost::asio::steady_timer m_Timer;
};

}

std::unique_ptr<IDeadlineTimer> MakeAsioTimer( std::shared_ptr<boost::asio::io_context> i_pContext )
{
  return std::make_unique<VAsioTimer>( std::move( i_pContext ) );
}

}
