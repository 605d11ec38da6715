// The node that checks and measures, given states by hand.
#include "host/FlowGraphWatcher.h"

#include "host/FlowGraphState.h"
#include "tests/support/FakeFlowServices.h"
#include "tests/support/HandTime.h"

#include <gtest/gtest.h>

namespace
{

using StageHost::VFlowWatcher;
using StageHost::VWatchFigures;

constexpr int64_t Period = 5400000;

struct VTestState
{
  int64_t m_Frame = 0;   // its tick in periods
  uint32_t m_Session = 1;
  double m_DroppedBefore = 0.0;
  double m_DeliveryTime = 100.0;
  size_t m_ImageBytes = 64;
  size_t m_SoundBytes = 8;
  const char* m_pURN = "vi:0";
  int64_t m_Off = 0;   // ticks beside the grid
};

class FlowWatcher : public ::testing::Test
{
protected:
  void SetUp() override { m_Watcher.PreProcessChecked( m_pServices ); }

  static KVZ::VFlowStatePtr Make( const VTestState& i_rState )
  {
    auto pState = std::make_shared<StageHost::VFlowState>();
    auto pVideo = std::make_shared<KVZ::VFlowVideoFrame>( KVZ::FlowLabels::VideoFrame );
    pVideo->m_Info.m_ImageWidth = 8;
    pVideo->m_Info.m_ImageHeight = 4;
    pVideo->m_Info.m_PixelFormat = KVZ::IPixelFormat::EU8Y8V8Y8;
    pVideo->m_pBuffer = std::make_shared<KVZ::IStandardBuffer>( i_rState.m_ImageBytes );
    auto pAudio = std::make_shared<KVZ::VFlowAudioFrame>( KVZ::FlowLabels::AudioFrame );
    pAudio->m_Info = { KVZ::IAudioSampleFormat::EInt16, 48000, 2 };
    pAudio->m_pBuffer = std::make_shared<KVZ::IStandardBuffer>( i_rState.m_SoundBytes );
    auto pCamera = std::make_shared<KVZ::VFlowCameraHardware>( KVZ::FlowLabels::CameraHardware );
    pCamera->m_DeviceURN = i_rState.m_pURN;
    pCamera->m_Tick = KVZ::VTick( Period * i_rState.m_Frame + i_rState.m_Off );
    pCamera->m_Period = KVZ::VTick( Period );
    pCamera->m_GlobalSession = KVZ::VGlobalSyncSessionId( i_rState.m_Session );
    auto pData = std::make_shared<KVZ::VFlowGenericData>( KVZ::FlowLabels::GenericData );
    pData->m_Values = { { "DeliveryTime", { i_rState.m_DeliveryTime } }, { "DroppedBefore", { i_rState.m_DroppedBefore } } };
    for( const KVZ::VFlowItemPtr& pItem : KVZ::VFlowItemList{ pVideo, pAudio, pCamera, pData } )
    {
      pState->AddItem( pItem );
    }
    return pState;
  }
  VWatchFigures Give( const VTestState& i_rState ) { return Give( Make( i_rState ) ); }
  VWatchFigures Give( KVZ::VFlowStatePtr i_pState )
  {
    m_pServices->m_pNext = std::move( i_pState );
    EXPECT_EQ( m_Watcher.ProcessChecked(), KVZ::EFlowResult::Ok );
    return m_Watcher.GetFigures();
  }

