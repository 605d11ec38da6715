#include "Core/VideoInterface/PixelFormat.h"

#include "Core/VideoInterface/Schemas.h"

#include <array>

namespace KVZ
{

namespace
{

constexpr std::array Rows = {
  VEnumRow{ IPixelFormat::EUnspecified, "Unspecified" },
  VEnumRow{ IPixelFormat::ELuminance8, "Luminance8" },
  VEnumRow{ IPixelFormat::EBayerRG8, "BayerRG8" },
  VEnumRow{ IPixelFormat::EBayerGB8, "BayerGB8" },
  VEnumRow{ IPixelFormat::EBayerGR8, "BayerGR8" },
  VEnumRow{ IPixelFormat::EBayerBG8, "BayerBG8" },
  VEnumRow{ IPixelFormat::ER5G6B5, "R5G6B5" },
  VEnumRow{ IPixelFormat::ER8G8B8, "R8G8B8" },
  VEnumRow{ IPixelFormat::EB8G8R8, "B8G8R8" },
  VEnumRow{ IPixelFormat::ER8G8B8u8, "R8G8B8u8" },
  VEnumRow{ IPixelFormat::EB8G8R8u8, "B8G8R8u8" },
  VEnumRow{ IPixelFormat::EU8Y8V8Y8, "U8Y8V8Y8" },
  VEnumRow{ IPixelFormat::EY8U8Y8V8, "Y8U8Y8V8" },
  VEnumRow{ IPixelFormat::EU10Y10V10Y10, "U10Y10V10Y10" },
  VEnumRow{ IPixelFormat::EBayerGB7, "BayerGB7" },
  VEnumRow{ IPixelFormat::EBayerGB6, "BayerGB6" },
  VEnumRow{ IPixelFormat::ELuminance7, "Luminance7" },
  VEnumRow{ IPixelFormat::ELuminance6, "Luminance6" },
};
static_assert( Rows.size() == PixelFormatCount );

constexpr VEnumTable Table{ "PixelFormat.Enum", "Enumeration.", Rows };

}

const VEnumTable& GetEnumTable( IPixelFormat::Enum ) { return Table; }

uint64_t GetImageSize( IPixelFormat::Enum i_Format, uint32_t i_Width, uint32_t i_Height )
{
  const uint64_t Pixels = static_cast<uint64_t>( i_Width ) * i_Height;
  switch( i_Format )
  {
    case IPixelFormat::ELuminance8:
    case IPixelFormat::EBayerRG8:
    case IPixelFormat::EBayerGB8:
    case IPixelFormat::EBayerGR8:
    case IPixelFormat::EBayerBG8: return Pixels;
    case IPixelFormat::ER5G6B5:
    case IPixelFormat::EU8Y8V8Y8:
    case IPixelFormat::EY8U8Y8V8: return Pixels * 2;
    case IPixelFormat::ER8G8B8:
    case IPixelFormat::EB8G8R8: return Pixels * 3;
    case IPixelFormat::ER8G8B8u8:
    case IPixelFormat::EB8G8R8u8: return Pixels * 4;
    case IPixelFormat::EU10Y10V10Y10: return ( static_cast<uint64_t>( i_Width ) + 47 ) / 48 * i_Height * 128;
    case IPixelFormat::EBayerGB7:
    case IPixelFormat::ELuminance7: return ( Pixels * 7 + 7 ) / 8;
    case IPixelFormat::EBayerGB6:
    case IPixelFormat::ELuminance6: return ( Pixels * 3 + 3 ) / 4;
    case IPixelFormat::EUnspecified: break;
  }
  return 0;
}

std::string ToName( IPixelFormat::Enum i_Value ) { return FindName( Table, i_Value ); }

bool FromName( const std::string& i_rName, IPixelFormat::Enum& o_rValue ) { return FindEnumerator( Table, i_rName, o_rValue ); }

}
