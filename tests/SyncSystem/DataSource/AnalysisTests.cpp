// When frames came, and how late: told of a session, and published one state a frame where somebody wants it.
#include "host/FlowGraphState.h"
#include "tests/SyncSystem/DataSource/TestSource.h"

namespace
{

double NumberOf( const KVZ::VFlowStatePtr& i_pState, const char* i_pName )
{
  double Number = -1.0;
  EXPECT_EQ( i_pState->Items().size(), 1u );
  EXPECT_EQ( i_pState->Items().front()->Label(), "GenericData Item" );
  EXPECT_EQ( &i_pState->Items().front()->Type(), &KVZ::VFlowGenericData::ItemType );
  EXPECT_TRUE( static_cast<const KVZ::VFlowGenericData&>( *i_pState->Items().front() ).GetNumber( i_pName, Number ) );
  return Number;
}

TEST( DeliveryAnalysis, TimesASessionAndPublishesAStateForEachTimedFrame )
{
  const TestSupport::VFrameMemory Memory( 50, 4 );
  std::vector<KVZ::VFlowStatePtr> Published;
  bool bStates = true;
  SyncSystem::VDataSourceSettings Settings = SourceSettings( Memory, nullptr );
  Settings.m_pAnalysis = std::make_shared<SyncSystem::VDriftMonitorAnalysis>( [&]() -> KVZ::VFlowStatePtr
    { return bStates ? std::make_shared<StageHost::VFlowState>() : nullptr; },
    [&]( KVZ::VFlowStatePtr i_pState ) { Published.push_back( std::move( i_pState ) ); } );
  const auto pSource = KVZ::MakeShared<VTestSource>( Settings );

  pSource->AddMany( 2 );
  EXPECT_TRUE( Published.empty() ) << "a time of 0 is no time";
  EXPECT_FALSE( pSource->GetSourceTimingInfo() );
  pSource->m_Now = 100.0;
  pSource->AddMany( 40 );
  const size_t Steady = Published.size();
  EXPECT_GE( Steady, 38u );
  const auto Info = pSource->GetSourceTimingInfo();
  ASSERT_TRUE( Info );
  EXPECT_EQ( Info->m_SessionId, 1u );
  EXPECT_NEAR( Info->m_StartTime, 100.0, 1e-6 ) << "of the session's first frame, though that was not timed";
  EXPECT_NEAR( Info->m_SecondsPerSample, 0.04, 1e-9 );
  pSource->m_Now = 100.004;   // from here on later
  pSource->AddMany( 1 );
  ASSERT_EQ( Published.size(), Steady + 1 );
  EXPECT_NEAR( NumberOf( Published.back(), "DeliveryOffset" ), 0.004, 0.0005 );
  EXPECT_NEAR( NumberOf( Published.back(), "PredictedOffset" ), 0.0001, 0.0005 );
  bStates = false;
  pSource->AddMany( 1 );
  EXPECT_EQ( Published.size(), Steady + 1 );
  SyncSystem::VDeliveryOffsets Offsets;
  EXPECT_FALSE( pSource->GetDeliveryOffsets( 2, 30, 101.2, Offsets ) ) << "of a session that is not timed";
}

}
