// What a device's settings and the command line say of the file that a recording makes.
#pragma once

#include "apps/stagehost/HostSession.h"
#include "apps/stagehost/RecordFormat.h"
#include "apps/stagehost/RecordLimits.h"

// Once the settings are applied.
VStoredFormat ReadStoredFormat( VHostSession& i_rSession, const StageHost::VDeviceInfo& i_rDevice, const VFormatOptions& i_rOptions );
