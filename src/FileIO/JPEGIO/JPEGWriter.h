// JPEG compression of one image through TurboJPEG. Any thread.
#pragma once

#include "Core/VideoInterface/FrameRecords.h"
#include "Utils/UtilsMemory/ByteVector.h"

#include <cstddef>
#include <cstdint>

namespace JPEGIO
{

// Takes Luminance8, the four RGB forms (4:4:4) and the two 8-bit 4:2:2 forms; those need an even width. Quality from 1 to 100. The scratch
// vector is used where the image has to be taken apart first.
//
// The output first grows to the most that such an image can become. False for another format and for less than a whole image; for what
// TurboJPEG refuses also with an assertion and a line in the log, category "JPEGIO".
bool JPEGWriter( const uint8_t* i_pSource, size_t i_Size, const KVZ::VideoFrameInfo& i_rInfo, int i_Quality, UtilsMemory::VByteVector& o_rBuffer,
  UtilsMemory::VByteVector& io_rScratch );

}
