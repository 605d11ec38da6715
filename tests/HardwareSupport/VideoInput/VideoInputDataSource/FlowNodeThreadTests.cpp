// The node in the host's graph, on a thread of its own, against a device that delivers just when the node goes to sleep.
#include "HardwareSupport/VideoInput/VideoInputDataSource/FlowNodeVideoInputDataSource.h"

#include "host/FlowGraph.h"
#include "tests/HardwareSupport/VideoInput/VideoInputDataSource/FlowRig.h"

namespace
{

constexpr uint64_t Frames = 5000;

class VTakingNode : public Flow2Utils::VFlowNode<VTakingNode>
{
public:
  static KVZ::VFlowNodeInfo MakeNodeInfo() { return { "Taking", "Lets states go", { "Input" }, {} }; }

protected:
  void Process() override
  {
    KVZ::VFlowStatePtr pState;
    Read( 0, KVZ::VFlowLimit::None(), pState );
  }
};

// The next frame is delivered as soon as the state of the last one has been written, and no other one comes to help: a wake-up that is lost
// between the look for frames and the sleep leaves the test waiting for ever.
TEST( FlowNodeThreads, NoFrameComesUnnoticedWhileTheNodeGoesToSleep )
{
  VFlowRig Rig;
  const auto pSource = Rig.MakeManaged();
  const auto pSources = std::make_shared<VideoInputHAL::VVideoInputDataSourceMap>();
  pSources->Insert( "vi:0", pSource );
  Rig.DeliverMany( 1 );
  Rig.Join( *pSource, 1 );

  StageHost::VFlowGraph Graph;
  const auto Node = Graph.AddNode( std::make_shared<VideoInputHAL::VFlowNodeVideoInputDataSource>( pSources ),
    { .m_Name = "Source", .m_Parameters = { { "DeviceURN", "vi:0" } } } );
  const auto Sink = Graph.AddNode( std::make_shared<VTakingNode>(), { .m_Name = "Sink" } );
  ASSERT_TRUE( Graph.Connect( { Node, 0 }, { Sink, 0 } ) );
  Graph.Start();
  for( uint64_t Count = 1; Count <= Frames; ++Count )
  {
    Graph.WaitUntil( Node, [Count]( const StageHost::VFlowNodeStatus& i_rStatus ) { return i_rStatus.m_StatesWritten == Count; } );
    Rig.DeliverMany( 1 );
    Rig.m_pStrand->RunAll();
  }
  Graph.Stop();
  EXPECT_EQ( Graph.GetFailure(), "" );
}

}
