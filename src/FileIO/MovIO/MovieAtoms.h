// The movie's own atoms. What each looks like is laid down in the QuickTime file format; where it stands differently there, the constants
// here are those that files of this system have.
#pragma once

#include "FileIO/MovIO/MovPrimitiveWriter.h"
#include "FileIO/MovIO/Movie.h"

namespace MovIO
{

// "moov" with all tracks.
bool WriteMoov( VMovPrimitiveWriter& io_rOut, const VMovie& i_rMovie );

// The identity transformation of an image, in "mvhd" and "tkhd".
void WriteMatrix( VMovPrimitiveWriter& io_rOut );

}
