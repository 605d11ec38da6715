#include "HardwareSupport/VideoInput/VideoInputDeviceBluefish444/Bluefish444Timecode.h"

#include "HardwareSupport/VideoInput/VideoInputHAL/TimecodeChoice.h"

#include <array>

namespace VideoInputHAL
{

namespace
{

using KVZ::ITimecodeSource;

namespace Place = BlueVelvet::TimecodePlace;

constexpr std::array Sources = {
  VTimecodeSourceRow{ ITimecodeSource::ERP188_LTC, 1, { Place::RP188LTC } },
  VTimecodeSourceRow{ ITimecodeSource::ERP188_VITC1, 1, { Place::RP188VITC } },
  VTimecodeSourceRow{ ITimecodeSource::EExternal_LTC, 1, { Place::ExternalLTC } },
  VTimecodeSourceRow{ ITimecodeSource::ERP188_Any, 2, { Place::RP188LTC, Place::RP188VITC } },
  VTimecodeSourceRow{ ITimecodeSource::EAny, 3, { Place::RP188LTC, Place::RP188VITC, Place::ExternalLTC } },
};

constexpr uint32_t DropFrameBit = 10;

// Units in the low nibble at i_Shift, tens in the byte above, with flags beside them.
uint8_t Digits( uint64_t i_Word, uint32_t i_Shift, uint64_t i_TensMask )
{
  return static_cast<uint8_t>( ( i_Word >> ( i_Shift + 8 ) & i_TensMask ) * 10 + ( i_Word >> i_Shift & 15 ) );
}

uint32_t UserBits( uint64_t i_Word )
{
  uint32_t Bits = 0;
  for( uint32_t Nibble = 0; Nibble < 8; ++Nibble )
  {
    Bits |= static_cast<uint32_t>( i_Word >> ( Nibble * 8 + 4 ) & 15 ) << ( Nibble * 4 );
  }
  return Bits;
}

}

bool ToTimecode( uint64_t i_Word, int64_t i_FramePeriod, KVZ::ITimecode& o_rTimecode )
{
  o_rTimecode = {};
  o_rTimecode.m_Hours = Digits( i_Word, 48, 3 );
  o_rTimecode.m_Minutes = Digits( i_Word, 32, 7 );
  o_rTimecode.m_Seconds = Digits( i_Word, 16, 7 );
  o_rTimecode.m_Frames = Digits( i_Word, 0, 3 );
  o_rTimecode.m_UserBits = UserBits( i_Word );
  o_rTimecode.m_SubFramePeriod = static_cast<uint32_t>( i_FramePeriod );
  o_rTimecode.m_Standard = ChooseTimecodeStandard( i_FramePeriod, ( i_Word >> DropFrameBit & 1 ) != 0 );
  return KVZ::IsValid( o_rTimecode );
}

KVZ::ITimecode ReadTimecode( const BlueVelvet::VHancDecodeRecord& i_rRecord, ITimecodeSource::Enum i_Source, int64_t i_FramePeriod )
{
  for( const uint32_t Place : FindTimecodeNumbers( Sources, i_Source ) )
  {
    KVZ::ITimecode Timecode;
    if( ToTimecode( i_rRecord.m_Timecodes[Place], i_FramePeriod, Timecode ) )
    {
      return Timecode;
    }
  }
  return {};
}

}
