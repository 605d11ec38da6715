// The plug-in object on the host's contract. All calls come on the host's thread.
#pragma once

#include "StageCoreDataStore/DataReader.h"
#include "StageCoreDataStoreTypes/DataPath.h"
#include "StageCorePluginInterface/Plugin.h"

#include <memory>

class VVideoInputEngine;

class VStageCorePluginVideoInput : public StageCorePluginInterface::IPlugin
{
public:
  ~VStageCorePluginVideoInput() override;

  bool RegisterFlowNodeFactories( StageCorePluginInterface::IFlowNodeRegistry& i_rRegistry ) override;
  // Makes the engine and starts it. Never false: a failure leaves as an exception.
  bool Initialise( StageCorePluginInterface::IStageCoreHost& i_rHost ) override;
  // False, after an assertion, without an engine.
  bool RegisterHardware( void* i_pUnused, StageCorePluginInterface::IHardwareHost& i_rHardware ) override;

private:
  std::shared_ptr<VVideoInputEngine> m_pEngine;
};

// True for the path of the class "VideoInput" and all below it.
bool SelectVideoInputSection( const IDataReader& i_rReader, const VDataPath& i_rPath );
