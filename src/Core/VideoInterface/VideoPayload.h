// What a video track holds. Values are stored in settings.
#pragma once

#include <cstdint>
#include <string>

namespace KVZ
{

class IVideoPayload
{
public:
  enum Enum : int32_t
  {
    ENone = 0,
    EUncompressed = 1,
    EImageJPEG = 2,
    EImagePNG = 3,
    EImageTIFF = 4,
    EVideoH264 = 5,
  };
};

// The enumerator's name; empty for a value outside the table.
std::string ToName( IVideoPayload::Enum i_Value );
bool FromName( const std::string& i_rName, IVideoPayload::Enum& o_rValue );

}
