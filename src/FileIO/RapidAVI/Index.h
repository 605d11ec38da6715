// Where the chunks of a file lie, in the three forms that AVI has: the standard indexes "ix00" and "ix01" of each RIFF, the old index "idx1" of
// the first one, and the super indexes "indx" that tell where the standard ones are. One thread at a time.
#pragma once

#include "FileIO/RapidAVI/ChunkWriter.h"

#include <deque>
#include <vector>

namespace RapidAVI
{

enum EStream : uint32_t
{
  VideoStream = 0,
  AudioStream = 1
};

struct VIndexEntry
{
  uint64_t m_Position;   // of the chunk's data in the file
  uint32_t m_Size;
  EStream m_Stream;
};

// Holds the entries of one RIFF at a time, 16 bytes each.
class VIndex
{
public:
  // The id of each stream's chunks, by EStream.
  explicit VIndex( std::vector<VFourCC> i_ChunkIds );

  VFourCC GetChunkId( EStream i_Stream ) const { return m_Streams[i_Stream].m_ChunkId; }
  size_t CountStreams() const { return m_Streams.size(); }
  // Video chunks in the whole file.
  uint64_t CountFrames() const { return m_Frames; }

  // All of them or, where memory has run out, none.
  void Add( const std::vector<VIndexEntry>& i_rEntries );
  void RemoveLast( size_t i_Entries );

  // The bytes that the standard indexes and the old one would take with so many entries more.
  uint64_t GetStoredSize( size_t i_MoreEntries ) const;

  // i_Base is the position behind the four characters "movi". A call that failed may be repeated.
  bool WriteStandardIndexes( VChunkWriter& io_rOut, uint64_t i_Base );
  bool WriteOldIndex( VChunkWriter& io_rOut, uint64_t i_Base ) const;
  // The standard indexes just written go into the super indexes; the entries are those of the next RIFF from here on. Never
  // throws.
  void FinishRiff();

  // Into the room of an "indx" chunk whose content begins there. Records that there is no room for are left out: their frames can still be
  // read one after another.
  bool WriteSuperIndex( VChunkWriter& io_rOut, uint64_t i_Position, EStream i_Stream ) const;

private:
  struct VStream
  {
    VFourCC m_ChunkId;
    uint32_t m_Entries = 0;
    VSuperIndexEntry m_Newest{};   // of the RIFF that is about to be finished
    std::vector<VSuperIndexEntry> m_SuperIndex{};
  };

  bool WriteStandardIndex( VChunkWriter& io_rOut, uint64_t i_Base, EStream i_Stream );

  std::vector<VStream> m_Streams;
  std::deque<VIndexEntry> m_Entries;
  uint64_t m_Frames = 0;
};

}
