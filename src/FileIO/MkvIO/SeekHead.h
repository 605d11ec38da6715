// The SeekHeads: where the elements of the segment lie. The main one stands at the beginning, in the place of a Void; the clusters for which
// it has no room are in the secondary one at the end.
#pragma once

#include "Core/VideoInterface/Streams.h"
#include "FileIO/MkvIO/ClusterTable.h"
#include "FileIO/MkvIO/Elements.h"

namespace MkvIO
{

class VMainSeekHead
{
public:
  // Positions are relative to the segment's data.
  void Add( const libebml::EbmlId& i_rId, uint64_t i_Position );

  // As many clusters from the first one on as leave room for what is added later. The number of those taken.
  size_t AddClusters( const VClusterTable& i_rClusters );

  // The SeekHead, followed by a Void: as many bytes as the Void whose place it takes.
  VBytes FillPlace() const;

private:
  VBytes m_Data;
};

// The clusters from i_First on. False if the stream failed.
bool WriteSecondarySeekHead( KVZ::IOutputStream& o_rStream, const VClusterTable& i_rClusters, size_t i_First );

}
