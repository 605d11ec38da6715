// Signals of a DeckLink card, the smallest picture of each rate.
#pragma once

#include "tests/support/system/CounterFile.h"

namespace SystemTests
{

inline const VSignalRate Rate2398{ "SD_720_486P_2398", 5630625, 24, 1, false, { 2002 } };
inline const VSignalRate Rate25{ "SD_720_576I_5000", 5400000, 25, 1, false, { 1920 } };
inline const VSignalRate Rate2997{ "SD_720_486I_5994", 4504500, 30, 1, false, { 1602, 1601, 1602, 1601, 1602 } };
inline const VSignalRate Rate2997Drop{ "SD_720_486I_5994", 4504500, 30, 1, true, { 1602, 1601, 1602, 1601, 1602 } };
inline const VSignalRate Rate50{ "SD_720_576P_5000", 2700000, 25, 2, false, { 960 } };
inline const VSignalRate Rate5994{ "SD_720_486P_5994", 2252250, 30, 2, false, { 801, 801, 800, 801, 801 } };
inline const VSignalRate Rate5994Drop{ "SD_720_486P_5994", 2252250, 30, 2, true, { 801, 801, 800, 801, 801 } };
inline const VSignalRate Rate60{ "HD_1280_720P_6000", 2250000, 30, 2, false, { 800 } };

}
