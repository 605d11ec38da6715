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

void AppendBigEndian( VBytes& o_rBytes, uint64_t i_Value, uint64_t i_Bytes )
{
  for( uint64_t Left = i_Bytes; Left != 0; --Left )
  {
    o_rBytes.push_back( static_cast<uint8_t>( i_Value >> ( 8 * ( Left - 1 ) ) ) );
  }
}

// A size of all ones is the mark of an unknown one.
constexpr uint64_t SmallestLongSize = 127;

}

void AppendId( VBytes& o_rBytes, const libebml::EbmlId& i_rId ) { AppendBigEndian( o_rBytes, i_rId.GetValue(), i_rId.GetLength() ); }

void AppendSize( VBytes& o_rBytes, uint64_t i_Size )
{
  if( i_Size < SmallestLongSize )
  {
    o_rBytes.push_back( static_cast<uint8_t>( 0x80 | i_Size ) );
    return;
  }
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
  AppendBigEndian( o_rBytes, i_Value, Length );
}

void AppendVoidHead( VBytes& o_rBytes, uint64_t i_WholeSize )
{
  // A size in one byte or in eight: with a size no longer than it must be, some whole sizes could not be reached.
  constexpr uint64_t LongHead = 9;
  const bool bShort = i_WholeSize < 100;
  uint8_t Size[8];
  libebml::CodedValueLength( i_WholeSize - ( bShort ? SmallestVoid : LongHead ), bShort ? 1 : 8, Size );
  AppendId( o_rBytes, EBML_ID( libebml::EbmlVoid ) );
  o_rBytes.insert( o_rBytes.end(), Size, Size + ( bShort ? 1 : 8 ) );
}

uint64_t HeadSize( const libebml::EbmlId& i_rId, uint64_t i_DataSize )
{
  return i_rId.GetLength() + ( i_DataSize < SmallestLongSize ? 1 : static_cast<uint64_t>( libebml::CodedSizeLength( i_DataSize, 0 ) ) );
}

uint64_t NumberSize( const libebml::EbmlId& i_rId, uint64_t i_Value )
{
  const uint64_t Length = NumberBytes( i_Value );
  return HeadSize( i_rId, Length ) + Length;
}

}
