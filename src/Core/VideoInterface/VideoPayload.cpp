#include "Core/VideoInterface/VideoPayload.h"

#include "Core/VideoInterface/Schemas.h"

#include <array>

namespace KVZ
{

namespace
{

constexpr std::array Rows = {
  VEnumRow{ IVideoPayload::ENone, "None", "No video present." },
  VEnumRow{ IVideoPayload::EUncompressed, "Uncompressed", "Uncompressed data.  Pixel format must be given with KVZ::IPixelFormat." },
  VEnumRow{ IVideoPayload::EImageJPEG, "ImageJPEG", "Image sequence of JPEG with complete headers." },
  VEnumRow{ IVideoPayload::EImagePNG, "ImagePNG", "Image sequence of PNG." },
  VEnumRow{ IVideoPayload::EImageTIFF, "ImageTIFF", "Image sequence of TIFF." },
  VEnumRow{ IVideoPayload::EVideoH264, "VideoH264", "Video compressed as H.264." },
};

constexpr VEnumTable Table{ "VideoPayload.Enum", "Enumeration of payload types.", Rows };

}

const VEnumTable& GetEnumTable( IVideoPayload::Enum ) { return Table; }

std::string ToName( IVideoPayload::Enum i_Value ) { return FindName( Table, i_Value ); }

bool FromName( const std::string& i_rName, IVideoPayload::Enum& o_rValue ) { return FindEnumerator( Table, i_rName, o_rValue ); }

}
