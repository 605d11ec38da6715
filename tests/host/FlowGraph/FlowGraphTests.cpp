// The graph with real nodes on real threads. Every wait is for a condition.
#include "host/FlowGraph.h"

#include "tests/host/FlowGraph/GraphNodes.h"

#include <gtest/gtest.h>

#include <atomic>
#include <future>
#include <numeric>

namespace
{

std::vector<double> UpTo( size_t i_Count )
{
  std::vector<double> Numbers( i_Count );
  std::iota( Numbers.begin(), Numbers.end(), 0.0 );
  return Numbers;
}

uint32_t StayAsleep( uint64_t ) { return EFlowResult::Asleep; }

class FlowGraph : public ::testing::Test
{
protected:
  VFlowNodeId Add( const std::shared_ptr<KVZ::IFlowNode>& i_pNode )
  {
    return m_Graph.AddNode( i_pNode, { .m_Name = "Node", .m_QueueLength = QueueLength } );
  }
  VFlowNodeId AddFunction( VFunctionNode::VFunction i_Function ) { return Add( std::make_shared<VFunctionNode>( std::move( i_Function ) ) ); }
  std::pair<std::shared_ptr<VCollectingNode>, VFlowNodeId> AddCollector()
  {
    auto pNode = std::make_shared<VCollectingNode>();
    return { pNode, Add( pNode ) };
  }
  // One that the source leads to
  std::pair<std::shared_ptr<VCollectingNode>, VFlowNodeId> AddConsumer()
  {
    auto Collector = AddCollector();
    EXPECT_TRUE( m_Graph.Connect( { m_Source, 0 }, { Collector.second, 0 } ) );
    return Collector;
  }
  void WaitForState( VFlowNodeId i_Node, EFlowNodeState i_State )
  {
    m_Graph.WaitUntil( i_Node, [i_State]( const VFlowNodeStatus& i_rStatus ) { return i_rStatus.m_State == i_State; } );
  }
  void WaitUntilAsleep( VFlowNodeId i_Node )
  {
    m_Graph.WaitUntil( i_Node, []( const VFlowNodeStatus& i_rStatus ) { return i_rStatus.m_bAsleep; } );
  }
  // The source has written all it may, or cannot go on.
  void WaitUntilWritten( uint64_t i_Count )
  {
    m_Graph.WaitUntil( m_Source,
      [i_Count]( const VFlowNodeStatus& i_rStatus ) { return i_rStatus.m_bAsleep && i_rStatus.m_StatesWritten == i_Count; } );
  }

  static constexpr size_t QueueLength = 3;

