// The compressors of single images: JPEG, PNG, TIFF.
#pragma once

#include "FileIO/ImageMagickWrapper/ImageMagickWrapper.h"
#include "FileIO/VideoEncoding/EncoderParts.h"

namespace VideoEncoding
{

// Where ImageMagick is found is asked when the first PNG or TIFF is made.
std::map<KVZ::IVideoPayload::Enum, VCompressor> ImageCompressors();

// The same with another library, which must outlive the rows.
std::map<KVZ::IVideoPayload::Enum, VCompressor> ImageCompressors( const ImageMagickWrapper::VLibrary& i_rLibrary );

}
