// Settings as people and scripts see them.
#pragma once

#include "host/DeviceSettings.h"

#include <nlohmann/json_fwd.hpp>

#include <string>
#include <vector>

// The paths that are in the settings file are marked.
nlohmann::ordered_json ToJson( const StageHost::VSettingInfo& i_rSetting, const std::vector<VDataPath>& i_rSaved );

// A tree: a heading for each group of a device, and its settings below, a line each.
std::string ToTree( const std::vector<StageHost::VSettingInfo>& i_rSettings, const std::vector<VDataPath>& i_rSaved );
