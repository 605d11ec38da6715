// Whether the bytes of a frame are what the file says they are.
#pragma once

#include "Core/VideoInterface/Streams.h"
#include "FileIO/MovIO/Movie.h"

#include <vector>

namespace MovIO
{

// Looks at the first buffer, or at the frame type of an H.264 stream, or at the size of an image of which all bytes are known.
bool IsContentOf( const VMovie& i_rMovie, const std::vector<KVZ::IOutputStream::VSpan>& i_rFrame, char i_FrameType );

}
