// The top-level atoms around the essence: the file type before it, the attributes at the very end.
#pragma once

#include "FileIO/MovIO/MovPrimitiveWriter.h"
#include "FileIO/MovIO/Movie.h"

namespace MovIO
{

bool WriteFtyp( VMovPrimitiveWriter& io_rOut, const VMovie& i_rMovie );

// The media data has a 64-bit size, which is 0 until the file is closed.
bool WriteMdatHeader( VMovPrimitiveWriter& io_rOut );
bool PatchMdatSize( VMovPrimitiveWriter& io_rOut, const VMovie& i_rMovie, uint64_t i_End );

// The system's own atom: the internal and the external attribute block, little-endian.
bool WriteTmsl( VMovPrimitiveWriter& io_rOut, const VMovie& i_rMovie );

// Declares everything up to i_End as unused. Fewer than eight bytes cannot be declared and stay as they are.
bool WriteFree( VMovPrimitiveWriter& io_rOut, uint64_t i_End );

}
