// The sound that a virtual signal carries, and its form in a client's memory.
#pragma once

#include "cards/common/CardSpec.h"

#include <cstdint>
#include <vector>

namespace VirtualCards
{

// How a client wants interleaved samples.
struct VSoundLayout
{
  uint32_t m_Bits = 16;   // 16, 24 or 32, signed
  uint32_t m_Channels = 2;

  size_t BytesPerFrame() const { return size_t{ m_Bits } / 8 * m_Channels; }
};

// The sound of one frame. Made signals are functions of the sample number; a clip's samples are carried along.
struct VSound
{
  EAudio m_Audio = EAudio::None;
  bool m_bClip = false;            // m_Clip counts instead of m_Audio
  uint32_t m_SignalChannels = 0;   // embedded in the signal; further ones that a client asks for are silent
  uint64_t m_FirstSample = 0;
  uint32_t m_Samples = 0;        // per channel
  std::vector<int32_t> m_Clip;   // interleaved, of m_ClipChannels
  uint32_t m_ClipChannels = 0;

  bool Exists() const { return m_bClip || m_Audio != EAudio::None; }

  // Fills i_rLayout.BytesPerFrame() * m_Samples bytes.
  //
  //   tone: 1 kHz at -18 dBFS, each channel a sixteenth of a turn further on
  //   ramp: sample k of channel c is (k + 257 c) modulo 65536 as a 16-bit number; longer samples hold it in their upper bits
  void Write( const VSoundLayout& i_rLayout, uint8_t* o_pBytes ) const;
};

}
