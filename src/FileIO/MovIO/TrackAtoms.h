// "trak" and what describes the track as a whole: header, clean aperture, edits, references to other tracks.
#pragma once

#include "FileIO/MovIO/MovPrimitiveWriter.h"
#include "FileIO/MovIO/Movie.h"

namespace MovIO
{

bool WriteVideoTrak( VMovPrimitiveWriter& io_rOut, const VMovie& i_rMovie );
bool WriteAudioTrak( VMovPrimitiveWriter& io_rOut, const VMovie& i_rMovie );
bool WriteTimecodeTrak( VMovPrimitiveWriter& io_rOut, const VMovie& i_rMovie );

}
