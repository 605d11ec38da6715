// A timer that is set again and again. Tests put one in its place that they move by hand.
#pragma once

#include <cstdint>
#include <functional>
#include <memory>

namespace boost::asio
{
class io_context;
}

namespace VideoInputHAL
{

// One call at a time.
class IDeadlineTimer
{
public:
  virtual ~IDeadlineTimer() = default;
  // Calls the function once, on a thread of the timer's own, when the span has passed. Setting it again takes the former function back, unless
  // that is on its way already.
  virtual void Set( int64_t i_Microseconds, std::function<void()> i_Function ) = 0;
  virtual void Cancel() = 0;
};

// On the threads that run the io_context.
std::unique_ptr<IDeadlineTimer> MakeAsioTimer( std::shared_ptr<boost::asio::io_context> i_pContext );

}
