// Parameters of the plug-in that belong to the system as a whole. There are none: the group is registered and stays empty.
#pragma once

#include "StageCoreParameters/StageCoreParameterHandler.h"

class VVideoInputSystemParameterHandler : public VStageCoreParameterHandler
{
public:
  VVideoInputSystemParameterHandler( std::shared_ptr<KVZ::IPostalService> i_pPostalService, std::shared_ptr<IDataStore> i_pDataStore,
    std::shared_ptr<StageCorePluginInterface::IParameterRegistry> i_pParameterRegistry );

  void CreateParameters() override {}
};
