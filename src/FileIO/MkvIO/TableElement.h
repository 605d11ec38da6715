// An element that holds a long row of small ones, written piece by piece so that it never lies in memory as a whole.
#pragma once

#include "Core/VideoInterface/Streams.h"
#include "FileIO/MkvIO/Elements.h"

namespace MkvIO
{

// i_AppendEntry( VBytes&, size_t ) appends the entry of an index and must give the same bytes each time: the row is put together twice, first
// for its size. False if the stream failed.
template<class TAppendEntry>
bool WriteTable( KVZ::IOutputStream& o_rStream, const libebml::EbmlId& i_rId, size_t i_Begin, size_t i_End, TAppendEntry i_AppendEntry )
{
  constexpr size_t PieceBytes = 65536;
  VBytes Bytes;
  Bytes.reserve( 2 * PieceBytes );
  uint64_t Size = 0;
  for( size_t Index = i_Begin; Index < i_End; ++Index )
  {
    Bytes.clear();
    i_AppendEntry( Bytes, Index );
    Size += Bytes.size();
  }
  Bytes.clear();
  AppendHead( Bytes, i_rId, Size );
  for( size_t Index = i_Begin; Index < i_End; ++Index )
  {
    i_AppendEntry( Bytes, Index );
    if( Bytes.size() >= PieceBytes )
    {
      if( !o_rStream.Write( Bytes.data(), Bytes.size() ) )
      {
        return false;
      }
      Bytes.clear();
    }
  }
  return o_rStream.Write( Bytes.data(), Bytes.size() );
}

}
