// Nodes are started, stopped, wired and rewired at random while states flow. Whatever happens, the graph stops cleanly, no state is left behind,
// and no consumer ever sees the numbers of a source out of order or twice.
#include "host/FlowGraph.h"

#include "tests/host/FlowGraph/GraphNodes.h"
#include "tests/support/Threads.h"

#include <gtest/gtest.h>

#include <random>

namespace
{

constexpr int Operations = 500;   // of each of two drivers
constexpr size_t SourceCount = 2;
constexpr size_t SinkCount = 3;
constexpr int NumbersOfSource = 1000000;

class VRandomDriver
{
public:
  VRandomDriver( StageHost::VFlowGraph& i_rGraph, unsigned int i_Seed ) : m_rGraph( i_rGraph ), m_Random( i_Seed )
  {
    for( size_t Index = 0; Index < SourceCount; ++Index )
    {
      m_Sources.push_back( std::make_shared<VCountingNode>( static_cast<int>( Index ) * NumbersOfSource ) );
      m_Nodes.push_back( m_rGraph.AddNode( m_Sources.back(), { .m_Name = "Source" } ) );
    }
    for( size_t Index = 0; Index < SinkCount; ++Index )
    {
      m_Sinks.push_back( std::make_shared<VCollectingNode>() );
      m_Nodes.push_back( m_rGraph.AddNode( m_Sinks.back(), { .m_Name = "Sink", .m_QueueLength = 1 + Index } ) );
    }
  }

  void Run()
  {
    for( int Count = 0; Count < Operations; ++Count )
    {
      Step();
    }
  }
  // One more number comes to each.
  void ExpectFlow()
  {
    std::vector<size_t> Seen;
    for( size_t Sink = 0; Sink < SinkCount; ++Sink )
    {
      m_rGraph.Disconnect( { m_Nodes[SourceCount + Sink], 0 } );
      EXPECT_TRUE( m_rGraph.Connect( { m_Nodes[0], 0 }, { m_Nodes[SourceCount + Sink], 0 } ) );
      Seen.push_back( m_Sinks[Sink]->Numbers().size() );
    }
    m_rGraph.Start();
    m_Sources[0]->Allow( 1 );
    for( size_t Sink = 0; Sink < SinkCount; ++Sink )
    {
      m_Sinks[Sink]->WaitFor( Seen[Sink] + 1 );
    }
  }
  void ExpectOrderAndNothingLeft() const
  {
    for( const auto& pSource : m_Sources )
    {
      EXPECT_TRUE( pSource->Last().expired() );
    }
    for( const auto& pSink : m_Sinks )
    {
      std::vector<int> Last( SourceCount, -1 );
      for( const double Number : pSink->Numbers() )
      {
        int& rLast = Last.at( static_cast<size_t>( Number ) / NumbersOfSource );
        EXPECT_GT( static_cast<int>( Number ), rLast );
        rLast = static_cast<int>( Number );
      }
    }
  }

private:
  size_t Pick( size_t i_Count ) { return std::uniform_int_distribution<size_t>( 0, i_Count - 1 )( m_Random ); }
  VFlowNodeId PickSink() { return m_Nodes[SourceCount + Pick( SinkCount )]; }

  void Step()
  {
    switch( Pick( 10 ) )
    {
      case 0: m_rGraph.StartNode( m_Nodes[Pick( m_Nodes.size() )] ); break;
      case 1: m_rGraph.StopNode( m_Nodes[Pick( m_Nodes.size() )] ); break;
      case 2:
      case 3: m_rGraph.Connect( { m_Nodes[Pick( SourceCount )], 0 }, { PickSink(), 0 } ); break;
      case 4: m_rGraph.Disconnect( { PickSink(), 0 } ); break;
      case 5: m_rGraph.SetGlobalItems( {} ); break;
      case 6: Pick( 5 ) == 0 ? m_rGraph.Stop() : m_rGraph.Start(); break;
      default: m_Sources[Pick( SourceCount )]->Allow( static_cast<int>( Pick( 4 ) ) ); break;
    }
  }

  StageHost::VFlowGraph& m_rGraph;
  std::mt19937 m_Random;
  std::vector<std::shared_ptr<VCountingNode>> m_Sources;
  std::vector<std::shared_ptr<VCollectingNode>> m_Sinks;
  std::vector<VFlowNodeId> m_Nodes;
};

TEST( RandomGraph, EndsCleanWhateverIsDoneToIt )
{
  for( const unsigned int Seed : { 1u, 2u, 3u } )
  {
    SCOPED_TRACE( Seed );
    StageHost::VFlowGraph Graph;
    VRandomDriver First( Graph, Seed );
    VRandomDriver Second( Graph, Seed + 1000 );
    TestSupport::RunOnThreads( 2, [&]( uint32_t i_Thread ) { ( i_Thread == 0 ? First : Second ).Run(); } );
    First.ExpectFlow();
    Second.ExpectFlow();
    Graph.Stop();
    First.ExpectOrderAndNothingLeft();
    Second.ExpectOrderAndNothingLeft();
    EXPECT_EQ( Graph.GetFailure(), "" );
  }
}

}
