// Finished files, read back when a recording has ended.
#pragma once

#include "host/Recording.h"

#include <vector>

// Validates the tracks of all MOV and MP4 files. One with a fault counts as failed from then on, and says what is wrong.
void ValidateMovies( std::vector<StageHost::VDeviceOutcome>& io_rOutcomes );
