// What every command that touches devices does first: cards, host, module, and waiting for devices.
#pragma once

#include "host/DeviceSettings.h"
#include "host/StandAloneHost.h"
#include "host/VirtualCards.h"

#include <cstddef>
#include <functional>
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
  std::vector<std::string> m_DeviceURNs;   // empty: all, or those that are enabled
  bool m_bLeaveOutDisabled = false;        // where no device is named
  std::string m_SettingsPath;              // empty: the user's own file; "none": no file
  bool m_bMayMakeSettings = false;         // a named file need not be there yet
  size_t m_MemoryMiB = 1024;
  bool m_bVerbose = false;
};

// --card, --settings and --verbose, which every such command takes.
void AddSessionOptions( CLI::App& io_rCommand, VSessionOptions& io_rOptions );

class VHostSession
{
public:
  // An exit code: not ExitComplete when cards, settings file or module could not be had, which was said on standard error. The saved settings
  // are there before the devices are.
  int Start( const VSessionOptions& i_rOptions );

  // Waits until the devices are there and have a signal, for as long as that may take. The devices asked for, in the order of their indices;
  // empty, with the reason on standard error, where there are none, one is unknown or, if a signal is needed, one has none.
  std::vector<StageHost::VDeviceInfo> WaitForDevices( bool i_bNeedSignal );
  // Waits a moment more, until those that have a signal deliver it: only then do their settings tell its timecode and what is wrong with it.
  void WaitForDelivery( const std::vector<StageHost::VDeviceInfo>& i_rDevices );
  // Waits at most so long, and no longer than to the first signal. True if the condition holds at the end.
  bool WaitUntil( double i_Seconds, const std::function<bool()>& i_Condition ) const;
  // The exit code for an empty answer.
  static int ExitWithoutDevices();

  StageHost::VStandAloneHost& Host() { return *m_pHost; }
  StageHost::VDeviceSettings& Settings() { return *m_pSettings; }
  StageHost::VSettingsFile& SettingsFile() { return m_pHost->SettingsFile(); }

private:
  // The file, empty for none. False where there is none that was named.
  bool ChooseSettingsFile( std::string& o_rPath ) const;
  std::vector<StageHost::VDeviceInfo> Choose( const std::vector<StageHost::VDeviceInfo>& i_rDevices ) const;

  VSessionOptions m_Options;
  StageHost::VVirtualCards m_Cards;
  std::unique_ptr<StageHost::VStandAloneHost> m_pHost;
  std::unique_ptr<StageHost::VDeviceSettings> m_pSettings;
};

// One line on standard error, behind the program's name.
void Complain( const std::string& i_rText );
