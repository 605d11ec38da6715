// What a card is made of: its text understood, its source opened, its script read.
#pragma once

#include "cards/common/CardSpec.h"
#include "cards/common/SignalContent.h"
#include "cards/common/VirtualCardControl.h"

#include <vector>

namespace VirtualCards
{

struct VCardParts
{
  VCardSpec m_Spec;
  VSignalSource m_Source;
  std::vector<VCardEvent> m_Events;

  VSignalTimeline Timeline() const { return VSignalTimeline( m_Source.m_Standard, m_Spec.m_Timecode, m_Events ); }
};

// False, with one line that names the key, the reason and what would be accepted, if the text cannot be understood, is of another kind than
// this library's, or names what cannot be opened.
bool OpenCard( const VCardKind& i_rKind, const char* i_pText, const VCardOptions& i_rOptions, VCardParts& o_rParts, std::string& o_rError );

}
