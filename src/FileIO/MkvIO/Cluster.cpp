#include "FileIO/MkvIO/Cluster.h"

#include "FileIO/MkvIO/Format.h"
#include "FileIO/WriterSupport/BufferSpans.h"

#include <matroska/KaxCluster.h>
#include <matroska/KaxSemantic.h>

namespace MkvIO
{

using namespace libmatroska;

namespace
{

// More than the heads of a cluster with two blocks take: the spans point into them, so they must never move.
constexpr size_t MostHeadBytes = 256;

// Before the frame's bytes in a block: the track's number as a coded size, the time relative to the cluster's in two bytes, the flags.
constexpr uint64_t BlockHeadBytes = 4;

uint64_t BlockDataSize( uint64_t i_FrameBytes ) { return BlockHeadBytes + i_FrameBytes; }

uint64_t GroupDataSize( uint64_t i_FrameBytes, uint64_t i_Duration )
{
  const uint64_t Block = BlockDataSize( i_FrameBytes );
  return HeadSize( EBML_ID( KaxBlock ), Block ) + Block + NumberSize( EBML_ID( KaxBlockDuration ), i_Duration );
}

uint64_t GroupSize( uint64_t i_FrameBytes, uint64_t i_Duration )
{
  const uint64_t Data = GroupDataSize( i_FrameBytes, i_Duration );
  return i_FrameBytes == 0 ? 0 : HeadSize( EBML_ID( KaxBlockGroup ), Data ) + Data;
}

}

const std::vector<KVZ::IOutputStream::VSpan>& VCluster::Compose( const VClusterTimes& i_rTimes, const KVZ::VBufferList& i_rVideo,
  const KVZ::VBufferList& i_rAudio )
{
  m_Spans.clear();
  m_Heads.clear();
  m_Heads.reserve( MostHeadBytes );
  m_Head = 0;
  const VBlock Video{ VideoTrackNumber, i_rVideo, KVZ::GetTotalSize( i_rVideo ) };
  const VBlock Audio{ AudioTrackNumber, i_rAudio, KVZ::GetTotalSize( i_rAudio ) };
  const uint64_t Data = NumberSize( EBML_ID( KaxClusterTimecode ), i_rTimes.m_Start ) + GroupSize( Video.m_Bytes, i_rTimes.m_Duration ) +
    GroupSize( Audio.m_Bytes, i_rTimes.m_Duration );
  AppendHead( m_Heads, EBML_ID( KaxCluster ), Data );
  AppendNumber( m_Heads, EBML_ID( KaxClusterTimecode ), i_rTimes.m_Start );
  AddBlock( Video, i_rTimes.m_Duration );
  AddBlock( Audio, i_rTimes.m_Duration );
  CloseHead();
  return m_Spans;
}

void VCluster::AddBlock( const VBlock& i_rBlock, uint64_t i_Duration )
{
  if( i_rBlock.m_Bytes == 0 )
  {
    return;
  }
  AppendHead( m_Heads, EBML_ID( KaxBlockGroup ), GroupDataSize( i_rBlock.m_Bytes, i_Duration ) );
  AppendHead( m_Heads, EBML_ID( KaxBlock ), BlockDataSize( i_rBlock.m_Bytes ) );
  AppendSize( m_Heads, i_rBlock.m_Track );
  m_Heads.insert( m_Heads.end(), { 0, 0, 0 } );   // at the cluster's own time; no lacing
  CloseHead();
  WriterSupport::AppendSpans( m_Spans, i_rBlock.m_rBuffers );
  AppendNumber( m_Heads, EBML_ID( KaxBlockDuration ), i_Duration );
}

void VCluster::CloseHead()
{
  if( m_Head != m_Heads.size() )
  {
    m_Spans.emplace_back( m_Heads.data() + m_Head, m_Heads.size() - m_Head );
    m_Head = m_Heads.size();
  }
}

}
