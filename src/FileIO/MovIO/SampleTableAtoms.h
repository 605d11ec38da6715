// "stbl" of each kind of track: which samples there are, how long, how large and where in the file.
#pragma once

#include "FileIO/MovIO/MovPrimitiveWriter.h"
#include "FileIO/MovIO/Movie.h"

namespace MovIO
{

bool WriteVideoStbl( VMovPrimitiveWriter& io_rOut, const VMovie& i_rMovie );
bool WriteAudioStbl( VMovPrimitiveWriter& io_rOut, const VMovie& i_rMovie );
bool WriteTimecodeStbl( VMovPrimitiveWriter& io_rOut, const VMovie& i_rMovie );

}
