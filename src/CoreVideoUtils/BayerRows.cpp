#include "CoreVideoUtils/PixelRows.h"

#include "CoreVideoUtils/ReferencePixels.h"
#include "CoreVideoUtils/VectorTargets.h"

#undef HWY_TARGET_INCLUDE
#define HWY_TARGET_INCLUDE "CoreVideoUtils/BayerRows.cpp"
#include <hwy/foreach_target.h>

#include "CoreVideoUtils/PixelWriters-inl.h"

HWY_BEFORE_NAMESPACE();
namespace CoreVideoUtils
{
namespace HWY_NAMESPACE
{

using VThreeRows = std::array<const uint8_t*, 3>;
using VFiveRows = std::array<const uint8_t*, 5>;

#if HWY_TARGET == HWY_SCALAR

bool DemosaicRowVectors( const VFiveRows& i_rRows, VBayerRow i_Row, KVZ::IPixelFormat::Enum i_Target, uint8_t* o_pTarget, size_t i_Pixels )
{
  return Reference::DemosaicRow( i_rRows, i_Row, i_Target, o_pTarget, i_Pixels );
}

void FilterBayerRowVectors( const VThreeRows& i_rRows, VBayerRow i_Row, uint8_t* o_pTarget, size_t i_Pixels )
{
  Reference::FilterBayerRow( i_rRows, i_Row, o_pTarget, i_Pixels );
}

#else

using KVZ::IPixelFormat;
using VTagHalf8 = hn::Rebind<uint8_t, VTag16>;

static_assert( BayerSlack >= 2 * Step );

HWY_INLINE V16 LoadPixels( const uint8_t* i_pPixels ) { return hn::PromoteTo( VTag16(), hn::LoadU( VTagHalf8(), i_pPixels ) ); }

// The lanes that are not green
HWY_INLINE hn::Mask<VTag16> ColourLanes( bool i_bColourFirst ) { return hn::MaskFromVec( i_bColourFirst ? Alternate( -1, 0 ) : Alternate( 0, -1 ) ); }

// Reads across the five rows. All four filters are computed for each pixel, in sixteenths, from the sums that they have in common; the pixel's
// place then says which two it takes.
struct VReadMosaic
{
  VFiveRows m_Rows;
  bool m_bRed;
  hn::Mask<VTag16> m_ColourLanes;

