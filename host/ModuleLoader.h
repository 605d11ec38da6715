// Loads a module as the closed host would: by its three exports and nothing else.
#pragma once

#include "StageCorePluginInterface/Plugin.h"

#include <memory>
#include <string>

namespace StageHost
{

class VLoadedModule
{
public:
  // An empty pointer with the reason in o_rError. The module stays loaded until the process ends: objects with code of its own may outlive
  // the plug-in.
  static std::unique_ptr<VLoadedModule> Load( const std::string& i_rPath, std::string& o_rError );
  ~VLoadedModule();
  VLoadedModule( const VLoadedModule& ) = delete;
  VLoadedModule& operator=( const VLoadedModule& ) = delete;

  StageCorePluginInterface::IPlugin& Plugin() { return *m_pPlugin; }
  unsigned int BuildRevision() const { return m_BuildRevision; }

private:
  VLoadedModule( StageCorePluginInterface::IPlugin* i_pPlugin, VDestroyPlugin i_pDestroy, unsigned int i_BuildRevision );

  StageCorePluginInterface::IPlugin* const m_pPlugin;
  const VDestroyPlugin m_pDestroy;
  const unsigned int m_BuildRevision;
};

// The folder of the running program, where module and libraries lie beside it.
std::string ProgramFolder();

}
