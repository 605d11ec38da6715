// Tracks: one entry for video, one for audio.
#pragma once

#include "FileIO/MkvIO/Codecs.h"

#include <matroska/KaxTracks.h>

namespace MkvIO
{

void FillVideoTrack( libmatroska::KaxTracks& io_rTracks, const KVZ::VideoFrameInfo& i_rVideo, const VVideoCodec& i_rCodec,
  uint32_t i_PeriodInNanoseconds );

void FillAudioTrack( libmatroska::KaxTracks& io_rTracks, const KVZ::AudioFrameInfo& i_rAudio, const VAudioCodec& i_rCodec );

}
