// What an audio track holds. Values are stored in settings.
#pragma once

#include <cstdint>
#include <string>

namespace KVZ
{

class IAudioPayload
{
public:
  enum Enum : int32_t
  {
    ENone = 0,
    EUncompressed = 1,
    ELosslessFLAC = 2,
  };
};

// The enumerator's name; empty for a value outside the table.
std::string ToName( IAudioPayload::Enum i_Value );
bool FromName( const std::string& i_rName, IAudioPayload::Enum& o_rValue );

}
