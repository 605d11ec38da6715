#include "NotificationSystem/AsioPostalService.h"
#include "NotificationSystem/DispatchCollapser.h"
#include "StageCoreRuntime/DebugServices.h"
#include "tests/support/LogCapture.h"
#include "tests/support/ManualPostalService.h"
#include "tests/support/Threads.h"

#include <gtest/gtest.h>

#include <boost/thread/barrier.hpp>

#include <future>
#include <stdexcept>

namespace
{
using NotificationSystem::VAsioPostalService;
using NotificationSystem::VDispatchCollapserDontPostIfAnotherQueued;

TEST( AsioPostalService, RunsInOrderOnItsNamedWorkerAndDrainsBeforeItEnds )
{
  constexpr int Count = 1000;
  std::vector<int> Ran;
  std::string Name;
  boost::thread::id Worker;
  {
    VAsioPostalService Service( "Video Input Engine" );
    Service.Post(
      [&]
      {
        Name = DebugServices::GetThreadName();
        Worker = boost::this_thread::get_id();
      } );
    for( int Number = 0; Number < Count; ++Number )
    {
      Service.Post( [&Ran, Number] { Ran.push_back( Number ); } );
    }
    Service.Post( [&] { Service.Post( [&] { Ran.push_back( Count ); } ); } );
  }
  EXPECT_EQ( Name, "Video Input Engine0" );
  EXPECT_NE( Worker, boost::this_thread::get_id() );
  ASSERT_EQ( Ran.size(), Count + 1u ) << "what is posted while the service ends still runs";
  EXPECT_TRUE( std::is_sorted( Ran.begin(), Ran.end() ) );
}

TEST( AsioPostalService, StartsAndStopsOnceEachWithAsManyWorkersAsItIsToldTo )
{
  constexpr unsigned int Workers = 3;
  VAsioPostalService Service( "Crew" );
  EXPECT_FALSE( Service.Start( 1 ) );
  EXPECT_TRUE( Service.Stop() );
  EXPECT_FALSE( Service.Stop() );
  EXPECT_FALSE( Service.Start( 0 ) );
  EXPECT_FALSE( Service.Stop() );

  // What is posted while it is stopped waits for the next start.
  boost::barrier AllAtOnce( Workers );   // passes only if each item has a thread of its own
  boost::mutex Mutex;
  std::set<std::string> Names;
  for( unsigned int Item = 0; Item < Workers; ++Item )
  {
    Service.Post(
      [&]
      {
        AllAtOnce.wait();
        boost::lock_guard<boost::mutex> Lock( Mutex );
        Names.insert( DebugServices::GetThreadName() );
      } );
  }
  EXPECT_TRUE( Names.empty() );
  ASSERT_TRUE( Service.Start( Workers ) );
  EXPECT_TRUE( Service.Stop() );
  EXPECT_EQ( Names, ( std::set<std::string>{ "Crew0", "Crew1", "Crew2" } ) );
}

TEST( AsioPostalService, AnExceptionEndsItsItemAlone )
{
  const TestSupport::VLogCapture Capture( "NotificationSystem" );
  bool bNextRan = false;
  {
    VAsioPostalService Service( "Thrower" );
    Service.Post( [] { throw std::runtime_error( "100% broken" ); } );
    Service.Post( [&] { bNextRan = true; } );
  }
  EXPECT_TRUE( bNextRan );
  EXPECT_TRUE( Capture.Has( "A posted function ended with an exception: 100% broken" ) );
}

TEST( AsioPostalService, MayEndOnItsOwnWorker )
{
  const auto pDrained = std::make_shared<std::promise<void>>();
  std::promise<void> Posted;
  auto pService = std::make_shared<VAsioPostalService>( "Suicidal" );
  VAsioPostalService* pRaw = pService.get();
  pRaw->Post(
    [pDrained, pOwner = std::move( pService ), AfterPost = Posted.get_future().share()]() mutable
    {
      AfterPost.wait();
      pOwner->Post( [pDrained] { pDrained->set_value(); } );
      pOwner.reset();
    } );
  Posted.set_value();
  pDrained->get_future().get();   // the worker drains the queue although its service has ended
}

TEST( AsioPostalService, StandsPostsFromSeveralThreadsAcrossRestarts )
{
  constexpr int Posts = 500;
  VAsioPostalService Service( "Busy" );
  int Ran = 0;   // one worker at a time, so no lock
  const auto Restart = [&]
  {
    for( int Round = 0; Round < 20; ++Round )
    {
      Service.Stop();
      Service.Start( 1 );
    }
  };
  const auto Post = [&]
  {
    for( int Number = 0; Number < Posts; ++Number )
    {
      Service.Post( [&Ran] { ++Ran; } );
    }
  };
  TestSupport::RunOnThreads( 3, [&]( uint32_t i_Thread ) { i_Thread == 0 ? Restart() : Post(); } );
  Service.Stop();
  EXPECT_EQ( Ran, 2 * Posts );
}

TEST( DispatchCollapser, RunsTheFirstOfABurstAndOneMoreForAPostFromInside )
{
  const auto pService = std::make_shared<TestSupport::VManualPostalService>();
  const auto pCollapser = VDispatchCollapserDontPostIfAnotherQueued::Create( pService );
  std::string Ran;
  for( int Post = 0; Post < 10; ++Post )
  {
    pCollapser->Post(
      [&, Post]
      {
        Ran += std::to_string( Post );
        pCollapser->Post( [&] { Ran += "n"; } );
        pCollapser->Post( [&] { Ran += "lost"; } );
      } );
  }
  EXPECT_EQ( pService->Pending(), 1u );
  EXPECT_EQ( pService->RunAll(), 2u );
  EXPECT_EQ( Ran, "0n" );
  EXPECT_EQ( VDispatchCollapserDontPostIfAnotherQueued::Create( nullptr ), nullptr );
}

TEST( DispatchCollapser, LosesNoNotificationAtTheEndOfABurst )
{
  constexpr int Bursts = 2000;
  std::atomic<int> Published{ 0 };
  int Seen = 0;
  const auto pService = std::make_shared<VAsioPostalService>( "Collapsed" );
  const auto pCollapser = VDispatchCollapserDontPostIfAnotherQueued::Create( pService );
  for( int Burst = 0; Burst < Bursts; ++Burst )
  {
    ++Published;
    pCollapser->Post( [&] { Seen = Published; } );
  }
  pService->Stop();
  EXPECT_EQ( Seen, Bursts );
}
}
