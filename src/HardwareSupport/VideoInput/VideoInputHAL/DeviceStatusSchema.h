// The schema by which the data store knows a device's status: "VideoInputDevice.EStatus".
#pragma once

#include "HardwareSupport/VideoInput/VideoInputHAL/VideoInputDevice.h"
#include "StageCoreRuntime/Variant.h"

template<>
struct KVZ::VSchemaOf<VideoInputHAL::IVideoInputDevice::EStatus::Enum>
{
  static const ISchema* Get();
};
