// Cues: for every block of every frame its time, its track and its cluster, in ascending order of time.
#pragma once

#include "Core/VideoInterface/Streams.h"
#include "FileIO/MkvIO/ClusterTable.h"

namespace MkvIO
{

// i_Period is the frame period in the file's unit. False if the stream failed.
bool WriteCues( KVZ::IOutputStream& o_rStream, const VClusterTable& i_rClusters, uint64_t i_Period );

}
