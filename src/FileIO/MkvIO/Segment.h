// The segment of a file, from its first byte to its closing. Times are in the file's unit.
#pragma once

#include "FileIO/MkvIO/Cluster.h"
#include "FileIO/MkvIO/ClusterTable.h"
#include "FileIO/MkvIO/MkvIOCallback.h"
#include "FileIO/MkvIO/SeekHead.h"

#include <matroska/KaxInfo.h>
#include <matroska/KaxTags.h>
#include <matroska/KaxTracks.h>

#include <string>

namespace MkvIO
{

struct VSegmentStart
{
  const char* m_pWritingApplication;
  uint64_t m_Period;   // of a frame
  libmatroska::KaxTracks& m_rTracks;
  libmatroska::KaxTags& m_rTags;
};

class VSegment
{
public:
  explicit VSegment( VMkvIOCallback& io_rFile ) : m_rFile( io_rFile ) {}

  // Everything before the first frame. Throws std::exception if the stream failed.
  void Begin( const VSegmentStart& i_rStart );

  uint64_t GetFrameCount() const { return m_Clusters.Count(); }

  // The next frame, at once and from the buffers' own memory. False if the stream failed, now or before.
  bool AddFrame( const KVZ::VBufferList& i_rVideo, const KVZ::VBufferList& i_rAudio );

  // Writes tables, duration and size, behind the last whole frame also where the stream has failed since. False, or std::exception, if the
  // stream failed now: the size is then still marked unknown.
  bool Finish();

private:
  uint64_t Relative( uint64_t i_Position ) const { return i_Position - m_DataStart; }
  void BeginSegment();
  void RenderIndexed( libebml::EbmlMaster& io_rElement );
  bool Write( const VBytes& i_rBytes ) { return m_rFile.Stream().Write( i_rBytes.data(), i_rBytes.size() ); }
  bool WriteAt( uint64_t i_Position, const VBytes& i_rBytes );
  template<class TWriteTable>
  bool AppendTable( const libebml::EbmlId& i_rId, TWriteTable i_WriteTable );
  bool AppendTables();
  bool RewriteInfo();
  bool CoverRemains();
  bool WriteSize();

  VMkvIOCallback& m_rFile;
  libmatroska::KaxInfo m_Info;
  VMainSeekHead m_SeekHead;
  VCluster m_Cluster;
  VClusterTable m_Clusters;
  uint64_t m_Period = 0;
  // Positions in the file
  uint64_t m_DataStart = 0;
  uint64_t m_VoidPosition = 0;
  uint64_t m_End = 0;   // of the last whole frame
};

}
