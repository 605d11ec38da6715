#include "CoreVideoUtils/PixelRows.h"

#include "CoreVideoUtils/ReferencePixels.h"
#include "CoreVideoUtils/VectorTargets.h"

#undef HWY_TARGET_INCLUDE
#define HWY_TARGET_INCLUDE "CoreVideoUtils/PixelRows.cpp"
#include <hwy/foreach_target.h>

#include "CoreVideoUtils/PixelReaders-inl.h"
#include "CoreVideoUtils/PixelWriters-inl.h"

HWY_BEFORE_NAMESPACE();
namespace CoreVideoUtils
{
namespace HWY_NAMESPACE
{

#if HWY_TARGET == HWY_SCALAR

bool ConvertRowVectors( VRowFormats i_Formats, const uint8_t* i_pSource, uint8_t* o_pTarget, size_t i_Pixels )
{
  return Reference::ConvertRow( i_Formats, i_pSource, o_pTarget, i_Pixels );
}

#else

using KVZ::IPixelFormat;
using VTagHalf8 = hn::Rebind<uint8_t, VTag16>;
using VTagUnsigned16 = hn::ScalableTag<uint16_t>;

// Moves that turn units of a row's bytes into units of another row's, several of them a call. A call may read MarginUnits beyond its own.

template<bool bLumaFirst>
struct VLumaOfPairs
{
  static constexpr size_t SourceBytes = 2;
  static constexpr size_t TargetBytes = 1;
  static constexpr size_t Units = VectorBytes;
  static constexpr size_t MarginUnits = 0;

  HWY_INLINE void operator()( const uint8_t* i_pSource, uint8_t* o_pTarget ) const
  {
    hn::StoreU( Permute( PackBlocks( Luma( i_pSource ), Luma( i_pSource + VectorBytes ) ), JoinHalves ), VTag8(), o_pTarget );
  }

private:
  static HWY_INLINE V16 Luma( const uint8_t* i_pPairs )
  {
    const auto Pairs = hn::BitCast( VTagUnsigned16(), hn::LoadU( VTag8(), i_pPairs ) );
    return hn::BitCast( VTag16(), bLumaFirst ? hn::And( Pairs, hn::Set( VTagUnsigned16(), 0xFF ) ) : hn::ShiftRight<8>( Pairs ) );
  }
};

struct VGreyToPairs
{
  static constexpr size_t SourceBytes = 1;
  static constexpr size_t TargetBytes = 2;
  static constexpr size_t Units = Step;
  static constexpr size_t MarginUnits = 0;

  bool m_bLumaFirst;

  HWY_INLINE void operator()( const uint8_t* i_pSource, uint8_t* o_pTarget ) const
  {
    const auto Grey = hn::PromoteTo( VTagUnsigned16(), hn::LoadU( VTagHalf8(), i_pSource ) );
    const auto Pairs = m_bLumaFirst ? hn::Or( Grey, hn::Set( VTagUnsigned16(), 0x8000 ) )
                                    : hn::Or( hn::ShiftLeft<8>( Grey ), hn::Set( VTagUnsigned16(), 0x80 ) );
    hn::StoreU( hn::BitCast( VTag8(), Pairs ), VTag8(), o_pTarget );
  }
};

struct VSwapPairs
{
  static constexpr size_t SourceBytes = 2;
  static constexpr size_t TargetBytes = 2;
  static constexpr size_t Units = Step;
  static constexpr size_t MarginUnits = 0;

  V8 m_Order;

  HWY_INLINE void operator()( const uint8_t* i_pSource, uint8_t* o_pTarget ) const
  {
    hn::StoreU( hn::TableLookupBytes( hn::LoadU( VTag8(), i_pSource ), m_Order ), VTag8(), o_pTarget );
  }
};

// Six pixels, twelve values, in four words of three values. The third value of a word keeps its six high bits alone.
struct VPackTenBits
{
  static constexpr size_t SourceBytes = 12;
  static constexpr size_t TargetBytes = 16;
  static constexpr size_t Units = Blocks;
  static constexpr size_t MarginUnits = ( Blocks + 1 ) / 2;

