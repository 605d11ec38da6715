#include "FileIO/MkvIO/Cues.h"

#include "FileIO/MkvIO/Format.h"
#include "FileIO/MkvIO/TableElement.h"

#include <matroska/KaxCues.h>
#include <matroska/KaxCuesData.h>
#include <matroska/KaxSemantic.h>

namespace MkvIO
{

using namespace libmatroska;

namespace
{

void AppendPoint( VBytes& o_rBytes, uint64_t i_Time, uint64_t i_Track, uint64_t i_Position )
{
  const uint64_t Positions = NumberSize( EBML_ID( KaxCueTrack ), i_Track ) + NumberSize( EBML_ID( KaxCueClusterPosition ), i_Position );
  const uint64_t Point = NumberSize( EBML_ID( KaxCueTime ), i_Time ) + HeadSize( EBML_ID( KaxCueTrackPositions ), Positions ) + Positions;
  AppendHead( o_rBytes, EBML_ID( KaxCuePoint ), Point );
  AppendNumber( o_rBytes, EBML_ID( KaxCueTime ), i_Time );
  AppendHead( o_rBytes, EBML_ID( KaxCueTrackPositions ), Positions );
  AppendNumber( o_rBytes, EBML_ID( KaxCueTrack ), i_Track );
  AppendNumber( o_rBytes, EBML_ID( KaxCueClusterPosition ), i_Position );
}

}

bool WriteCues( KVZ::IOutputStream& o_rStream, const VClusterTable& i_rClusters, uint64_t i_Period )
{
  return WriteTable( o_rStream, EBML_ID( KaxCues ), 0, i_rClusters.Count(),
    [&]( VBytes& o_rBytes, size_t i_Frame )
    {
      const VClusterTable::VEntry Cluster = i_rClusters.At( i_Frame );
      AppendPoint( o_rBytes, i_Frame * i_Period, VideoTrackNumber, Cluster.m_Position );
      if( Cluster.m_bAudio )
      {
        AppendPoint( o_rBytes, i_Frame * i_Period, AudioTrackNumber, Cluster.m_Position );
      }
    } );
}

}
