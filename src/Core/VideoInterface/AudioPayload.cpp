#include "Core/VideoInterface/AudioPayload.h"

#include "Core/VideoInterface/Schemas.h"

#include <array>

namespace KVZ
{

namespace
{

constexpr std::array Rows = {
  VEnumRow{ IAudioPayload::ENone, "None", "No audio present." },
  VEnumRow{ IAudioPayload::EUncompressed, "Uncompressed", "Uncompressed data.  Pixel format must be given with KVZ::ISampleFormat." },
  VEnumRow{ IAudioPayload::ELosslessFLAC, "LosslessFLAC", "Lossless encoding with FLAC." },
};

constexpr VEnumTable Table{ "AudioPayload.Enum", "Enumeration of payload types.", Rows };

}

const VEnumTable& GetEnumTable( IAudioPayload::Enum ) { return Table; }

std::string ToName( IAudioPayload::Enum i_Value ) { return FindName( Table, i_Value ); }

bool FromName( const std::string& i_rName, IAudioPayload::Enum& o_rValue ) { return FindEnumerator( Table, i_rName, o_rValue ); }

}
