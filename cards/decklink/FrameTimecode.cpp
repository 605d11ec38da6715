#include "cards/decklink/FrameTimecode.h"

#include "cards/decklink/References.h"

#include <array>

namespace VirtualCards
{

namespace
{

using namespace DeckLinkAPI;

uint32_t ToBCD( uint8_t i_Value ) { return static_cast<uint32_t>( i_Value / 10 << 4 | i_Value % 10 ); }

class VFrameTimecode final : public VHeapObject<IDeckLinkTimecode, IID_IDeckLinkTimecode>
{
public:
  explicit VFrameTimecode( const VSignalTimecode& i_rTimecode ) : m_Timecode( i_rTimecode ) {}

  uint32_t GetBCD() override
  {
    const KVZ::ITimecode& rLabel = m_Timecode.m_Label;
    return ToBCD( rLabel.m_Hours ) << 24 | ToBCD( rLabel.m_Minutes ) << 16 | ToBCD( rLabel.m_Seconds ) << 8 | ToBCD( rLabel.m_Frames );
  }

  HRESULT GetComponents( uint8_t* o_pHours, uint8_t* o_pMinutes, uint8_t* o_pSeconds, uint8_t* o_pFrames ) override
  {
    if( !o_pHours || !o_pMinutes || !o_pSeconds || !o_pFrames )
    {
      return E_POINTER;
    }
    *o_pHours = m_Timecode.m_Label.m_Hours;
    *o_pMinutes = m_Timecode.m_Label.m_Minutes;
    *o_pSeconds = m_Timecode.m_Label.m_Seconds;
    *o_pFrames = m_Timecode.m_Label.m_Frames;
    return S_OK;
  }

  HRESULT GetString( const char** o_ppTimecode ) override { return GiveText( KVZ::ToText( m_Timecode.m_Label ), o_ppTimecode ); }

  uint32_t GetFlags() override
  {
    const bool bDropFrame = m_Timecode.m_Label.m_Standard == KVZ::ITimecodeStandard::ETimecode30Drop;
    return ( bDropFrame ? TimecodeFlag::DropFrame : 0 ) | ( m_Timecode.m_bFieldMark ? TimecodeFlag::FieldMark : 0 );
  }

  HRESULT GetTimecodeUserBits( uint32_t* o_pUserBits ) override
  {
    if( !o_pUserBits )
    {
      return E_POINTER;
    }
    *o_pUserBits = m_Timecode.m_Label.m_UserBits;
    return S_OK;
  }

private:
  const VSignalTimecode m_Timecode;
};

enum class EPlace
{
  Always,
  Interlaced,
  StandardDefinition,
  StandardDefinitionInterlaced,
  Never
};

struct VPlace
{
  uint32_t m_Format;
  EPlace m_Where;
};

constexpr std::array Places = {
  VPlace{ TimecodeFormat::RP188Any, EPlace::Always },
  VPlace{ TimecodeFormat::RP188LTC, EPlace::Always },
  VPlace{ TimecodeFormat::RP188VITC1, EPlace::Always },
  VPlace{ TimecodeFormat::RP188VITC2, EPlace::Interlaced },
  VPlace{ TimecodeFormat::VITCField1, EPlace::StandardDefinition },
  VPlace{ TimecodeFormat::VITCField2, EPlace::StandardDefinitionInterlaced },
  VPlace{ TimecodeFormat::Serial, EPlace::Never },
};

bool Carries( const KVZ::VVideoStandardRow& i_rStandard, EPlace i_Where )
{
  const bool bStandardDefinition = i_rStandard.m_Height <= 576;
  const bool bInterlaced = i_rStandard.m_Scan == KVZ::EScan::Interlaced;
  switch( i_Where )
  {
    case EPlace::Always: return true;
    case EPlace::Interlaced: return bInterlaced;
    case EPlace::StandardDefinition: return bStandardDefinition;
    case EPlace::StandardDefinitionInterlaced: return bStandardDefinition && bInterlaced;
    default: return false;
  }
}

}

HRESULT GetFrameTimecode( const VSignalFrame& i_rSignal, uint32_t i_Format, IDeckLinkTimecode** o_ppTimecode )
{
  if( !o_ppTimecode )
  {
    return E_POINTER;
  }
  *o_ppTimecode = nullptr;
  for( const VPlace& rPlace : Places )
  {
    if( rPlace.m_Format == i_Format )
    {
      const bool bThere = i_rSignal.m_Timecode && Carries( *i_rSignal.m_pStandard, rPlace.m_Where );
      *o_ppTimecode = bThere ? new VFrameTimecode( *i_rSignal.m_Timecode ) : nullptr;
      return bThere ? S_OK : S_FALSE;
    }
  }
  return E_INVALIDARG;
}

}
