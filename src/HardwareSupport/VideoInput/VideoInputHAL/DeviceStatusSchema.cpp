#include "HardwareSupport/VideoInput/VideoInputHAL/DeviceStatusSchema.h"

const KVZ::ISchema* KVZ::VSchemaOf<VideoInputHAL::IVideoInputDevice::EStatus::Enum>::Get()
{
  using EStatus = VideoInputHAL::IVideoInputDevice::EStatus;
  static const ISchema* const s_pSchema = IO::GetUniqueSchema( "VideoInputDevice.EStatus", "Device status",
    std::vector<ISchema::VEntry>{
      { EStatus::EReady, "Ready", "Device present, not capturing." },
      { EStatus::ECapturing, "Capturing", "Capture is running." },
      { EStatus::EUnavailable, "Unavailable", "Device cannot be used." },
    } );
  return s_pSchema;
}
