// Images as the bytes of a file, through ImageMagick: what PNG and TIFF have in common. Any thread.
#pragma once

#include "Core/VideoInterface/FrameRecords.h"
#include "FileIO/ImageMagickWrapper/ImageMagickWrapper.h"
#include "Utils/UtilsMemory/ByteVector.h"

namespace ImageMagickWrapper
{

struct VFileKind
{
  const char* m_pFormat;     // ImageMagick's name of it
  const char* m_pCategory;   // of the log
};

// Luminance8 and R8G8B8 alone, sides of 1 to 8192 pixels. False, with a line in the log where the library has refused, leaves the output as it is.
bool EncodeImage( const VLibrary& i_rLibrary, const VFileKind& i_rKind, const uint8_t* i_pPixels, size_t i_Size, const KVZ::VideoFrameInfo& i_rInfo,
  UtilsMemory::VByteVector& o_rBytes );

// Gives Luminance8 for a grey image and R8G8B8 for one in colour; the description's other fields take their defaults. An image of nothing but
// black and white is of neither kind. False, with a line in the log, leaves the outputs as they are.
bool DecodeImage( const VLibrary& i_rLibrary, const VFileKind& i_rKind, const uint8_t* i_pBytes, size_t i_Size, KVZ::VideoFrameInfo& o_rInfo,
  UtilsMemory::VByteVector& o_rPixels );

}
