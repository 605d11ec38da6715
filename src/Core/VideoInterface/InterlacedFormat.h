// How the lines of a frame lie in time. Names are stored in files.
#pragma once

#include <cstdint>
#include <string>

namespace KVZ
{

class IInterlacedFormat
{
public:
  enum Enum : int32_t
  {
    EUnspecified = 0,
    ENotInterlaced = 1,
    EInterlacedFrameEvenOlder = 2,
    EInterlacedFrameOddOlder = 3,
    EInterlacedFrameUnspecifiedLineTiming = 4,
  };
};

// The enumerator's name; empty for a value outside the table.
std::string ToName( IInterlacedFormat::Enum i_Value );
bool FromName( const std::string& i_rName, IInterlacedFormat::Enum& o_rValue );

}
