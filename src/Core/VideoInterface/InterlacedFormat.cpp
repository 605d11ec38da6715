#include "Core/VideoInterface/InterlacedFormat.h"

#include "Core/VideoInterface/Schemas.h"

#include <array>

namespace KVZ
{

namespace
{

constexpr std::array Rows = {
  VEnumRow{ IInterlacedFormat::EUnspecified, "Unspecified" },
  VEnumRow{ IInterlacedFormat::ENotInterlaced, "NotInterlaced" },
  VEnumRow{ IInterlacedFormat::EInterlacedFrameEvenOlder, "InterlacedFrameEvenOlder" },
  VEnumRow{ IInterlacedFormat::EInterlacedFrameOddOlder, "InterlacedFrameOddOlder" },
  VEnumRow{ IInterlacedFormat::EInterlacedFrameUnspecifiedLineTiming, "InterlacedFrameUnspecifiedLineTiming" },
};

constexpr VEnumTable Table{ "InterlacedFormat.Enum", "Enumeration.", Rows };

}

const VEnumTable& GetEnumTable( IInterlacedFormat::Enum ) { return Table; }

std::string ToName( IInterlacedFormat::Enum i_Value ) { return FindName( Table, i_Value ); }

bool FromName( const std::string& i_rName, IInterlacedFormat::Enum& o_rValue ) { return FindEnumerator( Table, i_rName, o_rValue ); }

}
