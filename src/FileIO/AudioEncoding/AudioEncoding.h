// Brings captured audio to the layout that a file stores. No compression exists. Any thread; no state.
#pragma once

#include "Core/VideoInterface/BufferAllocator.h"
#include "Core/VideoInterface/FrameRecords.h"

namespace AudioEncoding
{

// What a payload stores of a source format. An unsupported payload leaves the stored format as it was, with a line in the log. The flag says
// whether the two formats differ afterwards.
void SampleFormatForPayloadFormat( KVZ::IAudioPayload::Enum i_Payload, KVZ::IAudioSampleFormat::Enum i_Source,
  KVZ::IAudioSampleFormat::Enum& io_rStored, bool& o_rConversionNeeded );

// Drops surplus channels and converts, buffer by buffer. Without a payload or a full description of the frame's audio the list becomes empty.
// False, with a line in the log and the list as it stood at that moment, if the frame cannot be stored.
bool EncodeIfRequired( KVZ::IBufferAllocator& i_rAllocator, KVZ::VBufferList& io_rAudio, const KVZ::AudioFrameInfo& i_rInfo,
  KVZ::IAudioPayload::Enum i_Payload, KVZ::IAudioSampleFormat::Enum i_StoredFormat, uint32_t i_StoredChannels );

}
