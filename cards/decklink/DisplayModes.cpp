#include "cards/decklink/DisplayModes.h"

#include "cards/decklink/References.h"

#include <algorithm>
#include <array>

namespace VirtualCards
{

namespace
{

using namespace DeckLinkAPI;
using KVZ::IVideoStandard;

constexpr std::array Modes = {
  VDisplayModeRow{ FourCharacterCode( "ntsc" ), IVideoStandard::ESD_720_486I_5994, "NTSC" },
  VDisplayModeRow{ FourCharacterCode( "nt23" ), IVideoStandard::ESD_720_486P_2398, "NTSC 23.98" },
  VDisplayModeRow{ FourCharacterCode( "pal " ), IVideoStandard::ESD_720_576I_5000, "PAL" },
  VDisplayModeRow{ FourCharacterCode( "ntsp" ), IVideoStandard::ESD_720_486P_5994, "NTSC Progressive" },
  VDisplayModeRow{ FourCharacterCode( "palp" ), IVideoStandard::ESD_720_576P_5000, "PAL Progressive" },
  VDisplayModeRow{ FourCharacterCode( "23ps" ), IVideoStandard::EHD_1920_1080P_2398, "1080p23.98" },
  VDisplayModeRow{ FourCharacterCode( "24ps" ), IVideoStandard::EHD_1920_1080P_2400, "1080p24" },
  VDisplayModeRow{ FourCharacterCode( "Hp25" ), IVideoStandard::EHD_1920_1080P_2500, "1080p25" },
  VDisplayModeRow{ FourCharacterCode( "Hp29" ), IVideoStandard::EHD_1920_1080P_2997, "1080p29.97" },
  VDisplayModeRow{ FourCharacterCode( "Hp30" ), IVideoStandard::EHD_1920_1080P_3000, "1080p30" },
  VDisplayModeRow{ FourCharacterCode( "Hi50" ), IVideoStandard::EHD_1920_1080I_5000, "1080i50" },
  VDisplayModeRow{ FourCharacterCode( "Hi59" ), IVideoStandard::EHD_1920_1080I_5994, "1080i59.94" },
  VDisplayModeRow{ FourCharacterCode( "Hi60" ), IVideoStandard::EHD_1920_1080I_6000, "1080i60" },
  VDisplayModeRow{ FourCharacterCode( "Hp50" ), IVideoStandard::EHD_1920_1080P_5000, "1080p50" },
  VDisplayModeRow{ FourCharacterCode( "Hp59" ), IVideoStandard::EHD_1920_1080P_5994, "1080p59.94" },
  VDisplayModeRow{ FourCharacterCode( "Hp60" ), IVideoStandard::EHD_1920_1080P_6000, "1080p60" },
  VDisplayModeRow{ FourCharacterCode( "hp50" ), IVideoStandard::EHD_1280_720P_5000, "720p50" },
  VDisplayModeRow{ FourCharacterCode( "hp59" ), IVideoStandard::EHD_1280_720P_5994, "720p59.94" },
  VDisplayModeRow{ FourCharacterCode( "hp60" ), IVideoStandard::EHD_1280_720P_6000, "720p60" },
  VDisplayModeRow{ FourCharacterCode( "2k23" ), IVideoStandard::EHD_2048_1556P_2398, "2K 23.98" },
  VDisplayModeRow{ FourCharacterCode( "2k24" ), IVideoStandard::EHD_2048_1556P_2400, "2K 24" },
  VDisplayModeRow{ FourCharacterCode( "2k25" ), IVideoStandard::EHD_2048_1556P_2500, "2K 25" },
  VDisplayModeRow{ FourCharacterCode( "2d23" ), IVideoStandard::EHD_2048_1080P_2398, "2K DCI 23.98" },
  VDisplayModeRow{ FourCharacterCode( "2d24" ), IVideoStandard::EHD_2048_1080P_2400, "2K DCI 24" },
  VDisplayModeRow{ FourCharacterCode( "2d25" ), IVideoStandard::EHD_2048_1080P_2500, "2K DCI 25" },
  VDisplayModeRow{ FourCharacterCode( "4k23" ), IVideoStandard::EHD_3840_2160P_2398, "2160p23.98" },
  VDisplayModeRow{ FourCharacterCode( "4k24" ), IVideoStandard::EHD_3840_2160P_2400, "2160p24" },
  VDisplayModeRow{ FourCharacterCode( "4k25" ), IVideoStandard::EHD_3840_2160P_2500, "2160p25" },
  VDisplayModeRow{ FourCharacterCode( "4k29" ), IVideoStandard::EHD_3840_2160P_2997, "2160p29.97" },
  VDisplayModeRow{ FourCharacterCode( "4k30" ), IVideoStandard::EHD_3840_2160P_3000, "2160p30" },
  VDisplayModeRow{ FourCharacterCode( "4k50" ), IVideoStandard::EHD_3840_2160P_5000, "2160p50" },
  VDisplayModeRow{ FourCharacterCode( "4k59" ), IVideoStandard::EHD_3840_2160P_5994, "2160p59.94" },
  VDisplayModeRow{ FourCharacterCode( "4k60" ), IVideoStandard::EHD_3840_2160P_6000, "2160p60" },
  VDisplayModeRow{ FourCharacterCode( "4d23" ), IVideoStandard::EHD_4096_2160P_2398, "4K DCI 23.98" },
  VDisplayModeRow{ FourCharacterCode( "4d24" ), IVideoStandard::EHD_4096_2160P_2400, "4K DCI 24" },
  VDisplayModeRow{ FourCharacterCode( "4d25" ), IVideoStandard::EHD_4096_2160P_2500, "4K DCI 25" },
};
static_assert( Modes.size() == 36 );

class VDisplayMode final : public VHeapObject<IDeckLinkDisplayMode, IID_IDeckLinkDisplayMode>
{
public:
  explicit VDisplayMode( const VDisplayModeRow& i_rMode ) : m_rMode( i_rMode ), m_rStandard( *KVZ::FindVideoStandard( i_rMode.m_Standard ) ) {}

