// What this build of the plug-in is composed of, as rows: drivers, containers that can be written, what frames are encoded with.
#pragma once

#include "Core/VideoInterface/VideoWriter.h"
#include "FileIO/VideoEncoding/EncoderParts.h"
#include "HardwareSupport/VideoInput/VideoInputHAL/VideoInputDevice.h"

#include <memory>
#include <vector>

namespace Composition
{

// In the order of the device indices.
std::vector<VideoInputHAL::VDriverMaker> DriverMakers();

// A writer for each container that captures can go to.
std::shared_ptr<const KVZ::VVideoWriterFactory> WriterFactory();

// Those containers, in the order of their values.
std::vector<KVZ::IVideoContainer::Enum> WritableContainers();

// Converters, compressors and the drawing of text, for all frame encoders.
VideoEncoding::VEncoderParts EncoderParts();

}
