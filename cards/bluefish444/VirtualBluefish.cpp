#include "cards/bluefish444/VirtualBluefish.h"

#include "cards/bluefish444/VideoModes.h"
#include "cards/common/EventScript.h"

#include <algorithm>
#include <array>

namespace VirtualCards
{

namespace
{

namespace Property = BlueVelvet::Property;

struct VProductRow
{
  uint32_t m_Inputs;
  uint32_t m_Outputs;
  uint32_t m_Product;
};

// The vendor's ids of what a card's connectors are for.
constexpr std::array Products = { VProductRow{ 4, 0, 4 }, VProductRow{ 0, 4, 5 }, VProductRow{ 2, 2, 6 }, VProductRow{ 1, 3, 8 },
  VProductRow{ 2, 3, 0x0A }, VProductRow{ 3, 1, 0x0B } };
constexpr uint32_t BroadcastProduct = 2;

uint32_t ProductOf( const VCardSpec& i_rSpec )
{
  const auto Found = std::find_if( Products.begin(), Products.end(),
    [&]( const VProductRow& i_r ) { return i_r.m_Inputs == i_rSpec.m_Inputs && i_r.m_Outputs == i_rSpec.m_Outputs; } );
  return Found != Products.end() ? Found->m_Product : BroadcastProduct;
}

}

std::shared_ptr<VVirtualBluefish> VVirtualBluefish::Make( VCardId i_Id, const char* i_pText, const VCardOptions& i_rOptions, std::string& o_rError )
{
  const VCardKind& rKind = *FindCardKind( "bluefish444" );
  VCardParts Parts;
  if( !OpenCard( rKind, i_pText, i_rOptions, Parts, o_rError ) )
  {
    return nullptr;
  }
  std::shared_ptr<VVirtualBluefish> pCard( new VVirtualBluefish( Parts.m_Spec ) );
  for( uint32_t Index = 0; Index < Parts.m_Spec.m_Inputs; ++Index )
  {
    // Each has a source of its own: a clip that two inputs show is read twice
    if( Index > 0 && !OpenCard( rKind, i_pText, i_rOptions, Parts, o_rError ) )
    {
      return nullptr;
    }
    const std::string Thread = "Virtual Bluefish444 " + std::to_string( i_Id ) + static_cast<char>( 'A' + Index );
    pCard->m_Inputs.push_back(
      std::make_unique<VBluefishInput>( Index, Parts, VPaceSettings{ Parts.m_Spec.m_Speed, i_rOptions.m_bManualClock, Thread } ) );
  }
  return pCard;
}

void VVirtualBluefish::Begin()
{
  for( const auto& pInput : m_Inputs )
  {
    pInput->Begin();
  }
}

void VVirtualBluefish::End()
{
  m_bEnded = true;
  for( const auto& pInput : m_Inputs )
  {
    pInput->End();
  }
}

bool VVirtualBluefish::IsCardThread() const
{
  return std::any_of( m_Inputs.begin(), m_Inputs.end(), []( const auto& i_p ) { return i_p->Runner().IsCardThread(); } );
}

bool VVirtualBluefish::Step( uint64_t i_Frames )
{
  bool bPassed = true;
  for( uint64_t i = 0; i < i_Frames && bPassed; ++i )
  {
    for( const auto& pInput : m_Inputs )
    {
      bPassed = pInput->Runner().Step( 1 ) && bPassed;
    }
  }
  return bPassed;
}

bool VVirtualBluefish::RunEvent( const char* i_pEvent, std::string& o_rError )
{
  for( const auto& pInput : m_Inputs )
  {
    const std::optional<VCardEvent> Event = ParseEvent( *m_Spec.m_pKind, pInput->Runner().Standard(), i_pEvent, o_rError );
    if( !Event )
    {
      return false;
    }
    pInput->Runner().Apply( *Event );
  }
  return true;
}

// Of all inputs together.
VCardCounters VVirtualBluefish::Counters() const
{
  VCardCounters Sum;
  for( const auto& pInput : m_Inputs )
  {
    const VCardCounters Counters = pInput->Counters();
    Sum.m_FramesPassed += Counters.m_FramesPassed;
    Sum.m_FramesDelivered += Counters.m_FramesDelivered;
    Sum.m_FramesDropped += Counters.m_FramesDropped;
    Sum.m_FramesWithoutBuffer += Counters.m_FramesWithoutBuffer;
    Sum.m_FormatChanges += Counters.m_FormatChanges;
    Sum.m_ClientsWaiting += Counters.m_ClientsWaiting;
  }
  return Sum;
}

// The vendor's users count on the features: without an answer, and without connectors, the inputs are of no use. Nobody finds a card that
// comes later.
uint32_t VVirtualBluefish::CountDevices() const
{
  uint32_t Connectors = 0;
  return IsPresent() && Query( Property::CardFeatureConnectorInfo, Connectors ) && Connectors != 0 ? m_Spec.m_Inputs : 0;
}

// The inputs come and go with the card, each at the same frame of its own.
bool VVirtualBluefish::IsPresent() const { return !m_bEnded && ( m_Inputs.empty() || m_Inputs.front()->Runner().IsPresent() ); }

bool VVirtualBluefish::Query( int i_Property, uint32_t& o_rValue ) const
{
  const bool bFeature = i_Property == Property::CardFeatureStreamInfo || i_Property == Property::CardFeatureConnectorInfo;
  if( bFeature && m_Spec.m_bOldDriver )
  {
    return false;
  }
  // Outputs in bits 0 to 3, inputs in bits 4 to 7
  switch( i_Property )
  {
    case Property::ProductId: o_rValue = ProductOf( m_Spec ); return true;
    case Property::InvalidVideoModeFlag: o_rValue = NoSignalMode; return true;
    case Property::CardFeatureStreamInfo: o_rValue = m_Spec.m_Outputs | m_Spec.m_Inputs << 4; return true;
    case Property::CardFeatureConnectorInfo: o_rValue = m_Spec.m_Outputs | m_Spec.m_Connectors.value_or( m_Spec.m_Inputs ) << 4; return true;
    default: return false;
  }
}

}
