// The records of an AVI file (RIFF) and of its OpenDML extension 1.02, as they lie on disk: little-endian, without padding. A field that no
// name is given for here is zero.
#pragma once

#include <array>
#include <bit>
#include <cstddef>
#include <cstdint>

namespace RapidAVI
{

static_assert( std::endian::native == std::endian::little, "Records go to disk as they lie in memory." );

using VFourCC = std::array<char, 4>;

constexpr VFourCC FourCC( const char ( &i_rText )[5] ) { return { i_rText[0], i_rText[1], i_rText[2], i_rText[3] }; }

#pragma pack( push, 1 )
struct VChunkHeader
{
  VFourCC m_Id{};
  uint32_t m_Size = 0;   // bytes that follow, without the one that pads to an even number
};

// "avih"
struct VMainHeader
{
  uint32_t m_MicrosecondsPerFrame = 0;
  uint32_t m_MaxBytesPerSecond = 0;
  uint32_t m_PaddingGranularity = 0;
  uint32_t m_Flags = 0;
  uint32_t m_TotalFrames = 0;
  uint32_t m_InitialFrames = 0;
  uint32_t m_Streams = 0;
  uint32_t m_SuggestedBufferSize = 0;
  uint32_t m_Width = 0;
  uint32_t m_Height = 0;
  uint32_t m_Reserved[4]{};
};
static_assert( sizeof( VMainHeader ) == 56 );

// "strh"
struct VStreamHeader
{
  VFourCC m_Type{};
  VFourCC m_Handler{};
  uint32_t m_Flags = 0;
  uint16_t m_Priority = 0;
  uint16_t m_Language = 0;
  uint32_t m_InitialFrames = 0;
  uint32_t m_Scale = 0;   // rate / scale units a second
  uint32_t m_Rate = 0;
  uint32_t m_Start = 0;
  uint32_t m_Length = 0;   // in these units
  uint32_t m_SuggestedBufferSize = 0;
  uint32_t m_Quality = 0xFFFFFFFF;   // the default one
  uint32_t m_SampleSize = 0;
  uint16_t m_Left = 0;
  uint16_t m_Top = 0;
  uint16_t m_Right = 0;
  uint16_t m_Bottom = 0;
};
static_assert( sizeof( VStreamHeader ) == 56 );

// "strf" of audio, the extensible form
struct VWaveFormat
{
  uint16_t m_FormatTag = 0xFFFE;
  uint16_t m_Channels = 0;
  uint32_t m_SampleRate = 0;
  uint32_t m_BytesPerSecond = 0;
  uint16_t m_BlockAlign = 0;
  uint16_t m_BitsPerSample = 0;
  uint16_t m_ExtensionSize = 22;
  uint16_t m_ValidBitsPerSample = 0;
  uint32_t m_ChannelMask = 0;
  std::array<uint8_t, 16> m_SubFormat{};
};
static_assert( sizeof( VWaveFormat ) == 40 );

// Begins an "indx" chunk. As many places for entries follow as the chunk has room for.
struct VSuperIndexHeader
{
  uint16_t m_LongsPerEntry = 4;
  uint8_t m_SubType = 0;
  uint8_t m_Type = 0;   // an index of indexes
  uint32_t m_EntriesInUse = 0;
  VFourCC m_ChunkId{};
  uint32_t m_Reserved[3]{};
};
static_assert( sizeof( VSuperIndexHeader ) == 24 );

struct VSuperIndexEntry
{
  uint64_t m_Position = 0;   // of the "ix" chunk in the file
  uint32_t m_Size = 0;       // of that chunk, its header included
  uint32_t m_Duration = 0;   // entries in it
};
static_assert( sizeof( VSuperIndexEntry ) == 16 );

constexpr size_t SuperIndexEntries = 1024;

// Begins an "ix00" or "ix01" chunk.
struct VStandardIndexHeader
{
  uint16_t m_LongsPerEntry = 2;
  uint8_t m_SubType = 0;
  uint8_t m_Type = 1;   // an index of chunks
  uint32_t m_EntriesInUse = 0;
  VFourCC m_ChunkId{};
  uint64_t m_BasePosition = 0;
  uint32_t m_Reserved = 0;
};
static_assert( sizeof( VStandardIndexHeader ) == 24 );

struct VStandardIndexEntry
{
  uint32_t m_Offset = 0;   // of the chunk's data, from the base
  uint32_t m_Size = 0;
};
static_assert( sizeof( VStandardIndexEntry ) == 8 );

// Of "idx1"
struct VOldIndexEntry
{
  VFourCC m_ChunkId{};
  uint32_t m_Flags = 0x10;   // a key frame
  uint32_t m_Offset = 0;     // of the chunk, from the four characters "movi"
  uint32_t m_Size = 0;
};
static_assert( sizeof( VOldIndexEntry ) == 16 );
#pragma pack( pop )

constexpr uint32_t ExtendedHeaderSize = 248;   // "dmlh": the number of frames, then zeros

}
