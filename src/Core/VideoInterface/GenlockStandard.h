// The host's genlock setting, schema "DataStoreSystemSettings.EGenlockStandard".
#pragma once

#include <cstdint>
#include <string>

namespace KVZ
{

class IGenlockStandard
{
public:
  enum Enum : int32_t
  {
    EGenlockStandardNone = 0,
    EGenlockStandardPAL = 1,
    EGenlockStandardNTSC = 2,
    EGenlockStandardFilm24 = 3,
    EGenlockStandardFilm23_98 = 4,
    EGenlockStandard30Hz = 5,
    EGenlockStandardVESA50 = 6,
    EGenlockStandardVESA60 = 7,
    EGenlockStandardVESA100 = 8,
    EGenlockStandardVESA120 = 9,
    EGenlockStandardVESA200 = 10,
    EGenlockStandardSDI23_98 = 11,
    EGenlockStandardSDI24 = 12,
    EGenlockStandardSDI25 = 13,
    EGenlockStandardSDI29_97 = 14,
    EGenlockStandardSDI30 = 15,
    EGenlockStandardSteamVR120 = 16,
  };
};

// The enumerator's name; empty for a value outside the table.
std::string ToName( IGenlockStandard::Enum i_Value );
bool FromName( const std::string& i_rName, IGenlockStandard::Enum& o_rValue );

}
