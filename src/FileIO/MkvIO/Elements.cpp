#include "FileIO/MkvIO/Elements.h"

#include <ebml/EbmlVoid.h>

#include <algorithm>
#include <bit>

namespace MkvIO
{

namespace
{

// Bytes of an unsigned number.
uint64_t NumberBytes( uint64_t i_Value ) { return std::max<uint64_t>( 1, ( std::bit_width( i_Value ) + 7 ) / 8 ); }

}

void AppendId( VBytes& o_rBytes, const libebml::EbmlId& i_rId )
{
  uint8_t Id[4];
  i_rId.Fill( Id );
  o_rBytes.insert( o_rBytes.end(), Id, Id + i_rId.GetLength() );
}

void AppendSize( VBytes& o_rBytes, uint64_t i_Size )
{
  uint8_t Size[8];
  const int Length = libebml::CodedSizeLength( i_Size, 0 );
  libebml::CodedValueLength( i_Size, Length, Size );
  o_rBytes.insert( o_rBytes.end(), Size, Size + Length );
}

void AppendHead( VBytes& o_rBytes, const libebml::EbmlId& i_rId, uint64_t i_DataSize )
{
  AppendId( o_rBytes, i_rId );
  AppendSize( o_rBytes, i_DataSize );
}

void AppendNumber( VBytes& o_rBytes, const libebml::EbmlId& i_rId, uint64_t i_Value )
{
  const uint64_t Length = NumberBytes( i_Value );
  AppendHead( o_rBytes, i_rId, Length );
  for( uint64_t Left = Length; Left != 0; --Left )
  {
    o_rBytes.push_back( static_cast<uint8_t>( i_Value >> ( 8 * ( Left - 1 ) ) ) );
  }
}

void AppendVoidHead( VBytes& o_rBytes, uint64_t i_WholeSize )
{
  // A size in one byte or in eight: which one it is must not depend on what it leaves for the data.
  constexpr uint64_t LongHead = 9;
  const bool bShort = i_WholeSize < 100;
  uint8_t Size[8];
  libebml::CodedValueLength( i_WholeSize - ( bShort ? SmallestVoid : LongHead ), bShort ? 1 : 8, Size );
  AppendId( o_rBytes, EBML_ID( libebml::EbmlVoid ) );
  o_rBytes.insert( o_rBytes.end(), Size, Size + ( bShort ? 1 : 8 ) );
}

uint64_t HeadSize( const libebml::EbmlId& i_rId, uint64_t i_DataSize )
{
  return i_rId.GetLength() + static_cast<uint64_t>( libebml::CodedSizeLength( i_DataSize, 0 ) );
}

uint64_t NumberSize( const libebml::EbmlId& i_rId, uint64_t i_Value )
{
  const uint64_t Length = NumberBytes( i_Value );
  return HeadSize( i_rId, Length ) + Length;
}

}
