// The text form of a card's events.
//
//   [ { "frame": 100, "do": "signal-loss", "frames": 25 }, { "frame": 200, "do": "format", "standard": "HD_1280_720P_5000" } ]
#pragma once

#include "cards/common/CardKinds.h"
#include "cards/common/SignalTimeline.h"

#include <optional>
#include <string>
#include <string_view>
#include <vector>

namespace VirtualCards
{

// A list of events, as in a script file. Empty, with one line of reason, if it cannot be understood: the line of the JSON text, or the
// index of the event (from 0) and the key, and what would be accepted. i_Standard is what the signal begins with.
std::optional<std::vector<VCardEvent>> ParseEvents( const VCardKind& i_rKind, KVZ::IVideoStandard::Enum i_Standard, std::string_view i_Text,
  std::string& o_rError );

// One event without "frame", to happen at once.
std::optional<VCardEvent> ParseEvent( const VCardKind& i_rKind, KVZ::IVideoStandard::Enum i_Standard, std::string_view i_Text,
  std::string& o_rError );

// The same as ParseEvents for the content of a file; a reason names the file.
std::optional<std::vector<VCardEvent>> ReadEvents( const VCardKind& i_rKind, KVZ::IVideoStandard::Enum i_Standard, const std::string& i_rPath,
  std::string& o_rError );

}
