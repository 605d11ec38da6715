#include "NotificationSystem/Callback.h"
#include "NotificationSystem/WeakBinder.h"
#include "tests/support/ManualPostalService.h"

#include <gtest/gtest.h>

namespace
{
using NotificationSystem::BindWeak;
using NotificationSystem::VCallback;
using NotificationSystem::VCallbackPostal;
using NotificationSystem::VDeregisterWeakCallbackException;
using TestSupport::VManualPostalService;

class VSubscriberBase
{
public:
  void OnNumber( uint64_t i_Number ) { m_Last = i_Number; }
  uint64_t m_Last = 0;
};

class VSubscriber : public VSubscriberBase
{
};

// Its destruction calls back into the slot that owned the callable: a deadlock if that held its lock.
template<class TSlot>
std::shared_ptr<void> CallsBackWhenDestroyed( TSlot& i_rSlot )
{
  return std::shared_ptr<void>( nullptr, [&i_rSlot]( void* ) { i_rSlot.IsSet(); } );
}

TEST( Callback, RunsWhatIsSetAndNothingElse )
{
  VCallback<void( uint64_t )> Callback;
  uint64_t Last = 0;
  EXPECT_FALSE( Callback( 1 ) );
  EXPECT_FALSE( Callback.Clear() );
  Callback.Set( [&]( uint64_t i_Number ) { Last = i_Number; } );
  EXPECT_TRUE( Callback( 2 ) );
  Callback.Set( [&]( uint64_t i_Number ) { Last = 10 * i_Number; } );
  EXPECT_TRUE( Callback( 3 ) );
  EXPECT_EQ( Last, 30u );
  EXPECT_TRUE( Callback.Clear() );
  EXPECT_FALSE( Callback( 4 ) );
  EXPECT_EQ( Last, 30u );
}

TEST( Callback, RemovesADeadSubscriberOnItsFirstCall )
{
  VCallback<void( uint64_t )> Callback;
  auto pSubscriber = std::make_shared<VSubscriber>();
  Callback.Set( BindWeak( std::weak_ptr<VSubscriber>( pSubscriber ), &VSubscriberBase::OnNumber ) );
  EXPECT_TRUE( Callback( 5 ) );
  EXPECT_EQ( pSubscriber->m_Last, 5u );
  pSubscriber.reset();
  EXPECT_TRUE( Callback.IsSet() );
  EXPECT_FALSE( Callback( 7 ) );
  EXPECT_FALSE( Callback.IsSet() );
}

TEST( Callback, KeepsItsSubscriberAliveDuringACall )
{
  VCallback<void()> Callback;
  auto pSubscriber = std::make_shared<VSubscriber>();
  Callback.Set( BindWeak( pSubscriber,
    [&pSubscriber]( VSubscriber& i_rSubscriber )
    {
      pSubscriber.reset();
      i_rSubscriber.OnNumber( 1 );   // a use after free if the call did not own it
    } ) );
  EXPECT_TRUE( Callback() );
  EXPECT_FALSE( Callback() );
}

TEST( Callback, AReplacementMadeDuringACallSurvivesItsDeregistration )
{
  VCallback<void()> Callback;
  int Calls = 0;
  Callback.Set(
    [&]
    {
      Callback.Set( [&] { ++Calls; } );
      throw VDeregisterWeakCallbackException();
    } );
  EXPECT_FALSE( Callback() );
  EXPECT_TRUE( Callback() );
  EXPECT_EQ( Calls, 1 );
}

TEST( Callback, HoldsNoLockWhileACallableEnds )
{
  VCallback<void()> Plain;
  VCallbackPostal<void()> Postal;
  for( int Round = 0; Round < 2; ++Round )
  {
    Plain.Set( [p = CallsBackWhenDestroyed( Plain )] {} );
    Postal.Set( [p = CallsBackWhenDestroyed( Postal )] {} );
  }
  EXPECT_TRUE( Plain.Clear() );
  EXPECT_TRUE( Postal.Clear() );
  Plain.Set( [p = CallsBackWhenDestroyed( Plain )] { throw VDeregisterWeakCallbackException(); } );
  Postal.Set( [p = CallsBackWhenDestroyed( Postal )] { throw VDeregisterWeakCallbackException(); } );
  EXPECT_FALSE( Plain() );
  EXPECT_FALSE( Postal() );
}

TEST( CallbackPostal, RunsOnItsServiceWithCopiesOfTheArguments )
{
  const auto pDefault = std::make_shared<VManualPostalService>();
  const auto pOther = std::make_shared<VManualPostalService>();
  VCallbackPostal<void( std::vector<bool> )> Callback( pDefault );
  std::vector<bool> Last;
  const auto Store = [&]( std::vector<bool> i_Bits ) { Last = std::move( i_Bits ); };
  Callback.Set( Store );
  std::vector<bool> Bits{ true, false };
  EXPECT_TRUE( Callback( Bits ) );
  Bits.clear();
  EXPECT_EQ( pDefault->RunAll(), 1u );
  EXPECT_EQ( Last, ( std::vector<bool>{ true, false } ) );
  Callback.Set( Store, pOther );
  EXPECT_TRUE( Callback( { true } ) );
  EXPECT_EQ( pDefault->Pending(), 0u );
  EXPECT_EQ( pOther->RunAll(), 1u );
  EXPECT_EQ( Last, std::vector<bool>{ true } );
}

TEST( CallbackPostal, APostedCallRunsTheCallableAsItStandsThen )
{
  const auto pService = std::make_shared<VManualPostalService>();
  auto pCallback = std::make_unique<VCallbackPostal<void()>>( pService );
  std::string Ran;
  pCallback->Set( [&] { Ran += "a"; } );
  ( *pCallback )();
  pCallback->Set( [&] { Ran += "b"; } );
  pService->RunAll();
  EXPECT_EQ( Ran, "b" );
  // A cleared slot runs nothing any more; a slot that has ended still runs what it had.
  ( *pCallback )();
  pCallback->Clear();
  pService->RunAll();
  EXPECT_EQ( Ran, "b" );
  pCallback->Set( [&] { Ran += "c"; } );
  ( *pCallback )();
  pCallback.reset();
  pService->RunAll();
  EXPECT_EQ( Ran, "bc" );
}

TEST( CallbackPostal, NoticesADeregistrationAtItsNextCallAndDropsTheService )
{
  auto pService = std::make_shared<VManualPostalService>();
  const std::weak_ptr<VManualPostalService> pWeakService = pService;
  VCallbackPostal<void()> Callback;
  auto pSubscriber = std::make_shared<VSubscriber>();
  Callback.Set( BindWeak( pSubscriber, []( VSubscriber& ) {} ), pService );
  pSubscriber.reset();
  EXPECT_TRUE( Callback() );
  pService->RunAll();
  EXPECT_FALSE( Callback.IsSet() );
  EXPECT_FALSE( Callback() );
  EXPECT_EQ( pService->Pending(), 0u );
  pService.reset();
  EXPECT_TRUE( pWeakService.expired() );
  int Calls = 0;
  Callback.Set( [&] { ++Calls; } );
  EXPECT_TRUE( Callback() );
  EXPECT_EQ( Calls, 1 );
}
}
