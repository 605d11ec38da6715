// The RIFFs of a file, one after another: each takes frames until it has reached its limit, then it gets its indexes and the next one begins.
// One thread at a time.
#pragma once

#include "Core/VideoInterface/BufferAllocator.h"
#include "FileIO/RapidAVI/Index.h"

namespace RapidAVI
{

// Bytes of the chunks of a RIFF, each counted with 16 more, at which no further frame begins in it.
struct VSegmentLimits
{
  uint64_t m_First = 0x3E800000;
  uint64_t m_Following = 0x7D000000;
};

class VSegments
{
public:
  using VSpans = std::vector<KVZ::IOutputStream::VSpan>;

  // Both must outlive this.
  VSegments( VChunkWriter& io_rOut, VIndex& io_rIndex, const VSegmentLimits& i_rLimits );

  // Behind the headers, in the first RIFF.
  bool Begin() { return m_rOut.GetMark( m_Whole ); }

  // Nothing has failed, or been broken off, half way. No frame may be written otherwise.
  bool IsWhole() const { return !m_rOut.HasFailed() && !m_bFinishing; }

  // A chunk for the image and one for each buffer of sound, in one write where they stay together. A frame that reaches the limit still ends
  // in the RIFF that it began in, its sound in the next one. False, with nothing written, for a chunk that is too long.
  bool WriteFrame( const VSpans& i_rVideo, const KVZ::VBufferList& i_rAudio );

  // Indexes what has come since the last RIFF and closes it. After a failure everything from the last whole frame on is written over. Leaves
  // the stream at the end of the last RIFF.
  bool Finish();

private:
  bool FitsChunks( const VSpans& i_rVideo, const KVZ::VBufferList& i_rAudio ) const;
  bool BeginMovi();
  bool Collect( EStream i_Stream, const KVZ::IOutputStream::VSpan* i_pSpans, size_t i_Count );
  bool CollectAudio( const KVZ::VBufferList& i_rAudio );
  bool Flush();
  void DropCollected();
  bool IsFull() const;
  bool FinishRiff();

  VChunkWriter& m_rOut;
  VIndex& m_rIndex;
  const VSegmentLimits m_Limits;

  VChunkWriter::VMark m_Whole;   // behind the last whole frame or RIFF
  bool m_bFinishing = false;
  uint32_t m_FinishedRiffs = 0;
  uint64_t m_RiffPosition = 0;
  uint64_t m_MoviBase = 0;
  uint64_t m_ByteCount = 0;

  // Of chunks that wait for the write. The vectors are kept for their memory.
  std::vector<VChunkHeader> m_Headers;
  VSpans m_Spans;
  std::vector<VIndexEntry> m_Entries;
  uint64_t m_CollectedBytes = 0;
};

}
