// Pixels in vectors: reading them from the formats' rows, writing them into rows. Included once for each processor target by the files with
// vector code.
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
constexpr VBytePattern SameOrder = { 0, 1, 2, 3, 4, 5, 6, 7, 8, 9, 10, 11, 12, 13, 14, 15 };
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

HWY_INLINE V16 Limit( V16 i_Vector ) { return hn::Min( hn::Max( i_Vector, hn::Zero( VTag16() ) ), hn::Set( VTag16(), 255 ) ); }

HWY_INLINE VPixel Opaque( VPixel i_Pixels ) { return hn::Or( i_Pixels, hn::Set( VTagPixel(), 0xFF000000U ) ); }

// Channels of 0 to 255 whose halves lie as SplitHalves leaves them
HWY_INLINE VPixels MergeChannels( V16 i_Red, V16 i_Green, V16 i_Blue )
{
  const V16 BlueGreen = hn::Or( i_Blue, hn::ShiftLeft<8>( i_Green ) );
  const V16 RedUnused = hn::Or( i_Red, hn::Set( VTag16(), static_cast<int16_t>( 0xFF00 ) ) );
  return { hn::BitCast( VTagPixel(), hn::InterleaveLower( VTag16(), BlueGreen, RedUnused ) ),
    hn::BitCast( VTagPixel(), hn::InterleaveUpper( VTag16(), BlueGreen, RedUnused ) ) };
}

// The factors 1.403, 0.714, 0.344 and 1.770 in 16.16 fixed point are whole numbers and a rest of 16 bits, so that high halves of 16-bit
// products give the whole sum's result: 91947 = 65536 + 26411, 115998 = 2 * 65536 - 15074, 46792 = 65536 - 18744. With ten bits, 16384 Y and
// a quarter of the other factors come to a result of ten bits, less its lowest two.
struct VEightBits
{
  static constexpr int16_t BlueRest = -15074;
  static constexpr int16_t RedRest = 26411;
  static V16 Finish( V16 i_Value ) { return Limit( i_Value ); }
};

struct VTenBits
{
  static constexpr int16_t BlueRest = -15076;   // 4 * 28999 - 2 * 65536
  static constexpr int16_t RedRest = 26408;     // 4 * 22986 - 65536
  static V16 Finish( V16 i_Value ) { return Limit( hn::ShiftRight<2>( i_Value ) ); }
};

// Luma, and chroma less its middle with U in even lanes and V in odd ones, a lane a pixel, to pixels
template<class TDepth>
struct VYuvDecoder
{
  V16 m_Rests;
  V16 m_GreenFactors;   // the sum's high half is in the odd lane
  V16 m_EvenLanes;
  V8 m_EvenTwice;
  V8 m_OddTwice;

  HWY_INLINE VPixels operator()( V16 i_Luma, V16 i_Chroma ) const
  {
    const V16 High = hn::MulHigh( i_Chroma, m_Rests );
    const V16 BlueRed = hn::Add( hn::Add( High, i_Chroma ), hn::And( i_Chroma, m_EvenLanes ) );
    const V16 Green = hn::Sub( hn::BitCast( VTag16(), MultiplyAddPairs( i_Chroma, m_GreenFactors ) ), i_Chroma );
    return MergeChannels( TDepth::Finish( hn::Add( i_Luma, ShuffleBytes( BlueRed, m_OddTwice ) ) ),
      TDepth::Finish( hn::Add( i_Luma, ShuffleBytes( Green, m_OddTwice ) ) ),
      TDepth::Finish( hn::Add( i_Luma, ShuffleBytes( BlueRed, m_EvenTwice ) ) ) );
  }
};
template<class TDepth>
HWY_INLINE VYuvDecoder<TDepth> MakeYuvDecoder()
{
  return { Alternate( TDepth::BlueRest, TDepth::RedRest ), Alternate( -22544, 18744 ), Alternate( -1, 0 ), Repeat( EvenTwice ), Repeat( OddTwice ) };
}

