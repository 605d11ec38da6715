// A flow node that runs what a test puts in. Two inputs, two outputs.
#pragma once

#include "Flow2/Flow2Utils/FlowNode.h"

#include <functional>

namespace TestSupport
{

class VFunctionNode : public Flow2Utils::VFlowNode<VFunctionNode>
{
public:
  using VFunction = std::function<void( VFunctionNode& )>;

  static KVZ::VFlowNodeInfo MakeNodeInfo() { return { "Function", "Runs functions", { "Left", "Right" }, { "Upper", "Lower" } }; }

  explicit VFunctionNode( VFunction i_Process = Nothing ) : m_Process( std::move( i_Process ) ) {}

  // Set before the node runs.
  VFunction m_PreProcess = Nothing;
  VFunction m_Process;   // round after round
  VFunction m_PostProcess = Nothing;
  uint32_t m_Start = KVZ::EFlowResult::Ok;   // the answer of PreProcess

  // Where the functions may put what services bring
  KVZ::VFlowStatePtr m_pState;
  uint32_t m_Index = 0;
  KVZ::VFlowSelection m_Selection;
  KVZ::VFlowItemList m_Items;

protected:
  static void Nothing( VFunctionNode& ) {}
  uint32_t PreProcess() override
  {
    m_PreProcess( *this );
    return m_Start;
  }
  void Process() override { m_Process( *this ); }
  void PostProcess() override { m_PostProcess( *this ); }
};

}
