#include "FileIO/MovIO/MovTiming.h"

#include "StageCoreRuntime/GlobalLog.h"

#include <algorithm>
#include <array>
#include <limits>
#include <numeric>

namespace MovIO
{

namespace
{

using KVZ::ITimecodeStandard;

constexpr uint64_t Limit = std::numeric_limits<uint32_t>::max();
constexpr uint32_t BasePerTick = 8;   // timecode standards count at 135 MHz
static_assert( BaseTicksPerSecond == BasePerTick * 135000000u );

// Tried in this order for a timecode of no use.
constexpr std::array StandardsByPeriod = { ITimecodeStandard::ETimecode30, ITimecodeStandard::ETimecode30Drift, ITimecodeStandard::ETimecode25,
  ITimecodeStandard::ETimecode24, ITimecodeStandard::ETimecode24Drift };

bool IsValidAtBaseRate( KVZ::ITimecode i_Timecode )
{
  const bool bRemainder = i_Timecode.m_TickRemainder < GetTimecodePeriod( i_Timecode.m_Standard );
  i_Timecode.m_TickRemainder = 0;
  return bRemainder && KVZ::IsValid( i_Timecode );
}

int32_t StandardForPeriod( uint32_t i_VideoPeriod )
{
  const auto Found = std::find_if( StandardsByPeriod.begin(), StandardsByPeriod.end(),
    [&]( int32_t i_Standard ) { return i_VideoPeriod != 0 && GetTimecodePeriod( i_Standard ) % i_VideoPeriod == 0; } );
  return Found == StandardsByPeriod.end() ? StandardsByPeriod.front() : *Found;
}

}

bool ToBaseTicks( const KVZ::VTimingRecord& i_rTiming, KVZ::VTimingRecord& o_rBase )
{
  if( i_rTiming.m_TicksPerSecond == 0 )
  {
    return false;
  }
  // The offset in unsigned arithmetic, which wraps: as small a fraction as possible keeps it from doing so.
  const uint64_t Common = std::gcd( BaseTicksPerSecond, i_rTiming.m_TicksPerSecond );
  const uint64_t Numerator = BaseTicksPerSecond / Common;
  const uint64_t Denominator = i_rTiming.m_TicksPerSecond / Common;
  const uint64_t Period = i_rTiming.m_FramePeriodInTicks * Numerator / Denominator;
  o_rBase.m_TicksPerSecond = BaseTicksPerSecond;
  o_rBase.m_FramePeriodInTicks = static_cast<uint32_t>( Period );
  o_rBase.m_StartOffsetInTicks = static_cast<int64_t>( static_cast<uint64_t>( i_rTiming.m_StartOffsetInTicks ) * Numerator / Denominator );
  return Period <= Limit;
}

bool Reduce( VPeriods& io_rPeriods )
{
  const std::array Fields = { &io_rPeriods.m_Video, &io_rPeriods.m_Timecode, &io_rPeriods.m_Audio, &io_rPeriods.m_Timescale };
  uint64_t Common = 0;
  for( const uint64_t* pField : Fields )
  {
    Common = std::gcd( Common, *pField );
  }
  for( uint64_t* pField : Fields )
  {
    *pField /= Common;
  }
  return std::all_of( Fields.begin(), Fields.end(), []( const uint64_t* i_pField ) { return *i_pField < Limit; } );
}

KVZ::ITimecode GetStartTimecode( const KVZ::ITimecode& i_rTimecode, uint32_t i_VideoPeriod )
{
  KVZ::ITimecode Start = i_rTimecode;
  if( !IsValidAtBaseRate( i_rTimecode ) )
  {
    Start.m_SubFramePeriod = i_VideoPeriod;
    Start.m_Standard = StandardForPeriod( i_VideoPeriod );
  }
  return Start;
}

uint32_t GetTimecodePeriod( int32_t i_Standard )
{
  const KVZ::VTimecodeStandardRow* pRow = KVZ::FindTimecodeStandard( i_Standard );
  return pRow ? pRow->m_Period * BasePerTick : 0;
}

bool GetTimecodeStart( const KVZ::ITimecode& i_rTimecode, uint32_t i_Timescale, VTimecodeStart& o_rStart )
{
  const KVZ::VTimecodeStandardRow* pRow = KVZ::FindTimecodeStandard( i_rTimecode.m_Standard );
  if( !pRow )
  {
    return false;
  }
  KVZ::ITimecode Label = i_rTimecode;
  Label.m_TickRemainder = 0;
  Label.m_Days = 0;
  const uint32_t Period = GetTimecodePeriod( i_rTimecode.m_Standard );
  const int64_t FrameNumber = i_rTimecode.m_Days * ( KVZ::GetTicksPerDay( Label ) / pRow->m_Period ) + KVZ::ToTicks( Label ) / pRow->m_Period +
    i_rTimecode.m_TickRemainder / Period;
  const uint64_t SubFrame = uint64_t{ i_rTimecode.m_TickRemainder % Period } * i_Timescale;
  if( SubFrame >= BaseTicksPerSecond * Limit )
  {
    KVZ_LOG_ERROR( "MovIO", "Time code remainder cannot be represented in 32 bits." );
    return false;
  }
  if( FrameNumber < 0 || FrameNumber >= static_cast<int64_t>( Limit ) )
  {
    KVZ_LOG_ERROR( "MovIO", "Timecode cannot be represented as 32 bit frame count." );
    return false;
  }
  o_rStart.m_FrameNumber = static_cast<uint32_t>( FrameNumber );
  o_rStart.m_Remainder = static_cast<uint32_t>( SubFrame / BaseTicksPerSecond );
  return true;
}

}
