// The tables behind the enumerations of this folder, and the schemas by which the data store knows them.
#pragma once

#include "Core/VideoInterface/AudioPayload.h"
#include "Core/VideoInterface/AudioSampleFormat.h"
#include "Core/VideoInterface/EnumTable.h"
#include "Core/VideoInterface/FrameRecords.h"
#include "Core/VideoInterface/GenlockStandard.h"
#include "Core/VideoInterface/InterlacedFormat.h"
#include "Core/VideoInterface/PixelFormat.h"
#include "Core/VideoInterface/Timecode.h"
#include "Core/VideoInterface/TimecodeSource.h"
#include "Core/VideoInterface/VideoContainer.h"
#include "Core/VideoInterface/VideoPayload.h"
#include "Core/VideoInterface/VideoStandard.h"
#include "StageCoreRuntime/Variant.h"

namespace KVZ
{

// The argument only selects the enumeration; its value does not matter.
const VEnumTable& GetEnumTable( IVideoStandard::Enum );
const VEnumTable& GetEnumTable( IPixelFormat::Enum );
const VEnumTable& GetEnumTable( IInterlacedFormat::Enum );
const VEnumTable& GetEnumTable( IAudioSampleFormat::Enum );
const VEnumTable& GetEnumTable( ITimecodeSource::Enum );
const VEnumTable& GetEnumTable( ITimecodeStandard::Enum );
const VEnumTable& GetEnumTable( IGenlockStandard::Enum );
const VEnumTable& GetEnumTable( IVideoContainer::Enum );
const VEnumTable& GetEnumTable( IVideoPayload::Enum );
const VEnumTable& GetEnumTable( IAudioPayload::Enum );
const VEnumTable& GetEnumTable( VLensDistortionRecord::ERadialModel );

// Made from the tables at first use; any thread.
template<>
struct VSchemaOf<IVideoStandard::Enum>
{
  static const ISchema* Get();
};
template<>
struct VSchemaOf<IPixelFormat::Enum>
{
  static const ISchema* Get();
};
template<>
struct VSchemaOf<IInterlacedFormat::Enum>
{
  static const ISchema* Get();
};
template<>
struct VSchemaOf<IAudioSampleFormat::Enum>
{
  static const ISchema* Get();
};
template<>
struct VSchemaOf<ITimecodeSource::Enum>
{
  static const ISchema* Get();
};
template<>
struct VSchemaOf<ITimecodeStandard::Enum>
{
  static const ISchema* Get();
};
template<>
struct VSchemaOf<IGenlockStandard::Enum>
{
  static const ISchema* Get();
};
template<>
struct VSchemaOf<IVideoContainer::Enum>
{
  static const ISchema* Get();
};
template<>
struct VSchemaOf<IVideoPayload::Enum>
{
  static const ISchema* Get();
};
template<>
struct VSchemaOf<IAudioPayload::Enum>
{
  static const ISchema* Get();
};
template<>
struct VSchemaOf<VLensDistortionRecord::ERadialModel>
{
  static const ISchema* Get();
};

}