// What reads a row: the step that begins at a pixel; and a reader of the row's rest, in a buffer with room for two whole steps.

template<class TReader>
struct VByteRow
{
  const uint8_t* m_pRow;

  TReader Rest( const TReader& i_rReader, size_t i_Pixel, size_t i_Pixels, uint8_t* o_pBuffer ) const
  {
    std::memcpy( o_pBuffer, m_pRow + i_Pixel * TReader::BytesPerPixel, i_Pixels * TReader::BytesPerPixel );
    TReader Reader = i_rReader;
    Reader.m_Row.m_pRow = o_pBuffer;
    return Reader;
  }
};

struct VReadThreeBytes
{
  static constexpr size_t BytesPerPixel = 3;

  VByteRow<VReadThreeBytes> m_Row;
  V8 m_Order;

  HWY_INLINE VPixels operator()( size_t i_Pixel ) const
  {
    const uint8_t* pPixel = m_Row.m_pRow + i_Pixel * BytesPerPixel;
    return { Spread( pPixel ), Spread( pPixel + VectorBytes / 4 * 3 ) };
  }
  VReadThreeBytes Rest( size_t i_Pixel, size_t i_Pixels, uint8_t* o_pBuffer ) const { return m_Row.Rest( *this, i_Pixel, i_Pixels, o_pBuffer ); }

private:
  HWY_INLINE VPixel Spread( const uint8_t* i_pPixel ) const
  {
    const V8 Bytes = Permute( hn::LoadU( VTag8(), i_pPixel ), SpreadTriplets );
    return Opaque( hn::BitCast( VTagPixel(), hn::TableLookupBytesOr0( Bytes, m_Order ) ) );
  }
};
HWY_INLINE VReadThreeBytes ReadThreeBytes( const uint8_t* i_pRow, bool i_bRedFirst )
{
  return { { i_pRow }, Repeat( i_bRedFirst ? RedFirst : BlueFirst ) };
}

struct VReadFourBytes
{
  static constexpr size_t BytesPerPixel = 4;

  VByteRow<VReadFourBytes> m_Row;
  V8 m_Order;

  HWY_INLINE VPixels operator()( size_t i_Pixel ) const
  {
    const uint8_t* pPixel = m_Row.m_pRow + i_Pixel * BytesPerPixel;
    const V8 First = hn::TableLookupBytes( hn::LoadU( VTag8(), pPixel ), m_Order );
    const V8 Second = hn::TableLookupBytes( hn::LoadU( VTag8(), pPixel + VectorBytes ), m_Order );
    return { Opaque( hn::BitCast( VTagPixel(), First ) ), Opaque( hn::BitCast( VTagPixel(), Second ) ) };
  }
  VReadFourBytes Rest( size_t i_Pixel, size_t i_Pixels, uint8_t* o_pBuffer ) const { return m_Row.Rest( *this, i_Pixel, i_Pixels, o_pBuffer ); }
};
HWY_INLINE VReadFourBytes ReadFourBytes( const uint8_t* i_pRow, bool i_bRedFirst )
{
  return { { i_pRow }, Repeat( i_bRedFirst ? SwapRedAndBlue : SameOrder ) };
}

// R5G6B5
struct VReadTwoBytes
{
  static constexpr size_t BytesPerPixel = 2;

  VByteRow<VReadTwoBytes> m_Row;

  HWY_INLINE VPixels operator()( size_t i_Pixel ) const
  {
    const V16 Bits = hn::BitCast( VTag16(), Permute( hn::LoadU( VTag8(), m_Row.m_pRow + i_Pixel * BytesPerPixel ), SplitHalves ) );
    return MergeChannels( hn::And( hn::ShiftRight<8>( Bits ), hn::Set( VTag16(), 0xF8 ) ),
      hn::And( hn::ShiftRight<3>( Bits ), hn::Set( VTag16(), 0xFC ) ), hn::And( hn::ShiftLeft<3>( Bits ), hn::Set( VTag16(), 0xF8 ) ) );
  }
  VReadTwoBytes Rest( size_t i_Pixel, size_t i_Pixels, uint8_t* o_pBuffer ) const { return m_Row.Rest( *this, i_Pixel, i_Pixels, o_pBuffer ); }
};

