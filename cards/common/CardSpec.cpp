#include "cards/common/CardSpec.h"

#include <algorithm>
#include <array>
#include <charconv>
#include <set>

namespace VirtualCards
{

namespace
{

template<class TEnum>
struct VChoice
{
  const char* m_pName;
  TEnum m_Value;
};

constexpr std::array Patterns = { VChoice<EPattern>{ "bars", EPattern::Bars }, VChoice<EPattern>{ "counter", EPattern::Counter },
  VChoice<EPattern>{ "noise", EPattern::Noise } };
constexpr std::array Audios = { VChoice<EAudio>{ "tone", EAudio::Tone }, VChoice<EAudio>{ "ramp", EAudio::Ramp },
  VChoice<EAudio>{ "silence", EAudio::Silence }, VChoice<EAudio>{ "none", EAudio::None } };
constexpr std::array Drivers = { VChoice<bool>{ "new", false }, VChoice<bool>{ "old", true } };
constexpr std::array Loops = { VChoice<bool>{ "1", true }, VChoice<bool>{ "0", false } };

constexpr uint32_t MostChannels = 16;
constexpr uint32_t MostInputs = 4;
constexpr double LeastSpeed = 0.01;
constexpr double MostSpeed = 100.0;

std::string Refusal( const std::string& i_rValue, const std::string& i_rAccepted )
{
  return "\"" + i_rValue + "\" is not understood; accepted: " + i_rAccepted;
}

// Each of these gives the reason for a refusal, or an empty text.
template<class TChoices, class TValue>
std::string ParseChoice( const TChoices& i_rChoices, const std::string& i_rText, TValue& o_rValue )
{
  std::string Accepted;
  for( const auto& rChoice : i_rChoices )
  {
    if( i_rText == rChoice.m_pName )
    {
      o_rValue = rChoice.m_Value;
      return {};
    }
    Accepted += std::string( Accepted.empty() ? "" : ", " ) + rChoice.m_pName;
  }
  return Refusal( i_rText, Accepted );
}

template<class TNumber>
bool ParseWhole( const std::string& i_rText, TNumber& o_rNumber )
{
  const char* pEnd = i_rText.data() + i_rText.size();
  const auto [pRead, Error] = std::from_chars( i_rText.data(), pEnd, o_rNumber );
  return Error == std::errc() && pRead == pEnd;
}

std::string SetStandard( VCardSpec& o_rSpec, const std::string& i_rText )
{
  KVZ::IVideoStandard::Enum Standard{};
  std::string Reason;
  if( ParseStandard( *o_rSpec.m_pKind, i_rText, Standard, Reason ) )
  {
    o_rSpec.m_Standard = Standard;
  }
  return Reason;
}

std::string SetPattern( VCardSpec& o_rSpec, const std::string& i_rText ) { return ParseChoice( Patterns, i_rText, o_rSpec.m_Pattern ); }

std::string SetTimecode( VCardSpec& o_rSpec, const std::string& i_rText )
{
  o_rSpec.m_Timecode = ParseTimecodeLabel( i_rText );
  return o_rSpec.m_Timecode || i_rText == "none" ? std::string() : Refusal( i_rText, "HH:MM:SS:FF, HH:MM:SS;FF (drop-frame), none" );
}

std::string SetAudio( VCardSpec& o_rSpec, const std::string& i_rText ) { return ParseChoice( Audios, i_rText, o_rSpec.m_Audio ); }

std::string SetChannels( VCardSpec& o_rSpec, const std::string& i_rText )
{
  uint32_t Channels = 0;
  if( !ParseWhole( i_rText, Channels ) || Channels < 1 || Channels > MostChannels )
  {
    return Refusal( i_rText, "a whole number from 1 to 16" );
  }
  o_rSpec.m_Channels = Channels;
  return {};
}

std::string SetScript( VCardSpec& o_rSpec, const std::string& i_rText )
{
  o_rSpec.m_Script = i_rText;
  return {};
}

std::string SetSpeed( VCardSpec& o_rSpec, const std::string& i_rText )
{
  double Speed = 0;
  if( !ParseWhole( i_rText, Speed ) || !( Speed >= LeastSpeed && Speed <= MostSpeed ) )
  {
    return Refusal( i_rText, "a number from 0.01 to 100" );
  }
  o_rSpec.m_Speed = Speed;
  return {};
}

std::string SetLoop( VCardSpec& o_rSpec, const std::string& i_rText ) { return ParseChoice( Loops, i_rText, o_rSpec.m_bLoop ); }

std::string SetInput( VCardSpec& o_rSpec, const std::string& i_rText )
{
  o_rSpec.m_Input = i_rText;
  return {};
}

std::string ParseUpToFour( const std::string& i_rText, uint32_t& o_rValue )
{
  uint32_t Value = 0;
  if( !ParseWhole( i_rText, Value ) || Value > MostInputs )
  {
    return Refusal( i_rText, "a whole number from 0 to 4" );
  }
  o_rValue = Value;
  return {};
}

std::string SetInputs( VCardSpec& o_rSpec, const std::string& i_rText ) { return ParseUpToFour( i_rText, o_rSpec.m_Inputs ); }

std::string SetOutputs( VCardSpec& o_rSpec, const std::string& i_rText ) { return ParseUpToFour( i_rText, o_rSpec.m_Outputs ); }

std::string SetConnectors( VCardSpec& o_rSpec, const std::string& i_rText ) { return ParseUpToFour( i_rText, o_rSpec.m_Connectors.emplace() ); }

std::string SetDriver( VCardSpec& o_rSpec, const std::string& i_rText ) { return ParseChoice( Drivers, i_rText, o_rSpec.m_bOldDriver ); }

struct VKey
{
  const char* m_pName;
  std::string ( *m_pSet )( VCardSpec&, const std::string& );
  const char* m_pKind = nullptr;   // the kind of card that knows it; null for all