  const std::shared_ptr<TestSupport::VHandTime> m_pTime = std::make_shared<TestSupport::VHandTime>();
  const std::shared_ptr<TestSupport::VFakeFlowServices> m_pServices = std::make_shared<TestSupport::VFakeFlowServices>();
  VFlowWatcher m_Watcher{ m_pTime };
};

TEST_F( FlowWatcher, TellsDroppedFramesFromMissedOnes )
{
  Give( { .m_Frame = 10 } );
  Give( { .m_Frame = 11 } );
  Give( { .m_Frame = 16, .m_DroppedBefore = 4 } );
  VWatchFigures Figures = Give( { .m_Frame = 20, .m_DroppedBefore = 1 } );   // two more are missing
  EXPECT_EQ( Figures.m_States, 4u );
  EXPECT_EQ( Figures.m_DroppedFrames, 5u );
  EXPECT_EQ( Figures.m_DropRuns, 2u );
  EXPECT_EQ( Figures.m_MissedFrames, 2u );
  EXPECT_EQ( Figures.m_Sessions, 1u );
  Figures = Give( { .m_Frame = 3, .m_Session = 2 } );   // another timeline
  EXPECT_EQ( Figures.m_Sessions, 2u );
  EXPECT_EQ( Figures.m_MissedFrames, 2u );
  EXPECT_EQ( Figures.m_Faults, 0u ) << Figures.m_FirstFault;
  m_Watcher.BeginAnew();
  Figures = Give( { .m_Frame = 9, .m_Session = 2 } );
  EXPECT_EQ( Figures.m_States, 1u );
  EXPECT_EQ( Figures.m_DroppedFrames + Figures.m_MissedFrames + Figures.m_Faults, 0u );
}

TEST_F( FlowWatcher, FindsWhatIsWrongWithAState )
{
  const VTestState Bad[] = {
    { .m_Frame = 11, .m_ImageBytes = 63 }, { .m_Frame = 11, .m_SoundBytes = 7 }, { .m_Frame = 11, .m_pURN = "vi:1" }, { .m_Frame = 11, .m_Off = 1 },
    { .m_Frame = 10 },                         // once more
    { .m_Frame = 11, .m_DroppedBefore = 3 },   // more than there is room for
    { .m_Frame = 11, .m_Session = 1 },         // of a session that is over
  };
  for( const VTestState& rBad : Bad )
  {
    m_Watcher.BeginAnew();
    Give( { .m_Frame = 10, .m_Session = &rBad == &Bad[6] ? 2u : 1u } );
    const VWatchFigures Figures = Give( rBad );
    EXPECT_EQ( Figures.m_Faults, 1u ) << "case " << &rBad - Bad;
    EXPECT_NE( Figures.m_FirstFault, "" );
  }
  m_Watcher.BeginAnew();
  EXPECT_EQ( Give( std::make_shared<StageHost::VFlowState>() ).m_Faults, 1u ) << "an empty state";
}

TEST_F( FlowWatcher, MeasuresLatencyAndRate )
{
  VWatchFigures Figures;
  for( int Frame = 0; Frame < 200; ++Frame )
  {
    m_pTime->m_Now = 100.0 + Frame * 0.04;
    Figures = Give( { .m_Frame = Frame, .m_DeliveryTime = m_pTime->m_Now - ( Frame % 100 < 97 ? 0.001 : 0.02 ) } );
  }
  EXPECT_NEAR( Figures.m_StatesPerSecond, 25.0, 1e-6 );
  EXPECT_NEAR( Figures.m_MedianLatency, 0.001, 1e-9 );
  EXPECT_NEAR( Figures.m_Latency99, 0.02, 1e-9 );
}

TEST_F( FlowWatcher, KeepsTheNewestImageOnlyWhenToldTo )
{
  Give( { .m_Frame = 1 } );
  EXPECT_EQ( m_Watcher.GetNewest(), nullptr );
  VFlowWatcher Keeper( m_pTime, true );
  Keeper.PreProcessChecked( m_pServices );
  const KVZ::VFlowStatePtr pFirst = Make( { .m_Frame = 1 } );
  m_pServices->m_pNext = pFirst;
  Keeper.ProcessChecked();
  EXPECT_EQ( Keeper.GetNewest(), pFirst->Items().front() );
  m_pServices->m_pNext = Make( { .m_Frame = 2 } );
  Keeper.ProcessChecked();
  EXPECT_NE( Keeper.GetNewest(), pFirst->Items().front() );
  EXPECT_EQ( pFirst->Items().front().use_count(), 1 );
}

}
