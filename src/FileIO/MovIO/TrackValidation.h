// Whether the times of a track agree with each other and with the base of 1080 MHz. What does not goes to the log, and into a list for whoever
// gives one.
#pragma once

#include "FileIO/MovIO/Movie.h"

#include <string>
#include <vector>

namespace MovIO
{

// False if there is nothing in the track; times that do not agree are told of and no more.
bool ValidateTrack( const VTrack& i_rTrack, uint32_t i_MovieTimescale, std::vector<std::string>* o_pMessages = nullptr );

// The track's sample period in base ticks, told of where that is no whole number; 0 for a timescale of 0.
uint64_t GetPeriodInBaseTicks( const VTrack& i_rTrack, std::vector<std::string>* o_pMessages = nullptr );

}