struct VReadGrey
{
  static constexpr size_t BytesPerPixel = 1;

  VByteRow<VReadGrey> m_Row;
  V8 m_Order;

  HWY_INLINE VPixels operator()( size_t i_Pixel ) const { return { Spread( i_Pixel ), Spread( i_Pixel + Step / 2 ) }; }
  VReadGrey Rest( size_t i_Pixel, size_t i_Pixels, uint8_t* o_pBuffer ) const { return m_Row.Rest( *this, i_Pixel, i_Pixels, o_pBuffer ); }

private:
  HWY_INLINE VPixel Spread( size_t i_Pixel ) const
  {
    const hn::Rebind<uint8_t, VTagPixel> Tag;
    return Opaque( ShuffleBytes( hn::PromoteTo( VTagPixel(), hn::LoadU( Tag, m_Row.m_pRow + i_Pixel ) ), m_Order ) );
  }
};
HWY_INLINE VReadGrey ReadGrey( const uint8_t* i_pRow ) { return { { i_pRow }, Repeat( GreyThrice ) }; }

// 4:2:2 with eight bits
template<bool bLumaFirst>
struct VReadPairs
{
  static constexpr size_t BytesPerPixel = 2;

  VByteRow<VReadPairs> m_Row;
  VYuvDecoder<VEightBits> m_Decode;

  HWY_INLINE VPixels operator()( size_t i_Pixel ) const
  {
    const hn::ScalableTag<uint16_t> Tag;
    const auto Pairs = hn::BitCast( Tag, Permute( hn::LoadU( VTag8(), m_Row.m_pRow + i_Pixel * BytesPerPixel ), SplitHalves ) );
    const V16 Low = hn::BitCast( VTag16(), hn::And( Pairs, hn::Set( Tag, 0xFF ) ) );
    const V16 High = hn::BitCast( VTag16(), hn::ShiftRight<8>( Pairs ) );
    return m_Decode( bLumaFirst ? Low : High, hn::Sub( bLumaFirst ? High : Low, hn::Set( VTag16(), 128 ) ) );
  }
  // The V that a lone last pixel lacks is put in.
  VReadPairs Rest( size_t i_Pixel, size_t i_Pixels, uint8_t* o_pBuffer ) const
  {
    const size_t Chroma = bLumaFirst ? 1 : 0;
    if( i_Pixels % 2 != 0 )
    {
      const bool bAlone = i_Pixel + i_Pixels == 1;
      o_pBuffer[2 * i_Pixels + Chroma] = bAlone ? uint8_t{ 128 } : m_Row.m_pRow[2 * ( i_Pixel + i_Pixels - 2 ) + Chroma];
    }
    return m_Row.Rest( *this, i_Pixel, i_Pixels, o_pBuffer );
  }
};
template<bool bLumaFirst>
HWY_INLINE VReadPairs<bLumaFirst> ReadPairs( const uint8_t* i_pRow )
{
  return { { i_pRow }, MakeYuvDecoder<VEightBits>() };
}

// 4:2:2 with ten bits that has been unpacked; there is enough after the row's end for two steps.
struct VReadPlanes
{
  const int16_t* m_pLuma;
  const int16_t* m_pChroma;
  VYuvDecoder<VTenBits> m_Decode;

  HWY_INLINE VPixels operator()( size_t i_Pixel ) const
  {
    const V16 Chroma = Permute( hn::LoadU( VTag16(), m_pChroma + i_Pixel ), SplitHalves );
    return m_Decode( Permute( hn::LoadU( VTag16(), m_pLuma + i_Pixel ), SplitHalves ), hn::Sub( Chroma, hn::Set( VTag16(), 512 ) ) );
  }
  VReadPlanes Rest( size_t i_Pixel, size_t, uint8_t* ) const { return { m_pLuma + i_Pixel, m_pChroma + i_Pixel, m_Decode }; }
};
HWY_INLINE VReadPlanes ReadPlanes( const int16_t* i_pLuma, const int16_t* i_pChroma ) { return { i_pLuma, i_pChroma, MakeYuvDecoder<VTenBits>() }; }

