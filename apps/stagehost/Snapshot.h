// One image of a device as a PNG file.
#pragma once

#include "StageCorePluginInterface/FlowItems.h"

#include <string>

// False with the reason in o_rError. An existing file is replaced.
bool WriteSnapshot( const KVZ::VFlowVideoFrame& i_rFrame, const std::string& i_rPath, std::string& o_rError );
