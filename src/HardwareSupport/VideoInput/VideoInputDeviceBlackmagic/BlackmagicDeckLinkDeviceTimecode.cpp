#include "HardwareSupport/VideoInput/VideoInputDeviceBlackmagic/BlackmagicDeckLinkDeviceTimecode.h"

#include "HardwareSupport/VideoInput/VideoInputDeviceBlackmagic/ComPointer.h"
#include "SyncSystem/Tick.h"

#include <array>
#include <span>

namespace VideoInputHAL
{

namespace
{

using KVZ::ITimecodeSource;
using KVZ::ITimecodeStandard;

namespace Format = DeckLinkAPI::TimecodeFormat;

struct VSourceRow
{
  ITimecodeSource::Enum m_Source;
  size_t m_FormatCount;
  std::array<uint32_t, 4> m_Formats;   // tried in turn
};

// A source that is not listed reads nothing.
constexpr std::array Sources = {
  VSourceRow{ ITimecodeSource::ERP188_LTC, 1, { Format::RP188LTC } },
  VSourceRow{ ITimecodeSource::ERP188_VITC1, 1, { Format::RP188VITC1 } },
  VSourceRow{ ITimecodeSource::ERP188_VITC2, 1, { Format::RP188VITC2 } },
  VSourceRow{ ITimecodeSource::EVITC_Field1, 1, { Format::VITCField1 } },
  VSourceRow{ ITimecodeSource::EVITC_Field2, 1, { Format::VITCField2 } },
  VSourceRow{ ITimecodeSource::ESerial, 1, { Format::Serial } },
  VSourceRow{ ITimecodeSource::ERP188_Any, 1, { Format::RP188Any } },
  VSourceRow{ ITimecodeSource::EAny, 4, { Format::RP188Any, Format::VITCField1, Format::VITCField2, Format::Serial } },
};

std::span<const uint32_t> FormatsOf( ITimecodeSource::Enum i_Source )
{
  for( const VSourceRow& rRow : Sources )
  {
    if( rRow.m_Source == i_Source )
    {
      return { rRow.m_Formats.data(), rRow.m_FormatCount };
    }
  }
  return {};
}

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

ITimecodeStandard::Enum ChooseStandard( int64_t i_FramePeriod, bool i_bDropFrame )
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

VComPointer<DeckLinkAPI::IDeckLinkTimecode> FindTimecode( DeckLinkAPI::IDeckLinkVideoInputFrame& i_rFrame, ITimecodeSource::Enum i_Source )
{
  for( const uint32_t TimecodeFormat : FormatsOf( i_Source ) )
  {
    DeckLinkAPI::IDeckLinkTimecode* pTimecode = nullptr;
    // An absent timecode may answer with a success that carries no object.
    if( i_rFrame.GetTimecode( TimecodeFormat, &pTimecode ) >= 0 && pTimecode )
    {
      return TakeReference( pTimecode );
    }
  }
  return nullptr;
}

}

VTimecodeReading ReadTimecode( DeckLinkAPI::IDeckLinkVideoInputFrame& i_rFrame, ITimecodeSource::Enum i_Source )
{
  VTimecodeReading Reading;
  int64_t Time = 0;
  int64_t Duration = 0;
  if( i_rFrame.GetStreamTime( &Time, &Duration, KVZ::VTick::TicksPerSecond ) < 0 )
  {
    return Reading;
  }
  Reading.m_FramePeriod = Duration;

  const auto pTimecode = FindTimecode( i_rFrame, i_Source );
  KVZ::ITimecode Timecode;
  if( !pTimecode || pTimecode->GetComponents( &Timecode.m_Hours, &Timecode.m_Minutes, &Timecode.m_Seconds, &Timecode.m_Frames ) < 0 )
  {
    return Reading;
  }
  pTimecode->GetTimecodeUserBits( &Timecode.m_UserBits );
  Timecode.m_SubFramePeriod = static_cast<uint32_t>( Duration );
  Timecode.m_Standard = ChooseStandard( Duration, ( pTimecode->GetFlags() & DeckLinkAPI::TimecodeFlag::DropFrame ) != 0 );
  Reading.m_Timecode = Timecode;
  return Reading;
}

}
