// What every command that touches devices does first: cards, host, module, and waiting for devices.
#pragma once

#include "host/DeviceSettings.h"
#include "host/StandAloneHost.h"
#include "host/VirtualCards.h"

#include <cstddef>
#include <memory>
#include <string>
#include <vector>

namespace CLI
{
class App;
}

struct VSessionOptions
{
  std::vector<std::string> m_Cards;
  std::vector<std::string> m_DeviceURNs;   // empty: all
  size_t m_MemoryMiB = 1024;
  bool m_bVerbose = false;
};

// --card and --verbose, which every such command takes.
void AddSessionOptions( CLI::App& io_rCommand, VSessionOptions& io_rOptions );

class VHostSession
{
public:
  // An exit code: not ExitComplete when cards or module could not be had, which was said on standard error.
  int Start( const VSessionOptions& i_rOptions );

  // Waits until the devices are there and, if told so, until each of them has a signal. The devices asked for, in the order of their
  // indices; empty, with the reason on standard error, where there are none, one is unknown or, if told so, one has no signal.
  std::vector<StageHost::VDeviceInfo> WaitForDevices( bool i_bNeedSignal );
  // The exit code for an empty answer.
  static int ExitWithoutDevices();

  StageHost::VStandAloneHost& Host() { return *m_pHost; }
  StageHost::VDeviceSettings& Settings() { return *m_pSettings; }

private:
  std::vector<StageHost::VDeviceInfo> Choose( const std::vector<StageHost::VDeviceInfo>& i_rDevices ) const;

  VSessionOptions m_Options;
  StageHost::VVirtualCards m_Cards;
  std::unique_ptr<StageHost::VStandAloneHost> m_pHost;
  std::unique_ptr<StageHost::VDeviceSettings> m_pSettings;
};

// One line on standard error, behind the program's name.
void Complain( const std::string& i_rText );
