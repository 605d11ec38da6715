#include "CoreVideoUtils/PackedBits.h"

#include <bit>
#include <cstring>

namespace CoreVideoUtils
{

namespace
{

static_assert( std::endian::native == std::endian::little );

// Eight pixels at a time, as a number with the first one at its high end: they go in TBits bytes.
template<size_t TBits>
struct VPacker
{
  static constexpr size_t Lost = 8 - TBits;
  static constexpr uint64_t Values = 0x0101010101010101U * ( ( 1U << TBits ) - 1 );

  // Closes the gaps between values, pairs of them and fours.
  static uint64_t Join( uint64_t i_Pixels )
  {
    uint64_t Bits = i_Pixels >> Lost & Values;
    Bits = ( Bits & 0xFF00FF00FF00FF00U ) >> Lost | ( Bits & 0x00FF00FF00FF00FFU );
    Bits = ( Bits & 0xFFFF0000FFFF0000U ) >> 2 * Lost | ( Bits & 0x0000FFFF0000FFFFU );
    Bits = ( Bits & 0xFFFFFFFF00000000U ) >> 4 * Lost | ( Bits & 0x00000000FFFFFFFFU );
    return Bits << 8 * Lost;
  }

  static uint64_t Spread( uint64_t i_Bits )
  {
    constexpr uint64_t Fours = ( uint64_t{ 1 } << 4 * TBits ) - 1;
    constexpr uint64_t Pairs = 0x0000000100000001U * ( ( uint64_t{ 1 } << 2 * TBits ) - 1 );
    constexpr uint64_t Singles = 0x0001000100010001U * ( ( uint64_t{ 1 } << TBits ) - 1 );
    uint64_t Bits = i_Bits >> 8 * Lost;
    Bits = ( Bits & ~Fours ) << 4 * Lost | ( Bits & Fours );
    Bits = ( Bits & Pairs << 2 * TBits ) << 2 * Lost | ( Bits & Pairs );
    Bits = ( Bits & Singles << TBits ) << Lost | ( Bits & Singles );
    return Bits << Lost;
  }
};

uint64_t Load( const uint8_t* i_pBytes, size_t i_Bytes )
{
  uint64_t Value = 0;
  std::memcpy( &Value, i_pBytes, i_Bytes );
  return __builtin_bswap64( Value );
}

void Store( uint64_t i_Value, uint8_t* o_pBytes, size_t i_Bytes )
{
  const uint64_t Value = __builtin_bswap64( i_Value );
  std::memcpy( o_pBytes, &Value, i_Bytes );
}

template<size_t TBits>
void Pack( const uint8_t* i_pSource, uint8_t* o_pTarget, size_t i_Pixels )
{
  for( ; i_Pixels >= 8; i_Pixels -= 8, i_pSource += 8, o_pTarget += TBits )
  {
    Store( VPacker<TBits>::Join( Load( i_pSource, 8 ) ), o_pTarget, TBits );
  }
  if( i_Pixels > 0 )
  {
    Store( VPacker<TBits>::Join( Load( i_pSource, i_Pixels ) ), o_pTarget, ( i_Pixels * TBits + 7 ) / 8 );
  }
}

template<size_t TBits>
void Unpack( const uint8_t* i_pSource, uint8_t* o_pTarget, size_t i_Pixels )
{
  // Whole words are faster to read than parts of them, and where sixteen pixels are left there are eight bytes.
  for( ; i_Pixels >= 16; i_Pixels -= 8, i_pSource += TBits, o_pTarget += 8 )
  {
    Store( VPacker<TBits>::Spread( Load( i_pSource, 8 ) ), o_pTarget, 8 );
  }
  for( ; i_Pixels >= 8; i_Pixels -= 8, i_pSource += TBits, o_pTarget += 8 )
  {
    Store( VPacker<TBits>::Spread( Load( i_pSource, TBits ) ), o_pTarget, 8 );
  }
  if( i_Pixels > 0 )
  {
    Store( VPacker<TBits>::Spread( Load( i_pSource, ( i_Pixels * TBits + 7 ) / 8 ) ), o_pTarget, i_Pixels );
  }
}

}

void PackBits( size_t i_Bits, const uint8_t* i_pSource, uint8_t* o_pTarget, size_t i_Pixels )
{
  i_Bits == 7 ? Pack<7>( i_pSource, o_pTarget, i_Pixels ) : Pack<6>( i_pSource, o_pTarget, i_Pixels );
}

void UnpackBits( size_t i_Bits, const uint8_t* i_pSource, uint8_t* o_pTarget, size_t i_Pixels )
{
  i_Bits == 7 ? Unpack<7>( i_pSource, o_pTarget, i_Pixels ) : Unpack<6>( i_pSource, o_pTarget, i_Pixels );
}

}
