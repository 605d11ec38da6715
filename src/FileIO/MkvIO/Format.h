// The layout of a Matroska file as this writer makes it.
//
//   EBML head
//   Segment             its size is marked unknown until the file is closed, so that a file that never was can be read to its last cluster
//     Void              gives its place to the main SeekHead when the file is closed
//     Info, Tracks, Tags
//     Cluster           one for each frame: Timecode, then one BlockGroup a track
//     Cues
//     SeekHead          the secondary one: the clusters for which the main one has no room
#pragma once

#include <cstdint>

namespace MkvIO
{

constexpr uint64_t TimecodeScale = 1000;   // nanoseconds; the unit of all times in the file

constexpr uint64_t SeekHeadRoom = 2000;   // data bytes of the Void
// The main SeekHead takes no more clusters when fewer bytes are left: they are for Cues and the secondary SeekHead.
constexpr uint64_t SeekHeadReserve = 75;

constexpr int SegmentSizeBytes = 5;
constexpr uint64_t LargestSegment = ( uint64_t{ 1 } << ( 7 * SegmentSizeBytes ) ) - 2;   // bytes of data; all ones stand for "unknown"

constexpr uint64_t VideoTrackNumber = 1;
constexpr uint64_t AudioTrackNumber = 2;

}
