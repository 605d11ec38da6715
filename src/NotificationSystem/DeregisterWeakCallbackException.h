// Thrown by a bound callable whose target has gone. The slot that called it removes it; the exception never leaves a slot.
#pragma once

#include <exception>

namespace NotificationSystem
{
// The destructor is defined in the runtime library alone, so that module and host share one type information.
class __attribute__( ( visibility( "default" ) ) ) VDeregisterWeakCallbackException : public std::exception
{
public:
  VDeregisterWeakCallbackException() = default;
  VDeregisterWeakCallbackException( const VDeregisterWeakCallbackException& ) = default;
  VDeregisterWeakCallbackException& operator=( const VDeregisterWeakCallbackException& ) = default;
  ~VDeregisterWeakCallbackException() override;
};
}
