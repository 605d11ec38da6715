#include "HardwareSupport/VideoInput/VideoInputDeviceBlackmagic/BlackmagicDeckLinkDeviceTimecode.h"

#include "HardwareSupport/VideoInput/VideoInputDeviceBlackmagic/ComPointer.h"
#include "HardwareSupport/VideoInput/VideoInputHAL/TimecodeChoice.h"
#include "SyncSystem/Tick.h"

#include <array>

namespace VideoInputHAL
{

namespace
{

using KVZ::ITimecodeSource;

namespace Format = DeckLinkAPI::TimecodeFormat;

constexpr std::array Sources = {
  VTimecodeSourceRow{ ITimecodeSource::ERP188_LTC, 1, { Format::RP188LTC } },
  VTimecodeSourceRow{ ITimecodeSource::ERP188_VITC1, 1, { Format::RP188VITC1 } },
  VTimecodeSourceRow{ ITimecodeSource::ERP188_VITC2, 1, { Format::RP188VITC2 } },
  VTimecodeSourceRow{ ITimecodeSource::EVITC_Field1, 1, { Format::VITCField1 } },
  VTimecodeSourceRow{ ITimecodeSource::EVITC_Field2, 1, { Format::VITCField2 } },
  VTimecodeSourceRow{ ITimecodeSource::ESerial, 1, { Format::Serial } },
  VTimecodeSourceRow{ ITimecodeSource::ERP188_Any, 1, { Format::RP188Any } },
  VTimecodeSourceRow{ ITimecodeSource::EAny, 4, { Format::RP188Any, Format::VITCField1, Format::VITCField2, Format::Serial } },
};

VComPointer<DeckLinkAPI::IDeckLinkTimecode> FindTimecode( DeckLinkAPI::IDeckLinkVideoInputFrame& i_rFrame, ITimecodeSource::Enum i_Source )
{
  for( const uint32_t TimecodeFormat : FindTimecodeNumbers( Sources, i_Source ) )
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
