// The host's register of parameter groups: what its settings views show.
#pragma once

#include <memory>

class IParameterGroup;

namespace StageCorePluginInterface
{

class IParameterRegistry
{
public:
  virtual void AddParameterGroup( std::shared_ptr<IParameterGroup> i_pGroup ) = 0;
  virtual void RemoveParameterGroup( const std::shared_ptr<IParameterGroup>& i_pGroup ) = 0;
  virtual ~IParameterRegistry() = default;
};

}
