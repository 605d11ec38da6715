// The kinds of virtual card, and the standards that each can carry.
#pragma once

#include "Core/VideoInterface/VideoStandard.h"

#include <span>
#include <string>
#include <string_view>

namespace VirtualCards
{

struct VCardKind
{
  const char* m_pName;      // as in a card's text
  const char* m_pLibrary;   // file name of the vendor's library that the virtual one stands in for
  std::span<const KVZ::IVideoStandard::Enum> m_Standards;
};

std::span<const VCardKind> CardKinds();

// A null pointer for a name outside the table.
const VCardKind* FindCardKind( std::string_view i_Name );

// The kind that a card's text begins with; a null pointer and one line of reason where there is none of that name.
const VCardKind* KindOfCardText( std::string_view i_Text, std::string& o_rError );

bool CanCarry( const VCardKind& i_rKind, KVZ::IVideoStandard::Enum i_Standard );

// The standard of this name, if this kind carries it. Otherwise false, with the reason and the list of those it carries.
bool ParseStandard( const VCardKind& i_rKind, const std::string& i_rName, KVZ::IVideoStandard::Enum& o_rStandard, std::string& o_rError );

}
