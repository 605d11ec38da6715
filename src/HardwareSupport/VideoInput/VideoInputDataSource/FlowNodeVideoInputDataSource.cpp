#include "HardwareSupport/VideoInput/VideoInputDataSource/FlowNodeVideoInputDataSource.h"

#include "Flow2/Flow2Utils/ParameterUtilsChecked.h"
#include "HardwareSupport/VideoInput/VideoInputDataSource/VideoInputDataSource.h"
#include "StageCoreRuntime/GlobalLog.h"

namespace VideoInputHAL
{

using Flow2Utils::EParameterFlags;
using KVZ::VFlowLimit;

VFlowNodeVideoInputDataSource::VParameters::VParameters()
{
  AddParameter<std::string>( "DeviceURN", &m_DeviceURN, { .m_Description = "The video capture device URN to use.", .m_bRequired = true } );
}

VFlowNodeVideoInputDataSource::VFlowNodeVideoInputDataSource( std::shared_ptr<VVideoInputDataSourceMap> i_pDataSources )
  : m_pDataSources( std::move( i_pDataSources ) )
{
}

KVZ::VFlowNodeInfo VFlowNodeVideoInputDataSource::MakeNodeInfo()
{
  return { "VideoInputDataSource", "Flow node that supplies states from a VideoInputDataSource", {}, { "Output" } };
}

uint32_t VFlowNodeVideoInputDataSource::PreProcess()
{
  m_pParameters = std::make_shared<VParameters>();
  if( !Targets().empty() )
  {
    m_pParameters->SetTarget( Targets().front() );
  }
  Flow2Utils::UpdateChecked( *m_pParameters, ParameterTexts(), EParameterFlags::UnknownIsError | EParameterFlags::BeginUpdate );
  return UseDataSource() ? KVZ::EFlowResult::Ok : KVZ::EFlowResult::Failed;
}

bool VFlowNodeVideoInputDataSource::UseDataSource()
{
  const auto pSource = m_pDataSources->Find( m_pParameters->m_DeviceURN );
  if( !pSource )
  {
    KVZ_LOG_ERROR( "VideoInputHAL", "Failed to find VideoInput data source with DeviceURN '%1%'.", m_pParameters->m_DeviceURN );
    return false;
  }
  LeaveDataSource();
  m_pDataSource = pSource;
  m_ToFlowState.emplace( pSource->DeviceManager(), *this );
  m_pDataSource->OnNewFramesCallback().Set( [pServices = Services()]( uint64_t i_WakeToken ) { pServices->Wake( i_WakeToken ); } );
  return true;
}

void VFlowNodeVideoInputDataSource::LeaveDataSource()
{
  if( m_pDataSource )
  {
    m_pDataSource->OnNewFramesCallback().Clear();
  }
  m_ToFlowState.reset();
  m_pDataSource.reset();
  m_Dropped = 0;
}

void VFlowNodeVideoInputDataSource::Process()
{
  WaitOutputConnected( 0, VFlowLimit::None() );
  // A node without its settings waits for the items that carry them.
  std::string Reasons;
  if( GlobalItems( m_pParameters->Validate( Reasons ) ? VFlowLimit::Zero() : VFlowLimit::None(), m_GlobalItems ) )
  {
    TakeGlobalParameters();
  }
  if( !m_pParameters->Validate( Reasons ) ||
    !DoBlockingCall( [this]( uint64_t i_WakeToken ) { return GetFrames( i_WakeToken ); }, VFlowLimit::None(), KVZ::EFlowFlags::Rewirable ) )
  {
    return;
  }
  for( KVZ::VFlowStatePtr& rpState : m_States )
  {
    // Somebody has the state already: it must not be the one that travels on.
    if( rpState.use_count() != 1 )
    {
      rpState = rpState ? rpState->Clone() : CreateState();
    }
    Write( 0, rpState, VFlowLimit::None(), KVZ::EFlowFlags::Rewirable );
  }
}

void VFlowNodeVideoInputDataSource::TakeGlobalParameters()
{
  const std::string Former = m_pParameters->m_DeviceURN;
  Flow2Utils::UpdateChecked( *m_pParameters, ParameterTexts(), m_GlobalItems, EParameterFlags::UnknownIsError | EParameterFlags::EndUpdate );
  if( m_pParameters->m_DeviceURN != Former )
  {
    UseDataSource();
  }
}

// Asleep: the next frame wakes the token.
uint32_t VFlowNodeVideoInputDataSource::GetFrames( uint64_t i_WakeToken )
{
  m_States.clear();
  if( m_pDataSource->GetFrames( i_WakeToken, m_Read ) != SyncSystem::EReadResult::Frames )
  {
    return KVZ::EFlowResult::Asleep;
  }
  MakeStates();
  return KVZ::EFlowResult::Ok;
}

void VFlowNodeVideoInputDataSource::MakeStates()
{
  for( const SyncSystem::VFrameRecord& rRecord : m_Read.m_Frames )
  {
    if( rRecord.m_DropRun != 0 )
    {
      ++m_Dropped;
      continue;
    }
    m_States.push_back( m_ToFlowState->MakeState( rRecord, Analyse( rRecord ) ) );
    m_Dropped = 0;
  }
  m_Read.m_Frames.clear();   // from here on the states alone hold their frames
}

VFrameAnalysis VFlowNodeVideoInputDataSource::Analyse( const SyncSystem::VFrameRecord& i_rRecord ) const
{
  VFrameAnalysis Analysis;
  Analysis.m_DroppedBefore = m_Dropped;
  const double DeliveryTime = VVideoInputDataSource::FrameOf( i_rRecord.m_Frame.Frame() )->m_DeliveryTime;
  const int64_t Frame = ( i_rRecord.m_Tick - m_Read.m_pInfo->m_CounterStart ).Count() / i_rRecord.m_Period.Count();
  SyncSystem::VDeliveryOffsets Offsets;
  if( DeliveryTime != 0.0 && Frame >= 0 &&
    m_pDataSource->GetDeliveryOffsets( m_Read.m_pInfo->m_Session.m_Id, static_cast<uint64_t>( Frame ), DeliveryTime, Offsets ) )
  {
    Analysis.m_Offsets = Offsets;
  }
  return Analysis;
}

void VFlowNodeVideoInputDataSource::PostProcess()
{
  LeaveDataSource();
  m_States.clear();
  m_Read = {};
  m_GlobalItems.clear();
  m_pParameters.reset();
}

}
