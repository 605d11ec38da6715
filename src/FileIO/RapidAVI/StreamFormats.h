// What the headers say of the two streams. Plain functions of the description; any thread.
#pragma once

#include "Core/VideoInterface/FrameRecords.h"
#include "FileIO/RapidAVI/Format.h"
#include "FileIO/WriterSupport/BitmapHeader.h"

#include <boost/optional.hpp>

namespace RapidAVI
{

struct VFileDescription
{
  KVZ::IVideoPayload::Enum m_VideoPayload = KVZ::IVideoPayload::EUncompressed;
  KVZ::VideoFrameInfo m_Video{};   // as stored
  KVZ::AudioFrameInfo m_Audio{};   // as stored; empty without sound
  KVZ::VTimingRecord m_Timing{};
};

// False, with a line in the log that names the limit, for a description that the headers' fields cannot hold.
bool FitsHeaders( const VFileDescription& i_rFile );

// The numbers that follow. 0 where the frame rate is not known.
uint64_t GetFrameBytes( const VFileDescription& i_rFile );
uint64_t GetMicrosecondsPerFrame( const VFileDescription& i_rFile );
// Only tells readers what to expect: a rate that the field cannot hold becomes the largest.
uint32_t GetMaxBytesPerSecond( const VFileDescription& i_rFile );

VFourCC GetVideoChunkId( const VFileDescription& i_rFile );
constexpr VFourCC AudioChunkId = FourCC( "01wb" );

VStreamHeader MakeVideoStreamHeader( const VFileDescription& i_rFile );
VStreamHeader MakeAudioStreamHeader( const VFileDescription& i_rFile );

// "strf" of video; a palette may follow. A warning goes to the log for an image that every reader will show upside down.
WriterSupport::VBitmapHeader MakeBitmapHeader( const VFileDescription& i_rFile );

// 256 entries of blue, green, red and a fourth byte. Grey values are stored as indexes into it.
using VPalette = std::array<std::array<uint8_t, 4>, 256>;
boost::optional<VPalette> MakePalette( const VFileDescription& i_rFile );

VWaveFormat MakeWaveFormat( const KVZ::AudioFrameInfo& i_rAudio );

}
