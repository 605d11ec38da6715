// The host that a module runs in without the closed one: every service real and working, composed in one place.
//
// Made, driven and destroyed on one thread.
#pragma once

#include "StageCorePluginInterface/StageCoreHost.h"
#include "host/CaptureTargets.h"
#include "host/FlowGraph.h"
#include "host/ModuleLoader.h"
#include "host/Registries.h"
#include "host/RestoredSettings.h"
#include "host/SettingsFile.h"
#include "host/SyncEngine.h"

#include <cstddef>
#include <memory>
#include <string>
#include <vector>

namespace NotificationSystem
{
class VAsioPostalService;
}

namespace StageHost
{

struct VHostOptions
{
  size_t m_MemoryMiB = 1024;    // for the frames of all devices
  std::string m_SettingsPath;   // see VSettingsFile
};

// The budget is counted in blocks of this size: room for the largest frame, 4096 by 2160 in 32 bits with 16 channels of sound.
constexpr size_t FrameBlockSize = 40u << 20;

// The smallest budget with which a device can go on while one block is being drained.
constexpr size_t MinimumMemoryMiB = 3 * ( FrameBlockSize >> 20 );

class VStandAloneHost : public StageCorePluginInterface::IStageCoreHost
{
public:
  explicit VStandAloneHost( const VHostOptions& i_rOptions );
  ~VStandAloneHost() override;

  // Brings the saved settings back; before the module starts, so that its devices find them. What could not be brought back, a line each.
  // A device's settings that it would not take from its user are told in the log when it appears, and go back to their defaults.
  std::vector<std::string> RestoreSettings();
  VSettingsFile& SettingsFile() { return m_SettingsFile; }

  // Loads a module and takes it through the whole start up to the hardware start event. False with the reason in o_rError.
  bool StartModule( const std::string& i_rPath, std::string& o_rError );
  // Ends the module; nothing of it runs after this. Done by the destructor too.
  void StopModule();

  VSyncEngine& Engine() { return *m_pEngine; }
  VCaptureTargets& Targets() { return *m_pTargets; }
  VParameterRegistry& Parameters() { return *m_pParameters; }
  // Emptied when the module ends.
  VFlowGraph& Flow() { return m_Flow; }
  const VFlowNodeRegistry& FlowNodes() const { return *m_pFlowNodes; }
  StageCorePluginInterface::ITimeService& Time() { return *m_pTime; }

  std::shared_ptr<StageCorePluginInterface::IShutdownManager> GetShutdownManager() override { return m_pShutdown; }
  std::shared_ptr<UtilsMemory::VBalancingAllocator> GetBalancingAllocator() override { return m_pAllocator; }
  std::shared_ptr<IDataStore> GetDataStore() override { return m_pDataStore; }
  std::shared_ptr<StageCorePluginInterface::ITimeService> GetTimeService() override { return m_pTime; }
  std::shared_ptr<StageCorePluginInterface::IFlowNodeRegistry> GetFlowNodeRegistry() override { return m_pFlowNodes; }
  std::shared_ptr<StageCorePluginInterface::IParameterRegistry> GetParameterRegistry() override { return m_pParameters; }
  std::shared_ptr<StageCorePluginInterface::IHardwareStartEvent> GetHardwareStartEvent() override { return m_pHardwareStart; }
  std::shared_ptr<StageCorePluginInterface::IServiceObject> GetTriggerService() override { return m_pTriggerService; }
  std::shared_ptr<StageCorePluginInterface::IServiceObject> GetFirstSourceService() override { return m_pFirstService; }
  std::shared_ptr<StageCorePluginInterface::IServiceObject> GetSecondSourceService() override { return m_pSecondService; }
  std::shared_ptr<StageCorePluginInterface::ICaptureTargets> GetCaptureTargetService() override { return m_pTargets; }
  std::shared_ptr<StageCorePluginInterface::ISourceRegistry> GetSourceRegistry() override { return m_pEngine; }
  std::shared_ptr<StageCorePluginInterface::ICaptureTargets> GetCaptureTargets() override { return m_pTargets; }
  // What files the module offers to open is for a window, and this host has none.
  void SetFileFilters( int, const std::vector<std::string>& ) override {}

private:
  const std::shared_ptr<IDataStore> m_pDataStore;
  VSettingsFile m_SettingsFile;
  const std::shared_ptr<StageCorePluginInterface::ITimeService> m_pTime;
  const std::shared_ptr<UtilsMemory::VBalancingAllocator> m_pAllocator;
  const std::shared_ptr<VShutdownManager> m_pShutdown;
  const std::shared_ptr<VFlowNodeRegistry> m_pFlowNodes;
  const std::shared_ptr<VRestoredSettings> m_pRestoredSettings;
  const std::shared_ptr<VParameterRegistry> m_pParameters;
  const std::shared_ptr<VHardwareStartEvent> m_pHardwareStart;
  const std::shared_ptr<VHardwareRegistry> m_pHardware;
  const std::shared_ptr<VCaptureTargets> m_pTargets;
  const std::shared_ptr<StageCorePluginInterface::IServiceObject> m_pTriggerService;
  const std::shared_ptr<StageCorePluginInterface::IServiceObject> m_pFirstService;
  const std::shared_ptr<StageCorePluginInterface::IServiceObject> m_pSecondService;
  const std::shared_ptr<NotificationSystem::VAsioPostalService> m_pEngineService;   // ends after the engine, whose calls it runs
  const std::shared_ptr<VSyncEngine> m_pEngine;
  std::unique_ptr<VLoadedModule> m_pModule;
  VFlowGraph m_Flow;   // ends before the module whose nodes it runs
};

}
