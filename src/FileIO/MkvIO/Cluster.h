// One frame as a cluster: the heads of its elements, put around the frame's own memory.
#pragma once

#include "Core/VideoInterface/Streams.h"
#include "FileIO/MkvIO/Elements.h"

#include <vector>

namespace MkvIO
{

// Times are in the file's unit.
struct VClusterTimes
{
  uint64_t m_Start;
  uint64_t m_Duration;
};

class VCluster
{
public:
  // What the cluster is written from, in order: valid until the next call and while the buffers live. A list without a byte gives no block.
  const std::vector<KVZ::IOutputStream::VSpan>& Compose( const VClusterTimes& i_rTimes, const KVZ::VBufferList& i_rVideo,
    const KVZ::VBufferList& i_rAudio );

private:
  struct VBlock
  {
    uint64_t m_Track;
    const KVZ::VBufferList& m_rBuffers;
    uint64_t m_Bytes;
  };

  void AddBlock( const VBlock& i_rBlock, uint64_t i_Duration );
  void CloseHead();

  VBytes m_Heads;      // of all elements, one after another
  size_t m_Head = 0;   // where the bytes begin that are not among the spans yet
  std::vector<KVZ::IOutputStream::VSpan> m_Spans;
};

}
