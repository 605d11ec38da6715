// One captured frame: a header, the image and its audio in one block from the device's allocator.
//
//   0                     VVideoInputDataSourceFrame, within the first 4096 bytes
//   4096                  image bytes
//   4096 + image bytes    audio bytes, interleaved
//
// The block is asked for with room for the image rounded up to 4096, so the audio always fits.
#pragma once

#include "Core/VideoInterface/FrameRecords.h"
#include "Core/VideoInterface/Timecode.h"

#include <cstdint>

namespace VideoInputHAL
{

class IVideoInputAllocator;

struct VVideoInputDataSourceFrame
{
  static constexpr uint64_t HeaderSize = 4096;
  static constexpr uint64_t ImageAlignment = 4096;

  IVideoInputAllocator* m_pAllocator = nullptr;   // whoever holds the block can free it
  int32_t m_DeviceIndex = 0;
  KVZ::VideoFrameInfo m_VideoInfo;
  KVZ::AudioFrameInfo m_AudioInfo;   // all zero without audio
  KVZ::ITimecode m_Timecode;         // with its tick remainder
  uint32_t m_ImageBytes = 0;
  uint32_t m_ImageCapacity = 0;   // m_ImageBytes rounded up to ImageAlignment
  uint32_t m_AudioBytes = 0;
  uint32_t m_AudioCapacity = 0;
  double m_FrameScale = 1.0;     // written by the data source
  double m_DeliveryTime = 0.0;   // host seconds, written by the data source; 0 for a frame that is not timed

  uint8_t* Image() { return reinterpret_cast<uint8_t*>( this ) + HeaderSize; }
  const uint8_t* Image() const { return reinterpret_cast<const uint8_t*>( this ) + HeaderSize; }
  uint8_t* Audio() { return Image() + m_ImageBytes; }
  const uint8_t* Audio() const { return Image() + m_ImageBytes; }

  static constexpr uint64_t RoundUp( uint64_t i_Bytes ) { return ( i_Bytes + ImageAlignment - 1 ) / ImageAlignment * ImageAlignment; }
  // Bytes of the whole block.
  static constexpr uint64_t BlockSize( uint64_t i_ImageBytes, uint64_t i_AudioBytes ) { return HeaderSize + RoundUp( i_ImageBytes ) + i_AudioBytes; }
};

static_assert( sizeof( VVideoInputDataSourceFrame ) <= VVideoInputDataSourceFrame::HeaderSize );

// A block with what is known before its bytes are there; the device adds its index, what the audio is, and the timecode. Null without an allocator,
// and where memory has run out. Delivery thread.
VVideoInputDataSourceFrame* MakeFrame( IVideoInputAllocator* i_pAllocator, const KVZ::VideoFrameInfo& i_rInfo, uint64_t i_ImageBytes,
  uint64_t i_AudioBytes );

}
