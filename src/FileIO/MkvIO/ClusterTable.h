// Where the clusters of a file lie: 8 bytes a frame. From it come, when the file is closed, Cues and the two SeekHeads.
#pragma once

#include <cstddef>
#include <cstdint>
#include <deque>

namespace MkvIO
{

// The n-th entry is frame n's.
class VClusterTable
{
public:
  struct VEntry
  {
    uint64_t m_Position;   // relative to the segment's data
    bool m_bAudio;         // besides the block of video there is one of audio
  };

  void Add( const VEntry& i_rEntry ) { m_Entries.push_back( i_rEntry.m_Position << 1 | ( i_rEntry.m_bAudio ? 1 : 0 ) ); }
  void RemoveLast() { m_Entries.pop_back(); }
  size_t Count() const { return m_Entries.size(); }
  VEntry At( size_t i_Frame ) const { return { m_Entries[i_Frame] >> 1, ( m_Entries[i_Frame] & 1 ) != 0 }; }

private:
  std::deque<uint64_t> m_Entries;   // unlike a vector it needs no second copy of itself to grow
};

}
