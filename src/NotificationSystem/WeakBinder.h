// Binds a subscriber weakly into a callback: the target is kept alive during a call, and when it has gone the call throws
// VDeregisterWeakCallbackException, by which the slot removes it. So a subscriber never deregisters in its destructor.
//
//   Callback.Set( BindWeak( pImpl, &VImpl::OnDeviceAdded ) );
//   Callback.Set( BindWeak( pImpl, []( VImpl& i_rImpl ) { i_rImpl.Update( 3 ); } ) );
#pragma once

#include "NotificationSystem/DeregisterWeakCallbackException.h"

#include <functional>
#include <memory>
#include <utility>

namespace NotificationSystem
{
template<class T, class TFunction>
class VWeakBinder
{
public:
  VWeakBinder( std::weak_ptr<T> i_pTarget, TFunction i_Function ) : m_pTarget( std::move( i_pTarget ) ), m_Function( std::move( i_Function ) ) {}

  template<class... TArgs>
  auto operator()( TArgs&&... i_Args ) const -> std::invoke_result_t<const TFunction&, T&, TArgs...>
  {
    const auto pTarget = m_pTarget.lock();
    if( !pTarget )
    {
      throw VDeregisterWeakCallbackException();
    }
    return std::invoke( m_Function, *pTarget, std::forward<TArgs>( i_Args )... );
  }

private:
  std::weak_ptr<T> m_pTarget;
  TFunction m_Function;
};

// The function is a member function of T or of a base of T, or a callable that takes T& and the signature's arguments.
template<class T, class TFunction>
VWeakBinder<T, TFunction> BindWeak( std::weak_ptr<T> i_pTarget, TFunction i_Function )
{
  return { std::move( i_pTarget ), std::move( i_Function ) };
}

template<class T, class TFunction>
VWeakBinder<T, TFunction> BindWeak( const std::shared_ptr<T>& i_pTarget, TFunction i_Function )
{
  return { std::weak_ptr<T>( i_pTarget ), std::move( i_Function ) };
}
}