  V8 m_Order;

  HWY_INLINE void operator()( const uint8_t* i_pSource, uint8_t* o_pTarget ) const
  {
    const V8 Bytes = Permute( hn::LoadU( VTag8(), i_pSource ), SpreadTriplets );
    const VPixel Values = hn::BitCast( VTagPixel(), hn::TableLookupBytesOr0( Bytes, m_Order ) );
    const VPixel First = hn::ShiftLeft<2>( hn::And( Values, hn::Set( VTagPixel(), 0xFF ) ) );
    const VPixel Second = hn::ShiftLeft<4>( hn::And( Values, hn::Set( VTagPixel(), 0xFF00 ) ) );
    const VPixel Third = hn::ShiftLeft<6>( hn::And( Values, hn::Set( VTagPixel(), 0xFC0000 ) ) );
    hn::StoreU( hn::BitCast( VTag8(), hn::Or( hn::Or( First, Second ), Third ) ), VTag8(), o_pTarget );
  }
};
constexpr VBytePattern ChromaFirstTriplets = BlueFirst;
constexpr VBytePattern LumaFirstTriplets = { 1, 0, 3, 0x80, 2, 5, 4, 0x80, 7, 6, 9, 0x80, 8, 11, 10, 0x80 };

template<class TMove>
HWY_INLINE void MoveUnits( const TMove& i_rMove, const uint8_t* i_pSource, uint8_t* o_pTarget, size_t i_Units )
{
  const TMove Move = i_rMove;
  size_t Unit = 0;
  for( ; Unit + TMove::Units + TMove::MarginUnits <= i_Units; Unit += TMove::Units )
  {
    Move( i_pSource + Unit * TMove::SourceBytes, o_pTarget + Unit * TMove::TargetBytes );
  }
  const size_t Rest = i_Units - Unit;
  if( Rest == 0 )
  {
    return;
  }
  alignas( 64 ) uint8_t Source[TailBytes] = {};
  alignas( 64 ) uint8_t Target[TailBytes];
  std::memcpy( Source, i_pSource + Unit * TMove::SourceBytes, Rest * TMove::SourceBytes );
  for( size_t Done = 0; Done < Rest; Done += TMove::Units )
  {
    Move( Source + Done * TMove::SourceBytes, Target + Done * TMove::TargetBytes );
  }
  std::memcpy( o_pTarget + Unit * TMove::TargetBytes, Target, Rest * TMove::TargetBytes );
}

// A row takes whole groups of 48 pixels; what is past its end is 0.
void PackTenBits( const uint8_t* i_pSource, bool i_bLumaFirst, uint8_t* o_pTarget, size_t i_Pixels )
{
  const VPackTenBits Move = { Repeat( i_bLumaFirst ? LumaFirstTriplets : ChromaFirstTriplets ) };
  const size_t Whole = i_Pixels / 6;
  MoveUnits( Move, i_pSource, o_pTarget, Whole );
  uint8_t* const pEnd = o_pTarget + ( i_Pixels + 47 ) / 48 * 128;
  uint8_t* pRest = o_pTarget + 16 * Whole;
  if( i_Pixels % 6 != 0 )
  {
    uint8_t Last[12] = {};
    std::memcpy( Last, i_pSource + 12 * Whole, i_Pixels % 6 * 2 );
    if( i_bLumaFirst && i_Pixels % 2 != 0 )
    {
      // The lone pixel's V is missing, and no other value.
      Last[i_Pixels % 6 * 2 + 1] = 0;
    }
    MoveUnits( Move, Last, pRest, 1 );
    pRest += 16;
  }
  if( pRest != pEnd )
  {
    std::memset( pRest, 0, static_cast<size_t>( pEnd - pRest ) );
  }
}

// Takes six values of ten bits from each group of four words: which byte each begins in, and what brings its highest bit to the top.
struct VTenBitValues
{
  VBytePattern m_Bytes{};
  std::array<uint16_t, 8> m_Factors{};
};

// Every second value of the order U Y V Y
constexpr VTenBitValues SelectTenBits( uint8_t i_First )
{
  constexpr uint16_t Factors[3] = { 64, 16, 4 };
  VTenBitValues Values{};
  for( uint8_t Lane = 0; Lane < 8; ++Lane )
  {
    const uint8_t Value = static_cast<uint8_t>( i_First + 2 * Lane );
    const uint8_t Byte = static_cast<uint8_t>( Value / 3 * 4 + Value % 3 );
    const bool bUsed = Lane < 6;
    Values.m_Bytes[2 * Lane] = bUsed ? Byte : 0x80;
    Values.m_Bytes[2 * Lane + 1] = bUsed ? static_cast<uint8_t>( Byte + 1 ) : 0x80;
    Values.m_Factors[Lane] = bUsed ? Factors[Value % 3] : 0;
  }
  return Values;
}
constexpr VTenBitValues ChromaValues = SelectTenBits( 0 );
constexpr VTenBitValues LumaValues = SelectTenBits( 1 );

// Several groups of 48 pixels, unpacked
class VTenBitPlanes
{
public:
  static constexpr size_t Pixels = 40 * 48;

