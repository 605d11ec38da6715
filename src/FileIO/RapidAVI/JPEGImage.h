// JPEG images as Motion JPEG in AVI has them: with an AVI1 header in the place of the JFIF one.
#pragma once

#include "Core/VideoInterface/PixelFormat.h"
#include "Core/VideoInterface/Streams.h"

#include <vector>

namespace RapidAVI
{

// Replaces the spans by the image's, which point into the buffer and to constants. False, with a line in the log, for an image of another form
// than our own compressor makes of that pixel format: baseline, a JFIF header first, 11 segments, or 8 of Luminance8.
bool MakeAVI1Image( const KVZ::IBufferConst& i_rImage, KVZ::IPixelFormat::Enum i_Format, std::vector<KVZ::IOutputStream::VSpan>& o_rSpans );

}
