// The node that supplies a device's frames to the graph, round by round: frames are delivered by hand and services answer at once.
#include "HardwareSupport/VideoInput/VideoInputDataSource/FlowNodeVideoInputDataSource.h"

#include "Flow2/Flow2Utils/FlowException.h"
#include "Flow2/Flow2Utils/FlowNodeFactory.h"
#include "tests/HardwareSupport/VideoInput/VideoInputDataSource/VideoRig.h"
#include "tests/support/FakeFlowServices.h"
#include "tests/support/LogCapture.h"

#include <cmath>
#include <cstring>

namespace
{

using KVZ::EFlowResult;
using KVZ::VFlowStatePtr;
using VideoInputHAL::VFlowNodeVideoInputDataSource;

constexpr int FiveSeconds = 125;   // frames

class FlowNodeVideoInput : public ::testing::Test
{
protected:
  void SetUp() override { m_pSources->Insert( "vi:0", m_pSource ); }

  std::shared_ptr<KVZ::IFlowNode> MakeNode( const std::string& i_rURN = "vi:0" )
  {
    Flow2Utils::VFlowNodeFactory1<VFlowNodeVideoInputDataSource, std::shared_ptr<VideoInputHAL::VVideoInputDataSourceMap>> Factory( m_pSources );
    const auto pNode = Factory.CreateNode();
    pNode->ParameterTexts() = { { "DeviceURN", i_rURN } };
    return pNode;
  }
  // The first frame, a session over it, and a node that has started.
  void Begin()
  {
    m_Rig.DeliverMany( 1 );
    m_Rig.Join( *m_pSource, 1 );
    m_pNode = MakeNode();
    ASSERT_EQ( m_pNode->PreProcessChecked( m_pServices ), EFlowResult::Ok );
  }
  // One round of the node; the states that it wrote.
  std::vector<VFlowStatePtr> Round()
  {
    m_pServices->m_Written.clear();
    EXPECT_EQ( m_pNode->ProcessChecked(), EFlowResult::Ok );
    return std::exchange( m_pServices->m_Written, {} );
  }
  template<class TItem>
  static const TItem& Item( const VFlowStatePtr& i_pState )
  {
    for( const KVZ::VFlowItemPtr& pItem : i_pState->Items() )
    {
      if( &pItem->Type() == &TItem::ItemType )
      {
        return static_cast<const TItem&>( *pItem );
      }
    }
    throw std::logic_error( TItem::ItemType.m_pName );
  }
  static std::vector<int64_t> Indices( const std::vector<VFlowStatePtr>& i_rStates )
  {
    std::vector<int64_t> Indices;
    for( const VFlowStatePtr& pState : i_rStates )
    {
      Indices.push_back( ( Item<KVZ::VFlowCameraHardware>( pState ).m_Tick - CounterStart ).Count() / Period.Count() );
    }
    return Indices;
  }
  static double Number( const VFlowStatePtr& i_pState, const char* i_pName )
  {
    double Number = NAN;
    Item<KVZ::VFlowGenericData>( i_pState ).GetNumber( i_pName, Number );
    return Number;
  }

