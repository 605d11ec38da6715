// Walks a JPEG image (ITU-T T.81, annex B) and lists its segments, without decoding anything.
//
// Any thread; each call works on what it is given alone. What a refusal is about goes to the log, category "JPEGIO".
#pragma once

#include "Core/VideoInterface/Streams.h"

#include <cstddef>
#include <cstdint>
#include <vector>

namespace JPEGIO
{

namespace Marker
{
constexpr uint8_t Stuffing = 0x00;   // no marker: a byte FF of entropy coded data
constexpr uint8_t StartOfImage = 0xD8;
constexpr uint8_t EndOfImage = 0xD9;
constexpr uint8_t StartOfScan = 0xDA;
constexpr uint8_t Application0 = 0xE0;
}

// Packed: copy its fields, take no reference to them.
#pragma pack( push, 1 )
struct VJPEGSegment
{
  uint8_t m_Marker = 0;      // the byte behind FF
  uint64_t m_Position = 0;   // of the marker's FF, in the stream
  uint64_t m_Length = 0;     // bytes, the marker's two included; a scan's entropy coded data lies behind it
};
#pragma pack( pop )
static_assert( sizeof( VJPEGSegment ) == 17 );

// The image reaches from the stream's position to i_Size, counted from the stream's beginning. True for a whole image, from SOI to EOI.
// The list is replaced; after a refusal it holds what was found up to there.
bool ParseJPEGSegments( KVZ::IInputStreamSeekable& io_rStream, uint64_t i_Size, std::vector<VJPEGSegment>& o_rSegments );

// The same for an image in memory.
bool ParseJPEGSegments( const uint8_t* i_pImage, size_t i_Size, std::vector<VJPEGSegment>& o_rSegments );

}
