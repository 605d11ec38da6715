#include "cards/decklink/VirtualDeckLink.h"

#include "cards/common/EventScript.h"
#include "cards/decklink/Registry.h"

namespace VirtualCards
{

std::shared_ptr<VVirtualDeckLink> VVirtualDeckLink::Make( VCardId i_Id, const char* i_pText, const VCardOptions& i_rOptions, std::string& o_rError )
{
  VCardParts Parts;
  if( !OpenCard( *FindCardKind( "decklink" ), i_pText, i_rOptions, Parts, o_rError ) )
  {
    return nullptr;
  }
  return std::shared_ptr<VVirtualDeckLink>( new VVirtualDeckLink( i_Id, Parts, i_rOptions ) );
}

VVirtualDeckLink::VVirtualDeckLink( VCardId i_Id, const VCardParts& i_rParts, const VCardOptions& i_rOptions )
  : m_Id( i_Id ),
    m_rKind( *i_rParts.m_Spec.m_pKind ),
    m_Source( i_rParts.m_Source ),
    m_Runner( i_rParts.Timeline(), { i_rParts.m_Spec.m_Speed, i_rOptions.m_bManualClock, "Virtual DeckLink " + std::to_string( i_Id ) }, *this )
{
}

VVirtualDeckLink::~VVirtualDeckLink() = default;

void VVirtualDeckLink::Begin()
{
  if( m_Runner.IsPresent() )
  {
    OnPresence( true );
  }
  m_Runner.Start();
}

void VVirtualDeckLink::End()
{
  m_Source.m_pContent->Close();
  m_Runner.Stop();
  if( m_pObject )
  {
    OnPresence( false );
  }
}

bool VVirtualDeckLink::RunEvent( const char* i_pEvent, std::string& o_rError )
{
  const std::optional<VCardEvent> Event = ParseEvent( m_rKind, m_Runner.Standard(), i_pEvent, o_rError );
  if( Event )
  {
    m_Runner.Apply( *Event );
  }
  return Event.has_value();
}

VCardCounters VVirtualDeckLink::Counters() const
{
  return { m_Runner.FramesPassed(), m_Delivered, m_Runner.FramesDropped(), m_WithoutBuffer, m_FormatChanges };
}

void VVirtualDeckLink::OnPresence( bool i_bPresent )
{
  if( i_bPresent )
  {
    m_pObject = new VDeckLinkObject( m_Id, weak_from_this() );
    VRegistry::Instance().CardArrived( *m_pObject );
    return;
  }
  m_pObject->Input().OnRemoved();
  VRegistry::Instance().CardRemoved( *m_pObject );
  m_pObject->ReleaseOwn();
  m_pObject = nullptr;
}

void VVirtualDeckLink::OnFrame( const VSignalFrame& i_rFrame ) { m_pObject->Input().OnFrame( i_rFrame ); }

}
