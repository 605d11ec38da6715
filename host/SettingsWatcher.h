// Tells which settings change, in the order in which they do.
//
// One thread at a time.
#pragma once

#include "host/Registries.h"

#include <cstddef>
#include <memory>
#include <string>
#include <vector>

class IParameter;
class IParameterGroup;

namespace StageHost
{

struct VSettingChange
{
  std::string m_Path;
  std::string m_Value;   // empty where it has none any more
};

class VSettingsWatcher
{
public:
  // Of the setting at this path or all below it; of all for the empty text.
  VSettingsWatcher( const VParameterRegistry& i_rRegistry, const std::string& i_rPath );

  // What has happened since the last call. Settings of devices that have come since then are watched from now on.
  std::vector<VSettingChange> Take();
  // How many settings are watched.
  size_t Count() const { return m_Count; }

private:
  class VHeard;

  void WatchNew();
  void Watch( const std::shared_ptr<IParameter>& i_pParameter );

  const VParameterRegistry& m_rRegistry;
  const VDataPath m_Branch;
  const std::shared_ptr<VHeard> m_pHeard;                 // the settings refer to it weakly
  std::vector<std::weak_ptr<IParameterGroup>> m_Groups;   // a group that is registered is whole
  size_t m_Count = 0;
};

}
