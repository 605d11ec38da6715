#include "HardwareSupport/VideoInput/VideoInputDeviceBlackmagic/BlackmagicDeckLinkDeviceTimecode.h"

#include "HardwareSupport/VideoInput/VideoInputDeviceBlackmagic/ComPointer.h"
#include "HardwareSupport/VideoInput/VideoInputHAL/TimecodeChoice.h"
#include "SyncSystem/Tick.h"

#include <array>
#include <span>

namespace VideoInputHAL
{

namespace
{

using KVZ::ITimecodeSource;

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
  Timecode.m_Standard = ChooseTimecodeStandard( Duration, ( pTimecode->GetFlags() & DeckLinkAPI::TimecodeFlag::DropFrame ) != 0 );
  Reading.m_Timecode = Timecode;
  return Reading;
}

}
