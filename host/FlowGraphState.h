// The states that the host hands out to its nodes.
#pragma once

#include "Core/VideoInterface/FlowState.h"

#include <string>

namespace StageHost
{

class VFlowState : public KVZ::IFlowState
{
public:
  void SetCategory( const std::string& i_rCategory ) override { m_Category = i_rCategory; }
  const std::string& Category() const override { return m_Category; }
  void AddItem( KVZ::VFlowItemPtr i_pItem ) override { m_Items.push_back( std::move( i_pItem ) ); }
  const KVZ::VFlowItemList& Items() const override { return m_Items; }
  KVZ::VFlowStatePtr Clone() const override { return std::make_shared<VFlowState>( *this ); }

private:
  std::string m_Category;
  KVZ::VFlowItemList m_Items;
};

}
