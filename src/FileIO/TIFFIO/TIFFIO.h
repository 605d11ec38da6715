// TIFF images in memory, through ImageMagick. Any thread.
#pragma once

#include "FileIO/ImageMagickWrapper/ImageCodec.h"

namespace TIFFIO
{

constexpr const char* Category = "TIFFIO";   // of the log

// Luminance8 and R8G8B8 alone, sides of 1 to 8192 pixels. False leaves the output as it is; what the library did not like is in the log,
// category "TIFFIO".
bool TIFFWriter( const uint8_t* i_pPixels, size_t i_Size, const KVZ::VideoFrameInfo& i_rInfo, UtilsMemory::VByteVector& o_rBuffer,
  const ImageMagickWrapper::VLibrary& i_rLibrary = ImageMagickWrapper::Instance( Category ) );

// Gives Luminance8 for a grey image and R8G8B8 for one in colour; one of nothing but black and white is refused. False leaves the outputs as
// they are.
bool TIFFReader( const uint8_t* i_pBytes, size_t i_Size, KVZ::VideoFrameInfo& o_rInfo, UtilsMemory::VByteVector& o_rPixels,
  const ImageMagickWrapper::VLibrary& i_rLibrary = ImageMagickWrapper::Instance( Category ) );

}
