#include "NotificationSystem/MultiCallback.h"
#include "NotificationSystem/WeakBinder.h"
#include "tests/support/ManualPostalService.h"
#include "tests/support/Threads.h"

#include <gtest/gtest.h>

namespace
{
using NotificationSystem::BindWeak;
using NotificationSystem::VDeregisterWeakCallbackException;
using NotificationSystem::VMultiCallback;
using NotificationSystem::VMultiCallbackPostal;
using TestSupport::VManualPostalService;

TEST( MultiCallback, RunsInOrderAndDropsTheOneThatDeregisters )
{
  VMultiCallback<void( unsigned int )> Callbacks;
  std::string Ran;
  EXPECT_FALSE( Callbacks( 0 ) );
  Callbacks.Add( [&]( unsigned int i_Number ) { Ran += "a" + std::to_string( i_Number ); } );
  auto pSubscriber = std::make_shared<int>( 1 );
  Callbacks.Add( BindWeak( pSubscriber, [&]( int&, unsigned int ) { Ran += "b"; } ) );
  Callbacks.Add( [&]( unsigned int i_Number ) { Ran += "c" + std::to_string( i_Number ); } );
  EXPECT_TRUE( Callbacks( 1 ) );
  EXPECT_EQ( Ran, "a1bc1" );
  pSubscriber.reset();
  EXPECT_EQ( Callbacks.Count(), 3u );
  EXPECT_TRUE( Callbacks( 2 ) );
  EXPECT_EQ( Ran, "a1bc1a2c2" );
  EXPECT_EQ( Callbacks.Count(), 2u );
  EXPECT_EQ( Callbacks.Clear(), 2u );
  EXPECT_EQ( Callbacks.Clear(), 0u );
  Callbacks.Add( []( unsigned int ) { throw VDeregisterWeakCallbackException(); } );
  EXPECT_FALSE( Callbacks( 3 ) );
  EXPECT_EQ( Callbacks.Count(), 0u );
}

TEST( MultiCallback, ARunningRoundGoesThroughTheListAsItWas )
{
  VMultiCallback<void()> Callbacks;
  std::string Ran;
  void* pLast = nullptr;
  Callbacks.Add(
    [&]
    {
      Ran += "a";
      Callbacks.Remove( pLast );
      Callbacks.Add( [&] { Ran += "n"; } );
    } );
  pLast = Callbacks.Add( [&] { Ran += "b"; } );
  EXPECT_TRUE( Callbacks() );
  EXPECT_EQ( Ran, "ab" );
  EXPECT_EQ( Callbacks.Count(), 2u );
}

TEST( MultiCallbackPostal, RunsEachServicesListAsOneItemInOrder )
{
  const auto pDefault = std::make_shared<VManualPostalService>();
  const auto pOther = std::make_shared<VManualPostalService>();
  VMultiCallbackPostal<void( unsigned int )> Callbacks( pDefault );
  std::string Ran;
  const auto Append = [&Ran]( const char* i_pName )
  { return [&Ran, i_pName]( unsigned int i_Number ) { Ran += i_pName + std::to_string( i_Number ); }; };
  EXPECT_FALSE( Callbacks( 0 ) );
  Callbacks.Add( Append( "d" ) );
  Callbacks.Add( Append( "o" ), pOther );
  Callbacks.AddImmediate( Append( "i" ) );
  Callbacks.Add( Append( "e" ) );
  Callbacks.Add( Append( "j" ), nullptr );
  EXPECT_EQ( Callbacks.Count(), 5u );
  EXPECT_TRUE( Callbacks( 1 ) );
  EXPECT_EQ( Ran, "i1j1" );
  EXPECT_EQ( pDefault->RunAll(), 1u );
  EXPECT_EQ( Ran, "i1j1d1e1" );
  EXPECT_EQ( pOther->RunAll(), 1u );
  EXPECT_EQ( Ran, "i1j1d1e1o1" );
  EXPECT_EQ( Callbacks.Clear(), 5u );
  EXPECT_FALSE( Callbacks( 2 ) );
  EXPECT_EQ( pDefault->Pending() + pOther->Pending(), 0u );
}

TEST( MultiCallbackPostal, RemovingAServicesLastEntryLetsTheServiceGo )
{
  auto pService = std::make_shared<VManualPostalService>();
  const std::weak_ptr<VManualPostalService> pWeakService = pService;
  VMultiCallbackPostal<void()> Callbacks;
  void* pFirst = Callbacks.Add( [] {}, pService );
  void* pSecond = Callbacks.Add( [] {}, pService );
  void* pImmediate = Callbacks.AddImmediate( [] {} );
  pService.reset();
  EXPECT_EQ( Callbacks.Remove( &Callbacks ), 0u );
  EXPECT_EQ( Callbacks.Remove( pFirst ), 1u );
  EXPECT_FALSE( pWeakService.expired() );
  EXPECT_EQ( Callbacks.Remove( pSecond ), 1u );
  EXPECT_TRUE( pWeakService.expired() );
  EXPECT_EQ( Callbacks.Remove( pSecond ), 0u );
  EXPECT_EQ( Callbacks.Remove( pImmediate ), 1u );
  EXPECT_EQ( Callbacks.Count(), 0u );
}

TEST( MultiCallbackPostal, DropsAServiceWhoseSubscribersHaveAllDied )
{
  auto pService = std::make_shared<VManualPostalService>();
  const std::weak_ptr<VManualPostalService> pWeakService = pService;
  VMultiCallbackPostal<void()> Callbacks( pService );
  auto pSubscriber = std::make_shared<int>( 1 );
  Callbacks.Add( BindWeak( pSubscriber, []( int& i_rCount ) { ++i_rCount; } ), pService );
  Callbacks.Add( BindWeak( pSubscriber, []( int& i_rCount ) { ++i_rCount; } ), nullptr );
  pSubscriber.reset();
  EXPECT_TRUE( Callbacks() );
  EXPECT_EQ( Callbacks.Count(), 1u );
  EXPECT_EQ( pService->RunAll(), 1u );
  EXPECT_EQ( Callbacks.Count(), 0u );
  EXPECT_FALSE( Callbacks() );
  EXPECT_EQ( pService->Pending(), 0u );
}

TEST( MultiCallbackPostal, APostedListOutlivesItsOwnerAndItsEntriesGoWithTheirRemoval )
{
  const auto pService = std::make_shared<VManualPostalService>();
  auto pCallbacks = std::make_unique<VMultiCallbackPostal<void()>>( pService );
  std::string Ran;
  void* pFirst = pCallbacks->Add( [&] { Ran += "a"; } );
  pCallbacks->Add( [&] { Ran += "b"; } );
  ( *pCallbacks )();
  pCallbacks->Remove( pFirst );
  pCallbacks.reset();
  EXPECT_EQ( pService->RunAll(), 1u );
  EXPECT_EQ( Ran, "b" );
}

// The destruction of a callable or a service may come back into the list: a deadlock if that held its lock.
TEST( MultiCallbackPostal, HoldsNoLockWhileACallableOrServiceEnds )
{
  VMultiCallbackPostal<void()> Callbacks;
  const auto CallsBack = [&Callbacks] { return std::shared_ptr<void>( nullptr, [&Callbacks]( void* ) { Callbacks.Count(); } ); };
  class VServiceThatCallsBack : public VManualPostalService
  {
  public:
    explicit VServiceThatCallsBack( std::shared_ptr<void> i_pEnd ) : m_pEnd( std::move( i_pEnd ) ) {}

  private:
    const std::shared_ptr<void> m_pEnd;
  };
  const auto Add = [&] { return Callbacks.Add( [p = CallsBack()] {}, std::make_shared<VServiceThatCallsBack>( CallsBack() ) ); };
  EXPECT_EQ( Callbacks.Remove( Add() ), 1u );
  Add();
  EXPECT_EQ( Callbacks.Clear(), 1u );
  Callbacks.AddImmediate( [p = CallsBack()] { throw VDeregisterWeakCallbackException(); } );
  EXPECT_FALSE( Callbacks() );
  EXPECT_EQ( Callbacks.Count(), 0u );
}

TEST( MultiCallbackPostal, StandsSubscribersThatComeAndGoWhileItFires )
{
  constexpr int Rounds = 400;
  const auto pService = std::make_shared<VManualPostalService>();
  VMultiCallbackPostal<void( unsigned int )> Callbacks( pService );
  std::atomic<unsigned int> Permanent{ 0 };
  std::atomic<unsigned int> Passing{ 0 };
  Callbacks.AddImmediate( [&]( unsigned int ) { ++Permanent; } );
  const auto Fire = [&]
  {
    EXPECT_TRUE( Callbacks( 1 ) );
    pService->RunAll();
  };
  const auto ComeAndGo = [&]
  {
    auto pSubscriber = std::make_shared<int>( 0 );
    void* pHandle = Callbacks.Add( [&]( unsigned int ) { ++Passing; } );
    Callbacks.Add( BindWeak( pSubscriber, []( int&, unsigned int ) {} ), nullptr );
    pSubscriber.reset();
    EXPECT_EQ( Callbacks.Remove( pHandle ), 1u );
  };
  const auto Repeat = [&]( uint32_t i_Thread )
  {
    for( int Round = 0; Round < Rounds; ++Round )
    {
      i_Thread == 0 ? Fire() : ComeAndGo();
    }
  };
  TestSupport::RunOnThreads( 3, Repeat );
  Callbacks( 1 );
  EXPECT_EQ( Permanent, Rounds + 1u );
  EXPECT_EQ( Callbacks.Count(), 1u );
}
}