// What writes a step's pixels

struct VWriteThreeBytes
{
  static constexpr size_t BytesPerPixel = 3;

  V8 m_Order;

  HWY_INLINE void operator()( const VPixels& i_rPixels, uint8_t* o_pPixel ) const
  {
    hn::StoreU( Join( i_rPixels.m_First ), VTag8(), o_pPixel );
    hn::StoreU( Join( i_rPixels.m_Second ), VTag8(), o_pPixel + VectorBytes / 4 * 3 );
  }

private:
  HWY_INLINE V8 Join( VPixel i_Pixels ) const
  {
    return Permute( hn::TableLookupBytesOr0( hn::BitCast( VTag8(), i_Pixels ), m_Order ), JoinTriplets );
  }
};

HWY_INLINE VWriteThreeBytes WriteThreeBytes( bool i_bRedFirst ) { return { Repeat( i_bRedFirst ? JoinRedFirst : JoinBlueFirst ) }; }

struct VWriteFourBytes
{
  static constexpr size_t BytesPerPixel = 4;

  V8 m_Order;

  HWY_INLINE void operator()( const VPixels& i_rPixels, uint8_t* o_pPixel ) const
  {
    hn::StoreU( hn::TableLookupBytes( hn::BitCast( VTag8(), i_rPixels.m_First ), m_Order ), VTag8(), o_pPixel );
    hn::StoreU( hn::TableLookupBytes( hn::BitCast( VTag8(), i_rPixels.m_Second ), m_Order ), VTag8(), o_pPixel + VectorBytes );
  }
};
HWY_INLINE VWriteFourBytes WriteFourBytes( bool i_bRedFirst ) { return { Repeat( i_bRedFirst ? SwapRedAndBlue : SameOrder ) }; }

// Each pixel's own Y, and its own U in even pixels, V in odd ones. The factors of Y add up to 65535, those of U to 1, those of V to 0: with blue
// and red less green, and green for itself, all fit 16 bits. V's are halved.
struct VWritePairs
{
  static constexpr size_t BytesPerPixel = 2;

  bool m_bLumaFirst;
  V8 m_GreenTwice;
  V16 m_LumaFactors;   // a pixel has two lanes of 16 bits
  V16 m_ChromaFactors;

  HWY_INLINE void operator()( const VPixels& i_rPixels, uint8_t* o_pPixel ) const
  {
    const VLumaChroma First = Encode( i_rPixels.m_First );
    const VLumaChroma Second = Encode( i_rPixels.m_Second );
    const V16 Luma = hn::ReorderDemote2To( VTag16(), First.m_Luma, Second.m_Luma );
    const V16 Chroma = Limit( hn::Add( hn::ReorderDemote2To( VTag16(), First.m_Chroma, Second.m_Chroma ), hn::Set( VTag16(), 128 ) ) );
    const V16 Pairs = m_bLumaFirst ? hn::Or( Luma, hn::ShiftLeft<8>( Chroma ) ) : hn::Or( Chroma, hn::ShiftLeft<8>( Luma ) );
    hn::StoreU( hn::BitCast( VTag8(), Permute( Pairs, JoinHalves ) ), VTag8(), o_pPixel );
  }

private:
  struct VLumaChroma
  {
    V32 m_Luma;
    V32 m_Chroma;   // less 128
  };