  // Whole groups of 48 pixels from a place that is a multiple of them. Returns the pixels that are then here, at most i_Pixels.
  size_t Unpack( const uint8_t* i_pRow, size_t i_Pixel, size_t i_Pixels )
  {
    const size_t Here = i_Pixels - i_Pixel < Pixels ? i_Pixels - i_Pixel : Pixels;
    const uint8_t* pWords = i_pRow + i_Pixel / 48 * 128;
    const size_t Groups = ( Here + 47 ) / 48 * 8;
    UnpackValues( LumaValues, pWords, Groups, m_Luma );
    UnpackValues( ChromaValues, pWords, Groups, m_Chroma );
    return Here;
  }

  const int16_t* Luma() const { return m_Luma; }
  const int16_t* Chroma() const { return m_Chroma; }

private:
  // A vector of words has whole groups of six pixels, and 128 bytes have whole vectors.
  static HWY_INLINE void UnpackValues( const VTenBitValues& i_rValues, const uint8_t* i_pWords, size_t i_Groups, int16_t* o_pValues )
  {
    const V8 Order = Repeat( i_rValues.m_Bytes );
    const auto Factors = hn::LoadDup128( VTagUnsigned16(), i_rValues.m_Factors.data() );
    for( size_t Group = 0; Group < i_Groups; Group += Blocks )
    {
      const V8 Bytes = hn::TableLookupBytesOr0( hn::LoadU( VTag8(), i_pWords + 16 * Group ), Order );
      const auto Values = hn::ShiftRight<6>( hn::Mul( hn::BitCast( VTagUnsigned16(), Bytes ), Factors ) );
      hn::StoreU( hn::BitCast( VTag16(), Permute( Values, JoinTriplets ) ), VTag16(), o_pValues + 6 * Group );
    }
  }