  HWY_INLINE VPixels operator()( size_t i_Pixel ) const
  {
    const uint8_t* const pAbove = m_Rows[1] + i_Pixel;
    const uint8_t* const pOwn = m_Rows[2] + i_Pixel;
    const uint8_t* const pBelow = m_Rows[3] + i_Pixel;
    const V16 Centre = LoadPixels( pOwn );
    const V16 ColumnFar = hn::Add( LoadPixels( m_Rows[0] + i_Pixel ), LoadPixels( m_Rows[4] + i_Pixel ) );
    const V16 ColumnNear = hn::Add( LoadPixels( pAbove ), LoadPixels( pBelow ) );
    const V16 RowFar = hn::Add( LoadPixels( pOwn - 2 ), LoadPixels( pOwn + 2 ) );
    const V16 RowNear = hn::Add( LoadPixels( pOwn - 1 ), LoadPixels( pOwn + 1 ) );
    const V16 Diagonal = hn::Add( hn::Add( LoadPixels( pAbove - 1 ), LoadPixels( pAbove + 1 ) ),
      hn::Add( LoadPixels( pBelow - 1 ), LoadPixels( pBelow + 1 ) ) );

    const V16 Far = hn::Add( ColumnFar, RowFar );
    // 8 C - 2 Far, and the half that rounds
    const V16 Common = hn::Add( hn::Sub( hn::ShiftLeft<3>( Centre ), hn::ShiftLeft<1>( Far ) ), hn::Set( VTag16(), 8 ) );
    const V16 GreenAtColour = hn::Add( Common, hn::ShiftLeft<2>( hn::Add( ColumnNear, RowNear ) ) );
    const V16 OtherAtColour = hn::Add( Common, hn::Sub( hn::ShiftLeft<2>( hn::Add( Centre, Diagonal ) ), Far ) );
    const V16 AtGreen = hn::Add( Common, hn::ShiftLeft<1>( hn::Sub( Centre, Diagonal ) ) );
    const V16 RowAtGreen = hn::Add( AtGreen, hn::Add( Thrice( ColumnFar ), hn::ShiftLeft<3>( RowNear ) ) );
    const V16 ColumnAtGreen = hn::Add( AtGreen, hn::Add( Thrice( RowFar ), hn::ShiftLeft<3>( ColumnNear ) ) );

    const V16 First = hn::ShiftRight<4>( hn::IfThenElse( m_ColourLanes, GreenAtColour, RowAtGreen ) );
    const V16 Other = Split( hn::ShiftRight<4>( hn::IfThenElse( m_ColourLanes, OtherAtColour, ColumnAtGreen ) ) );
    const V16 Green = Split( hn::IfThenElse( m_ColourLanes, First, Centre ) );
    const V16 RowColour = Split( hn::IfThenElse( m_ColourLanes, Centre, First ) );
    return m_bRed ? MergeChannels( RowColour, Green, Other ) : MergeChannels( Other, Green, RowColour );
  }
  VReadMosaic Rest( size_t i_Pixel, size_t, uint8_t* ) const
  {
    VReadMosaic Reader = *this;
    for( const uint8_t*& rpRow : Reader.m_Rows )
    {
      rpRow += i_Pixel;
    }
    return Reader;
  }

private:
  static HWY_INLINE V16 Thrice( V16 i_Sum ) { return hn::Add( i_Sum, hn::ShiftLeft<1>( i_Sum ) ); }
  static HWY_INLINE V16 Split( V16 i_Channel ) { return Permute( i_Channel, SplitHalves ); }
};

bool DemosaicRowVectors( const VFiveRows& i_rRows, VBayerRow i_Row, IPixelFormat::Enum i_Target, uint8_t* o_pTarget, size_t i_Pixels )
{
  const VReadMosaic Reader = { i_rRows, i_Row.m_bRed, ColourLanes( i_Row.m_bColourFirst ) };
  switch( i_Target )
  {
    case IPixelFormat::ER8G8B8:
    case IPixelFormat::EB8G8R8: ConvertPixels( Reader, WriteThreeBytes( i_Target == IPixelFormat::ER8G8B8 ), o_pTarget, i_Pixels ); return true;
    case IPixelFormat::ER8G8B8u8: ConvertPixels( Reader, WriteFourBytes<true, true>(), o_pTarget, i_Pixels ); return true;
    case IPixelFormat::EB8G8R8u8: ConvertPixels( Reader, WriteFourBytes<false, true>(), o_pTarget, i_Pixels ); return true;
    case IPixelFormat::EU8Y8V8Y8:
    case IPixelFormat::EY8U8Y8V8: ConvertPixels( Reader, WritePairs( i_Target == IPixelFormat::EY8U8Y8V8 ), o_pTarget, i_Pixels ); return true;
    default: return false;
  }
}

// Twelfths: a colour counts four, and so do green and the other colour, each in parts of what is around. A green pixel's six parts are doubled.
HWY_INLINE V16 FilterPixels( const VThreeRows& i_rRows, size_t i_Pixel, hn::Mask<VTag16> i_ColourLanes )
{
  const uint8_t* const pAbove = i_rRows[0] + i_Pixel;
  const uint8_t* const pOwn = i_rRows[1] + i_Pixel;
  const uint8_t* const pBelow = i_rRows[2] + i_Pixel;
  const V16 Beside = hn::Add( hn::Add( LoadPixels( pAbove ), LoadPixels( pBelow ) ), hn::Add( LoadPixels( pOwn - 1 ), LoadPixels( pOwn + 1 ) ) );
  const V16 Diagonal = hn::Add( hn::Add( LoadPixels( pAbove - 1 ), LoadPixels( pAbove + 1 ) ),
    hn::Add( LoadPixels( pBelow - 1 ), LoadPixels( pBelow + 1 ) ) );
  const V16 Around = hn::Add( Beside, hn::IfThenElse( i_ColourLanes, Diagonal, Beside ) );
  // 5462 is a twelfth of 65536, and enough more to make the division exact up to 3060.
  return hn::MulHigh( hn::Add( hn::ShiftLeft<2>( LoadPixels( pOwn ) ), Around ), hn::Set( VTag16(), 5462 ) );
}

void FilterBayerRowVectors( const VThreeRows& i_rRows, VBayerRow i_Row, uint8_t* o_pTarget, size_t i_Pixels )
{
  const hn::Mask<VTag16> Lanes = ColourLanes( i_Row.m_bColourFirst );
  size_t Pixel = 0;
  for( ; Pixel + Step <= i_Pixels; Pixel += Step )
  {
    hn::StoreU( hn::DemoteTo( VTagHalf8(), FilterPixels( i_rRows, Pixel, Lanes ) ), VTagHalf8(), o_pTarget + Pixel );
  }
  if( Pixel < i_Pixels )
  {
    alignas( 64 ) uint8_t Rest[Step];
    hn::StoreU( hn::DemoteTo( VTagHalf8(), FilterPixels( i_rRows, Pixel, Lanes ) ), VTagHalf8(), Rest );
    std::memcpy( o_pTarget + Pixel, Rest, i_Pixels - Pixel );
  }
}

#endif

}
}
HWY_AFTER_NAMESPACE();

#if HWY_ONCE
namespace CoreVideoUtils
{

HWY_EXPORT( DemosaicRowVectors );
HWY_EXPORT( FilterBayerRowVectors );

bool DemosaicRow( const std::array<const uint8_t*, 5>& i_rRows, VBayerRow i_Row, KVZ::IPixelFormat::Enum i_Target, uint8_t* o_pTarget,
  size_t i_Pixels )
{
  return HWY_DYNAMIC_DISPATCH( DemosaicRowVectors )( i_rRows, i_Row, i_Target, o_pTarget, i_Pixels );
}

void FilterBayerRow( const std::array<const uint8_t*, 3>& i_rRows, VBayerRow i_Row, uint8_t* o_pTarget, size_t i_Pixels )
{
  HWY_DYNAMIC_DISPATCH( FilterBayerRowVectors )( i_rRows, i_Row, o_pTarget, i_Pixels );
}

}
#endif
