// What a node derives from: VFlowNode<T>, with T the node itself.
//
//   class VMyNode : public Flow2Utils::VFlowNode<VMyNode>
//   {
//   public:
//     static KVZ::VFlowNodeInfo MakeNodeInfo();
//   protected:
//     uint32_t Process() override;
//   };
//
// All on the thread that the host runs the node on.
#pragma once

#include "Flow2/Flow2Utils/FlowNodeUtils.h"

#include <string>

namespace Flow2Utils
{

// Installs the host's services around a node's three operations. A node that reaches the end of data or a stop needs no code for it:
// VFlowFinishedException ends here, with a line in the log. Any other exception passes out to the host.
class VFlowNodeBase : public KVZ::IFlowNode, public virtual VFlowNodeUtils
{
public:
  const KVZ::VFlowNodeInfo& NodeInfo() const override = 0;
  KVZ::VFlowParameterTexts& ParameterTexts() override { return VFlowNodeUtils::ParameterTexts(); }
  VTargets& Targets() override { return VFlowNodeUtils::Targets(); }
  uint32_t PreProcessChecked( std::shared_ptr<KVZ::IFlowNodeServices> i_pServices ) override;
  uint32_t ProcessChecked() override;
  uint32_t PostProcessChecked() override;
  ~VFlowNodeBase() override;

protected:
  // Called once the services are installed, before PreProcess.
  virtual void OnServicesInstalled() {}
  // A failure keeps the node from running.
  virtual uint32_t PreProcess() { return KVZ::EFlowResult::Ok; }
  // One round; called again until the graph stops.
  virtual void Process() = 0;
  virtual void PostProcess() {}
};

template<class T>
class VFlowNode : public VFlowNodeBase
{
public:
  static const KVZ::VFlowNodeInfo& Info()
  {
    static const KVZ::VFlowNodeInfo s_Info = T::MakeNodeInfo();
    return s_Info;
  }
  const KVZ::VFlowNodeInfo& NodeInfo() const override { return Info(); }

protected:
  VFlowNode()
  {
    InputNames() = Info().m_Inputs;
    OutputNames() = Info().m_Outputs;
  }
};

}
