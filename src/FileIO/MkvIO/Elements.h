// Elements put together without the libraries' element trees: those that every frame needs, and the tables over all frames, for which a tree
// would take hundreds of bytes a frame. Ids and coded sizes are the libraries'.
#pragma once

#include <ebml/EbmlElement.h>

#include <cstdint>
#include <vector>

namespace MkvIO
{

using VBytes = std::vector<uint8_t>;

void AppendId( VBytes& o_rBytes, const libebml::EbmlId& i_rId );
// The coded size of an element's data, in as few bytes as it takes.
void AppendSize( VBytes& o_rBytes, uint64_t i_Size );
void AppendHead( VBytes& o_rBytes, const libebml::EbmlId& i_rId, uint64_t i_DataSize );
// A whole element that holds an unsigned number, in as few bytes as it takes.
void AppendNumber( VBytes& o_rBytes, const libebml::EbmlId& i_rId, uint64_t i_Value );

// The head of a Void that takes so many bytes with its head, SmallestVoid or more.
constexpr uint64_t SmallestVoid = 2;
void AppendVoidHead( VBytes& o_rBytes, uint64_t i_WholeSize );

// Bytes of a head.
uint64_t HeadSize( const libebml::EbmlId& i_rId, uint64_t i_DataSize );
// Bytes of what AppendNumber appends.
uint64_t NumberSize( const libebml::EbmlId& i_rId, uint64_t i_Value );

}
