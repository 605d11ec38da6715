// A callback slot: one callable that a publisher invokes, on its own thread or through a postal service.
// Every operation may be called from any thread, also from inside a call. No lock is held while a callable runs or is destroyed.
#pragma once

#include "NotificationSystem/DeregisterWeakCallbackException.h"
#include "NotificationSystem/IPostalService.h"
#include "StageCoreRuntime/ThreadAnnotations.h"

#include <boost/thread/lock_guard.hpp>
#include <boost/thread/mutex.hpp>

#include <functional>
#include <memory>
#include <utility>

namespace KVZ
{
template<class TSignature>
class ICallback
{
public:
  ICallback() = default;
  ICallback( const ICallback& ) = delete;
  ICallback& operator=( const ICallback& ) = delete;

  // Replaces the stored callable.
  virtual void Set( std::function<TSignature> i_Function ) = 0;
  // True if something was stored.
  virtual bool Clear() = 0;
  virtual bool IsSet() = 0;
  virtual ~ICallback() = default;
};

template<class TSignature>
class ICallbackPostal : public ICallback<TSignature>
{
public:
  // The plain Set delivers through the slot's default service; these through the given one, or on the publisher's thread.
  using ICallback<TSignature>::Set;
  virtual void Set( std::function<TSignature> i_Function, std::shared_ptr<IPostalService> i_pService ) = 0;
  virtual void SetImmediate( std::function<TSignature> i_Function ) = 0;
};
}

namespace NotificationSystem
{
// Owns its target and calls it: what a postal slot binds into a posted item, so that the slot inside outlives a posted call.
template<class TResult, class TTarget>
class VCallableSharedPtr
{
public:
  explicit VCallableSharedPtr( std::shared_ptr<TTarget> i_pTarget ) : m_pTarget( std::move( i_pTarget ) ) {}

  template<class... TArgs>
  TResult operator()( TArgs&&... i_Args ) const
  {
    return ( *m_pTarget )( std::forward<TArgs>( i_Args )... );
  }

private:
  std::shared_ptr<TTarget> m_pTarget;
};

// Posts one call of a shared slot with copies of the arguments.
template<class TTarget, class... TArgs>
void PostCall( KVZ::IPostalService& i_rService, const std::shared_ptr<TTarget>& i_pTarget, const TArgs&... i_rArgs )
{
  i_rService.Post( [Callable = VCallableSharedPtr<bool, TTarget>( i_pTarget ), ... Args = i_rArgs] { Callable( Args... ); }, 0 );
}

template<class TSignature>
class VCallback;

template<class... TArgs>
class VCallback<void( TArgs... )> : public KVZ::ICallback<void( TArgs... )>
{
public:
  using VFunction = std::function<void( TArgs... )>;

  void Set( VFunction i_Function ) override { Replace( std::move( i_Function ) ); }
  bool Clear() override { return Exchange( nullptr ) != nullptr; }
  bool IsSet() override { return Current() != nullptr; }

  // Sets, and returns the former callable, for a caller that must not destroy it yet.
  std::shared_ptr<VFunction> Replace( VFunction i_Function ) { return Exchange( std::make_shared<VFunction>( std::move( i_Function ) ) ); }

  // True if the callable ran. A callable that deregisters is removed, unless it has been replaced during the call; any other
  // exception passes to the caller.
  bool operator()( TArgs... i_Args )
  {
    const std::shared_ptr<VFunction> pFunction = Current();
    if( !pFunction )
    {
      return false;
    }
    try
    {
      ( *pFunction )( i_Args... );
      return true;
    }
    catch( const VDeregisterWeakCallbackException& )
    {
      Forget( pFunction );
      return false;
    }
  }

private:
  std::shared_ptr<VFunction> Current()
  {
    boost::lock_guard<boost::mutex> Lock( m_Mutex );
    return m_pFunction;
  }