  HWY_INLINE VLumaChroma Encode( VPixel i_Pixels ) const
  {
    const V16 BlueRed = hn::BitCast( VTag16(), hn::And( i_Pixels, hn::Set( VTagPixel(), 0x00FF00FFU ) ) );
    const V16 GreenPair = hn::BitCast( VTag16(), ShuffleBytes( i_Pixels, m_GreenTwice ) );
    const V16 Differences = hn::Sub( BlueRed, GreenPair );
    const V32 Green = hn::ShiftRight<16>( hn::BitCast( VTag32(), GreenPair ) );
    const V32 Luma = hn::Add( hn::ShiftRight<16>( hn::Sub( MultiplyAddPairs( Differences, m_LumaFactors ), Green ) ), Green );
    const V32 Chroma = MultiplyAddPairs( Differences, m_ChromaFactors );
    return { Luma, hn::ShiftRight<16>( hn::Add( Chroma, hn::OddEven( Chroma, Green ) ) ) };
  }
};
HWY_INLINE VWritePairs WritePairs( bool i_bLumaFirst )
{
  const VPixel Even = hn::BitCast( VTagPixel(), Alternate( 28573, -9642 ) );
  const VPixel Odd = hn::BitCast( VTagPixel(), Alternate( -3277, 20152 ) );
  return { i_bLumaFirst, Repeat( GreenTwice ), Alternate( 7471, 19595 ), hn::BitCast( VTag16(), hn::OddEven( Odd, Even ) ) };
}

// The mean of the channels
struct VWriteGrey
{
  static constexpr size_t BytesPerPixel = 1;

  V8 m_GreenTwice;

  HWY_INLINE void operator()( const VPixels& i_rPixels, uint8_t* o_pPixel ) const
  {
    const V16 Grey = Permute( hn::ReorderDemote2To( VTag16(), Mean( i_rPixels.m_First ), Mean( i_rPixels.m_Second ) ), JoinHalves );
    const hn::Rebind<uint8_t, VTag16> Tag;
    hn::StoreU( hn::DemoteTo( Tag, Grey ), Tag, o_pPixel );
  }

private:
  // 21846 is a third of 65536, and enough more to make the division exact up to 765.
  HWY_INLINE V32 Mean( VPixel i_Pixels ) const
  {
    const V16 BlueRed = hn::BitCast( VTag16(), hn::And( i_Pixels, hn::Set( VTagPixel(), 0x00FF00FFU ) ) );
    const V16 Green = hn::BitCast( VTag16(), ShuffleBytes( i_Pixels, m_GreenTwice ) );
    const V16 Sums = hn::Add( hn::Add( BlueRed, BlueRed ), Green );   // the lanes add up to twice the sum of the channels
    return hn::ShiftRight<16>( MultiplyAddPairs( Sums, hn::Set( VTag16(), 10923 ) ) );
  }
};
HWY_INLINE VWriteGrey WriteGrey() { return { Repeat( GreenTwice ) }; }

template<class TReader, class TWriter>
HWY_INLINE void ConvertPixels( const TReader& i_rReader, const TWriter& i_rWriter, uint8_t* o_pTarget, size_t i_Pixels )
{
  const TReader Reader = i_rReader;
  const TWriter Writer = i_rWriter;
  size_t Pixel = 0;
  for( ; Pixel + Step + Margin <= i_Pixels; Pixel += Step )
  {
    Writer( Reader( Pixel ), o_pTarget + Pixel * TWriter::BytesPerPixel );
  }
  const size_t Rest = i_Pixels - Pixel;
  if( Rest == 0 )
  {
    return;
  }
  alignas( 64 ) uint8_t Source[TailBytes] = {};
  alignas( 64 ) uint8_t Target[TailBytes];
  const TReader RestReader = Reader.Rest( Pixel, Rest, Source );
  for( size_t Done = 0; Done < Rest; Done += Step )
  {
    Writer( RestReader( Done ), Target + Done * TWriter::BytesPerPixel );
  }
  std::memcpy( o_pTarget + Pixel * TWriter::BytesPerPixel, Target, Rest * TWriter::BytesPerPixel );
}

}
}
HWY_AFTER_NAMESPACE();

#endif
#endif
