// What the host sees of a module: the plug-in object and the hardware manager behind it.
//
// Order of the host's calls, all on its own thread: load, CreatePlugin, Initialise, RegisterFlowNodeFactories and RegisterHardware in either
// order, then the hardware start event, and DestroyPlugin at the end.
#pragma once

#include <string>

class VDataPath;

namespace StageCorePluginInterface
{

class IStageCoreHost;
class IFlowNodeRegistry;
class IHardwareHost;

// The order of the virtual operations is binding: module and host are two binaries.
class IPlugin
{
public:
  virtual ~IPlugin() = default;
  virtual std::string GetDisplayName() const { return {}; }
  virtual std::string GetVersionText() const { return {}; }
  virtual bool RegisterTypes() { return true; }
  virtual bool RegisterFlowNodeFactories( IFlowNodeRegistry& ) { return true; }
  virtual bool RegisterCommands() { return true; }
  virtual bool RegisterViews() { return true; }
  virtual bool Initialise( IStageCoreHost& ) { return true; }
  virtual bool PostInitialise() { return true; }
  // The first argument is for the host's own plug-ins.
  virtual bool RegisterHardware( void*, IHardwareHost& ) { return true; }
  virtual void OnHostReady() {}
  virtual void OnHostClosing() {}
};

// Held by the host's hardware registry; it only keeps the object.
class IHardwareManager
{
public:
  virtual ~IHardwareManager() = default;
  virtual void OnSystemStarted() {}
  virtual void OnSystemStopping() {}
  virtual void OnSettingsLoaded() {}
};

}

// The module's three exports.
using VCreatePlugin = StageCorePluginInterface::IPlugin* (*)();
using VDestroyPlugin = void ( * )( StageCorePluginInterface::IPlugin* );
using VPluginBuildRevision = unsigned int ( * )();
