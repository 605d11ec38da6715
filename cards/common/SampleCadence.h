// How many audio samples belong to a frame of video.
#pragma once

#include <cstdint>

namespace VirtualCards
{

constexpr uint32_t AudioRate = 48000;   // samples a second, the only rate that SDI carries

// Samples that have passed when i_Frames frames of this period (ticks of 1/135000000 s) have. Rounded to the nearest, which gives the
// standard's cadence: 1602, 1601, 1602, 1601, 1602 at 29.97 frames a second.
constexpr uint64_t SamplesUntil( uint64_t i_Frames, int64_t i_VideoPeriod )
{
  // 48000 / 135000000 is 2 / 5625
  return ( i_Frames * static_cast<uint64_t>( i_VideoPeriod ) * 4 + 5625 ) / 11250;
}

static_assert( SamplesUntil( 1, 4504500 ) == 1602 && SamplesUntil( 2, 4504500 ) == 1602 + 1601 && SamplesUntil( 5, 4504500 ) == 8008 );

}
