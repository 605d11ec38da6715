#include "tests/SyncSystem/DataSource/TestSource.h"

#include "tests/support/LogCapture.h"

namespace
{

using SyncSystem::EReadResult;
using SyncSystem::VReadFrames;

constexpr uint64_t Plenty = 1000;

std::vector<int64_t> Indices( const VReadFrames& i_rRead )
{
  std::vector<int64_t> Indices;
  for( const auto& rFrame : i_rRead.m_Frames )
  {
    Indices.push_back( IndexOf( rFrame.m_Frame ) );
  }
  return Indices;
}

TEST( DataSourceReading, GivesEachFrameOnceFromTheFirstAtOrAfterTheStart )
{
  VSourceRig Rig;
  VReadFrames Read;
  EXPECT_EQ( Rig.m_pSource->ReadFrames( Plenty, Read ), EReadResult::None ) << "no session";
  Rig.m_pSource->AddMany( 5 );
  const auto Session = Rig.Declare( 1 );
  ASSERT_TRUE( Session );
  EXPECT_EQ( Rig.m_pSource->ReadFrames( Plenty, Read ), EReadResult::None ) << "declared and not started";

  const VTick Start( 1000000007 );
  Rig.m_pSource->StartGlobalSyncSession( Rig.ReadingsAt( *Session, Start, Start + Period * 2 + VTick( 1 ) ), VTick() );
  ASSERT_EQ( Rig.m_pSource->ReadFrames( Plenty, Read ), EReadResult::Frames );
  EXPECT_EQ( Indices( Read ), ( std::vector<int64_t>{ 3, 4 } ) ) << "one tick after frame 2";
  EXPECT_EQ( Read.m_Frames[0].m_Tick, Start + Period * 3 );
  EXPECT_EQ( Read.m_Frames[1].m_GlobalSession, KVZ::VGlobalSyncSessionId( 1 ) );
  EXPECT_EQ( Rig.m_pSource->ReadFrames( Plenty, Read ), EReadResult::None );
  Rig.m_pSource->AddMany( 1 );
  ASSERT_EQ( Rig.m_pSource->ReadFrames( Plenty, Read ), EReadResult::Frames );
  EXPECT_EQ( Indices( Read ), ( std::vector<int64_t>{ 5 } ) );
}

TEST( DataSourceReading, ThinsABacklogAndSaysSo )
{
  VSourceRig Rig;
  Rig.m_pSource->m_BeatPeriod = Period;
  Rig.m_pSource->AddMany( 1 );
  Rig.Join( 1, VTick( 0 ) );
  Rig.m_pSource->AddMany( 39 );
  const TestSupport::VLogCapture Log( "Hal.Test" );
  VReadFrames Read;
  ASSERT_EQ( Rig.m_pSource->ReadFrames( 10, Read ), EReadResult::Frames );
  ASSERT_EQ( Read.m_Frames.size(), 40u );
  EXPECT_EQ( std::count_if( Read.m_Frames.begin(), Read.m_Frames.end(), []( const auto& i_rFrame ) { return i_rFrame.m_DropRun == 0; } ), 10 );
  EXPECT_EQ( Read.m_Beat.m_Period, Period );
  EXPECT_TRUE( Log.Has( "Backlog is 40 frames long" ) );
  EXPECT_TRUE( Log.Has( "Evenly dropped 30 frames" ) );
}

TEST( DataSourceReading, ChangesOverWhenANewSessionHasStarted )
{
  VSourceRig Rig;
  Rig.m_pSource->AddMany( 3 );
  Rig.Join( 1, VTick( 0 ) );
  VReadFrames Read;
  ASSERT_EQ( Rig.m_pSource->ReadFrames( Plenty, Read ), EReadResult::Frames );
  Rig.m_pSource->Miss( 5 );
  Rig.m_pSource->AddMany( 4 );
  EXPECT_EQ( Rig.m_pSource->ReadFrames( Plenty, Read ), EReadResult::None ) << "frames of a session that is not declared yet";
  Rig.Join( 2, Period * 8, Period * 13 );
  Rig.m_pSource->AddMany( 1 );
  EXPECT_EQ( Rig.m_pSource->ReadFrames( Plenty, Read ), EReadResult::None ) << "the start lies ahead";
  Rig.m_pSource->AddMany( 1 );
  ASSERT_EQ( Rig.m_pSource->ReadFrames( Plenty, Read ), EReadResult::Frames );
  EXPECT_EQ( Indices( Read ), ( std::vector<int64_t>{ 13 } ) );
  EXPECT_EQ( Read.m_Frames[0].m_Tick, Period * 13 );
  EXPECT_EQ( Read.m_pInfo->m_Id, KVZ::VGlobalSyncSessionId( 2 ) );
}

}
