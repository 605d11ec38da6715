// How late frames came, published one state a frame where somebody wants it.
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

TEST( DeliveryAnalysis, PublishesAStateForEachTimedFrame )
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
  EXPECT_TRUE( Published.empty() ) << "frames without a time";
  pSource->m_Now = 100.0;
  pSource->AddMany( 40 );
  const size_t Steady = Published.size();
  EXPECT_GE( Steady, 38u );
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
