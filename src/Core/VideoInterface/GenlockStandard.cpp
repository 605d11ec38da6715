#include "Core/VideoInterface/GenlockStandard.h"

#include "Core/VideoInterface/Schemas.h"

#include <array>

namespace KVZ
{

namespace
{

constexpr std::array Rows = {
  VEnumRow{ IGenlockStandard::EGenlockStandardNone, "GenlockStandardNone" },
  VEnumRow{ IGenlockStandard::EGenlockStandardPAL, "GenlockStandardPAL" },
  VEnumRow{ IGenlockStandard::EGenlockStandardNTSC, "GenlockStandardNTSC" },
  VEnumRow{ IGenlockStandard::EGenlockStandardFilm24, "GenlockStandardFilm24" },
  VEnumRow{ IGenlockStandard::EGenlockStandardFilm23_98, "GenlockStandardFilm23_98" },
  VEnumRow{ IGenlockStandard::EGenlockStandard30Hz, "GenlockStandard30Hz" },
  VEnumRow{ IGenlockStandard::EGenlockStandardVESA50, "GenlockStandardVESA50" },
  VEnumRow{ IGenlockStandard::EGenlockStandardVESA60, "GenlockStandardVESA60" },
  VEnumRow{ IGenlockStandard::EGenlockStandardVESA100, "GenlockStandardVESA100" },
  VEnumRow{ IGenlockStandard::EGenlockStandardVESA120, "GenlockStandardVESA120" },
  VEnumRow{ IGenlockStandard::EGenlockStandardVESA200, "GenlockStandardVESA200" },
  VEnumRow{ IGenlockStandard::EGenlockStandardSDI23_98, "GenlockStandardSDI23_98" },
  VEnumRow{ IGenlockStandard::EGenlockStandardSDI24, "GenlockStandardSDI24" },
  VEnumRow{ IGenlockStandard::EGenlockStandardSDI25, "GenlockStandardSDI25" },
  VEnumRow{ IGenlockStandard::EGenlockStandardSDI29_97, "GenlockStandardSDI29_97" },
  VEnumRow{ IGenlockStandard::EGenlockStandardSDI30, "GenlockStandardSDI30" },
  VEnumRow{ IGenlockStandard::EGenlockStandardSteamVR120, "GenlockStandardSteamVR120" },
};
static_assert( Rows.size() == 17 );

constexpr VEnumTable Table{ "DataStoreSystemSettings.EGenlockStandard", "Genlock standard", Rows };

}

const VEnumTable& GetEnumTable( IGenlockStandard::Enum ) { return Table; }

std::string ToName( IGenlockStandard::Enum i_Value ) { return FindName( Table, i_Value ); }

bool FromName( const std::string& i_rName, IGenlockStandard::Enum& o_rValue ) { return FindEnumerator( Table, i_rName, o_rValue ); }

}
