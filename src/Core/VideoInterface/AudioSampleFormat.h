// Sample layouts of interleaved audio, little-endian. The values are stored in files; they are not in name order.
#pragma once

#include <cstdint>
#include <string>

namespace KVZ
{

class IAudioSampleFormat
{
public:
  enum Enum : int32_t
  {
    EUnspecified = 0,
    EInt8 = 1,
    EInt16 = 2,
    EInt24 = 3,
    EInt32 = 4,
    EUInt16 = 5,
    EFloat32 = 6,
    EUInt8 = 7,
    EUInt24 = 8,
    EUInt32 = 9,
  };
};

// 0 for "Unspecified" and for a value outside the table.
uint32_t GetBytesPerSample( IAudioSampleFormat::Enum i_Format );

// The enumerator's name; empty for a value outside the table.
std::string ToName( IAudioSampleFormat::Enum i_Value );
bool FromName( const std::string& i_rName, IAudioSampleFormat::Enum& o_rValue );

}
