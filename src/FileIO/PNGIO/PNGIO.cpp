#include "FileIO/PNGIO/PNGIO.h"

namespace PNGIO
{

namespace
{

constexpr ImageMagickWrapper::VFileKind Kind{ "png", Category };

}

bool PNGWriter( const uint8_t* i_pPixels, size_t i_Size, const KVZ::VideoFrameInfo& i_rInfo, UtilsMemory::VByteVector& o_rBuffer,
  const ImageMagickWrapper::VLibrary& i_rLibrary )
{
  return ImageMagickWrapper::EncodeImage( i_rLibrary, Kind, i_pPixels, i_Size, i_rInfo, o_rBuffer );
}

bool PNGReader( const uint8_t* i_pBytes, size_t i_Size, KVZ::VideoFrameInfo& o_rInfo, UtilsMemory::VByteVector& o_rPixels,
  const ImageMagickWrapper::VLibrary& i_rLibrary )
{
  return ImageMagickWrapper::DecodeImage( i_rLibrary, Kind, i_pBytes, i_Size, o_rInfo, o_rPixels );
}

}
