// The vendor's display modes, by code and by video standard.
#pragma once

#include "Core/VideoInterface/VideoStandard.h"
#include "VendorInterfaces/DeckLinkAPI.h"

namespace VirtualCards
{

struct VDisplayModeRow
{
  uint32_t m_Code;
  KVZ::IVideoStandard::Enum m_Standard;
  const char* m_pName;
};

// A null pointer for a mode that the card does not have.
const VDisplayModeRow* FindDisplayMode( uint32_t i_Code );
const VDisplayModeRow* FindDisplayMode( KVZ::IVideoStandard::Enum i_Standard );

uint32_t FieldDominanceOf( const VDisplayModeRow& i_rMode );

// Each carries one reference for the caller.
DeckLinkAPI::IDeckLinkDisplayMode* MakeDisplayMode( const VDisplayModeRow& i_rMode );
DeckLinkAPI::IDeckLinkDisplayModeIterator* MakeDisplayModeIterator();

}
