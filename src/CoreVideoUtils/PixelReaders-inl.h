// Reads rows of all formats into vectors of pixels. Included once for each processor target.
#if defined( STAGECORE_PIXEL_READERS_INL ) == defined( HWY_TARGET_TOGGLE )
#ifdef STAGECORE_PIXEL_READERS_INL
#undef STAGECORE_PIXEL_READERS_INL
#else
#define STAGECORE_PIXEL_READERS_INL
#endif

#include "CoreVideoUtils/PixelVectors-inl.h"

#if HWY_TARGET != HWY_SCALAR

HWY_BEFORE_NAMESPACE();
namespace CoreVideoUtils
{
namespace HWY_NAMESPACE
{

// The factors 1.403, 0.714, 0.344 and 1.770 in 16.16 fixed point are whole numbers and a rest of 16 bits, so that high halves of 16-bit
// products give the whole sum's result: 91947 = 65536 + 26411, 115998 = 2 * ( 65536 - 7537 ), 46792 = 65536 - 18744, 22544 = 2 * 11272.
// With ten bits, 16384 Y and a quarter of the other factors come to a result of ten bits, less its lowest two.
struct VEightBits
{
  static constexpr int16_t BlueRest = -7537;
  static constexpr int16_t RedRest = 26411;
  static HWY_INLINE V16 Finish( V16 i_Value ) { return i_Value; }
};

struct VTenBits
{
  static constexpr int16_t BlueRest = -7538;   // 2 * 28999 - 65536
  static constexpr int16_t RedRest = 26408;    // 4 * 22986 - 65536
  static HWY_INLINE V16 Finish( V16 i_Value ) { return hn::ShiftRight<2>( i_Value ); }
};

// Luma, and chroma less its middle with twice U in even lanes and V in odd ones, a lane a pixel, to pixels
template<class TDepth>
struct VYuvDecoder
{
  V16 m_Rests;
  V16 m_GreenFactors;   // the sum's high half is in the odd lane
  V8 m_EvenTwice;
  V8 m_OddTwice;

  HWY_INLINE VPixels operator()( V16 i_Luma, V16 i_Chroma ) const
  {
    const V16 BlueRed = hn::Add( i_Chroma, hn::MulHigh( i_Chroma, m_Rests ) );
    const V16 Green = hn::Sub( hn::BitCast( VTag16(), MultiplyAddPairs( i_Chroma, m_GreenFactors ) ), i_Chroma );
    return MergeChannels( TDepth::Finish( hn::Add( i_Luma, ShuffleBytes( BlueRed, m_OddTwice ) ) ),
      TDepth::Finish( hn::Add( i_Luma, ShuffleBytes( Green, m_OddTwice ) ) ),
      TDepth::Finish( hn::Add( i_Luma, ShuffleBytes( BlueRed, m_EvenTwice ) ) ) );
  }
};
template<class TDepth>
HWY_INLINE VYuvDecoder<TDepth> MakeYuvDecoder()
{
  return { Alternate( TDepth::BlueRest, TDepth::RedRest ), Alternate( -11272, 18744 ), Repeat( EvenTwice ), Repeat( OddTwice ) };
}

// What reads a row: the step that begins at a pixel; and a reader of the row's rest, in a buffer with room for two whole steps. Those that are not
// opaque leave anything in the fourth byte.

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
  static constexpr bool bOpaque = false;
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
    return hn::BitCast( VTagPixel(), hn::TableLookupBytesOr0( Bytes, m_Order ) );
  }
};
HWY_INLINE VReadThreeBytes ReadThreeBytes( const uint8_t* i_pRow, bool i_bRedFirst )
{
  return { { i_pRow }, Repeat( i_bRedFirst ? RedFirst : BlueFirst ) };
}

template<bool bRedFirst>
struct VReadFourBytes
{
  static constexpr bool bOpaque = false;
  static constexpr size_t BytesPerPixel = 4;

  VByteRow<VReadFourBytes> m_Row;
  V8 m_Order;

