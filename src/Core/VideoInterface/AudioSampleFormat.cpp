#include "Core/VideoInterface/AudioSampleFormat.h"

#include "Core/VideoInterface/Schemas.h"

#include <array>

namespace KVZ
{

namespace
{

constexpr std::array Rows = {
  VEnumRow{ IAudioSampleFormat::EUnspecified, "Unspecified", "Unspecified sample format." },
  VEnumRow{ IAudioSampleFormat::EInt8, "Int8", "8-bit signed integer sample (-128 to 127)." },
  VEnumRow{ IAudioSampleFormat::EInt16, "Int16", "16-bit signed integer sample (-32768 to 32767)." },
  VEnumRow{ IAudioSampleFormat::EInt24, "Int24", "24-bit signed integer sample (-8388608 to 8388607)." },
  VEnumRow{ IAudioSampleFormat::EInt32, "Int32", "32-bit signed integer sample (-2147483648 to 2147483647)." },
  VEnumRow{ IAudioSampleFormat::EUInt16, "UInt16", "16-bit unsigned integer sample (0 to 65535)." },
  VEnumRow{ IAudioSampleFormat::EFloat32, "Float32", "IEEE floating point sample (using full range)." },
  VEnumRow{ IAudioSampleFormat::EUInt8, "UInt8", "8-bit unsigned integer sample (0 to 255)." },
  VEnumRow{ IAudioSampleFormat::EUInt24, "UInt24", "24-bit unsigned integer sample (0 to 16777216)." },
  VEnumRow{ IAudioSampleFormat::EUInt32, "UInt32", "32-bit unsigned integer sample (0 to 4294967296)." },
};

constexpr VEnumTable Table{ "AudioSampleFormat.Enum", "Enumeration.", Rows };

}

const VEnumTable& GetEnumTable( IAudioSampleFormat::Enum ) { return Table; }

uint32_t GetBytesPerSample( IAudioSampleFormat::Enum i_Format )
{
  switch( i_Format )
  {
    case IAudioSampleFormat::EInt8:
    case IAudioSampleFormat::EUInt8: return 1;
    case IAudioSampleFormat::EInt16:
    case IAudioSampleFormat::EUInt16: return 2;
    case IAudioSampleFormat::EInt24:
    case IAudioSampleFormat::EUInt24: return 3;
    case IAudioSampleFormat::EInt32:
    case IAudioSampleFormat::EUInt32:
    case IAudioSampleFormat::EFloat32: return 4;
    case IAudioSampleFormat::EUnspecified: break;
  }
  return 0;
}

std::string ToName( IAudioSampleFormat::Enum i_Value ) { return FindName( Table, i_Value ); }

bool FromName( const std::string& i_rName, IAudioSampleFormat::Enum& o_rValue ) { return FindEnumerator( Table, i_rName, o_rValue ); }

}
