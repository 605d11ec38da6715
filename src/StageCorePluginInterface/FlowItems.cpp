#include "StageCorePluginInterface/FlowItems.h"

namespace KVZ
{

const VFlowItemType VFlowVideoFrame::ItemType{ "FlowVideoFrame", "The image of a frame" };
const VFlowItemType VFlowAudioFrame::ItemType{ "FlowAudioFrame", "The sound of a frame" };
const VFlowItemType VFlowCameraHardware::ItemType{ "FlowCameraHardware", "The device that a frame comes from, and its place in time" };
const VFlowItemType VFlowParameters::ItemType{ "FlowParametersItem", "Parameters that can be tagged and addressed to a particular target" };

VFlowVideoFrame::~VFlowVideoFrame() = default;
VFlowAudioFrame::~VFlowAudioFrame() = default;
VFlowCameraHardware::~VFlowCameraHardware() = default;
VFlowParameters::~VFlowParameters() = default;

namespace
{

template<class TItem>
VFlowItemPtr Make( const std::string& i_rLabel )
{
  return std::make_shared<TItem>( i_rLabel );
}

struct VItemRow
{
  const VFlowItemType& m_rType;
  VFlowItemPtr ( *m_pMake )( const std::string& i_rLabel );
};

const VItemRow ItemRows[] = {
  { VFlowVideoFrame::ItemType, &Make<VFlowVideoFrame> },
  { VFlowAudioFrame::ItemType, &Make<VFlowAudioFrame> },
  { VFlowCameraHardware::ItemType, &Make<VFlowCameraHardware> },
  { VFlowGenericData::ItemType, &Make<VFlowGenericData> },
  { VFlowParameters::ItemType, &Make<VFlowParameters> },
};

}

VFlowItemPtr MakeFlowItem( const std::string& i_rTypeName, const std::string& i_rLabel )
{
  for( const VItemRow& rRow : ItemRows )
  {
    if( i_rTypeName == rRow.m_rType.m_pName )
    {
      return rRow.m_pMake( i_rLabel );
    }
  }
  return nullptr;
}

}
