#include "HardwareSupport/VideoInput/VideoInputDataSource/VideoInputDataBufferToFlowState.h"

#include "Flow2/Flow2Utils/FlowException.h"
#include "HardwareSupport/VideoInput/VideoInputDataSource/SimpleBufferWrapper.h"
#include "HardwareSupport/VideoInput/VideoInputDataSource/VideoInputDataSource.h"
#include "HardwareSupport/VideoInput/VideoInputHAL/VideoInputDeviceManager.h"

namespace VideoInputHAL
{

namespace
{

constexpr const char* Category = "VideoInput";

const VVideoInputDataSourceFrame& FrameOf( const SyncSystem::VFrameRecord& i_rRecord )
{
  return *VVideoInputDataSource::FrameOf( i_rRecord.m_Frame.Frame() );
}

}

VVideoInputDataBufferToFlowState::VVideoInputDataBufferToFlowState( std::shared_ptr<VVideoInputDeviceManager> i_pDeviceManager,
  Flow2Utils::VFlowNodeUtils& i_rServices )
  : m_pDeviceManager( std::move( i_pDeviceManager ) ), m_rServices( i_rServices )
{
}

KVZ::VFlowStatePtr VVideoInputDataBufferToFlowState::MakeState( const SyncSystem::VFrameRecord& i_rRecord, const VFrameAnalysis& i_rAnalysis ) const
{
  KVZ::VFlowItemPtr pCamera = MakeCamera( i_rRecord );
  KVZ::VFlowStatePtr pState = m_rServices.CreateState();
  pState->SetCategory( Category );
  pState->AddItem( MakeVideo( i_rRecord ) );
  if( FrameOf( i_rRecord ).m_AudioInfo.HasAudio() )
  {
    pState->AddItem( MakeAudio( i_rRecord ) );
  }
  pState->AddItem( std::move( pCamera ) );
  pState->AddItem( MakeAnalysis( i_rRecord, i_rAnalysis ) );
  return pState;
}

KVZ::VFlowItemPtr VVideoInputDataBufferToFlowState::MakeVideo( const SyncSystem::VFrameRecord& i_rRecord ) const
{
  const VVideoInputDataSourceFrame& rFrame = FrameOf( i_rRecord );
  auto pItem = m_rServices.CreateItemOf<KVZ::VFlowVideoFrame>( KVZ::FlowLabels::VideoFrame );
  pItem->m_Info = rFrame.m_VideoInfo;
  pItem->m_Timecode = rFrame.m_Timecode;
  pItem->m_pBuffer = std::make_shared<ISimpleBufferWrapper>( i_rRecord.m_Frame, rFrame.Image(), rFrame.m_ImageBytes );
  return pItem;
}

KVZ::VFlowItemPtr VVideoInputDataBufferToFlowState::MakeAudio( const SyncSystem::VFrameRecord& i_rRecord ) const
{
  const VVideoInputDataSourceFrame& rFrame = FrameOf( i_rRecord );
  auto pItem = m_rServices.CreateItemOf<KVZ::VFlowAudioFrame>( KVZ::FlowLabels::AudioFrame );
  pItem->m_Info = rFrame.m_AudioInfo;
  pItem->m_pBuffer = std::make_shared<ISimpleBufferWrapper>( i_rRecord.m_Frame, rFrame.Audio(), rFrame.m_AudioBytes );
  return pItem;
}

KVZ::VFlowItemPtr VVideoInputDataBufferToFlowState::MakeCamera( const SyncSystem::VFrameRecord& i_rRecord ) const
{
  const int32_t DeviceIndex = FrameOf( i_rRecord ).m_DeviceIndex;
  const auto pDevice = m_pDeviceManager ? m_pDeviceManager->GetDevice( static_cast<uint32_t>( DeviceIndex ) ) : nullptr;
  if( !pDevice )
  {
    throw Flow2Utils::VFlowException( "Device identifier not found." );
  }
  auto pItem = m_rServices.CreateItemOf<KVZ::VFlowCameraHardware>( KVZ::FlowLabels::CameraHardware );
  pItem->m_DeviceURN = MakeDeviceURN( DeviceIndex );   // not asked of the device: it may be busy with its next frame, and answer only after that
  pItem->m_DeviceName = pDevice->GetDeviceName();
  pItem->m_Tick = i_rRecord.m_Tick;
  pItem->m_Period = i_rRecord.m_Period;
  pItem->m_GlobalSession = i_rRecord.m_GlobalSession;
  return pItem;
}

KVZ::VFlowItemPtr VVideoInputDataBufferToFlowState::MakeAnalysis( const SyncSystem::VFrameRecord& i_rRecord, const VFrameAnalysis& i_rAnalysis ) const
{
  auto pItem = m_rServices.CreateItemOf<KVZ::VFlowGenericData>( KVZ::FlowLabels::GenericData );
  pItem->m_Values["DeliveryTime"] = { FrameOf( i_rRecord ).m_DeliveryTime };
  pItem->m_Values["DroppedBefore"] = { static_cast<double>( i_rAnalysis.m_DroppedBefore ) };
  if( i_rAnalysis.m_Offsets )
  {
    SyncSystem::AddOffsets( *pItem, *i_rAnalysis.m_Offsets );
  }
  return pItem;
}

}
