#include "cards/decklink/References.h"

#include <cstring>

namespace VirtualCards
{

namespace
{

std::atomic<int64_t> g_ReferencesHeld{ 0 };
std::atomic<int64_t> g_ReleaseErrors{ 0 };

}

int64_t ReferencesHeld() { return g_ReferencesHeld; }

int64_t ReleaseErrors() { return g_ReleaseErrors; }

VReferences::VReferences( EFirst i_First ) : m_State( i_First == EFirst::Own ? OwnFlag : 1 )
{
  g_ReferencesHeld += i_First == EFirst::Client ? 1 : 0;
}

unsigned long VReferences::AddRef()
{
  ++g_ReferencesHeld;
  const unsigned long Before = m_State.fetch_add( 1 );
  return ( Before & ~OwnFlag ) + 1 + ( Before & OwnFlag ? 1 : 0 );
}

unsigned long VReferences::Release()
{
  unsigned long State = m_State;
  do {
    if( State == OwnFlag )
    {
      ++g_ReleaseErrors;
      return 1;
    }
  } while( !m_State.compare_exchange_weak( State, State - 1 ) );
  --g_ReferencesHeld;
  return ( State & ~OwnFlag ) - 1 + ( State & OwnFlag ? 1 : 0 );
}

void VReferences::TakeOwn() { m_State = OwnFlag; }

bool VReferences::ReleaseOwn() { return m_State.fetch_and( ~OwnFlag ) == OwnFlag; }

DeckLinkAPI::HRESULT GiveText( const std::string& i_rText, const char** o_ppText )
{
  if( !o_ppText )
  {
    return DeckLinkAPI::E_POINTER;
  }
  *o_ppText = strdup( i_rText.c_str() );
  return *o_ppText ? DeckLinkAPI::S_OK : DeckLinkAPI::E_OUTOFMEMORY;
}

}
