#include "cards/common/CardParts.h"

#include "cards/common/EventScript.h"

namespace VirtualCards
{

bool OpenCard( const VCardKind& i_rKind, const char* i_pText, const VCardOptions& i_rOptions, VCardParts& o_rParts, std::string& o_rError )
{
  const std::optional<VCardSpec> Spec = ParseCardSpec( i_pText, o_rError );
  if( !Spec )
  {
    return false;
  }
  const std::string Card = "card \"" + std::string( i_pText ) + "\": ";
  if( Spec->m_pKind != &i_rKind )
  {
    o_rError = Card + "this library makes no cards of the kind " + Spec->m_pKind->m_pName + "; accepted: " + i_rKind.m_pName;
    return false;
  }
  std::string Reason;
  o_rParts.m_Source = OpenSource( *Spec, i_rOptions.m_bManualClock, Reason );
  if( o_rParts.m_Source.m_pContent && !Spec->m_Script.empty() )
  {
    std::optional<std::vector<VCardEvent>> Events = ReadEvents( i_rKind, o_rParts.m_Source.m_Standard, Spec->m_Script, Reason );
    Reason = Events ? Reason : "script: " + Reason;
    o_rParts.m_Events = Events.value_or( std::vector<VCardEvent>() );
  }
  o_rParts.m_Spec = *Spec;
  o_rError = Reason.empty() ? Reason : Card + Reason;
  return Reason.empty();
}

}
