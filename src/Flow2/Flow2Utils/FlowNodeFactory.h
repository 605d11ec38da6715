// Factories by which a module makes its nodes known to the host.
#pragma once

#include "Flow2/Flow2Utils/ParameterSet.h"
#include "StageCorePluginInterface/FlowNode.h"

#include <map>
#include <memory>
#include <string>
#include <utility>

namespace Flow2Utils
{

// T is a VFlowNode<T> with a parameter set T::VParameters that can be made of nothing.
template<class T>
class VFlowNodeFactoryBase : public KVZ::IFlowNodeFactory
{
public:
  const KVZ::VFlowNodeInfo& NodeInfo() const override { return T::Info(); }
  std::map<std::string, std::map<std::string, std::string>> DescribeParameters() const override { return typename T::VParameters().Describe(); }
  bool NeedsBlockingCalls() const override { return true; }
};

// Its nodes get one argument, the same for all.
template<class T, class TArg>
class VFlowNodeFactory1 : public VFlowNodeFactoryBase<T>
{
public:
  explicit VFlowNodeFactory1( TArg i_Argument ) : m_Argument( std::move( i_Argument ) ) {}
  std::shared_ptr<KVZ::IFlowNode> CreateNode() override { return std::make_shared<T>( m_Argument ); }

private:
  const TArg m_Argument;
};

}