  // Returns the former callable, so that it is destroyed without the lock.
  std::shared_ptr<VFunction> Exchange( std::shared_ptr<VFunction> i_pFunction )
  {
    boost::lock_guard<boost::mutex> Lock( m_Mutex );
    m_pFunction.swap( i_pFunction );
    return i_pFunction;
  }

  void Forget( const std::shared_ptr<VFunction>& i_pFunction )
  {
    boost::lock_guard<boost::mutex> Lock( m_Mutex );
    if( m_pFunction == i_pFunction )
    {
      m_pFunction.reset();   // the caller's owner keeps it alive beyond the lock
    }
  }

  boost::mutex m_Mutex;
  std::shared_ptr<VFunction> m_pFunction GUARDED_BY( m_Mutex );
};

template<class TSignature>
class VCallbackPostal;

template<class... TArgs>
class VCallbackPostal<void( TArgs... )> : public KVZ::ICallbackPostal<void( TArgs... )>
{
public:
  using VFunction = std::function<void( TArgs... )>;

  // An empty default service means the publisher's thread.
  explicit VCallbackPostal( std::shared_ptr<KVZ::IPostalService> i_pDefaultService = nullptr ) : m_pDefaultService( std::move( i_pDefaultService ) )
  {
  }

  void Set( VFunction i_Function ) override { Register( std::move( i_Function ), m_pDefaultService ); }
  void Set( VFunction i_Function, std::shared_ptr<KVZ::IPostalService> i_pService ) override
  {
    Register( std::move( i_Function ), std::move( i_pService ) );
  }
  void SetImmediate( VFunction i_Function ) override { Register( std::move( i_Function ), nullptr ); }

  bool Clear() override
  {
    const VRegistration Former = Exchange( {} );
    return Former.m_pCallback && Former.m_pCallback->Clear();
  }

  bool IsSet() override
  {
    boost::lock_guard<boost::mutex> Lock( m_Mutex );
    return m_Current.m_pCallback && m_Current.m_pCallback->IsSet();
  }

  // True if the call was made, or posted to a callable that is still set. A posted call runs the callable as it stands when the
  // item runs.
  bool operator()( TArgs... i_Args )
  {
    const VRegistration Current = Take();
    if( !Current.m_pCallback )
    {
      return false;
    }
    if( !Current.m_pService )
    {
      return ( *Current.m_pCallback )( i_Args... );
    }
    PostCall( *Current.m_pService, Current.m_pCallback, i_Args... );
    return Current.m_pCallback->IsSet();
  }

private:
  using VInner = VCallback<void( TArgs... )>;

  struct VRegistration
  {
    std::shared_ptr<KVZ::IPostalService> m_pService;
    std::shared_ptr<VInner> m_pCallback;
  };

  void Register( VFunction i_Function, std::shared_ptr<KVZ::IPostalService> i_pService )
  {
    std::shared_ptr<VFunction> pFormer;   // like the former service, it ends without the lock
    boost::lock_guard<boost::mutex> Lock( m_Mutex );
    m_Current.m_pService.swap( i_pService );
    if( !m_Current.m_pCallback )
    {
      m_Current.m_pCallback = std::make_shared<VInner>();
    }
    pFormer = m_Current.m_pCallback->Replace( std::move( i_Function ) );
  }

  VRegistration Exchange( VRegistration i_Registration )
  {
    boost::lock_guard<boost::mutex> Lock( m_Mutex );
    std::swap( m_Current, i_Registration );
    return i_Registration;
  }

  // The registration in force; one whose callable has deregistered itself is dropped here.
  VRegistration Take()
  {
    VRegistration Dead;
    boost::lock_guard<boost::mutex> Lock( m_Mutex );
    if( m_Current.m_pCallback && !m_Current.m_pCallback->IsSet() )
    {
      std::swap( m_Current, Dead );
    }
    return m_Current;
  }

  const std::shared_ptr<KVZ::IPostalService> m_pDefaultService;
  boost::mutex m_Mutex;
  VRegistration m_Current GUARDED_BY( m_Mutex );
};
}
