#include "HardwareSupport/VideoInput/VideoInputHAL/VideoInputDevice.h"

namespace VideoInputHAL
{

std::string MakeDeviceURN( int32_t i_Index ) { return "vi:" + std::to_string( i_Index ); }

}
