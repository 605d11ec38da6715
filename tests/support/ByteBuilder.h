// Bytes of a file put together piece by piece, to be compared with those of a writer.
#pragma once

#include <cstdint>
#include <cstring>
#include <string>
#include <vector>

namespace TestSupport
{

enum class EByteOrder
{
  Little,
  Big
};

template<EByteOrder Order>
class VByteBuilder
{
public:
  VByteBuilder& Raw( const std::string& i_rText )
  {
    m_Bytes.insert( m_Bytes.end(), i_rText.begin(), i_rText.end() );
    return *this;
  }
  VByteBuilder& Zeros( size_t i_Count ) { return Raw( std::string( i_Count, '\0' ) ); }
  VByteBuilder& U8( uint64_t i_Value ) { return Number( i_Value, 1 ); }
  VByteBuilder& U16( uint64_t i_Value ) { return Number( i_Value, 2 ); }
  VByteBuilder& U32( uint64_t i_Value ) { return Number( i_Value, 4 ); }
  VByteBuilder& U64( uint64_t i_Value ) { return Number( i_Value, 8 ); }
  VByteBuilder& Double( double i_Value )
  {
    uint64_t Bits = 0;
    std::memcpy( &Bits, &i_Value, sizeof( Bits ) );
    return U64( Bits );
  }
  VByteBuilder& Text( const std::string& i_rText ) { return U32( i_rText.size() ).Raw( i_rText ); }    // behind its length
  VByteBuilder& Pascal( const std::string& i_rText ) { return U8( i_rText.size() ).Raw( i_rText ); }   // the same in one byte

  // Of MOV files: what an atom begins with, and the matrix that changes nothing
  VByteBuilder& Atom( uint32_t i_Size, const std::string& i_rType ) { return U32( i_Size ).Raw( i_rType ); }
  VByteBuilder& Matrix() { return U32( 0x10000 ).Zeros( 12 ).U32( 0x10000 ).Zeros( 12 ).U32( 0x40000000 ); }

  std::vector<uint8_t> m_Bytes;

private:
  VByteBuilder& Number( uint64_t i_Value, int i_Count )
  {
    for( int Byte = 0; Byte < i_Count; ++Byte )
    {
      m_Bytes.push_back( static_cast<uint8_t>( i_Value >> 8 * ( Order == EByteOrder::Little ? Byte : i_Count - 1 - Byte ) ) );
    }
    return *this;
  }
};

using VLittleEndian = VByteBuilder<EByteOrder::Little>;
using VBigEndian = VByteBuilder<EByteOrder::Big>;

}
