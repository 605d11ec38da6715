// JPEG images as Motion JPEG in AVI has them: with an AVI1 header in the place of the JFIF one.
#pragma once

#include "Core/VideoInterface/Streams.h"

#include <vector>

namespace RapidAVI
{

// Replaces the spans by the image's, which point into the buffer and to constants. False, with a line in the log, for an image of another form
// than our own compressor gives it: colour, baseline, a JFIF header first, 11 segments.
bool MakeAVI1Image( const KVZ::IBufferConst& i_rImage, std::vector<KVZ::IOutputStream::VSpan>& o_rSpans );

}