  VVideoRig m_Rig{ 160 };
  std::shared_ptr<VTestVideoSource> m_pSource = m_Rig.Make();
  const std::shared_ptr<VideoInputHAL::VVideoInputDataSourceMap> m_pSources = std::make_shared<VideoInputHAL::VVideoInputDataSourceMap>();
  const std::shared_ptr<TestSupport::VFakeFlowServices> m_pServices = std::make_shared<TestSupport::VFakeFlowServices>();
  std::shared_ptr<KVZ::IFlowNode> m_pNode;
};

TEST_F( FlowNodeVideoInput, AnUnknownDeviceKeepsItFromStarting )
{
  const TestSupport::VLogCapture Log( "", 2 );
  const auto pNode = MakeNode( "vi:7" );
  EXPECT_TRUE( KVZ::IsFlowFailure( pNode->PreProcessChecked( m_pServices ) ) );
  EXPECT_TRUE( Log.Has( "Failed to find VideoInput data source with DeviceURN 'vi:7'." ) );
  EXPECT_EQ( pNode->PostProcessChecked(), EFlowResult::Ok );
  EXPECT_FALSE( m_pSource->OnNewFramesCallback().IsSet() );

  pNode->ParameterTexts() = { { "DeviceURN", "vi:0" }, { "Colour", "red" } };
  EXPECT_THROW( pNode->PreProcessChecked( m_pServices ), Flow2Utils::VFlowException ) << "no such parameter";
  pNode->PostProcessChecked();
}

TEST_F( FlowNodeVideoInput, StatesHoldTheFrameWithoutACopy )
{
  m_Rig.m_pTime->m_Now = 50.0;
  m_Rig.m_Timecode.m_Standard = KVZ::ITimecodeStandard::ETimecode25;
  Begin();
  const auto States = Round();
  ASSERT_EQ( States.size(), 1u );
  EXPECT_EQ( States[0]->Category(), "VideoInput" );
  std::vector<std::string> Labels;
  for( const KVZ::VFlowItemPtr& pItem : States[0]->Items() )
  {
    Labels.push_back( pItem->Type().m_pName + std::string( ": " ) + pItem->Label() );
  }
  EXPECT_EQ( Labels,
    ( std::vector<std::string>{ "FlowVideoFrame: VideoFrame Item", "FlowAudioFrame: AudioFrame Item", "FlowCameraHardware: CameraHardware Item",
      "FlowGenericData: GenericData Item" } ) );

  SyncSystem::VToken Token;
  SyncSystem::VRefCountedToken Pinned;
  ASSERT_TRUE( m_pSource->Buffer()->GetNewestToken( Token ) && m_pSource->Buffer()->Read( Token, Pinned ) );
  const VVideoInputDataSourceFrame& rFrame = *VVideoInputDataSource::FrameOf( Pinned.Frame() );
  const auto& rVideo = Item<KVZ::VFlowVideoFrame>( States[0] );
  EXPECT_EQ( rVideo.m_pBuffer->Data(), rFrame.Image() );
  EXPECT_EQ( rVideo.m_pBuffer->Size(), rFrame.m_ImageBytes );
  EXPECT_EQ( rVideo.m_Info, rFrame.m_VideoInfo );
  EXPECT_EQ( KVZ::ToText( rVideo.m_Timecode ), "00:00:00:00" );
  const auto& rAudio = Item<KVZ::VFlowAudioFrame>( States[0] );
  EXPECT_EQ( rAudio.m_pBuffer->Data(), rFrame.Audio() );
  EXPECT_EQ( rAudio.m_pBuffer->Size(), 160u );
  EXPECT_EQ( rAudio.m_Info, rFrame.m_AudioInfo );
  const auto& rCamera = Item<KVZ::VFlowCameraHardware>( States[0] );
  EXPECT_EQ( rCamera.m_DeviceURN, "vi:0" );
  EXPECT_EQ( rCamera.m_DeviceName, "Test Card (1)" );
  EXPECT_EQ( rCamera.m_Tick, CounterStart );
  EXPECT_EQ( rCamera.m_Period, Period );
  EXPECT_EQ( rCamera.m_GlobalSession, KVZ::VGlobalSyncSessionId( 1 ) );
  EXPECT_EQ( Number( States[0], "DeliveryTime" ), 50.0 );

  m_Rig.m_Format.m_Audio = {};
  m_Rig.DeliverMany( 1 );
  EXPECT_EQ( Round().front()->Items().size(), 3u ) << "no sound, no item for it";
}

TEST_F( FlowNodeVideoInput, TellsHowLateFramesCame )
{
  Begin();
  for( int Count = 1; Count < 50; ++Count )
  {
    m_Rig.m_pTime->m_Now = 100.0 + 0.04 * Count;
    m_Rig.DeliverMany( 1 );
    Round();
  }
  m_Rig.m_pTime->m_Now = 100.0 + 0.04 * 50 + 0.003;
  m_Rig.DeliverMany( 1 );
  const auto States = Round();
  EXPECT_NEAR( Number( States[0], "DeliveryOffset" ), 0.003, 0.0005 );
  EXPECT_NEAR( Number( States[0], "PredictedOffset" ), 0.0, 0.0005 );
}

TEST_F( FlowNodeVideoInput, SleepsUntilTheNextFrame )
{
  Begin();
  EXPECT_EQ( Round().size(), 1u );
  EXPECT_TRUE( Round().empty() );
  EXPECT_EQ( m_pServices->m_LastCall, EFlowResult::Asleep );
  EXPECT_EQ( m_Rig.m_pStrand->RunAll(), 0u ) << "somebody has work although nothing came";
  EXPECT_TRUE( m_pServices->m_Woken.empty() );
  const uint64_t Token = m_pServices->m_NextToken - 1;
  m_Rig.DeliverMany( 3 );
  EXPECT_TRUE( m_pServices->m_Woken.empty() ) << "the wake goes through the strand";
  m_Rig.m_pStrand->RunAll();
  EXPECT_EQ( m_pServices->m_Woken, ( std::vector<uint64_t>{ Token } ) ) << "the first of them wakes, the others find it awake";
  EXPECT_EQ( Indices( Round() ), ( std::vector<int64_t>{ 1, 2, 3 } ) );
  EXPECT_EQ( m_pServices->m_WriteFlags.back(), 2u );
  m_Rig.DeliverMany( 1 );
  m_Rig.m_pStrand->RunAll();
  EXPECT_EQ( m_pServices->m_Woken.size(), 1u ) << "nobody slept";
  Round();

  EXPECT_TRUE( Round().empty() );
  m_pNode->PostProcessChecked();
  m_Rig.DeliverMany( 1 );
  m_Rig.m_pStrand->RunAll();
  EXPECT_EQ( m_pServices->m_Woken.size(), 1u );
  EXPECT_EQ( m_pServices.use_count(), 1 ) << "the source still has the services";
}

TEST_F( FlowNodeVideoInput, AStallCostsAllButTenFrames )
{
  Begin();
  Round();
  m_Rig.DeliverMany( FiveSeconds );
  const auto States = Round();
  const std::vector<int64_t> Kept = Indices( States );
  ASSERT_EQ( Kept.size(), 10u );
  double Dropped = 0.0;
  for( size_t Index = 0; Index < Kept.size(); ++Index )
  {
    const int64_t Gap = Kept[Index] - ( Index == 0 ? 0 : Kept[Index - 1] );
    EXPECT_EQ( Number( States[Index], "DroppedBefore" ), static_cast<double>( Gap - 1 ) );
    Dropped += Number( States[Index], "DroppedBefore" );
  }

  // Nothing of the backlog is left: the next frame is the next state, and it tells of those behind the last kept one.
  EXPECT_TRUE( Round().empty() );
  m_Rig.DeliverMany( 1 );
  const auto Next = Round();
  ASSERT_EQ( Indices( Next ), ( std::vector<int64_t>{ FiveSeconds + 1 } ) );
  EXPECT_EQ( Dropped + Number( Next[0], "DroppedBefore" ) + 11.0, FiveSeconds + 1.0 );
}

TEST_F( FlowNodeVideoInput, AFrameIsPinnedExactlyAsLongAsItsStateLives )
{
  Begin();
  Round();
  m_Rig.DeliverMany( 8 );
  std::vector<VFlowStatePtr> Held = Round();
  ASSERT_EQ( Held.size(), 8u );
  Round();   // the node lets its own references go
  m_Rig.DeliverMany( 1000 );
  SyncSystem::VToken Oldest;
  ASSERT_TRUE( m_pSource->Buffer()->GetFirstToken( m_pSource->Buffer()->GetCurrentBufferSession(), Oldest ) );
  EXPECT_GT( Oldest.m_FrameNumber, 100 ) << "all frames around the held ones are gone";
  for( size_t Index = 0; Index < Held.size(); ++Index )
  {
    const auto& rVideo = Item<KVZ::VFlowVideoFrame>( Held[Index] );
    const std::vector<uint8_t> Expected( rVideo.m_pBuffer->Size(), static_cast<uint8_t>( 1 + Index ) );
    ASSERT_EQ( std::memcmp( rVideo.m_pBuffer->Data(), Expected.data(), Expected.size() ), 0 );
  }

  for( const VFlowStatePtr& pState : Round() )
  {
    EXPECT_EQ( Item<KVZ::VFlowVideoFrame>( pState ).m_pBuffer->Data()[0], static_cast<uint8_t>( Indices( { pState } )[0] ) ) << "at their true time";
  }
  Round();

  // One buffer alone keeps its frame as well, also when node and source have gone.
  std::shared_ptr<const KVZ::IBufferConst> pSound = Item<KVZ::VFlowAudioFrame>( Held[3] ).m_pBuffer;
  Held.clear();
  m_pNode->PostProcessChecked();
  m_pNode.reset();
  m_pSources->Clear();
  m_Rig.m_pSource.reset();
  m_pSource.reset();
  m_Rig.m_pStrand->RunAll();
  EXPECT_GT( m_Rig.m_Memory.m_pClient->GetHeldBlocks(), 0u );
  EXPECT_EQ( pSound->Data()[0], 4 );
  pSound.reset();
  EXPECT_EQ( m_Rig.m_Memory.m_pClient->GetHeldBlocks(), 0u );
}

TEST_F( FlowNodeVideoInput, TakesItsDeviceFromGlobalItemsToo )
{
  const TestSupport::VLogCapture Log( "", 2 );
  VVideoRig Other;
  const auto pOther = Other.Make();
  m_pSources->Insert( "vi:1", pOther );
  Begin();
  Round();
  Other.DeliverMany( 1 );
  Other.Join( *pOther, 1 );

  auto pItem = std::make_shared<KVZ::VFlowParameters>( "test" );
  pItem->m_Texts = { { "DeviceURN", "vi:9" } };
  m_pServices->m_Global = { pItem };
  m_Rig.DeliverMany( 1 );
  EXPECT_EQ( Round().size(), 1u ) << "an unknown device changes nothing";
  EXPECT_TRUE( Log.Has( "Failed to find VideoInput data source with DeviceURN 'vi:9'." ) );
  EXPECT_EQ( m_pServices->m_GlobalLimits.back().m_Milliseconds, 0u );
  pItem->m_Texts = { { "DeviceURN", "vi:1" } };
  m_pServices->m_Global = { pItem };
  EXPECT_EQ( Round().size(), 1u );
  EXPECT_FALSE( m_pSource->OnNewFramesCallback().IsSet() );
  EXPECT_TRUE( pOther->OnNewFramesCallback().IsSet() );
  m_pNode->PostProcessChecked();
  EXPECT_FALSE( pOther->OnNewFramesCallback().IsSet() );
}

TEST_F( FlowNodeVideoInput, EndsWithTheGraph )
{
  Begin();
  m_pServices->m_Answer = EFlowResult::Stopping;
  EXPECT_EQ( m_pNode->ProcessChecked(), EFlowResult::Stopping );
  m_pServices->m_Answer = EFlowResult::Ok;
  m_Rig.m_pManager->Shutdown();
  EXPECT_THROW( m_pNode->ProcessChecked(), Flow2Utils::VFlowException ) << "no device any more that the frame could come from";
  m_pNode->PostProcessChecked();
  EXPECT_FALSE( m_pSource->OnNewFramesCallback().IsSet() );
  EXPECT_EQ( m_pServices.use_count(), 1 ) << "a failed node keeps its services";
}

}
