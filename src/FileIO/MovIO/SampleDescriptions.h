// "stsd" of each kind of track: the format of its samples. One file a kind.
#pragma once

#include "FileIO/MovIO/MovPrimitiveWriter.h"
#include "FileIO/MovIO/Movie.h"

namespace MovIO
{

// Each is false, with a line in the log, for a format that it has no code for.
bool WriteVideoStsd( VMovPrimitiveWriter& io_rOut, const VMovie& i_rMovie );
bool WriteAudioStsd( VMovPrimitiveWriter& io_rOut, const VMovie& i_rMovie );
bool WriteTimecodeStsd( VMovPrimitiveWriter& io_rOut, const VMovie& i_rMovie );

}
