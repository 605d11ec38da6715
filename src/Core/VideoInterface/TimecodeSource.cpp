#include "Core/VideoInterface/TimecodeSource.h"

#include "Core/VideoInterface/Schemas.h"

#include <array>

namespace KVZ
{

namespace
{

constexpr std::array Rows = {
  VEnumRow{ ITimecodeSource::ERP188_LTC, "RP188_LTC", "RP188 Embedded LTC timecode on line 10 of SDI." },
  VEnumRow{ ITimecodeSource::ERP188_VITC1, "RP188_VITC1", "RP188 Embedded VITC timecode on line 9 of SDI." },
  VEnumRow{ ITimecodeSource::ERP188_VITC2, "RP188_VITC2", "RP188 Embedded VITC timecode on line 571 of SDI." },
  VEnumRow{ ITimecodeSource::EVITC_Field1, "VITC_Field1", "VITC timecode field 1." },
  VEnumRow{ ITimecodeSource::EVITC_Field2, "VITC_Field2", "VITC timecode field 2." },
  VEnumRow{ ITimecodeSource::ESerial, "Serial", "Serial timecode." },
  VEnumRow{ ITimecodeSource::EExternal_LTC, "External_LTC", "External LTC timecode." },
  VEnumRow{ ITimecodeSource::EUnspecified, "Unspecified", "Represents a timecode source that is unknown or unsupported." },
  VEnumRow{ ITimecodeSource::ERP188_Any, "RP188_Any", "Any available RP188 timecode." },
  VEnumRow{ ITimecodeSource::EAny, "Any", "Any available timecode." },
};

constexpr VEnumTable Table{ "TimecodeSource.Enum", "Enumeration of timecode sources.", Rows };

}

const VEnumTable& GetEnumTable( ITimecodeSource::Enum ) { return Table; }

std::string ToName( ITimecodeSource::Enum i_Value ) { return FindName( Table, i_Value ); }

bool FromName( const std::string& i_rName, ITimecodeSource::Enum& o_rValue ) { return FindEnumerator( Table, i_rName, o_rValue ); }

}
