// Nodes are started, stopped, wired and rewired at random while states flow. Whatever happens, the graph stops cleanly, no state is left behind,
// and no consumer ever sees the numbers of a source out of order or twice.
#include "host/FlowGraph.h"

#include "tests/host/FlowGraph/GraphNodes.h"

#include <gtest/gtest.h>

#include <boost/thread/thread.hpp>

#include <algorithm>
#include <random>

namespace
{

constexpr int Operations = 1000;
constexpr size_t SourceCount = 2;
constexpr size_t SinkCount = 3;

class VRandomDriver
{
public:
  VRandomDriver( StageHost::VFlowGraph& i_rGraph, unsigned int i_Seed ) : m_rGraph( i_rGraph ), m_Random( i_Seed )
  {
    for( size_t Index = 0; Index < SourceCount; ++Index )
    {
      m_Sources.push_back( std::make_shared<VCountingNode>() );
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
    for( int Count = 0; Count < Operations / 2; ++Count )
    {
      Step();
    }
  }
  void ExpectNothingLeft() const
  {
    for( const auto& pSource : m_Sources )
    {
      EXPECT_TRUE( pSource->Last().expired() );
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
    boost::thread Other( [&] { Second.Run(); } );
    First.Run();
    Other.join();
    Graph.Start();
    Graph.Stop();
    First.ExpectNothingLeft();
    Second.ExpectNothingLeft();
    EXPECT_EQ( Graph.GetFailure(), "" );
  }
}

TEST( RandomGraph, KeepsTheOrderOfASource )
{
  StageHost::VFlowGraph Graph;
  const auto pSource = std::make_shared<VCountingNode>();
  const auto pSink = std::make_shared<VCollectingNode>();
  const VFlowNodeId Source = Graph.AddNode( pSource, { .m_Name = "Source" } );
  const VFlowNodeId Sink = Graph.AddNode( pSink, { .m_Name = "Sink" } );
  std::mt19937 Random( 4 );
  for( int Count = 0; Count < Operations; ++Count )
  {
    switch( Random() % 6 )
    {
      case 0: Graph.Connect( { Source, 0 }, { Sink, 0 } ); break;
      case 1: Graph.Disconnect( { Sink, 0 } ); break;
      case 2: Graph.Start(); break;
      case 3: Graph.StopNode( Random() % 2 == 0 ? Source : Sink ); break;
      default: pSource->Allow( 3 ); break;
    }
  }
  Graph.Connect( { Source, 0 }, { Sink, 0 } );
  Graph.Start();
  pSource->Allow( 1 );
  pSink->WaitFor( 1 );
  const std::vector<double> Numbers = pSink->Numbers();
  EXPECT_TRUE( std::is_sorted( Numbers.begin(), Numbers.end() ) );
  EXPECT_EQ( std::adjacent_find( Numbers.begin(), Numbers.end() ), Numbers.end() ) << "one came twice";
}

}