  HRESULT GetName( const char** o_ppName ) override { return GiveText( m_rMode.m_pName, o_ppName ); }
  uint32_t GetDisplayMode() override { return m_rMode.m_Code; }
  long GetWidth() override { return m_rStandard.m_Width; }
  long GetHeight() override { return m_rStandard.m_Height; }

  HRESULT GetFrameRate( int64_t* o_pFrameDuration, int64_t* o_pTimeScale ) override
  {
    if( !o_pFrameDuration || !o_pTimeScale )
    {
      return E_POINTER;
    }
    const bool bWhole = m_rStandard.m_RateDenominator == 1;
    *o_pFrameDuration = bWhole ? 1000 : m_rStandard.m_RateDenominator;
    *o_pTimeScale = bWhole ? m_rStandard.m_RateNumerator * 1000 : m_rStandard.m_RateNumerator;
    return S_OK;
  }

  uint32_t GetFieldDominance() override { return FieldDominanceOf( m_rMode ); }
  uint32_t GetFlags() override { return m_rStandard.m_Height > 576 ? DisplayModeFlag::Rec709 : DisplayModeFlag::Rec601; }

private:
  const VDisplayModeRow& m_rMode;
  const KVZ::VVideoStandardRow& m_rStandard;
};

class VDisplayModeIterator final : public VHeapObject<IDeckLinkDisplayModeIterator, IID_IDeckLinkDisplayModeIterator>
{
public:
  HRESULT Next( IDeckLinkDisplayMode** o_ppMode ) override
  {
    if( !o_ppMode )
    {
      return E_POINTER;
    }
    const size_t Index = m_Next.fetch_add( 1 );
    *o_ppMode = Index < Modes.size() ? MakeDisplayMode( Modes[Index] ) : nullptr;
    return *o_ppMode ? S_OK : S_FALSE;
  }

private:
  std::atomic<size_t> m_Next{ 0 };
};

}

const VDisplayModeRow* FindDisplayMode( uint32_t i_Code )
{
  const auto Found = std::find_if( Modes.begin(), Modes.end(), [&]( const VDisplayModeRow& i_r ) { return i_r.m_Code == i_Code; } );
  return Found != Modes.end() ? &*Found : nullptr;
}

const VDisplayModeRow* FindDisplayMode( KVZ::IVideoStandard::Enum i_Standard )
{
  const auto Found = std::find_if( Modes.begin(), Modes.end(), [&]( const VDisplayModeRow& i_r ) { return i_r.m_Standard == i_Standard; } );
  return Found != Modes.end() ? &*Found : nullptr;
}

uint32_t FieldDominanceOf( const VDisplayModeRow& i_rMode )
{
  const KVZ::VVideoStandardRow& rStandard = *KVZ::FindVideoStandard( i_rMode.m_Standard );
  if( rStandard.m_Scan != KVZ::EScan::Interlaced )
  {
    return FieldDominance::Progressive;
  }
  return rStandard.m_Height == 486 ? FieldDominance::LowerFieldFirst : FieldDominance::UpperFieldFirst;
}

IDeckLinkDisplayMode* MakeDisplayMode( const VDisplayModeRow& i_rMode ) { return new VDisplayMode( i_rMode ); }

IDeckLinkDisplayModeIterator* MakeDisplayModeIterator() { return new VDisplayModeIterator; }

}
