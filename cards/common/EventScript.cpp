#include "cards/common/EventScript.h"

#include <nlohmann/json.hpp>

#include <algorithm>
#include <array>
#include <fstream>
#include <iterator>
#include <numeric>
#include <set>

namespace VirtualCards
{

namespace
{

using nlohmann::json;

// What makes an event impossible to understand; becomes one line of text.
struct VRefusal
{
  std::string m_Reason;
};

[[noreturn]] void Refuse( const std::string& i_rKey, const std::string& i_rReason ) { throw VRefusal{ "\"" + i_rKey + "\": " + i_rReason }; }

constexpr uint64_t MostFrames = 1000000000;   // half a year at 60 frames a second
constexpr uint64_t MostMilliseconds = 60000;

uint64_t ParseNumber( const json& i_rEvent, const char* i_pKey, uint64_t i_Least, uint64_t i_Most )
{
  const std::string Accepted = "; accepted: a whole number from " + std::to_string( i_Least ) + " to " + std::to_string( i_Most );
  const auto Found = i_rEvent.find( i_pKey );
  if( Found == i_rEvent.end() )
  {
    Refuse( i_pKey, "is missing" + Accepted );
  }
  if( !Found->is_number_unsigned() || Found->get<uint64_t>() < i_Least || Found->get<uint64_t>() > i_Most )
  {
    Refuse( i_pKey, "cannot be " + Found->dump() + Accepted );
  }
  return Found->get<uint64_t>();
}

std::string ParseText( const json& i_rEvent, const char* i_pKey, const std::string& i_rAccepted )
{
  const auto Found = i_rEvent.find( i_pKey );
  if( Found == i_rEvent.end() || !Found->is_string() )
  {
    Refuse( i_pKey, ( Found == i_rEvent.end() ? "is missing" : "cannot be " + Found->dump() ) + "; accepted: " + i_rAccepted );
  }
  return Found->get<std::string>();
}

void ParseFrames( const json& i_rEvent, const VCardKind&, VCardEvent& o_rEvent )
{
  o_rEvent.m_Frames = ParseNumber( i_rEvent, "frames", 1, MostFrames );
}

void ParseOptionalFrames( const json& i_rEvent, const VCardKind& i_rKind, VCardEvent& o_rEvent )
{
  if( i_rEvent.contains( "frames" ) )
  {
    ParseFrames( i_rEvent, i_rKind, o_rEvent );
  }
}

void ParseFormat( const json& i_rEvent, const VCardKind& i_rKind, VCardEvent& o_rEvent )
{
  std::string Reason;
  if( !ParseStandard( i_rKind, ParseText( i_rEvent, "standard", "the name of a video standard" ), o_rEvent.m_Standard, Reason ) )
  {
    Refuse( "standard", Reason );
  }
}

void ParseTo( const json& i_rEvent, const VCardKind&, VCardEvent& o_rEvent )
{
  const std::string Text = ParseText( i_rEvent, "to", "HH:MM:SS:FF or HH:MM:SS;FF" );
  const std::optional<VTimecodeLabel> Label = ParseTimecodeLabel( Text );
  if( !Label )
  {
    Refuse( "to", "\"" + Text + "\" is no timecode; accepted: HH:MM:SS:FF or HH:MM:SS;FF" );
  }
  o_rEvent.m_To = *Label;
}

void ParseMilliseconds( const json& i_rEvent, const VCardKind&, VCardEvent& o_rEvent )
{
  o_rEvent.m_Milliseconds = static_cast<uint32_t>( ParseNumber( i_rEvent, "milliseconds", 0, MostMilliseconds ) );
}

void ParseNothing( const json&, const VCardKind&, VCardEvent& ) {}

struct VEventRow
{
  const char* m_pName;
  EEvent m_Do;
  const char* m_pKey;   // the key that this event has besides "frame" and "do"; null for none
  void ( *m_pParse )( const json&, const VCardKind&, VCardEvent& );
};

constexpr std::array EventRows = {
  VEventRow{ "signal-loss", EEvent::SignalLoss, "frames", ParseFrames },
  VEventRow{ "format", EEvent::Format, "standard", ParseFormat },
  VEventRow{ "drop", EEvent::Drop, "frames", ParseFrames },
  VEventRow{ "timecode-jump", EEvent::TimecodeJump, "to", ParseTo },
  VEventRow{ "timecode-loss", EEvent::TimecodeLoss, "frames", ParseOptionalFrames },
  VEventRow{ "late", EEvent::Late, "milliseconds", ParseMilliseconds },
  VEventRow{ "remove", EEvent::Remove, nullptr, ParseNothing },
  VEventRow{ "arrive", EEvent::Arrive, nullptr, ParseNothing },
};

const VEventRow& ParseDo( const json& i_rEvent )
{
  std::string Accepted;
  for( const VEventRow& rRow : EventRows )
  {
    Accepted += std::string( Accepted.empty() ? "" : ", " ) + rRow.m_pName;
  }
  const std::string Name = ParseText( i_rEvent, "do", Accepted );
  const auto Found = std::find_if( EventRows.begin(), EventRows.end(), [&]( const VEventRow& i_rRow ) { return Name == i_rRow.m_pName; } );
  if( Found == EventRows.end() )
  {
    Refuse( "do", "no event is called \"" + Name + "\"; accepted: " + Accepted );
  }
  return *Found;
}

void RefuseOtherKeys( const json& i_rEvent, const std::set<std::string>& i_rAccepted )
{
  for( const auto& rItem : i_rEvent.items() )
  {
    if( !i_rAccepted.contains( rItem.key() ) )
    {
      const std::string List = std::accumulate( i_rAccepted.begin(), i_rAccepted.end(), std::string(),
        []( const std::string& i_rSoFar, const std::string& i_rKey ) { return i_rSoFar + ( i_rSoFar.empty() ? "" : ", " ) + i_rKey; } );
      Refuse( rItem.key(), "this event has no such key; accepted: " + List );
    }
  }
}

VCardEvent ParseObject( const json& i_rEvent, const VCardKind& i_rKind, bool i_bWithFrame )
{
  if( !i_rEvent.is_object() )
  {
    throw VRefusal{ "is not an object; accepted: { \"frame\": N, \"do\": NAME, ... }" };
  }
  VCardEvent Event;
  const VEventRow& rRow = ParseDo( i_rEvent );
  std::set<std::string> Keys{ "do" };
  if( i_bWithFrame )
  {
    Keys.insert( "frame" );
    Event.m_Frame = ParseNumber( i_rEvent, "frame", 0, MostFrames );
  }
  if( rRow.m_pKey )
  {
    Keys.insert( rRow.m_pKey );
  }
  RefuseOtherKeys( i_rEvent, Keys );
  Event.m_Do = rRow.m_Do;
  rRow.m_pParse( i_rEvent, i_rKind, Event );
  return Event;
}

void CheckLabel( const VCardEvent& i_rEvent, KVZ::IVideoStandard::Enum i_Standard )
{
  const std::string Reason = WhyNotAt( i_rEvent.m_To, KVZ::GetFramePeriod( i_Standard ) );
  if( i_rEvent.m_Do == EEvent::TimecodeJump && !Reason.empty() )
  {
    Refuse( "to", Reason );
  }
}

// Labels can be judged only at the rate that the signal has by then.
void CheckLabels( const std::vector<VCardEvent>& i_rEvents, KVZ::IVideoStandard::Enum i_Standard, size_t& o_rIndex )
{
  std::vector<size_t> Order( i_rEvents.size() );
  std::iota( Order.begin(), Order.end(), size_t{ 0 } );
  std::stable_sort( Order.begin(), Order.end(), [&]( size_t i_A, size_t i_B ) { return i_rEvents[i_A].m_Frame < i_rEvents[i_B].m_Frame; } );
  for( const size_t Index : Order )
  {
    o_rIndex = Index;
    if( i_rEvents[Index].m_Do == EEvent::Format )
    {
      i_Standard = i_rEvents[Index].m_Standard;
    }
    CheckLabel( i_rEvents[Index], i_Standard );
  }
}

// nlohmann's texts begin with a tag in brackets and name line and column.
std::string ReasonOf( const json::parse_error& i_rError )
{
  const std::string Text = i_rError.what();
  const size_t End = Text.find( "] " );
  return "is no JSON: " + ( End == std::string::npos ? Text : Text.substr( End + 2 ) );
}

}

std::optional<std::vector<VCardEvent>> ParseEvents( const VCardKind& i_rKind, KVZ::IVideoStandard::Enum i_Standard, std::string_view i_Text,
  std::string& o_rError )
{
  size_t Index = 0;
  try
  {
    const json List = json::parse( i_Text );
    if( !List.is_array() )
    {
      o_rError = "is not a list; accepted: [ { \"frame\": N, \"do\": NAME, ... }, ... ]";
      return std::nullopt;
    }
    std::vector<VCardEvent> Events;
    for( ; Index < List.size(); ++Index )
    {
      Events.push_back( ParseObject( List[Index], i_rKind, true ) );
    }
    CheckLabels( Events, i_Standard, Index );
    return Events;
  }
  catch( const json::parse_error& rError )
  {
    o_rError = ReasonOf( rError );
  }
  catch( const VRefusal& rRefusal )
  {
    o_rError = "event " + std::to_string( Index ) + ": " + rRefusal.m_Reason;
  }
  return std::nullopt;
}

std::optional<VCardEvent> ParseEvent( const VCardKind& i_rKind, KVZ::IVideoStandard::Enum i_Standard, std::string_view i_Text, std::string& o_rError )
{
  try
  {
    const VCardEvent Event = ParseObject( json::parse( i_Text ), i_rKind, false );
    CheckLabel( Event, i_Standard );
    return Event;
  }
  catch( const json::parse_error& rError )
  {
    o_rError = "event " + ReasonOf( rError );
  }
  catch( const VRefusal& rRefusal )
  {
    o_rError = "event: " + rRefusal.m_Reason;
  }
  return std::nullopt;
}

std::optional<std::vector<VCardEvent>> ReadEvents( const VCardKind& i_rKind, KVZ::IVideoStandard::Enum i_Standard, const std::string& i_rPath,
  std::string& o_rError )
{
  std::ifstream File( i_rPath, std::ios::binary );
  const std::string Text{ std::istreambuf_iterator<char>( File ), std::istreambuf_iterator<char>() };
  if( !File.is_open() || File.bad() )
  {
    o_rError = "\"" + i_rPath + "\" cannot be read; accepted: a JSON file with a list of events";
    return std::nullopt;
  }
  std::optional<std::vector<VCardEvent>> Events = ParseEvents( i_rKind, i_Standard, Text, o_rError );
  if( !Events )
  {
    o_rError = "\"" + i_rPath + "\" " + o_rError;
  }
  return Events;
}

}