  HWY_INLINE VPixels operator()( size_t i_Pixel ) const
  {
    const uint8_t* pPixel = m_Row.m_pRow + i_Pixel * BytesPerPixel;
    return { Order( pPixel ), Order( pPixel + VectorBytes ) };
  }
  VReadFourBytes Rest( size_t i_Pixel, size_t i_Pixels, uint8_t* o_pBuffer ) const { return m_Row.Rest( *this, i_Pixel, i_Pixels, o_pBuffer ); }

private:
  HWY_INLINE VPixel Order( const uint8_t* i_pPixel ) const
  {
    const V8 Bytes = hn::LoadU( VTag8(), i_pPixel );
    return hn::BitCast( VTagPixel(), bRedFirst ? hn::TableLookupBytes( Bytes, m_Order ) : Bytes );
  }
};
template<bool bRedFirst>
HWY_INLINE VReadFourBytes<bRedFirst> ReadFourBytes( const uint8_t* i_pRow )
{
  return { { i_pRow }, Repeat( SwapRedAndBlue ) };
}

// R5G6B5
struct VReadTwoBytes
{
  static constexpr bool bOpaque = true;
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
  static constexpr bool bOpaque = false;
  static constexpr size_t BytesPerPixel = 1;

  VByteRow<VReadGrey> m_Row;
  V8 m_Order;

  HWY_INLINE VPixels operator()( size_t i_Pixel ) const { return { Spread( i_Pixel ), Spread( i_Pixel + Step / 2 ) }; }
  VReadGrey Rest( size_t i_Pixel, size_t i_Pixels, uint8_t* o_pBuffer ) const { return m_Row.Rest( *this, i_Pixel, i_Pixels, o_pBuffer ); }

private:
  HWY_INLINE VPixel Spread( size_t i_Pixel ) const
  {
    const hn::Rebind<uint8_t, VTagPixel> Tag;
    return ShuffleBytes( hn::PromoteTo( VTagPixel(), hn::LoadU( Tag, m_Row.m_pRow + i_Pixel ) ), m_Order );
  }
};
HWY_INLINE VReadGrey ReadGrey( const uint8_t* i_pRow ) { return { { i_pRow }, Repeat( GreyThrice ) }; }

// 4:2:2 with eight bits
template<bool bLumaFirst>
struct VReadPairs
{
  static constexpr bool bOpaque = true;
  static constexpr size_t BytesPerPixel = 2;

  VByteRow<VReadPairs> m_Row;
  VYuvDecoder<VEightBits> m_Decode;
  V8 m_ChromaFactors;   // none for luma

  HWY_INLINE VPixels operator()( size_t i_Pixel ) const
  {
    const hn::ScalableTag<uint16_t> Tag;
    const V8 Bytes = Permute( hn::LoadU( VTag8(), m_Row.m_pRow + i_Pixel * BytesPerPixel ), SplitHalves );
    const auto Pairs = hn::BitCast( Tag, Bytes );
    const auto Luma = bLumaFirst ? hn::And( Pairs, hn::Set( Tag, 0xFF ) ) : hn::ShiftRight<8>( Pairs );
    const V8 Centred = hn::Xor( Bytes, hn::Set( VTag8(), 128 ) );
    return m_Decode( hn::BitCast( VTag16(), Luma ), MultiplyAddBytes( m_ChromaFactors, Centred ) );
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
  const uint32_t Factors = bLumaFirst ? 0x01000200U : 0x00010002U;
  return { { i_pRow }, MakeYuvDecoder<VEightBits>(), hn::BitCast( VTag8(), hn::Set( VTagPixel(), Factors ) ) };
}

// 4:2:2 with ten bits that has been unpacked; there is enough after the row's end for two steps.
struct VReadPlanes
{
  static constexpr bool bOpaque = true;

  const int16_t* m_pLuma;
  const int16_t* m_pChroma;
  VYuvDecoder<VTenBits> m_Decode;

  HWY_INLINE VPixels operator()( size_t i_Pixel ) const
  {
    const V16 Chroma = Permute( hn::LoadU( VTag16(), m_pChroma + i_Pixel ), SplitHalves );
    return m_Decode( Permute( hn::LoadU( VTag16(), m_pLuma + i_Pixel ), SplitHalves ),
      hn::Sub( hn::Mul( Chroma, Alternate( 2, 1 ) ), Alternate( 2 * 512, 512 ) ) );
  }
  VReadPlanes Rest( size_t i_Pixel, size_t, uint8_t* ) const { return { m_pLuma + i_Pixel, m_pChroma + i_Pixel, m_Decode }; }
};
HWY_INLINE VReadPlanes ReadPlanes( const int16_t* i_pLuma, const int16_t* i_pChroma ) { return { i_pLuma, i_pChroma, MakeYuvDecoder<VTenBits>() }; }

}
}
HWY_AFTER_NAMESPACE();

#endif
#endif
