// What a virtual card is told to be, in one text:
//
//   KIND[:KEY=VALUE[,KEY=VALUE]...]
//
//   standard=NAME     default HD_1920_1080P_2500, with input= the one nearest to the clip
//   pattern=bars|counter|noise
//   timecode=HH:MM:SS:FF | HH:MM:SS;FF | none       ";" is drop-frame
//   audio=tone|ramp|silence|none                    default tone; with input= the clip's own sound
//   channels=N        embedded channels the signal carries, 1 to 16
//   script=FILE       JSON list of events on the card's own frame count
//   speed=X           frame rate factor; the tick values stay those of the standard
//   loop=1|0          when the input ends: begin again, or lose the signal
//   input=REST        comes last and takes the rest, commas and all: a file or URL, or FFmpeg input options where it begins with "-"
//
// A card of the kind bluefish444 knows these as well:
//
//   inputs=N          input channels, 0 to 4, all with this signal; default 1
//   outputs=N         output channels, 0 to 4; default 0
//   connectors=N      connectors of the inputs, 0 to 4; default one for each input
//   driver=new|old    an old driver does not answer queries about the card's features
//
// Commas part the keys; a value may hold colons and equals signs.
#pragma once

#include "cards/common/CardKinds.h"
#include "cards/common/TimecodeTrack.h"

#include <optional>
#include <string>
#include <string_view>

namespace VirtualCards
{

enum class EPattern
{
  Bars,
  Counter,
  Noise
};

enum class EAudio
{
  Tone,
  Ramp,
  Silence,
  None
};

struct VCardSpec
{
  const VCardKind* m_pKind = nullptr;
  std::optional<KVZ::IVideoStandard::Enum> m_Standard;   // empty: as the default says
  EPattern m_Pattern = EPattern::Bars;
  std::optional<VTimecodeLabel> m_Timecode = VTimecodeLabel();   // empty: the signal carries none
  std::optional<EAudio> m_Audio;                                 // empty: as the default says
  uint32_t m_Channels = 16;
  std::string m_Script;
  double m_Speed = 1.0;
  bool m_bLoop = true;
  std::string m_Input;

  // bluefish444 alone
  uint32_t m_Inputs = 1;
  uint32_t m_Outputs = 0;
  std::optional<uint32_t> m_Connectors;   // empty: as the default says
  bool m_bOldDriver = false;
};

constexpr KVZ::IVideoStandard::Enum DefaultStandard = KVZ::IVideoStandard::EHD_1920_1080P_2500;

// Empty, with one line that names the key, the reason and what would be accepted, if the text cannot be understood. Files are not opened.
std::optional<VCardSpec> ParseCardSpec( std::string_view i_Text, std::string& o_rError );

}
