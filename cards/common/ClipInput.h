// What a card's input= shows: how FFmpeg opens it, what it found there, and the command that turns it into a signal.
#pragma once

#include "cards/common/CardKinds.h"
#include "cards/common/Picture.h"

#include <optional>
#include <string>
#include <vector>

namespace VirtualCards
{

struct VClipInput
{
  std::vector<std::string> m_Options;   // the input's part of FFmpeg's command line
  bool m_bOptionsForm = false;          // given as options: may be live, and what FFmpeg found is known only in part
  uint32_t m_Width = 0;                 // pixels as shown; 0 for not known
  uint32_t m_Height = 0;
  double m_FrameRate = 0;   // frames a second; 0 for not known
  bool m_bInterlaced = false;
  uint32_t m_AudioChannels = 0;   // of the first sound track; 0 for none
  uint32_t m_AudioInput = 0;      // which of several inputs has it; pictures are those of the first
};

// Splits text as a shell does: blanks part the words; '...', "..." and \ quote. Empty for an unfinished quotation.
std::optional<std::vector<std::string>> SplitOptions( const std::string& i_rText );

// Opens the input once to see what it is. Empty, with one line of reason, if FFmpeg cannot open it or finds no pictures.
std::optional<VClipInput> ProbeClip( const std::string& i_rText, std::string& o_rError );

// Nearest in size, then in rate, then in scan, of those that the kind carries. The default where the input's size is not known.
KVZ::IVideoStandard::Enum NearestStandard( const VCardKind& i_rKind, const VClipInput& i_rInput );

// FFmpeg's command: raw pictures of this format on descriptor 1, and sound, if there is any, as signed 32-bit samples at 48 kHz with
// ClipSoundChannels() channels on descriptor 3. Pictures of the standard's size and rate pass unscaled and uncounted; others are scaled
// into the frame with black borders, and repeated or left out to the standard's rate.
std::vector<std::string> ClipCommand( const VClipInput& i_rInput, const VPictureFormat& i_rFormat );

constexpr int ClipSoundDescriptor = 3;

}
