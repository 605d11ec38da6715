// Signals of both kinds of card, the smallest picture of each rate.
#pragma once

#include "tests/support/system/CounterFile.h"

#include <gtest/gtest.h>

namespace SystemTests
{

inline const VSignalRate Rate2398{ "SD_720_486P_2398", 5630625, 24, 1, false, { 2002 } };
inline const VSignalRate Rate25{ "SD_720_576I_5000", 5400000, 25, 1, false, { 1920 } };
inline const VSignalRate Rate2997Drop{ "SD_720_486I_5994", 4504500, 30, 1, true, { 1602, 1601, 1602, 1601, 1602 } };
inline const VSignalRate Rate50{ "SD_720_576P_5000", 2700000, 25, 2, false, { 960 } };
inline const VSignalRate Rate5994{ "SD_720_486P_5994", 2252250, 30, 2, false, { 801, 801, 800, 801, 801 } };
inline const VSignalRate Rate5994Drop{ "SD_720_486P_5994", 2252250, 30, 2, true, { 801, 801, 800, 801, 801 } };
inline const VSignalRate Rate60{ "HD_1280_720P_6000", 2250000, 30, 2, false, { 800 } };

// The frames of a Bluefish444 card have a fixed number of samples at each rate, at some rates less than the signal has on average.
inline const VSignalRate Bluefish2398{ "HD_1280_720P_2398", 5630625, 24, 1, false, { 2002 }, "bluefish444" };
inline const VSignalRate Bluefish24{ "HD_1280_720P_2400", 5625000, 24, 1, false, { 2000 }, "bluefish444" };
inline const VSignalRate Bluefish25{ "SD_720_576I_5000", 5400000, 25, 1, false, { 1920 }, "bluefish444" };
inline const VSignalRate Bluefish2997Drop{ "SD_720_486I_5994", 4504500, 30, 1, true, { 1601 }, "bluefish444", 1 };
inline const VSignalRate Bluefish30{ "HD_1280_720P_3000", 4500000, 30, 1, false, { 1600 }, "bluefish444" };
inline const VSignalRate Bluefish50{ "HD_1280_720P_5000", 2700000, 25, 2, false, { 960 }, "bluefish444" };
inline const VSignalRate Bluefish5994Drop{ "HD_1280_720P_5994", 2252250, 30, 2, true, { 800 }, "bluefish444", 1 };
inline const VSignalRate Bluefish60{ "HD_1280_720P_6000", 2250000, 30, 2, false, { 800 }, "bluefish444" };

// One signal that both kinds carry.
inline const auto BothKinds = testing::Values( Rate25, Bluefish25 );
inline void PrintTo( const VSignalRate& i_rRate, std::ostream* o_pStream ) { *o_pStream << CounterCardText( i_rRate ); }
inline std::string KindName( const testing::TestParamInfo<VSignalRate>& i_rInfo ) { return i_rInfo.param.m_pKind; }

}
