// The layout of a tvid file. All integers are little-endian, nothing is padded.
//
//   fixed header     48 bytes, below
//   internal and external attribute block
//   frame records    video bytes, whose number follows from the stored description; with audio a uint32 length and as many bytes
//   index            uint64 count, then count times uint64 key and uint64 position of the record, in ascending key order
//
// A file whose index position is 0 was never closed. It has no index.
#pragma once

#include <bit>
#include <cstdint>

namespace TarvoVideo
{

static_assert( std::endian::native == std::endian::little, "Records go to disk as they lie in memory." );

#pragma pack( push, 1 )
struct VFixedHeader
{
  char m_Magic[20] = { '#', '#', '#', 'T', 'a', 'r', 'v', 'o', 'V', 'i', 'd', 'e', 'o', 'F', 'i', 'l', 'e', '#', '#', '#' };
  uint32_t m_Signature = 0x9F31C19C;
  uint32_t m_MajorVersion = 1;
  uint32_t m_MinorVersion = 2;
  uint64_t m_Kind = 1;
  uint64_t m_IndexPosition = 0;
};

struct VIndexEntry
{
  uint64_t m_Key;
  uint64_t m_Position;
};
#pragma pack( pop )

static_assert( sizeof( VFixedHeader ) == 48 );
static_assert( sizeof( VIndexEntry ) == 16 );

constexpr uint64_t IndexPositionOffset = 40;

}
