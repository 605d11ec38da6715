// Writes vectors of pixels into rows of all formats. Included once for each processor target.
#if defined( STAGECORE_PIXEL_WRITERS_INL ) == defined( HWY_TARGET_TOGGLE )
#ifdef STAGECORE_PIXEL_WRITERS_INL
#undef STAGECORE_PIXEL_WRITERS_INL
#else
#define STAGECORE_PIXEL_WRITERS_INL
#endif

#include "CoreVideoUtils/PixelVectors-inl.h"

#if HWY_TARGET != HWY_SCALAR

HWY_BEFORE_NAMESPACE();
namespace CoreVideoUtils
{
namespace HWY_NAMESPACE
{

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

template<bool bRedFirst, bool bOpaque>
struct VWriteFourBytes
{
  static constexpr size_t BytesPerPixel = 4;

  V8 m_Order;

  HWY_INLINE void operator()( const VPixels& i_rPixels, uint8_t* o_pPixel ) const
  {
    hn::StoreU( Order( i_rPixels.m_First ), VTag8(), o_pPixel );
    hn::StoreU( Order( i_rPixels.m_Second ), VTag8(), o_pPixel + VectorBytes );
  }

private:
  HWY_INLINE V8 Order( VPixel i_Pixels ) const
  {
    const V8 Bytes = hn::BitCast( VTag8(), bOpaque ? i_Pixels : Opaque( i_Pixels ) );
    return bRedFirst ? hn::TableLookupBytes( Bytes, m_Order ) : Bytes;
  }
};
// For what is opaque already, and for what is not
template<bool bRedFirst, bool bOpaque>
HWY_INLINE VWriteFourBytes<bRedFirst, bOpaque> WriteFourBytes()
{
  return { Repeat( SwapRedAndBlue ) };
}

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
