#include "cards/common/CardKinds.h"

#include <algorithm>
#include <array>

namespace VirtualCards
{

namespace
{

using KVZ::IVideoStandard;

constexpr std::array DeckLinkStandards = {
  IVideoStandard::ESD_720_486I_5994,
  IVideoStandard::ESD_720_486P_2398,
  IVideoStandard::ESD_720_486P_5994,
  IVideoStandard::ESD_720_576I_5000,
  IVideoStandard::ESD_720_576P_5000,
  IVideoStandard::EHD_1280_720P_5000,
  IVideoStandard::EHD_1280_720P_5994,
  IVideoStandard::EHD_1280_720P_6000,
  IVideoStandard::EHD_1920_1080I_5000,
  IVideoStandard::EHD_1920_1080I_5994,
  IVideoStandard::EHD_1920_1080I_6000,
  IVideoStandard::EHD_1920_1080P_2398,
  IVideoStandard::EHD_1920_1080P_2400,
  IVideoStandard::EHD_1920_1080P_2500,
  IVideoStandard::EHD_1920_1080P_2997,
  IVideoStandard::EHD_1920_1080P_3000,
  IVideoStandard::EHD_1920_1080P_5000,
  IVideoStandard::EHD_1920_1080P_5994,
  IVideoStandard::EHD_1920_1080P_6000,
  IVideoStandard::EHD_2048_1556P_2398,
  IVideoStandard::EHD_2048_1556P_2400,
  IVideoStandard::EHD_2048_1556P_2500,
  IVideoStandard::EHD_2048_1080P_2398,
  IVideoStandard::EHD_2048_1080P_2400,
  IVideoStandard::EHD_2048_1080P_2500,
  IVideoStandard::EHD_3840_2160P_2398,
  IVideoStandard::EHD_3840_2160P_2400,
  IVideoStandard::EHD_3840_2160P_2500,
  IVideoStandard::EHD_3840_2160P_2997,
  IVideoStandard::EHD_3840_2160P_3000,
  IVideoStandard::EHD_3840_2160P_5000,
  IVideoStandard::EHD_3840_2160P_5994,
  IVideoStandard::EHD_3840_2160P_6000,
  IVideoStandard::EHD_4096_2160P_2398,
  IVideoStandard::EHD_4096_2160P_2400,
  IVideoStandard::EHD_4096_2160P_2500,
};

// The modes of the 5.x driver, without the two slow film scans, which have no period.
constexpr std::array BluefishStandards = {
  IVideoStandard::ESD_720_486I_5994,
  IVideoStandard::ESD_720_576I_5000,
  IVideoStandard::EHD_1280_720P_2398,
  IVideoStandard::EHD_1280_720P_2400,
  IVideoStandard::EHD_1280_720P_2500,
  IVideoStandard::EHD_1280_720P_2997,
  IVideoStandard::EHD_1280_720P_3000,
  IVideoStandard::EHD_1280_720P_5000,
  IVideoStandard::EHD_1280_720P_5994,
  IVideoStandard::EHD_1280_720P_6000,
  IVideoStandard::EHD_1920_1080I_5000,
  IVideoStandard::EHD_1920_1080I_5994,
  IVideoStandard::EHD_1920_1080I_6000,
  IVideoStandard::EHD_1920_1080P_2398,
  IVideoStandard::EHD_1920_1080P_2400,
  IVideoStandard::EHD_1920_1080P_2500,
  IVideoStandard::EHD_1920_1080P_2997,
  IVideoStandard::EHD_1920_1080P_3000,
  IVideoStandard::EHD_1920_1080P_4800,
  IVideoStandard::EHD_1920_1080P_5000,
  IVideoStandard::EHD_1920_1080P_5994,
  IVideoStandard::EHD_1920_1080P_6000,
  IVideoStandard::EHD_1920_1080PSF_2398,
  IVideoStandard::EHD_1920_1080PSF_2400,
  IVideoStandard::EHD_1920_1080PSF_2500,
  IVideoStandard::EHD_1920_1080PSF_2997,
  IVideoStandard::EHD_1920_1080PSF_3000,
  IVideoStandard::EHD_2048_1080P_2398,
  IVideoStandard::EHD_2048_1080P_2400,
  IVideoStandard::EHD_2048_1080P_2500,
  IVideoStandard::EHD_2048_1080P_2997,
  IVideoStandard::EHD_2048_1080P_3000,
  IVideoStandard::EHD_2048_1080P_4800,
  IVideoStandard::EHD_2048_1080P_5000,
  IVideoStandard::EHD_2048_1080P_5994,
  IVideoStandard::EHD_2048_1080P_6000,
  IVideoStandard::EHD_2048_1080PSF_2398,
  IVideoStandard::EHD_2048_1080PSF_2400,
  IVideoStandard::EHD_2048_1080PSF_2500,
  IVideoStandard::EHD_2048_1080PSF_2997,
  IVideoStandard::EHD_2048_1080PSF_3000,
};

constexpr std::array Kinds = {
  VCardKind{ "decklink", "libDeckLinkAPI.so", DeckLinkStandards },
  VCardKind{ "bluefish444", "libBlueVelvetC64.so", BluefishStandards },
};

}

std::span<const VCardKind> CardKinds() { return Kinds; }

const VCardKind* FindCardKind( std::string_view i_Name )
{
  const auto Found = std::find_if( Kinds.begin(), Kinds.end(), [&]( const VCardKind& i_rKind ) { return i_Name == i_rKind.m_pName; } );
  return Found != Kinds.end() ? &*Found : nullptr;
}

const VCardKind* KindOfCardText( std::string_view i_Text, std::string& o_rError )
{
  const std::string_view Name = i_Text.substr( 0, i_Text.find( ':' ) );
  const VCardKind* pKind = FindCardKind( Name );
  if( !pKind )
  {
    o_rError = "card \"" + std::string( i_Text ) + "\": no kind of card is called \"" + std::string( Name ) + "\"; accepted:";
    for( const VCardKind& rKind : Kinds )
    {
      o_rError += std::string( &rKind == &Kinds.front() ? " " : ", " ) + rKind.m_pName;
    }
  }
  return pKind;
}

bool CanCarry( const VCardKind& i_rKind, KVZ::IVideoStandard::Enum i_Standard )
{
  return std::find( i_rKind.m_Standards.begin(), i_rKind.m_Standards.end(), i_Standard ) != i_rKind.m_Standards.end();
}

bool ParseStandard( const VCardKind& i_rKind, const std::string& i_rName, KVZ::IVideoStandard::Enum& o_rStandard, std::string& o_rError )
{
  KVZ::IVideoStandard::Enum Standard{};
  const bool bKnown = KVZ::FromName( i_rName, Standard );
  if( bKnown && CanCarry( i_rKind, Standard ) )
  {
    o_rStandard = Standard;
    return true;
  }
  o_rError = "\"" + i_rName + "\" " + ( bKnown ? "cannot be carried by this kind of card" : "is no video standard" ) + "; accepted:";
  for( const KVZ::IVideoStandard::Enum Accepted : i_rKind.m_Standards )
  {
    o_rError += ( Accepted == i_rKind.m_Standards.front() ? " " : ", " ) + KVZ::ToName( Accepted );
  }
  return false;
}

}