  StageHost::VFlowGraph m_Graph;
  const std::shared_ptr<VCountingNode> m_pSource = std::make_shared<VCountingNode>();
  const VFlowNodeId m_Source = Add( m_pSource );
};

TEST_F( FlowGraph, RefusesWhatCannotBeWired )
{
  const VFlowNodeId Node = AddFunction( []( VFunctionNode& ) {} );
  EXPECT_FALSE( m_Graph.Connect( { m_Source, 1 }, { Node, 0 } ) );
  EXPECT_FALSE( m_Graph.Connect( { m_Source, 0 }, { Node, 2 } ) );
  EXPECT_FALSE( m_Graph.Connect( { Node + 1, 0 }, { Node, 0 } ) );
  EXPECT_FALSE( m_Graph.Disconnect( { Node, 0 } ) );
  EXPECT_TRUE( m_Graph.Connect( { m_Source, 0 }, { Node, 1 } ) );
  EXPECT_FALSE( m_Graph.Connect( { m_Source, 0 }, { Node, 1 } ) ) << "one source for an input";
  EXPECT_FALSE( m_Graph.StopNode( Node ) );
  EXPECT_FALSE( m_Graph.StartNode( Node + 1 ) );
  EXPECT_FALSE( m_Graph.RemoveNode( Node + 1 ) );
}

TEST_F( FlowGraph, AFullQueueHoldsTheSourceBack )
{
  const auto [pCollector, Collector] = AddConsumer();
  pCollector->Hold( true );
  m_Graph.Start();
  m_pSource->Allow( 10 );
  pCollector->WaitFor( 1 );
  WaitUntilWritten( 1 + QueueLength );
  EXPECT_FALSE( m_pSource->Last().expired() );
  pCollector->Hold( false );
  EXPECT_EQ( pCollector->WaitFor( 10 ), UpTo( 10 ) );
}

TEST_F( FlowGraph, IsRewiredWhileItRuns )
{
  const auto [pFirst, First] = AddConsumer();
  const auto [pSecond, Second] = AddCollector();
  pFirst->Hold( true );
  m_Graph.Start();
  m_pSource->Allow( 4 );
  pFirst->WaitFor( 1 );
  WaitUntilWritten( 4 );   // the others wait at the input
  EXPECT_FALSE( m_pSource->Last().expired() );
  EXPECT_TRUE( m_Graph.Disconnect( { First, 0 } ) );
  EXPECT_TRUE( m_pSource->Last().expired() ) << "what waited at the input is let go";
  WaitUntilAsleep( m_Source );
  m_pSource->Allow( 2 );   // nobody is connected: they are not made
  m_Graph.Connect( { m_Source, 0 }, { Second, 0 } );
  EXPECT_EQ( pSecond->WaitFor( 2 ), ( std::vector<double>{ 4, 5 } ) );
  pFirst->Hold( false );
  EXPECT_EQ( pFirst->Numbers(), UpTo( 1 ) );
}

TEST_F( FlowGraph, CarriesStatesInOrderToEveryInputAndPastAConsumerThatStops )
{
  const auto [pFirst, First] = AddConsumer();
  const auto [pSecond, Second] = AddConsumer();
  m_Graph.Start();
  m_pSource->Allow( 20 );
  EXPECT_EQ( pFirst->WaitFor( 20 ), UpTo( 20 ) );
  pSecond->WaitFor( 20 );
  EXPECT_TRUE( m_Graph.StopNode( First ) );
  m_pSource->Allow( 20 );
  EXPECT_EQ( pSecond->WaitFor( 40 ), UpTo( 40 ) );
  EXPECT_TRUE( m_Graph.StartNode( First ) );
  m_pSource->Allow( 1 );
  EXPECT_EQ( pFirst->WaitFor( 21 ).back(), 40.0 );
  EXPECT_TRUE( m_Graph.RemoveNode( First ) );
  EXPECT_EQ( pFirst.use_count(), 1 );
  m_pSource->Allow( 1 );
  pSecond->WaitFor( 42 );
  m_Graph.Stop();
  EXPECT_EQ( m_Graph.GetStatus( Second ).m_State, EFlowNodeState::Idle );
  EXPECT_EQ( m_Graph.GetStatus( m_Source ).m_StatesWritten, 42u );
  EXPECT_TRUE( m_pSource->Last().expired() );
}

TEST_F( FlowGraph, NothingRunsWhileThereIsNothingToDo )
{
  const auto [pCollector, Collector] = AddConsumer();
  m_Graph.Start();
  std::vector<uint64_t> WakeUps;
  for( const size_t Count : { 1, 2 } )
  {
    m_pSource->Allow( 1 );
    pCollector->WaitFor( Count );
    for( const VFlowNodeId Node : { m_Source, Collector } )
    {
      WaitUntilAsleep( Node );
      WakeUps.push_back( m_Graph.GetStatus( Node ).m_WakeUps );
    }
  }
  EXPECT_EQ( WakeUps[2], WakeUps[0] + 1 );
  EXPECT_EQ( WakeUps[3], WakeUps[1] + 1 );
}

TEST_F( FlowGraph, WakesTheCallThatATokenBelongsToAndNoOther )
{
  std::shared_ptr<KVZ::IFlowNodeServices> pServices;
  std::promise<uint64_t> Tokens[4];
  std::atomic<int> Calls{ 0 };
  const VFlowNodeId Node = AddFunction(
    [&]( VFunctionNode& i_rNode )
    {
      pServices = i_rNode.Services();
      const auto Call = [&]( uint64_t i_Token ) -> uint32_t
      {
        const int Number = Calls++;
        if( Number == 0 )
        {
          pServices->Wake( i_Token );   // before the node sleeps: not lost
          return EFlowResult::Asleep;
        }
        Tokens[Number].set_value( i_Token );
        return Number < 3 ? EFlowResult::Asleep : EFlowResult::EndOfData;
      };
      i_rNode.DoBlockingCall( Call, VFlowLimit::None() );
    } );
  m_Graph.StartNode( Node );
  const uint64_t First = Tokens[1].get_future().get();
  EXPECT_NE( First, 0u );
  WaitUntilAsleep( Node );
  const uint64_t WakeUps = m_Graph.GetStatus( Node ).m_WakeUps;
  pServices->Wake( 0 );
  pServices->Wake( First + 1 );
  pServices->Wake( First - 1 );
  EXPECT_EQ( m_Graph.GetStatus( Node ).m_WakeUps, WakeUps );
  pServices->Wake( First );
  const uint64_t Second = Tokens[2].get_future().get();
  EXPECT_NE( Second, First );
  WaitUntilAsleep( Node );
  pServices->Wake( First );
  EXPECT_EQ( Calls, 3 );
  pServices->Wake( Second );
  WaitForState( Node, EFlowNodeState::Ended );
  pServices->Wake( Second );   // too late: nothing happens
  EXPECT_EQ( Calls, 4 );
}

TEST_F( FlowGraph, TheEndOfDataRunsThroughTheGraph )
{
  const VFlowNodeId Source = AddFunction(
    []( VFunctionNode& i_rNode )
    {
      for( int Number = 0; Number < 5; ++Number )
      {
        i_rNode.Write( 1, MakeNumber( i_rNode, Number ), VFlowLimit::None() );
      }
      throw Flow2Utils::VFlowFinishedException( "That was all" );
    } );
  const VFlowNodeId Middle = AddFunction(
    []( VFunctionNode& i_rNode )
    {
      i_rNode.Select( { 0, 1 }, {}, VFlowLimit::None(), i_rNode.m_Selection );
      EXPECT_TRUE( i_rNode.m_Selection.m_bInput );
      EXPECT_EQ( i_rNode.m_Selection.m_Index, 1u );
      i_rNode.ReadOneOf( { 1 }, VFlowLimit::None(), i_rNode.m_Index, i_rNode.m_pState );
      i_rNode.Select( {}, { 0, 1 }, VFlowLimit::None(), i_rNode.m_Selection );
      EXPECT_FALSE( i_rNode.m_Selection.m_bInput );
      EXPECT_EQ( i_rNode.m_Selection.m_Index, 0u );
      i_rNode.Write( 0, i_rNode.m_pState, VFlowLimit::None() );
    } );
  const auto [pCollector, Collector] = AddCollector();
  m_Graph.Connect( { Source, 1 }, { Middle, 1 } );
  m_Graph.Connect( { Middle, 0 }, { Collector, 0 } );
  m_Graph.Start();
  for( const VFlowNodeId Node : { Source, Middle, Collector } )
  {
    WaitForState( Node, EFlowNodeState::Ended );
  }
  EXPECT_EQ( pCollector->Numbers(), UpTo( 5 ) );
  EXPECT_EQ( m_Graph.GetFailure(), "" );
  m_Graph.Start();   // once more from the beginning, now that all of them are at their ends
  EXPECT_EQ( pCollector->WaitFor( 10 ).back(), 4.0 );
}

TEST_F( FlowGraph, AnExceptionEndsTheWholeRunWithItsText )
{
  const VFlowNodeId Other = AddFunction( []( VFunctionNode& i_rNode ) { i_rNode.Sleep( VFlowLimit::None() ); } );
  const auto pFaulty = std::make_shared<VFunctionNode>( []( VFunctionNode& i_rNode ) { i_rNode.WaitInputConnected( 17, VFlowLimit::None() ); } );
  int Ends = 0;
  pFaulty->m_PostProcess = [&Ends]( VFunctionNode& ) { ++Ends; };
  const VFlowNodeId Faulty = Add( pFaulty );
  m_Graph.Start();
  WaitForState( Faulty, EFlowNodeState::Failed );
  WaitForState( Other, EFlowNodeState::Idle );
  WaitForState( m_Source, EFlowNodeState::Idle );
  EXPECT_EQ( m_Graph.GetFailure(), "WaitInputConnected: Unknown input - index = 17" );
  EXPECT_EQ( m_Graph.GetStatus( Faulty ).m_Failure, m_Graph.GetFailure() );
  EXPECT_EQ( Ends, 1 ) << "what it has set up stays";
}

TEST_F( FlowGraph, ANodeThatCannotBeStartedLeavesTheOthersAlone )
{
  const auto pFaulty = std::make_shared<VFunctionNode>( []( VFunctionNode& ) { ADD_FAILURE() << "runs"; } );
  int Ends = 0;
  pFaulty->m_Start = EFlowResult::Failed;
  pFaulty->m_PostProcess = [&Ends]( VFunctionNode& ) { ++Ends; };
  const VFlowNodeId Faulty = Add( pFaulty );
  const auto [pCollector, Collector] = AddConsumer();
  m_Graph.Start();
  WaitForState( Faulty, EFlowNodeState::Failed );
  m_pSource->Allow( 1 );
  pCollector->WaitFor( 1 );
  EXPECT_EQ( Ends, 1 ) << "what it has set up stays";
  EXPECT_EQ( m_Graph.GetFailure(), "" );
}

TEST_F( FlowGraph, GivesGlobalItemsToThoseWhoRunAndThoseWhoStartLater )
{
  std::promise<KVZ::VFlowItemList> Given[3];
  std::atomic<int> Count{ 0 };
  const auto Function = [&]( VFunctionNode& i_rNode )
  {
    KVZ::VFlowItemList Items;
    i_rNode.GlobalItems( VFlowLimit::None(), Items );
    Given[Count++].set_value( Items );
    // Whoever is asleep in a call that may be rewired hears of the next ones too.
    while( !i_rNode.GlobalItems( VFlowLimit::Zero(), Items ) )
    {
      i_rNode.DoBlockingCall( &StayAsleep, VFlowLimit::None(), KVZ::EFlowFlags::Rewirable );
    }
    Given[Count++].set_value( Items );
  };
  const VFlowNodeId Node = AddFunction( Function );
  const auto pItem = std::make_shared<KVZ::VFlowParameters>( "parameters" );
  m_Graph.SetGlobalItems( { pItem } );
  m_Graph.StartNode( Node );
  EXPECT_EQ( Given[0].get_future().get(), ( KVZ::VFlowItemList{ pItem } ) );
  WaitUntilAsleep( Node );
  m_Graph.SetGlobalItems( { pItem, pItem } );
  EXPECT_EQ( Given[1].get_future().get().size(), 2u );
}

// Each way to wait, without end. A stop ends all of them; so does the end of the graph itself.
TEST_F( FlowGraph, StopsFromEveryWait )
{
  const VFunctionNode::VFunction Waits[] = {
    []( VFunctionNode& r ) { r.Read( 0, VFlowLimit::None(), r.m_pState ); },
    []( VFunctionNode& r ) {
      r.ReadOneOf( { 0, 1 }, VFlowLimit::None(), r.m_Index, r.m_pState );
    },
    []( VFunctionNode& r ) { r.Write( 0, MakeNumber( r, 1 ), VFlowLimit::None() ); },   // until its own queue is full
    []( VFunctionNode& r ) { r.Select( { 0 }, { 1 }, VFlowLimit::None(), r.m_Selection ); },
    []( VFunctionNode& r ) { r.Sleep( VFlowLimit::None() ); },
    []( VFunctionNode& r ) { r.Sleep( { 1000000 } ); },
    []( VFunctionNode& r ) { r.DoBlockingCall( &StayAsleep, VFlowLimit::None() ); },
    []( VFunctionNode& r ) { r.GlobalItems( VFlowLimit::None(), r.m_Items ); },
    []( VFunctionNode& r ) { r.WaitInputConnected( 1, VFlowLimit::None() ); },
    []( VFunctionNode& r ) { r.WaitOutputConnected( 1, VFlowLimit::None() ); },
  };
  std::vector<VFlowNodeId> Nodes;
  for( const auto& rWait : Waits )
  {
    Nodes.push_back( AddFunction( rWait ) );
  }
  m_Graph.Connect( { Nodes[2], 0 }, { Nodes[2], 1 } );   // its own output
  m_Graph.Connect( { m_Source, 0 }, { Nodes[3], 0 } );
  for( int Round = 0; Round < 2; ++Round )
  {
    m_Graph.Start();
    for( const VFlowNodeId Node : Nodes )
    {
      WaitUntilAsleep( Node );
    }
    if( Round == 0 )
    {
      m_Graph.Stop();
      for( const VFlowNodeId Node : Nodes )
      {
        EXPECT_EQ( m_Graph.GetStatus( Node ).m_State, EFlowNodeState::Idle );
      }
    }
  }
}

TEST_F( FlowGraph, WaitsNoLongerThanItsLimit )
{
  std::promise<void> Done;
  const VFlowNodeId Node = AddFunction(
    [&]( VFunctionNode& i_rNode )
    {
      for( const VFlowLimit Limit : { VFlowLimit::Zero(), VFlowLimit{ 1 } } )
      {
        EXPECT_FALSE( i_rNode.Read( 0, Limit, i_rNode.m_pState ) );
        EXPECT_FALSE( i_rNode.WaitOutputConnected( 0, Limit ) );
        EXPECT_FALSE( i_rNode.GlobalItems( Limit, i_rNode.m_Items ) );
        EXPECT_FALSE( i_rNode.DoBlockingCall( &StayAsleep, Limit ) );
        i_rNode.Sleep( Limit );
      }
      EXPECT_EQ( i_rNode.InputIndex( "Right" ), 1u );
      EXPECT_EQ( i_rNode.OutputIndex( "Upper" ), 0u );
      EXPECT_EQ( i_rNode.CreateSharedUserBuffer( 100 )->Size(), 100u );
      EXPECT_TRUE( i_rNode.Write( 0, MakeNumber( i_rNode, 1 ), VFlowLimit::None(), KVZ::EFlowFlags::Rewirable ) ) << "let go";
      EXPECT_THROW( i_rNode.Write( 0, MakeNumber( i_rNode, 1 ), VFlowLimit::None() ), Flow2Utils::VFlowException ) << "not connected";
      EXPECT_THROW( i_rNode.Select( { 0 }, {}, VFlowLimit::None(), i_rNode.m_Selection ), Flow2Utils::VFlowException ) << "not connected";
      EXPECT_THROW( i_rNode.Select( {}, {}, VFlowLimit::None(), i_rNode.m_Selection ), Flow2Utils::VFlowException ) << "nothing to wait for";
      Done.set_value();
      throw Flow2Utils::VFlowFinishedException( "done" );
    } );
  m_Graph.StartNode( Node );
  Done.get_future().wait();
  WaitForState( Node, EFlowNodeState::Ended );
}

}
