#include "StageCorePluginVideoInput/FrameRateCheck.h"

#include "StageCoreRuntime/GlobalLog.h"
#include "SyncSystem/Tick.h"

#include <algorithm>
#include <array>
#include <cmath>

namespace
{

using KVZ::IGenlockStandard;

constexpr auto TicksPerSecond = static_cast<double>( KVZ::VTick::TicksPerSecond );

// 30, 29.97, 25, 24 and 23.98 frames a second
constexpr std::array<int64_t, 5> BasePeriods = { 4500000, 4504500, 5400000, 5625000, 5630625 };

constexpr int64_t OtherGenlockPeriod = 2700000;

struct VGenlockRow
{
  IGenlockStandard::Enum m_Standard;
  int64_t m_Period;
};

constexpr std::array GenlockRows = {
  VGenlockRow{ IGenlockStandard::EGenlockStandardPAL, 2700000 },
  VGenlockRow{ IGenlockStandard::EGenlockStandardVESA50, 2700000 },
  VGenlockRow{ IGenlockStandard::EGenlockStandardNTSC, 2252250 },
  VGenlockRow{ IGenlockStandard::EGenlockStandardFilm24, 5625000 },
  VGenlockRow{ IGenlockStandard::EGenlockStandardSDI24, 5625000 },
  VGenlockRow{ IGenlockStandard::EGenlockStandardFilm23_98, 5630625 },
  VGenlockRow{ IGenlockStandard::EGenlockStandardSDI23_98, 5630625 },
  VGenlockRow{ IGenlockStandard::EGenlockStandard30Hz, 4500000 },
  VGenlockRow{ IGenlockStandard::EGenlockStandardSDI30, 4500000 },
  VGenlockRow{ IGenlockStandard::EGenlockStandardVESA60, 2250000 },
  VGenlockRow{ IGenlockStandard::EGenlockStandardVESA100, 1350000 },
  VGenlockRow{ IGenlockStandard::EGenlockStandardVESA120, 1125000 },
  VGenlockRow{ IGenlockStandard::EGenlockStandardSteamVR120, 1125000 },
  VGenlockRow{ IGenlockStandard::EGenlockStandardVESA200, 675000 },
  VGenlockRow{ IGenlockStandard::EGenlockStandardSDI25, 5400000 },
  VGenlockRow{ IGenlockStandard::EGenlockStandardSDI29_97, 4504500 },
};
static_assert( GenlockRows.size() == 16 );

// The largest double below one half, so that a number just below one half does not become 1.
constexpr double Half = 0.49999999999999994;

double ToRate( int64_t i_Period ) { return i_Period == 0 ? 0.0 : TicksPerSecond / static_cast<double>( i_Period ); }

std::string FormatRates( const char* i_pFormat, int64_t i_First, int64_t i_Second )
{
  const KVZ::VLogArgument Arguments[] = { ToRate( i_First ), ToRate( i_Second ) };
  return KVZ::FormatLogMessage( i_pFormat, Arguments, std::size( Arguments ) );
}

}

namespace FrameRateCheck
{

int64_t GenlockPeriod( IGenlockStandard::Enum i_Standard )
{
  const auto IsRow = [i_Standard]( const VGenlockRow& i_rRow ) { return i_rRow.m_Standard == i_Standard; };
  const auto Row = std::find_if( GenlockRows.begin(), GenlockRows.end(), IsRow );
  return Row == GenlockRows.end() ? OtherGenlockPeriod : Row->m_Period;
}

int64_t SystemPeriod( double i_Rate )
{
  const double Period = 1.0 / i_Rate * TicksPerSecond;
  constexpr double Limit = 9.0e18;   // what 64 bits hold
  return std::abs( Period ) < Limit ? static_cast<int64_t>( Period + std::copysign( Half, Period ) ) : 0;
}

bool AreCompatible( int64_t i_PeriodA, int64_t i_PeriodB )
{
  if( i_PeriodA <= 0 || i_PeriodB <= 0 )
  {
    return false;
  }
  const auto FitsBoth = [=]( int64_t i_Base ) { return i_Base % i_PeriodA == 0 && i_Base % i_PeriodB == 0; };
  return std::any_of( BasePeriods.begin(), BasePeriods.end(), FitsBoth );
}

std::string GenlockWarning( int64_t i_GenlockPeriod, int64_t i_VideoPeriod )
{
  return FormatRates( "The genlock standard (%.2f Hz) is incompatible with this video input's frame rate (%.2f Hz).  Disable the video input, or "
                      "change the genlock standard to a compatible rate.",
    i_GenlockPeriod, i_VideoPeriod );
}

std::string SystemWarning( int64_t i_SystemPeriod, int64_t i_VideoPeriod )
{
  return FormatRates( "The system rate (%.2f Hz) is incompatible with this video input's frame rate (%.2f Hz). Disable the input, or change the "
                      "system frame rate to multiple of a standard SDI base rate.",
    i_SystemPeriod, i_VideoPeriod );
}

}
