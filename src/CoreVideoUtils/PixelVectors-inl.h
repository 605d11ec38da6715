// Pixels in vectors, and how lanes and bytes of them are moved. Included once for each processor target by the files with vector code.
//
// A step is half as many pixels as a vector has bytes, in two vectors of pixels with the bytes blue, green, red, 255.
#if defined( STAGECORE_PIXEL_VECTORS_INL ) == defined( HWY_TARGET_TOGGLE )
#ifdef STAGECORE_PIXEL_VECTORS_INL
#undef STAGECORE_PIXEL_VECTORS_INL
#else
#define STAGECORE_PIXEL_VECTORS_INL
#endif

#include <hwy/highway.h>

#include <array>
#include <cstddef>
#include <cstdint>
#include <cstring>

#if HWY_TARGET != HWY_SCALAR

HWY_BEFORE_NAMESPACE();
namespace CoreVideoUtils
{
namespace HWY_NAMESPACE
{

namespace hn = hwy::HWY_NAMESPACE;

using VTag8 = hn::ScalableTag<uint8_t>;
using VTag16 = hn::ScalableTag<int16_t>;
using VTag32 = hn::ScalableTag<int32_t>;
using VTagPixel = hn::ScalableTag<uint32_t>;
using V8 = hn::Vec<VTag8>;
using V16 = hn::Vec<VTag16>;
using V32 = hn::Vec<VTag32>;
using VPixel = hn::Vec<VTagPixel>;

constexpr size_t VectorBytes = hn::MaxLanes( VTag8() );
constexpr size_t Blocks = VectorBytes / 16;
constexpr size_t Step = VectorBytes / 2;
// Three-byte pixels are read and written a quarter of a vector beyond a step; this many pixels cover it.
constexpr size_t Margin = VectorBytes / 8;
// The last pixels of a row go through buffers: less than a step and the margin, in up to two steps.
constexpr size_t TailBytes = 5 * VectorBytes;

struct VPixels
{
  VPixel m_First;
  VPixel m_Second;
};

// Which lane of 32 bits each lane is taken from
using VLanes = std::array<int32_t, VectorBytes / 4>;
using VBytePattern = std::array<uint8_t, 16>;

template<class TFunction>
constexpr VLanes MakeLanes( TFunction i_Source )
{
  VLanes Lanes{};
  for( size_t Lane = 0; Lane < Lanes.size(); ++Lane )
  {
    Lanes[Lane] = static_cast<int32_t>( i_Source( Lane ) );
  }
  return Lanes;
}

// Three lanes to each block of four, and back
alignas( 64 ) constexpr VLanes SpreadTriplets = MakeLanes( []( size_t i_Lane ) { return i_Lane / 4 * 3 + i_Lane % 4; } );
alignas( 64 ) constexpr VLanes JoinTriplets = MakeLanes( []( size_t i_Lane ) { return i_Lane < 3 * Blocks ? i_Lane / 3 * 4 + i_Lane % 3 : 0; } );
// The vector's lower half to the lower halves of its blocks, the upper to the upper ones, and back: what is interleaved or packed block by
// block thus comes out in order.
alignas( 64 ) constexpr VLanes SplitHalves = MakeLanes(
  []( size_t i_Lane ) { return i_Lane / 4 * 2 + i_Lane % 2 + ( i_Lane % 4 >= 2 ? 2 * Blocks : 0 ); } );
alignas( 64 ) constexpr VLanes JoinHalves = MakeLanes(
  []( size_t i_Lane ) { return i_Lane < 2 * Blocks ? i_Lane / 2 * 4 + i_Lane % 2 : ( i_Lane - 2 * Blocks ) / 2 * 4 + 2 + i_Lane % 2; } );

constexpr VBytePattern BlueFirst = { 0, 1, 2, 0x80, 3, 4, 5, 0x80, 6, 7, 8, 0x80, 9, 10, 11, 0x80 };
constexpr VBytePattern RedFirst = { 2, 1, 0, 0x80, 5, 4, 3, 0x80, 8, 7, 6, 0x80, 11, 10, 9, 0x80 };
constexpr VBytePattern JoinBlueFirst = { 0, 1, 2, 4, 5, 6, 8, 9, 10, 12, 13, 14, 0x80, 0x80, 0x80, 0x80 };
constexpr VBytePattern JoinRedFirst = { 2, 1, 0, 6, 5, 4, 10, 9, 8, 14, 13, 12, 0x80, 0x80, 0x80, 0x80 };
constexpr VBytePattern SwapRedAndBlue = { 2, 1, 0, 3, 6, 5, 4, 7, 10, 9, 8, 11, 14, 13, 12, 15 };
constexpr VBytePattern GreenTwice = { 1, 0x80, 1, 0x80, 5, 0x80, 5, 0x80, 9, 0x80, 9, 0x80, 13, 0x80, 13, 0x80 };
constexpr VBytePattern GreyThrice = { 0, 0, 0, 0x80, 4, 4, 4, 0x80, 8, 8, 8, 0x80, 12, 12, 12, 0x80 };
constexpr VBytePattern EvenTwice = { 0, 1, 0, 1, 4, 5, 4, 5, 8, 9, 8, 9, 12, 13, 12, 13 };
constexpr VBytePattern OddTwice = { 2, 3, 2, 3, 6, 7, 6, 7, 10, 11, 10, 11, 14, 15, 14, 15 };
constexpr VBytePattern SwapPairs = { 1, 0, 3, 2, 5, 4, 7, 6, 9, 8, 11, 10, 13, 12, 15, 14 };

template<class TVector>
HWY_INLINE TVector Permute( TVector i_Vector, const VLanes& i_rLanes )
{
  if constexpr( Blocks == 1 )
  {
    return i_Vector;
  }
  else
  {
    const hn::DFromV<TVector> Tag;
    return hn::BitCast( Tag, hn::TableLookupLanes( hn::BitCast( VTagPixel(), i_Vector ), hn::SetTableIndices( VTagPixel(), i_rLanes.data() ) ) );
  }
}

HWY_INLINE V8 Repeat( const VBytePattern& i_rPattern ) { return hn::LoadDup128( VTag8(), i_rPattern.data() ); }

// Even and odd lanes
HWY_INLINE V16 Alternate( int16_t i_Even, int16_t i_Odd )
{
  const uint32_t Bits = static_cast<uint16_t>( i_Even ) | static_cast<uint32_t>( static_cast<uint16_t>( i_Odd ) ) << 16;
  return hn::BitCast( VTag16(), hn::Set( VTagPixel(), Bits ) );
}

template<class TVector>
HWY_INLINE TVector ShuffleBytes( TVector i_Vector, V8 i_Pattern )
{
  return hn::BitCast( hn::DFromV<TVector>(), hn::TableLookupBytesOr0( hn::BitCast( VTag8(), i_Vector ), i_Pattern ) );
}

// Each pair's products, added up
HWY_INLINE V32 MultiplyAddPairs( V16 i_Left, V16 i_Right )
{
  V32 Odd = hn::Zero( VTag32() );
  const V32 Sum = hn::ReorderWidenMulAccumulate( VTag32(), i_Left, i_Right, hn::Zero( VTag32() ), Odd );
  return hn::RearrangeToOddPlusEven( Sum, Odd );
}

// The same of bytes: factors of 0 to 255 and signed values, with sums of no more than 16 bits
HWY_INLINE V16 MultiplyAddBytes( V8 i_Factors, V8 i_Signed )
{
#if HWY_TARGET == HWY_AVX3
  return V16{ _mm512_maddubs_epi16( i_Factors.raw, i_Signed.raw ) };
#elif HWY_TARGET == HWY_AVX2
  return V16{ _mm256_maddubs_epi16( i_Factors.raw, i_Signed.raw ) };
#elif HWY_TARGET == HWY_SSE4
  return V16{ _mm_maddubs_epi16( i_Factors.raw, i_Signed.raw ) };
#else
  const V16 Factors = hn::BitCast( VTag16(), i_Factors );
  const V16 Signed = hn::BitCast( VTag16(), i_Signed );
  const V16 Low = hn::Mul( hn::And( Factors, hn::Set( VTag16(), 0xFF ) ), hn::ShiftRight<8>( hn::ShiftLeft<8>( Signed ) ) );
  const V16 HighFactors = hn::And( hn::ShiftRight<8>( Factors ), hn::Set( VTag16(), 0xFF ) );
  return hn::Add( Low, hn::Mul( HighFactors, hn::ShiftRight<8>( Signed ) ) );
#endif
}

HWY_INLINE V16 Limit( V16 i_Vector ) { return hn::Min( hn::Max( i_Vector, hn::Zero( VTag16() ) ), hn::Set( VTag16(), 255 ) ); }

// Limited to 0 to 255, block by block: eight bytes of the first, then eight of the second.
HWY_INLINE V8 PackBlocks( V16 i_First, V16 i_Second )
{
#if HWY_TARGET == HWY_AVX3
  return V8{ _mm512_packus_epi16( i_First.raw, i_Second.raw ) };
#elif HWY_TARGET == HWY_AVX2
  return V8{ _mm256_packus_epi16( i_First.raw, i_Second.raw ) };
#else
  static_assert( Blocks == 1 );
  const hn::Half<VTag8> Tag;
  return hn::Combine( VTag8(), hn::DemoteTo( Tag, i_Second ), hn::DemoteTo( Tag, i_First ) );
#endif
}

HWY_INLINE VPixel Opaque( VPixel i_Pixels ) { return hn::Or( i_Pixels, hn::Set( VTagPixel(), 0xFF000000U ) ); }

// Channels, limited to 0 to 255, whose halves lie as SplitHalves leaves them; to opaque pixels
HWY_INLINE VPixels MergeChannels( V16 i_Red, V16 i_Green, V16 i_Blue )
{
  const V8 BlueThenRed = PackBlocks( i_Blue, i_Red );
  const V8 GreenThenUnused = PackBlocks( i_Green, hn::Set( VTag16(), 255 ) );
  const V16 BlueGreen = hn::BitCast( VTag16(), hn::InterleaveLower( VTag8(), BlueThenRed, GreenThenUnused ) );
  const V16 RedUnused = hn::BitCast( VTag16(), hn::InterleaveUpper( VTag8(), BlueThenRed, GreenThenUnused ) );
  return { hn::BitCast( VTagPixel(), hn::InterleaveLower( VTag16(), BlueGreen, RedUnused ) ),
    hn::BitCast( VTagPixel(), hn::InterleaveUpper( VTag16(), BlueGreen, RedUnused ) ) };
}

}
}
HWY_AFTER_NAMESPACE();

#endif
#endif