  // Readers go up to two steps beyond the last pixel.
  alignas( 64 ) int16_t m_Luma[Pixels + 2 * Step] = {};
  alignas( 64 ) int16_t m_Chroma[Pixels + 2 * Step] = {};
};

template<class TReader>
bool WriteRgb( const TReader& i_rReader, IPixelFormat::Enum i_Target, uint8_t* o_pTarget, size_t i_Pixels )
{
  switch( i_Target )
  {
    case IPixelFormat::ER8G8B8:
    case IPixelFormat::EB8G8R8: ConvertPixels( i_rReader, WriteThreeBytes( i_Target == IPixelFormat::ER8G8B8 ), o_pTarget, i_Pixels ); return true;
    case IPixelFormat::ER8G8B8u8: ConvertPixels( i_rReader, WriteFourBytes<true, TReader::bOpaque>(), o_pTarget, i_Pixels ); return true;
    case IPixelFormat::EB8G8R8u8: ConvertPixels( i_rReader, WriteFourBytes<false, TReader::bOpaque>(), o_pTarget, i_Pixels ); return true;
    default: return false;
  }
}

template<class TReader>
bool WriteAny( const TReader& i_rReader, IPixelFormat::Enum i_Target, uint8_t* o_pTarget, size_t i_Pixels )
{
  switch( i_Target )
  {
    case IPixelFormat::EU8Y8V8Y8:
    case IPixelFormat::EY8U8Y8V8: ConvertPixels( i_rReader, WritePairs( i_Target == IPixelFormat::EY8U8Y8V8 ), o_pTarget, i_Pixels ); return true;
    case IPixelFormat::ELuminance8: ConvertPixels( i_rReader, WriteGrey(), o_pTarget, i_Pixels ); return true;
    default: return WriteRgb( i_rReader, i_Target, o_pTarget, i_Pixels );
  }
}

bool ConvertGrey( const uint8_t* i_pSource, IPixelFormat::Enum i_Target, uint8_t* o_pTarget, size_t i_Pixels )
{
  if( i_Target == IPixelFormat::EU8Y8V8Y8 || i_Target == IPixelFormat::EY8U8Y8V8 )
  {
    MoveUnits( VGreyToPairs{ i_Target == IPixelFormat::EY8U8Y8V8 }, i_pSource, o_pTarget, i_Pixels );
    return true;
  }
  return WriteRgb( ReadGrey( i_pSource ), i_Target, o_pTarget, i_Pixels );
}

template<bool bLumaFirst>
bool ConvertPairs( const uint8_t* i_pSource, IPixelFormat::Enum i_Target, uint8_t* o_pTarget, size_t i_Pixels )
{
  switch( i_Target )
  {
    case IPixelFormat::EU8Y8V8Y8:
    case IPixelFormat::EY8U8Y8V8: MoveUnits( VSwapPairs{ Repeat( SwapPairs ) }, i_pSource, o_pTarget, i_Pixels ); return true;
    case IPixelFormat::EU10Y10V10Y10: PackTenBits( i_pSource, bLumaFirst, o_pTarget, i_Pixels ); return true;
    case IPixelFormat::ELuminance8: MoveUnits( VLumaOfPairs<bLumaFirst>(), i_pSource, o_pTarget, i_Pixels ); return true;
    default: return WriteRgb( ReadPairs<bLumaFirst>( i_pSource ), i_Target, o_pTarget, i_Pixels );
  }
}

// The eight high bits of what has ten
void NarrowTenBits( const VTenBitPlanes& i_rPlanes, IPixelFormat::Enum i_Target, uint8_t* o_pTarget, size_t i_Pixels )
{
  const bool bGrey = i_Target == IPixelFormat::ELuminance8;
  const bool bLumaFirst = i_Target == IPixelFormat::EY8U8Y8V8;
  alignas( 64 ) uint8_t Narrow[2 * VTenBitPlanes::Pixels + VectorBytes];
  for( size_t Pixel = 0; Pixel < i_Pixels; Pixel += Step )
  {
    const V16 Luma = hn::ShiftRight<2>( hn::LoadU( VTag16(), i_rPlanes.Luma() + Pixel ) );
    const V16 Chroma = hn::ShiftRight<2>( hn::LoadU( VTag16(), i_rPlanes.Chroma() + Pixel ) );
    if( bGrey )
    {
      hn::StoreU( hn::DemoteTo( VTagHalf8(), Luma ), VTagHalf8(), Narrow + Pixel );
      continue;
    }
    const V16 Pairs = bLumaFirst ? hn::Or( Luma, hn::ShiftLeft<8>( Chroma ) ) : hn::Or( Chroma, hn::ShiftLeft<8>( Luma ) );
    hn::StoreU( hn::BitCast( VTag8(), Pairs ), VTag8(), Narrow + 2 * Pixel );
  }
  std::memcpy( o_pTarget, Narrow, i_Pixels * ( bGrey ? 1 : 2 ) );
}

bool ConvertTenBits( const uint8_t* i_pSource, IPixelFormat::Enum i_Target, uint8_t* o_pTarget, size_t i_Pixels )
{
  const bool bNarrow = i_Target == IPixelFormat::ELuminance8 || i_Target == IPixelFormat::EU8Y8V8Y8 || i_Target == IPixelFormat::EY8U8Y8V8;
  const size_t TargetBytes = static_cast<size_t>( KVZ::GetImageSize( i_Target, 1, 1 ) );
  VTenBitPlanes Planes;
  for( size_t Pixel = 0; Pixel < i_Pixels; Pixel += VTenBitPlanes::Pixels )
  {
    const size_t Here = Planes.Unpack( i_pSource, Pixel, i_Pixels );
    uint8_t* const pTarget = o_pTarget + Pixel * TargetBytes;
    if( bNarrow )
    {
      NarrowTenBits( Planes, i_Target, pTarget, Here );
    }
    else if( !WriteRgb( ReadPlanes( Planes.Luma(), Planes.Chroma() ), i_Target, pTarget, Here ) )
    {
      return false;
    }
  }
  return true;
}

bool ConvertRowVectors( VRowFormats i_Formats, const uint8_t* i_pSource, uint8_t* o_pTarget, size_t i_Pixels )
{
  const IPixelFormat::Enum Target = i_Formats.m_Target;
  switch( i_Formats.m_Source )
  {
    case IPixelFormat::ER8G8B8: return WriteAny( ReadThreeBytes( i_pSource, true ), Target, o_pTarget, i_Pixels );
    case IPixelFormat::EB8G8R8: return WriteAny( ReadThreeBytes( i_pSource, false ), Target, o_pTarget, i_Pixels );
    case IPixelFormat::ER8G8B8u8: return WriteAny( ReadFourBytes<true>( i_pSource ), Target, o_pTarget, i_Pixels );
    case IPixelFormat::EB8G8R8u8: return WriteAny( ReadFourBytes<false>( i_pSource ), Target, o_pTarget, i_Pixels );
    case IPixelFormat::ER5G6B5: return WriteAny( VReadTwoBytes{ { i_pSource } }, Target, o_pTarget, i_Pixels );
    case IPixelFormat::ELuminance8: return ConvertGrey( i_pSource, Target, o_pTarget, i_Pixels );
    case IPixelFormat::EU8Y8V8Y8: return ConvertPairs<false>( i_pSource, Target, o_pTarget, i_Pixels );
    case IPixelFormat::EY8U8Y8V8: return ConvertPairs<true>( i_pSource, Target, o_pTarget, i_Pixels );
    case IPixelFormat::EU10Y10V10Y10: return ConvertTenBits( i_pSource, Target, o_pTarget, i_Pixels );
    default: return false;
  }
}

#endif

}
}
HWY_AFTER_NAMESPACE();

#if HWY_ONCE
namespace CoreVideoUtils
{

HWY_EXPORT( ConvertRowVectors );

bool ConvertRow( VRowFormats i_Formats, const uint8_t* i_pSource, uint8_t* o_pTarget, size_t i_Pixels )
{
  return i_Formats.m_Source != i_Formats.m_Target && HWY_DYNAMIC_DISPATCH( ConvertRowVectors )( i_Formats, i_pSource, o_pTarget, i_Pixels );
}

}
#endif
