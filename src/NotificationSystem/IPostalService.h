// A queue of functions that run later, on another thread than the one that posts them, in order of posting where one thread serves it.
#pragma once

#include <functional>

namespace KVZ
{
class IPostalService
{
public:
  IPostalService() = default;
  IPostalService( const IPostalService& ) = delete;
  IPostalService& operator=( const IPostalService& ) = delete;

  // Queues the function and returns at once. The second argument travels with the queued item and has no effect.
  virtual void Post( std::function<void()> i_Function, unsigned int i_Unused = 0 ) = 0;

  virtual ~IPostalService() = default;
};
}
