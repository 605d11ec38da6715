// The header list "hdrl", and the fields of it that are known only when the file is closed.
#pragma once

#include "FileIO/RapidAVI/Index.h"
#include "FileIO/RapidAVI/StreamFormats.h"

namespace RapidAVI
{

// Positions in the file; those of the sound are 0 without it.
struct VOpenFields
{
  uint64_t m_TotalFrames = 0;
  uint64_t m_VideoLength = 0;
  uint64_t m_VideoSuperIndex = 0;
  uint64_t m_AudioLength = 0;
  uint64_t m_AudioSuperIndex = 0;
  uint64_t m_ExtendedTotalFrames = 0;
};

bool WriteHeaderList( VChunkWriter& io_rOut, const VFileDescription& i_rFile, VOpenFields& o_rFields );

// From the index, and with the number of sample frames of the sound. The position in the stream is another afterwards.
bool FillOpenFields( VChunkWriter& io_rOut, const VOpenFields& i_rFields, const VIndex& i_rIndex, uint32_t i_AudioSampleFrames );

}
