// The only names that the module exports.
#include "StageCorePluginVideoInput/StageCorePluginVideoInput.h"

extern "C"
{

  StageCorePluginInterface::IPlugin* CreatePlugin() { return new VStageCorePluginVideoInput; }

  void DestroyPlugin( StageCorePluginInterface::IPlugin* i_pPlugin ) { delete i_pPlugin; }

  unsigned int PluginBuildRevision() { return 120364; }
}
