// Where in the signal a device looks for timecode. Values are stored in settings.
#pragma once

#include <cstdint>
#include <string>

namespace KVZ
{

class ITimecodeSource
{
public:
  enum Enum : int32_t
  {
    ERP188_LTC = 0,
    ERP188_VITC1 = 1,
    ERP188_VITC2 = 2,
    EVITC_Field1 = 3,
    EVITC_Field2 = 4,
    ESerial = 5,
    EExternal_LTC = 6,
    EUnspecified = 7,
    ERP188_Any = 8,
    EAny = 9,
  };
};

// The enumerator's name; empty for a value outside the table.
std::string ToName( ITimecodeSource::Enum i_Value );
bool FromName( const std::string& i_rName, ITimecodeSource::Enum& o_rValue );

}
