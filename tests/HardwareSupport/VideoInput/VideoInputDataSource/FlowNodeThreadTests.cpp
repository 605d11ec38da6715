// The node in the host's graph, on a thread of its own, against a device that delivers just when the node goes to sleep, and one that is busy.
#include "HardwareSupport/VideoInput/VideoInputDataSource/FlowNodeVideoInputDataSource.h"

#include "HardwareSupport/VideoInput/VideoInputDeviceBlackmagic/BlackmagicDeckLinkDevice.h"
#include "host/FlowGraph.h"
#include "tests/HardwareSupport/VideoInput/VideoInputDataSource/VideoRig.h"
#include "tests/support/FakeDeckLink.h"
#include "tests/support/FunctionNode.h"

#include <boost/thread/thread.hpp>

#include <atomic>
#include <future>

namespace
{

constexpr uint64_t Frames = 5000;

// The source's node and one that takes its states.
struct VLiveGraph
{
  explicit VLiveGraph( const std::shared_ptr<VTestVideoSource>& i_pSource )
  {
    m_pSources->Insert( "vi:0", i_pSource );
    m_Node = m_Graph.AddNode( std::make_shared<VideoInputHAL::VFlowNodeVideoInputDataSource>( m_pSources ),
      { .m_Name = "Source", .m_Parameters = { { "DeviceURN", "vi:0" } } } );
    const auto Take = []( TestSupport::VFunctionNode& i_rNode ) { i_rNode.Read( 0, KVZ::VFlowLimit::None(), i_rNode.m_pState ); };
    const auto Sink = m_Graph.AddNode( std::make_shared<TestSupport::VFunctionNode>( Take ), { .m_Name = "Sink" } );
    EXPECT_TRUE( m_Graph.Connect( { m_Node, 0 }, { Sink, 0 } ) );
  }
  ~VLiveGraph()
  {
    m_Graph.Stop();
    EXPECT_EQ( m_Graph.GetFailure(), "" );
  }
  void WaitForStates( uint64_t i_Count )
  {
    m_Graph.WaitUntil( m_Node, [i_Count]( const StageHost::VFlowNodeStatus& i_rStatus ) { return i_rStatus.m_StatesWritten == i_Count; } );
  }

  const std::shared_ptr<VideoInputHAL::VVideoInputDataSourceMap> m_pSources = std::make_shared<VideoInputHAL::VVideoInputDataSourceMap>();
  StageHost::VFlowGraph m_Graph;
  StageHost::VFlowNodeId m_Node = 0;
};

// Keeps whoever asks for memory waiting, once it has been told to.
class VSlowAllocator : public VideoInputHAL::IVideoInputAllocator
{
public:
  void* Allocate( uint64_t i_Bytes ) override
  {
    if( m_bSlow )
    {
      m_Reached.set_value();
      m_Opened.get_future().wait();
    }
    return m_pFrames->Allocate( i_Bytes );
  }
  void Free( void* i_pBlock ) override { m_pFrames->Free( i_pBlock ); }

  std::shared_ptr<VideoInputHAL::IVideoInputAllocator> m_pFrames;
  std::atomic<bool> m_bSlow{ false };
  std::promise<void> m_Reached;
  std::promise<void> m_Opened;
};

// The next frame is delivered as soon as the state of the last one has been written, and no other one comes to help: a wake-up that is lost
// between the look for frames and the sleep leaves the test waiting for ever.
TEST( FlowNodeThreads, NoFrameComesUnnoticedWhileTheNodeGoesToSleep )
{
  VVideoRig Rig;
  const auto pSource = Rig.Make();
  Rig.DeliverMany( 1 );
  Rig.Join( *pSource, 1 );

  VLiveGraph Live( pSource );
  Live.m_Graph.Start();
  for( uint64_t Count = 1; Count <= Frames; ++Count )
  {
    Live.WaitForStates( Count );
    Rig.DeliverMany( 1 );
    Rig.m_pStrand->RunAll();
  }
}

// A card that is behind comes with one frame after the other, and its device is in a frame nearly all of the time. Neither states nor captures
// may wait for a moment in which it is not: where they do, this test does not end.
TEST( FlowNodeThreads, StatesAreMadeAndCapturesStartedWhileTheDeviceIsBusy )
{
  namespace Fake = TestSupport::FakeDeckLink;
  const auto pAllocator = std::make_shared<VSlowAllocator>();   // frames name it, so it outlives them
  VVideoRig Rig;
  auto* const pCard = new Fake::VCard;
  const auto pDevice = KVZ::MakeShared<VideoInputHAL::VBlackmagicDeckLinkDevice>( pCard, 1, Rig.m_pStrand );
  const auto pSource = Rig.Make( {}, pDevice );
  pAllocator->m_pFrames = Rig.m_pFrames;
  ASSERT_TRUE( pDevice->Initialise().Succeeded() );
  pDevice->SetAllocator( pAllocator );
  pDevice->SetDataCallback( pSource );
  ASSERT_TRUE( pDevice->StartCapture( KVZ::IPixelFormat::EU8Y8V8Y8, KVZ::ITimecodeSource::EAny, KVZ::IAudioSampleFormat::EInt16, 0 ).Succeeded() );
  pCard->Input().DeliverFrame( {} );
  Rig.Join( *pSource, 1 );
  pCard->Input().DeliverFrame( {} );

  pAllocator->m_bSlow = true;
  boost::thread Card( [pCard] { pCard->Input().DeliverFrame( {} ); } );
  pAllocator->m_Reached.get_future().wait();
  {
    VLiveGraph Live( pSource );
    Live.m_Graph.Start();
    Live.WaitForStates( 2 );
  }
  Rig.Start( *pSource, 1, 0, 1 );
  pAllocator->m_Opened.set_value();
  Card.join();
  pDevice->Close();
  Rig.m_pStrand->RunAll();
  Rig.m_pWriterService->RunAll();
  pCard->Release();
}

}
