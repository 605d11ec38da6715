// Reads the tracks of a finished file back and validates each. Knows files as the writer here makes them.
#pragma once

#include "Core/VideoInterface/Streams.h"

#include <string>
#include <vector>

namespace MovIO
{

// Everything that is wrong, one line each; empty for a file that is right. The lines are in the log too.
std::vector<std::string> CheckMovFile( const std::string& i_rPath );
std::vector<std::string> CheckMovStream( KVZ::IInputStreamSeekable& i_rStream, uint64_t i_Size );

}
