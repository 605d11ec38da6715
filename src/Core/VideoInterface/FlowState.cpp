#include "Core/VideoInterface/FlowState.h"

namespace KVZ
{

IFlowItem::~IFlowItem() = default;
IFlowState::~IFlowState() = default;

const VFlowItemType VFlowGenericData::ItemType{ "FlowGenericData", "Named values of any meaning" };

VFlowGenericData::~VFlowGenericData() = default;

bool VFlowGenericData::GetNumber( const std::string& i_rName, double& o_rValue ) const
{
  const auto Found = m_Values.find( i_rName );
  if( Found == m_Values.end() || Found->second.empty() )
  {
    return false;
  }
  o_rValue = Found->second.front();
  return true;
}

}
