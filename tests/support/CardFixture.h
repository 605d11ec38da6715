// Cards of a virtual library, moved by hand through the library's control.
#pragma once

#include "cards/common/VirtualCardControl.h"

#include <gtest/gtest.h>

#include <dlfcn.h>
#include <string>
#include <vector>

inline VirtualCards::IVirtualCardControl& ControlOf( const char* i_pLibrary )
{
  void* const pLibrary = dlopen( i_pLibrary, RTLD_NOW );
  return *reinterpret_cast<VirtualCards::GetVirtualCardControlFunction*>( dlsym( pLibrary, VirtualCards::GetVirtualCardControlName ) )();
}

class VCardsFixture : public testing::Test
{
protected:
  explicit VCardsFixture( VirtualCards::IVirtualCardControl& i_rControl ) : m_rControl( i_rControl ) {}

  VirtualCards::IVirtualCardControl& Control() const { return m_rControl; }

  // From now on the card that is meant.
  void AddCard( const std::string& i_rText, bool i_bManualClock = true )
  {
    std::string Error;
    m_Card = Control().AddCard( i_rText.c_str(), { i_bManualClock }, Error );
    ASSERT_NE( m_Card, 0u ) << Error;
    m_Cards.push_back( m_Card );
  }
  void RemoveCards()
  {
    for( const VirtualCards::VCardId Card : m_Cards )
    {
      Control().RemoveCard( Card );
    }
  }

  void Step( uint64_t i_Frames = 1 ) { ASSERT_TRUE( Control().Step( m_Card, i_Frames ) ); }

  void Event( const std::string& i_rEvent )
  {
    std::string Error;
    ASSERT_TRUE( Control().RunEvent( m_Card, i_rEvent.c_str(), Error ) ) << Error;
  }

  VirtualCards::VCardCounters Counters()
  {
    VirtualCards::VCardCounters Counters;
    EXPECT_TRUE( Control().GetCounters( m_Card, Counters ) );
    return Counters;
  }

  VirtualCards::IVirtualCardControl& m_rControl;
  VirtualCards::VCardId m_Card = 0;
  std::vector<VirtualCards::VCardId> m_Cards;
};
