// Reads the sample number out of sound with the ramp: sample k of channel c is (k + 257 c) modulo 65536 as a 16-bit number, in the upper
// bits of longer samples.
#pragma once

#include <cstddef>
#include <cstdint>
#include <cstring>
#include <optional>

namespace TestSupport
{

struct VSamples
{
  const uint8_t* m_pBytes = nullptr;   // interleaved
  size_t m_Frames = 0;                 // samples a channel
  uint32_t m_Channels = 0;
  uint32_t m_Bytes = 2;   // of a sample: 2, 3 or 4
};

inline int32_t SampleAt( const VSamples& i_rSamples, size_t i_Frame, uint32_t i_Channel )
{
  const uint8_t* pSample = i_rSamples.m_pBytes + ( i_Frame * i_rSamples.m_Channels + i_Channel ) * i_rSamples.m_Bytes;
  uint32_t Sample = 0;
  std::memcpy( &Sample, pSample, i_rSamples.m_Bytes );
  const uint32_t Shift = 32 - 8 * i_rSamples.m_Bytes;
  return static_cast<int32_t>( Sample << Shift ) >> Shift;   // with its sign
}

// The number of the first sample, modulo 65536, if every sample of the first i_Carried channels follows the rule and the others are
// silent. Nothing otherwise: a gap, a repetition or mixed-up channels.
inline std::optional<uint16_t> ReadRamp( const VSamples& i_rSamples, uint32_t i_Carried )
{
  if( i_rSamples.m_Frames == 0 || i_rSamples.m_Channels == 0 )
  {
    return std::nullopt;
  }
  const uint32_t Shift = 8 * ( i_rSamples.m_Bytes - 2 );
  const auto First = static_cast<uint16_t>( SampleAt( i_rSamples, 0, 0 ) >> Shift );
  for( size_t Frame = 0; Frame < i_rSamples.m_Frames; ++Frame )
  {
    for( uint32_t Channel = 0; Channel < i_rSamples.m_Channels; ++Channel )
    {
      const auto Upper = static_cast<int32_t>( static_cast<int16_t>( First + Frame + 257 * Channel ) );
      const int32_t Expected = Channel < i_Carried ? Upper * ( 1 << Shift ) : 0;
      if( SampleAt( i_rSamples, Frame, Channel ) != Expected )
      {
        return std::nullopt;
      }
    }
  }
  return First;
}

}
