// Rates and times of the sources under test.
#pragma once

#include "SyncSystem/Clock.h"

constexpr int64_t Period25 = 5400000;
constexpr int64_t Period5994 = 2252250;
inline const KVZ::VTick OneHour = KVZ::SecondsToTick135( 3600 );
