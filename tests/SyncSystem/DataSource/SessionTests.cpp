#include "tests/SyncSystem/DataSource/TestSource.h"

#include "NotificationSystem/AsioPostalService.h"
#include "tests/support/LogCapture.h"

#include <future>

namespace
{

using KVZ::VGlobalSyncSessionId;

TEST( DataSourceSessions, OptsOutWithoutFramesAndWhileDisabledAndBeginsAnewWhenEnabled )
{
  VSourceRig Rig;
  const TestSupport::VLogCapture Log( "Hal.Test" );
  EXPECT_FALSE( Rig.Declare( 1 ) );
  EXPECT_TRUE( Log.Has( "DeclareGlobalSyncSession(1): Source will not participate in session as there is no valid source sync session" ) );
  Rig.m_pSource->AddMany( 1 );
  EXPECT_TRUE( Log.Has( "AddFrame: Frame forced new local sync session 1 - will request new global sync session" ) );
  Rig.m_pService->RunAll();
  EXPECT_EQ( Rig.m_Requests, ( std::vector<uint32_t>{ 1 } ) );

  const auto Session = Rig.Declare( 2 );
  ASSERT_TRUE( Session );
  EXPECT_TRUE( Log.Has( "DeclareGlobalSyncSession(2): Source prepping for Non-Triggered session - will use source sync session 1" ) );
  EXPECT_EQ( Session->Validate(), "" );
  EXPECT_EQ( Session->m_NoticePeriod, VTick( 67500000 ) );

  Rig.OnStrand( [&] { EXPECT_TRUE( Rig.m_pSource->SetSourceEnabled( false ) ); } );
  EXPECT_TRUE( Log.Has( "SetSourceEnabled: Source disabled - will request new global session" ) );
  EXPECT_EQ( Rig.m_Requests.back(), 2u );
  EXPECT_FALSE( Rig.Declare( 3 ) );
  EXPECT_TRUE( Log.Has( "DeclareGlobalSyncSession(3): Source will opt out of this global session" ) );
  const size_t Requests = Rig.m_Requests.size();
  Rig.OnStrand( [&] { EXPECT_FALSE( Rig.m_pSource->SetSourceEnabled( false ) ); } );
  EXPECT_EQ( Rig.m_Requests.size(), Requests ) << "no change, no request";

  Rig.m_pSource->AddMany( 3 );
  Rig.OnStrand( [&] { EXPECT_TRUE( Rig.m_pSource->SetSourceEnabled( true ) ); } );
  EXPECT_EQ( Rig.m_Requests.size(), Requests + 1 );
  EXPECT_FALSE( Rig.Declare( 4 ) ) << "no session is offered before the next frame";
  Rig.m_pSource->AddMany( 1 );
  EXPECT_EQ( Rig.m_pSource->Buffer()->GetCurrentBufferSession().Value(), 2u );
  const auto Next = Rig.Declare( 5 );
  ASSERT_TRUE( Next );
  EXPECT_EQ( Next->m_Id, 2u );
}

TEST( DataSourceSessions, AStartDoesNothingWithoutItsCounterOrToASourceThatOptedOut )
{
  VSourceRig Rig;
  Rig.m_pSource->AddMany( 3 );
  const auto Session = Rig.Declare( 1 );
  ASSERT_TRUE( Session );
  SyncSystem::VReadFrames Read;
  KVZ::ITickInClocks Ticks = Rig.ReadingsAt( *Session, VTick( 1000 ), VTick( 1000 ) );
  Ticks.m_TickByClock.erase( Rig.m_pSource->CounterClock() );
  const TestSupport::VLogCapture Log( "Hal.Test", 2 );
  Rig.m_pSource->StartGlobalSyncSession( Ticks, VTick() );
  EXPECT_EQ( Log.Lines().size(), 1u );
  EXPECT_EQ( Rig.m_pSource->ReadFrames( 10, Read ), SyncSystem::EReadResult::None );

  Rig.m_pSource->StartGlobalSyncSession( Rig.ReadingsAt( *Session, VTick( 1000 ), VTick( 1000 ) ), VTick() );
  Rig.OnStrand( [&] { Rig.m_pSource->SetSourceEnabled( false ); } );
  EXPECT_FALSE( Rig.Declare( 2 ) );
  Rig.m_pSource->StartGlobalSyncSession( Rig.ReadingsAt( *Session, VTick( 9000 ), VTick( 9000 ) ), VTick() );
  ASSERT_EQ( Rig.m_pSource->ReadFrames( 10, Read ), SyncSystem::EReadResult::Frames );
  EXPECT_EQ( Read.m_Frames[0].m_Tick, VTick( 1000 ) );
}

TEST( DataSourceSessions, TakesTheTimecodeOfItsOwnStandard )
{
  VSourceRig Rig;
  Rig.m_pSource->m_Timecode = Period * 1500;   // 00:01:00:00
  Rig.m_pSource->AddMany( 9 );
  const auto Session = Rig.Declare( 1 );
  ASSERT_TRUE( Session );
  KVZ::ITickInClocks Ticks = Rig.ReadingsAt( *Session, VTick( 12345 ), VTick( 12345 ) + Period * 8 );
  Ticks.Set( IClock( IClock::Timecode, 1, 0 ), VTick( 5625000 ) );   // another source's, of 24 frames: sorts before
  Ticks.Set( IClock( IClock::Timecode, 6, 0 ), VTick( 0 ) );
  const TestSupport::VLogCapture Log( "Hal.Test" );
  Rig.m_pSource->StartGlobalSyncSession( Ticks, Period * 2 );
  EXPECT_TRUE( Log.Has( "StartGlobalSyncSession(1): Start tick " + std::to_string( 12345 + Period.Count() * 8 ) ) );
  SyncSystem::VReadFrames Read;
  Rig.m_pSource->ReadFrames( 10, Read );
  ASSERT_TRUE( Read.m_pInfo );
  EXPECT_EQ( KVZ::ToText( Read.m_FirstTimecode ), "00:01:00:08" );
  EXPECT_EQ( KVZ::ToText( Read.m_pInfo->m_Timecode ), "00:01:00:00" );
  EXPECT_EQ( Read.m_pInfo->m_CounterStart, VTick( 12345 ) );
  EXPECT_EQ( Read.m_pInfo->m_OffsetTimecodeFrames, 2 );
  EXPECT_EQ( KVZ::ToText( Read.m_pInfo->TimecodeAt( VTick( 12345 ) - Period ) ), "00:00:59:24" );
}

TEST( DataSourceSessions, TellsItsPlaceAndForgetsSessionsWhoseFramesHaveGone )
{
  VSourceRig Rig( 40 );
  EXPECT_EQ( Rig.m_pSource->GetOldestGlobalSyncSession(), VGlobalSyncSessionId() );
  Rig.m_pSource->AddMany( 10 );
  Rig.Join( 1, VTick( 0 ) );
  EXPECT_EQ( Rig.SyncStatus().m_LatestCounterFrames, 9u );
  Rig.m_pSource->Miss( 1 );
  Rig.m_pSource->AddMany( 6 );
  Rig.Join( 2, VTick( 0 ) );
  const auto Status = Rig.SyncStatus();
  EXPECT_EQ( Status.m_Session.m_Id, 2u );
  EXPECT_EQ( Status.m_LatestCounterFrames, 5u );
  EXPECT_EQ( Status.m_LastDeclared, VGlobalSyncSessionId( 2 ) );
  EXPECT_TRUE( Status.m_bEnabled );
  EXPECT_EQ( Rig.m_pSource->GetOldestGlobalSyncSession(), VGlobalSyncSessionId( 1 ) );
  Rig.m_pSource->AddMany( 60 );
  EXPECT_EQ( Rig.m_pSource->GetOldestGlobalSyncSession(), VGlobalSyncSessionId( 2 ) );
}

// An engine that answers a request on the source's own strand.
TEST( DataSourceSessions, ACallerOnTheStrandIsAnsweredInPlace )
{
  const TestSupport::VFrameMemory Memory( 10, 4 );
  const auto pSource = KVZ::MakeShared<VTestSource>( SourceSettings( Memory, std::make_shared<NotificationSystem::VAsioPostalService>( "Strand" ) ) );
  std::promise<uint32_t> Offered;
  pSource->OnRequestNewGlobalSyncSession().Set(
    [&]( VGlobalSyncSessionId )
    {
      const auto Session = pSource->DeclareGlobalSyncSession( VGlobalSyncSessionId( 1 ), nullptr );
      Offered.set_value( Session ? Session->m_Id : 0 );
    } );
  ASSERT_TRUE( pSource->Add() );
  EXPECT_EQ( Offered.get_future().get(), 1u );
  EXPECT_EQ( pSource->GetSourceSyncStatus().m_LastDeclared, VGlobalSyncSessionId( 1 ) ) << "from any other thread it waits";
}

}
