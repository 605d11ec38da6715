// Info: what the file is as a whole.
#pragma once

#include <matroska/KaxInfo.h>

#include <string>

namespace MkvIO
{

// With the duration 0, a new random id and the present time.
void FillInfo( libmatroska::KaxInfo& o_rInfo, const std::string& i_rWritingApplication );

// In the file's unit. Does not change the element's size.
void SetDuration( libmatroska::KaxInfo& io_rInfo, uint64_t i_Duration );

}
