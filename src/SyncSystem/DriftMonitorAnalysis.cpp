#include "SyncSystem/DriftMonitorAnalysis.h"

namespace SyncSystem
{

void AddOffsets( KVZ::VFlowGenericData& io_rData, const VDeliveryOffsets& i_rOffsets )
{
  io_rData.m_Values["DeliveryOffset"] = { i_rOffsets.m_Delivery };
  io_rData.m_Values["PredictedOffset"] = { i_rOffsets.m_Predicted };
}

void VDriftMonitorAnalysis::Publish( const VDeliveryOffsets& i_rOffsets )
{
  KVZ::VFlowStatePtr pState = m_MakeState();
  if( pState )
  {
    auto pItem = std::make_shared<KVZ::VFlowGenericData>( KVZ::FlowLabels::GenericData );
    AddOffsets( *pItem, i_rOffsets );
    pState->AddItem( std::move( pItem ) );
    m_Sink( std::move( pState ) );
  }
}

}
