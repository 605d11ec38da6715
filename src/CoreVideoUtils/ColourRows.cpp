#include "CoreVideoUtils/ColourRows.h"

#include "CoreVideoUtils/VectorTargets.h"

#include <algorithm>
#include <array>
#include <cstring>

#undef HWY_TARGET_INCLUDE
#define HWY_TARGET_INCLUDE "CoreVideoUtils/ColourRows.cpp"
#include <hwy/foreach_target.h>

#include "CoreVideoUtils/PixelReaders-inl.h"
#include "CoreVideoUtils/PixelWriters-inl.h"

HWY_BEFORE_NAMESPACE();
namespace CoreVideoUtils
{
namespace HWY_NAMESPACE
{

#if HWY_TARGET == HWY_SCALAR

void MoveToMeanVectors( float i_Amount, uint8_t* io_pPixels, size_t i_Pixels, size_t i_BytesPerPixel )
{
  Reference::MoveToMean( i_Amount, io_pPixels, i_Pixels, i_BytesPerPixel );
}

#else

using VTagFloat = hn::ScalableTag<float>;
using VFloat = hn::Vec<VTagFloat>;

// The highest byte stays; which of the others is which colour does not matter.
HWY_INLINE VPixel MoveToMean( VPixel i_Pixels, VFloat i_Amount )
{
  const V32 Pixels = hn::BitCast( VTag32(), i_Pixels );
  const V32 Low = hn::Set( VTag32(), 0xFF );
  const std::array<V32, 3> Channels = { hn::And( Pixels, Low ), hn::And( hn::ShiftRight<8>( Pixels ), Low ),
    hn::And( hn::ShiftRight<16>( Pixels ), Low ) };
  const VFloat Sum = hn::ConvertTo( VTagFloat(), hn::Add( hn::Add( Channels[0], Channels[1] ), Channels[2] ) );
  const VFloat Mean = hn::Mul( i_Amount, hn::Mul( Sum, hn::Set( VTagFloat(), 0.33333334f ) ) );
  const VFloat Kept = hn::Sub( hn::Set( VTagFloat(), 1.0f ), i_Amount );
  const auto Move = [&]( V32 i_Channel )
  {
    const VFloat Moved = hn::Add( hn::Mul( Kept, hn::ConvertTo( VTagFloat(), i_Channel ) ), Mean );
    const VFloat Limited = hn::Min( hn::Max( Moved, hn::Zero( VTagFloat() ) ), hn::Set( VTagFloat(), 255.0f ) );
    return hn::ConvertTo( VTag32(), hn::Add( Limited, hn::Set( VTagFloat(), 0.5f ) ) );
  };
  const V32 Moved = hn::Or( hn::Or( Move( Channels[0] ), hn::ShiftLeft<8>( Move( Channels[1] ) ) ), hn::ShiftLeft<16>( Move( Channels[2] ) ) );
  return hn::Or( hn::BitCast( VTagPixel(), Moved ), hn::And( i_Pixels, hn::Set( VTagPixel(), 0xFF000000U ) ) );
}

struct VMovingReader
{
  VReadThreeBytes m_Reader;
  VFloat m_Amount;

  HWY_INLINE VPixels operator()( size_t i_Pixel ) const
  {
    const VPixels Pixels = m_Reader( i_Pixel );
    return { MoveToMean( Pixels.m_First, m_Amount ), MoveToMean( Pixels.m_Second, m_Amount ) };
  }
  VMovingReader Rest( size_t i_Pixel, size_t i_Pixels, uint8_t* o_pBuffer ) const
  {
    return { m_Reader.Rest( i_Pixel, i_Pixels, o_pBuffer ), m_Amount };
  }
};

// From copies, as a writer of three bytes goes beyond its step.
void MoveThreeBytes( VFloat i_Amount, uint8_t* io_pPixels, size_t i_Pixels )
{
  constexpr size_t ChunkPixels = 1920;
  uint8_t Copy[ChunkPixels * 3];
  for( size_t Pixel = 0; Pixel < i_Pixels; Pixel += ChunkPixels )
  {
    const size_t Here = std::min( ChunkPixels, i_Pixels - Pixel );
    uint8_t* const pHere = io_pPixels + 3 * Pixel;
    std::memcpy( Copy, pHere, 3 * Here );
    ConvertPixels( VMovingReader{ ReadThreeBytes( Copy, false ), i_Amount }, WriteThreeBytes( false ), pHere, Here );
  }
}

void MoveFourBytes( VFloat i_Amount, uint8_t* io_pPixels, size_t i_Pixels )
{
  constexpr size_t PixelsAtOnce = VectorBytes / 4;
  const auto Move = [&]( uint8_t* io_pSome )
  {
    const VPixel Pixels = hn::BitCast( VTagPixel(), hn::LoadU( VTag8(), io_pSome ) );
    hn::StoreU( hn::BitCast( VTag8(), MoveToMean( Pixels, i_Amount ) ), VTag8(), io_pSome );
  };
  size_t Pixel = 0;
  for( ; Pixel + PixelsAtOnce <= i_Pixels; Pixel += PixelsAtOnce )
  {
    Move( io_pPixels + 4 * Pixel );
  }
  alignas( 64 ) uint8_t Rest[VectorBytes] = {};
  std::copy_n( io_pPixels + 4 * Pixel, 4 * ( i_Pixels - Pixel ), Rest );
  Move( Rest );
  std::copy_n( Rest, 4 * ( i_Pixels - Pixel ), io_pPixels + 4 * Pixel );
}

void MoveToMeanVectors( float i_Amount, uint8_t* io_pPixels, size_t i_Pixels, size_t i_BytesPerPixel )
{
  const VFloat Amount = hn::Set( VTagFloat(), i_Amount );
  i_BytesPerPixel == 3 ? MoveThreeBytes( Amount, io_pPixels, i_Pixels ) : MoveFourBytes( Amount, io_pPixels, i_Pixels );
}

#endif

}
}
HWY_AFTER_NAMESPACE();

#if HWY_ONCE
namespace CoreVideoUtils
{

HWY_EXPORT( MoveToMeanVectors );

void MoveToMean( float i_Amount, uint8_t* io_pPixels, size_t i_Pixels, size_t i_BytesPerPixel )
{
  HWY_DYNAMIC_DISPATCH( MoveToMeanVectors )( i_Amount, io_pPixels, i_Pixels, i_BytesPerPixel );
}

void Reference::MoveToMean( float i_Amount, uint8_t* io_pPixels, size_t i_Pixels, size_t i_BytesPerPixel )
{
  for( uint8_t* pPixel = io_pPixels; pPixel != io_pPixels + i_Pixels * i_BytesPerPixel; pPixel += i_BytesPerPixel )
  {
    const float Mean = static_cast<float>( pPixel[0] + pPixel[1] + pPixel[2] ) * 0.33333334f;
    for( size_t Channel = 0; Channel < 3; ++Channel )
    {
      const float Moved = ( 1.0f - i_Amount ) * static_cast<float>( pPixel[Channel] ) + i_Amount * Mean;
      pPixel[Channel] = static_cast<uint8_t>( std::clamp( Moved, 0.0f, 255.0f ) + 0.5f );
    }
  }
}

}
#endif
