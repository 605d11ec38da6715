// "mdia" of each kind of track: media header, handlers, media information, data references.
#pragma once

#include "FileIO/MovIO/MovPrimitiveWriter.h"
#include "FileIO/MovIO/Movie.h"

namespace MovIO
{

bool WriteVideoMdia( VMovPrimitiveWriter& io_rOut, const VMovie& i_rMovie );
bool WriteAudioMdia( VMovPrimitiveWriter& io_rOut, const VMovie& i_rMovie );
bool WriteTimecodeMdia( VMovPrimitiveWriter& io_rOut, const VMovie& i_rMovie );

}
