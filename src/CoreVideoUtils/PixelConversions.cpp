#include "CoreVideoUtils/PixelConversions.h"

#include "CoreVideoUtils/MosaicRows.h"
#include "CoreVideoUtils/PackedBits.h"
#include "CoreVideoUtils/PixelRows.h"
#include "StageCoreRuntime/DebugServices.h"
#include "StageCoreRuntime/GlobalLog.h"

namespace CoreVideoUtils
{

namespace
{

using KVZ::IPixelFormat;

bool Require( VFormatSet i_Set, IPixelFormat::Enum i_Format )
{
  const bool bContains = Contains( i_Set, i_Format );
  if( !bContains )
  {
    KVZ_LOG_ERROR( "CoreVideoUtils", "Unsupported video format [%1%]", KVZ::ToName( i_Format ) );
  }
  return bContains;
}

// Rows follow one another without padding, and no pixel depends on where a row ends.
bool HasJoinedRows( IPixelFormat::Enum i_Format, uint32_t i_Width )
{
  if( i_Format == IPixelFormat::EU10Y10V10Y10 )
  {
    return i_Width % 48 == 0;
  }
  return i_Width % 2 == 0 || !Contains( PairFormats, i_Format );
}

bool ConvertRows( const VConversion& i_rConversion )
{
  const VRowFormats Formats = { i_rConversion.m_Source, i_rConversion.m_Target };
  const uint32_t Width = i_rConversion.m_Width;
  if( HasJoinedRows( Formats.m_Source, Width ) && HasJoinedRows( Formats.m_Target, Width ) )
  {
    return ConvertRow( Formats, i_rConversion.m_pSource, i_rConversion.m_pTarget, size_t{ Width } * i_rConversion.m_Height );
  }
  const uint64_t SourceStride = KVZ::GetImageSize( Formats.m_Source, Width, 1 );
  const uint64_t TargetStride = KVZ::GetImageSize( Formats.m_Target, Width, 1 );
  bool bDone = true;
  for( uint64_t Row = 0; bDone && Row < i_rConversion.m_Height; ++Row )
  {
    bDone = ConvertRow( Formats, i_rConversion.m_pSource + Row * SourceStride, i_rConversion.m_pTarget + Row * TargetStride, Width );
  }
  return bDone;
}

void RequirePairs( uint32_t i_Width, uint32_t i_Height ) { KVZ_ASSERT( ( ( i_Width * i_Height ) % 2 ) == 0 ); }

// Bits a pixel of the packed formats
size_t BitsOf( IPixelFormat::Enum i_Format ) { return i_Format == IPixelFormat::EBayerGB7 || i_Format == IPixelFormat::ELuminance7 ? 7 : 6; }

bool ArePacked( IPixelFormat::Enum i_Packed, IPixelFormat::Enum i_Bytes )
{
  return ( i_Bytes == IPixelFormat::ELuminance8 && Contains( PackedLuminanceFormats, i_Packed ) ) ||
    ( i_Bytes == IPixelFormat::EBayerGB8 && Contains( PackedBayerFormats, i_Packed ) );
}

}

bool ConvertColour( const VConversion& i_rConversion )
{
  constexpr VFormatSet Grey = MakeFormatSet( { IPixelFormat::ELuminance8 } );
  constexpr VFormatSet Sources = RgbFormats | Grey | MakeFormatSet( { IPixelFormat::ER5G6B5 } );
  return Contains( Sources, i_rConversion.m_Source ) && Contains( RgbFormats | Grey, i_rConversion.m_Target ) && ConvertRows( i_rConversion );
}

bool ConvertFromYuv( const VConversion& i_rConversion )
{
  constexpr VFormatSet Targets = RgbFormats | MakeFormatSet( { IPixelFormat::ELuminance8 } );
  if( !Require( YuvFormats, i_rConversion.m_Source ) || !Require( Targets, i_rConversion.m_Target ) )
  {
    return false;
  }
  if( i_rConversion.m_Source == IPixelFormat::EU10Y10V10Y10 && i_rConversion.m_Target != IPixelFormat::ELuminance8 )
  {
    RequirePairs( i_rConversion.m_Width, i_rConversion.m_Height );
  }
  return ConvertRows( i_rConversion );
}

bool ConvertToPairs( const VConversion& i_rConversion )
{
  constexpr VFormatSet Sources = RgbFormats | MakeFormatSet( { IPixelFormat::ER5G6B5, IPixelFormat::ELuminance8, IPixelFormat::EU10Y10V10Y10 } );
  return Require( Sources, i_rConversion.m_Source ) && Require( PairFormats, i_rConversion.m_Target ) && ConvertRows( i_rConversion );
}

bool ConvertToTenBits( const VConversion& i_rConversion )
{
  return Require( PairFormats, i_rConversion.m_Source ) && Require( MakeFormatSet( { IPixelFormat::EU10Y10V10Y10 } ), i_rConversion.m_Target ) &&
    ConvertRows( i_rConversion );
}

bool SwapPairs( const VConversion& i_rConversion )
{
  return Require( PairFormats, i_rConversion.m_Source ) && Require( PairFormats, i_rConversion.m_Target ) &&
    i_rConversion.m_Source != i_rConversion.m_Target && ConvertRows( i_rConversion );
}

bool Demosaic( const VConversion& i_rConversion )
{
  if( !Contains( BayerFormats, i_rConversion.m_Source ) || !Contains( RgbFormats | PairFormats, i_rConversion.m_Target ) )
  {
    return false;
  }
  const bool bCorrect = Contains( RgbFormats, i_rConversion.m_Target ) && !i_rConversion.m_Corrector.IsNeutral();
  const uint64_t PixelBytes = KVZ::GetImageSize( i_rConversion.m_Target, 1, 1 );
  VMosaicRows Rows( i_rConversion, VMosaicRows::EOutside::Nearest );
  uint8_t* pTarget = i_rConversion.m_pTarget;
  for( int64_t Row = 0; Row < i_rConversion.m_Height; ++Row )
  {
    DemosaicRow( { Rows.Get( Row - 2 ), Rows.Get( Row - 1 ), Rows.Get( Row ), Rows.Get( Row + 1 ), Rows.Get( Row + 2 ) }, Rows.Colours( Row ),
      i_rConversion.m_Target, pTarget, i_rConversion.m_Width );
    if( bCorrect )
    {
      i_rConversion.m_Corrector.Apply( pTarget, i_rConversion.m_Width, PixelBytes );
    }
    pTarget += i_rConversion.m_Width * PixelBytes;
  }
  return true;
}

bool FilterBayer( const VConversion& i_rConversion )
{
  const uint64_t Pixels = uint64_t{ i_rConversion.m_Width } * i_rConversion.m_Height;
  if( !Contains( BayerFormats, i_rConversion.m_Source ) || i_rConversion.m_Target != IPixelFormat::ELuminance8 ||
    i_rConversion.m_TargetSize != Pixels )
  {
    return false;
  }
  VMosaicRows Rows( i_rConversion, VMosaicRows::EOutside::Zero );
  uint8_t* pTarget = i_rConversion.m_pTarget;
  for( int64_t Row = 0; Row < i_rConversion.m_Height; ++Row, pTarget += i_rConversion.m_Width )
  {
    FilterBayerRow( { Rows.Get( Row - 1 ), Rows.Get( Row ), Rows.Get( Row + 1 ) }, Rows.Colours( Row ), pTarget, i_rConversion.m_Width );
  }
  return true;
}

bool PackPixels( const VConversion& i_rConversion )
{
  if( !ArePacked( i_rConversion.m_Target, i_rConversion.m_Source ) )
  {
    return false;
  }
  PackBits( BitsOf( i_rConversion.m_Target ), i_rConversion.m_pSource, i_rConversion.m_pTarget,
    size_t{ i_rConversion.m_Width } * i_rConversion.m_Height );
  return true;
}

bool UnpackPixels( const VConversion& i_rConversion )
{
  if( !ArePacked( i_rConversion.m_Source, i_rConversion.m_Target ) )
  {
    return false;
  }
  UnpackBits( BitsOf( i_rConversion.m_Source ), i_rConversion.m_pSource, i_rConversion.m_pTarget,
    size_t{ i_rConversion.m_Width } * i_rConversion.m_Height );
  return true;
}

}
