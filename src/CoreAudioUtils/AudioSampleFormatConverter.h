// Conversion between the layouts of audio samples. Little-endian; any thread; no state.
#pragma once

#include "Core/VideoInterface/FrameRecords.h"

#include <cstddef>
#include <cstdint>

namespace CoreAudioUtils
{

// Bytes that a conversion of i_SourceSize bytes needs at its target; 0 for a source format without a sample size.
size_t GetConvertedSize( KVZ::IAudioSampleFormat::Enum i_Source, KVZ::IAudioSampleFormat::Enum i_Target, size_t i_SourceSize );

// Converts whole sample frames of the given description. o_pTarget has room for GetConvertedSize bytes and does not overlap the source.
//
// Integers move by their top bytes. Integers become floats over the full 32-bit range, while floats become integers as if they ran over the
// 16-bit range; nothing is clipped or dithered. False, with a line in the log, for equal formats and for a pair that is not supported.
bool ConvertSamples( const KVZ::AudioFrameInfo& i_rInfo, KVZ::IAudioSampleFormat::Enum i_Target, const uint8_t* i_pSource, size_t i_SourceSize,
  uint8_t* o_pTarget );

}
