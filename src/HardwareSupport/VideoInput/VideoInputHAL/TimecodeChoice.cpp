#include "HardwareSupport/VideoInput/VideoInputHAL/TimecodeChoice.h"

#include <algorithm>
#include <array>

namespace VideoInputHAL
{

namespace
{

using KVZ::ITimecodeStandard;

struct VPeriodRow
{
  int64_t m_Period;   // ticks a timecode frame
  ITimecodeStandard::Enum m_Standard;
  ITimecodeStandard::Enum m_DropStandard;   // where the timecode says that it drops labels
};

// The first row whose period is a whole multiple of the video frame's wins.
constexpr std::array Periods = {
  VPeriodRow{ 4500000, ITimecodeStandard::ETimecode30, ITimecodeStandard::ETimecode30 },
  VPeriodRow{ 4504500, ITimecodeStandard::ETimecode30Drift, ITimecodeStandard::ETimecode30Drop },
  VPeriodRow{ 5400000, ITimecodeStandard::ETimecode25, ITimecodeStandard::ETimecode25 },
  VPeriodRow{ 5625000, ITimecodeStandard::ETimecode24, ITimecodeStandard::ETimecode24 },
  VPeriodRow{ 5630625, ITimecodeStandard::ETimecode24Drift, ITimecodeStandard::ETimecode24Drift },
};

}

ITimecodeStandard::Enum ChooseTimecodeStandard( int64_t i_FramePeriod, bool i_bDropFrame )
{
  for( const VPeriodRow& rRow : Periods )
  {
    if( i_FramePeriod != 0 && rRow.m_Period % i_FramePeriod == 0 )
    {
      return i_bDropFrame ? rRow.m_DropStandard : rRow.m_Standard;
    }
  }
  return ITimecodeStandard::ETimecode30;
}

std::span<const uint32_t> FindTimecodeNumbers( std::span<const VTimecodeSourceRow> i_Rows, KVZ::ITimecodeSource::Enum i_Source )
{
  const auto Found = std::find_if( i_Rows.begin(), i_Rows.end(), [=]( const VTimecodeSourceRow& i_r ) { return i_r.m_Source == i_Source; } );
  return Found != i_Rows.end() ? std::span( Found->m_Numbers ).first( Found->m_Count ) : std::span<const uint32_t>();
}

}