  bool IsKnownTo( const VCardKind& i_rKind ) const { return !m_pKind || &i_rKind == FindCardKind( m_pKind ); }
};

constexpr std::array Keys = {
  VKey{ "standard", SetStandard },
  VKey{ "pattern", SetPattern },
  VKey{ "timecode", SetTimecode },
  VKey{ "audio", SetAudio },
  VKey{ "channels", SetChannels },
  VKey{ "script", SetScript },
  VKey{ "speed", SetSpeed },
  VKey{ "loop", SetLoop },
  VKey{ "input", SetInput },
  VKey{ "inputs", SetInputs, "bluefish444" },
  VKey{ "outputs", SetOutputs, "bluefish444" },
  VKey{ "connectors", SetConnectors, "bluefish444" },
  VKey{ "driver", SetDriver, "bluefish444" },
};

std::string ListKeys( const VCardKind& i_rKind )
{
  std::string List;
  for( const VKey& rKey : Keys )
  {
    if( rKey.IsKnownTo( i_rKind ) )
    {
      List += std::string( List.empty() ? "" : ", " ) + rKey.m_pName;
    }
  }
  return List;
}

// Takes one "KEY=VALUE" off the front.
std::string ParseNext( std::string_view& io_rRest, VCardSpec& o_rSpec, std::set<std::string>& io_rSeen )
{
  const bool bInput = io_rRest.starts_with( "input=" );
  const std::string_view Item = bInput ? io_rRest : io_rRest.substr( 0, io_rRest.find( ',' ) );
  const size_t Equals = Item.find( '=' );
  const std::string Name( Item.substr( 0, Equals ) );
  const VCardKind& rKind = *o_rSpec.m_pKind;
  const auto Found = std::find_if( Keys.begin(), Keys.end(),
    [&]( const VKey& i_rKey ) { return Name == i_rKey.m_pName && i_rKey.IsKnownTo( rKind ); } );
  if( Found == Keys.end() )
  {
    return "no key is called \"" + Name + "\"; accepted: " + ListKeys( rKind );
  }
  if( Equals == std::string_view::npos || Equals + 1 == Item.size() )
  {
    return Name + ": has no value; accepted: " + Name + "=VALUE";
  }
  if( !io_rSeen.insert( Name ).second )
  {
    return Name + ": is given twice; accepted: each key once";
  }
  const std::string Reason = Found->m_pSet( o_rSpec, std::string( Item.substr( Equals + 1 ) ) );
  io_rRest.remove_prefix( Item.size() );
  return Reason.empty() ? Reason : Name + ": " + Reason;
}

// What can be judged only with all keys known.
std::string CheckTogether( const VCardSpec& i_rSpec, const std::set<std::string>& i_rSeen )
{
  if( i_rSeen.contains( "input" ) && i_rSeen.contains( "pattern" ) )
  {
    return "pattern: an input brings its own pictures; accepted: either pattern= or input=";
  }
  if( i_rSeen.contains( "loop" ) && !i_rSeen.contains( "input" ) )
  {
    return "loop: only an input can end; accepted: together with input=";
  }
  const bool bStandardKnown = i_rSpec.m_Standard || i_rSpec.m_Input.empty();
  if( bStandardKnown && i_rSpec.m_Timecode )
  {
    const std::string Reason = WhyNotAt( *i_rSpec.m_Timecode, KVZ::GetFramePeriod( i_rSpec.m_Standard.value_or( DefaultStandard ) ) );
    return Reason.empty() ? Reason : "timecode: " + Reason;
  }
  return {};
}

std::string ParseKeys( std::string_view i_Rest, VCardSpec& o_rSpec )
{
  std::set<std::string> Seen;
  for( bool bMore = true; bMore; )
  {
    const std::string Reason = ParseNext( i_Rest, o_rSpec, Seen );
    if( !Reason.empty() )
    {
      return Reason;
    }
    bMore = !i_Rest.empty();
    i_Rest.remove_prefix( bMore ? 1 : 0 );   // the comma
  }
  return CheckTogether( o_rSpec, Seen );
}

}

std::optional<VCardSpec> ParseCardSpec( std::string_view i_Text, std::string& o_rError )
{
  VCardSpec Spec;
  Spec.m_pKind = KindOfCardText( i_Text, o_rError );
  if( !Spec.m_pKind )
  {
    return std::nullopt;
  }
  const size_t Colon = i_Text.find( ':' );
  const std::string Reason = Colon == std::string_view::npos ? std::string() : ParseKeys( i_Text.substr( Colon + 1 ), Spec );
  if( !Reason.empty() )
  {
    o_rError = "card \"" + std::string( i_Text ) + "\": " + Reason;
    return std::nullopt;
  }
  return Spec;
}

}
