// Whether a video input's frame rate can be locked to the system's. Periods are in ticks of 135 MHz; a period of 0 stands for a rate that is
// not usable. Pure functions.
#pragma once

#include "Core/VideoInterface/GenlockStandard.h"

#include <cstdint>
#include <string>

namespace FrameRateCheck
{

// Of one beat of the genlock. A standard without a row of its own counts as 50 Hz.
int64_t GenlockPeriod( KVZ::IGenlockStandard::Enum i_Standard );

// Of a free-running system; 0 for a rate, in hertz, that gives no period.
int64_t SystemPeriod( double i_Rate );

// True if one of the SDI base periods is a whole number of both. A period of 0 is compatible with nothing.
bool AreCompatible( int64_t i_PeriodA, int64_t i_PeriodB );

// What the user is told of incompatible periods.
std::string GenlockWarning( int64_t i_GenlockPeriod, int64_t i_VideoPeriod );
std::string SystemWarning( int64_t i_SystemPeriod, int64_t i_VideoPeriod );

}
