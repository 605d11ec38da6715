// The stored form of an attribute map, the same in every container of ours that keeps one.
//
//   uint32 number of entries, then for each in ascending byte order of the keys:
//   uint32 key length, the key, uint32 type tag, the value; a string value is its uint32 length and its bytes. Little-endian, no padding.
#pragma once

#include "Core/VideoInterface/VideoAttributes.h"

#include <string>

namespace WriterSupport
{

// In one write. False if a text is longer than its length field can say, or if the write failed.
bool WriteAttributeBlock( KVZ::IOutputStream& o_rStream, const KVZ::IVideoAttributes& i_rAttributes );

// Replaces the map. i_Available is what the stream still holds: nothing longer is believed. False, with one line that says why, for a block
// that is cut short or damaged.
bool ReadAttributeBlock( KVZ::IInputStream& i_rStream, uint64_t i_Available, KVZ::IVideoAttributes& o_rAttributes, std::string& o_rError );

}
