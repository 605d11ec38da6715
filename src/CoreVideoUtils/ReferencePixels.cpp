#include "CoreVideoUtils/ReferencePixels.h"

#include <algorithm>
#include <cstring>

namespace CoreVideoUtils::Reference
{

namespace
{

using KVZ::IPixelFormat;

struct VColour
{
  uint8_t m_Red;
  uint8_t m_Green;
  uint8_t m_Blue;
};

// Eight or ten bits each
struct VYuv
{
  int32_t m_Y;
  int32_t m_U;
  int32_t m_V;
};

uint8_t ToByte( int32_t i_Value ) { return static_cast<uint8_t>( std::clamp( i_Value, 0, 255 ) ); }

VColour ToColour( const VYuv& i_rYuv )
{
  return { ToByte( ( 65536 * i_rYuv.m_Y + 91947 * ( i_rYuv.m_V - 128 ) ) >> 16 ),
    ToByte( ( 65536 * i_rYuv.m_Y + 8875008 - 46792 * i_rYuv.m_V - 22544 * i_rYuv.m_U ) >> 16 ),
    ToByte( ( 65536 * i_rYuv.m_Y + 115998 * ( i_rYuv.m_U - 128 ) ) >> 16 ) };
}

VColour TenBitsToColour( const VYuv& i_rYuv )
{
  return { ToByte( ( 16384 * i_rYuv.m_Y + 22986 * ( i_rYuv.m_V - 512 ) ) >> 16 ),
    ToByte( ( 16384 * i_rYuv.m_Y + 8875008 - 5636 * i_rYuv.m_U - 11698 * i_rYuv.m_V ) >> 16 ),
    ToByte( ( 16384 * i_rYuv.m_Y + 28999 * ( i_rYuv.m_U - 512 ) ) >> 16 ) };
}

VYuv ToYuv( const VColour& i_rColour )
{
  const int32_t Red = i_rColour.m_Red;
  const int32_t Green = i_rColour.m_Green;
  const int32_t Blue = i_rColour.m_Blue;
  return { ToByte( ( 19595 * Red + 38469 * Green + 7471 * Blue ) >> 16 ), ToByte( ( -9642 * Red - 18930 * Green + 28573 * Blue + 8388608 ) >> 16 ),
    ToByte( ( 40304 * Red - 33750 * Green - 6554 * Blue + 8388608 ) >> 16 ) };
}

bool IsFourTwoTwo( IPixelFormat::Enum i_Format ) { return i_Format == IPixelFormat::EU8Y8V8Y8 || i_Format == IPixelFormat::EY8U8Y8V8; }

bool IsYuv( IPixelFormat::Enum i_Format ) { return IsFourTwoTwo( i_Format ) || i_Format == IPixelFormat::EU10Y10V10Y10; }

struct VSourceRow
{
  IPixelFormat::Enum m_Format;
  const uint8_t* m_pBytes;
  size_t m_Pixels;
};

VYuv ReadFourTwoTwo( const VSourceRow& i_rRow, size_t i_Pixel )
{
  const size_t Luma = i_rRow.m_Format == IPixelFormat::EU8Y8V8Y8 ? 1 : 0;
  const uint8_t* pPair = i_rRow.m_pBytes + 4 * ( i_Pixel / 2 ) + 1 - Luma;
  int32_t V = 128;
  if( 2 * ( i_Pixel / 2 ) + 1 < i_rRow.m_Pixels )
  {
    V = pPair[2];
  }
  else if( i_Pixel > 0 )
  {
    V = pPair[-2];
  }
  return { i_rRow.m_pBytes[2 * i_Pixel + Luma], pPair[0], V };
}

// The k-th value of a row in the order U Y V Y
int32_t ReadTenBits( const uint8_t* i_pRow, size_t i_Index )
{
  uint32_t Word = 0;
  std::memcpy( &Word, i_pRow + i_Index / 3 * 4, sizeof( Word ) );
  return static_cast<int32_t>( Word >> ( 10 * ( i_Index % 3 ) ) & 0x3FF );
}

VYuv ReadTenBitPixel( const uint8_t* i_pRow, size_t i_Pixel )
{
  const size_t Pair = i_Pixel / 2 * 4;
  return { ReadTenBits( i_pRow, 2 * i_Pixel + 1 ), ReadTenBits( i_pRow, Pair ), ReadTenBits( i_pRow, Pair + 2 ) };
}

VYuv ReadYuv( const VSourceRow& i_rRow, size_t i_Pixel )
{
  return IsFourTwoTwo( i_rRow.m_Format ) ? ReadFourTwoTwo( i_rRow, i_Pixel ) : ReadTenBitPixel( i_rRow.m_pBytes, i_Pixel );
}

VColour ReadPackedColour( const uint8_t* i_pPixel )
{
  uint16_t Bits = 0;
  std::memcpy( &Bits, i_pPixel, sizeof( Bits ) );
  return { static_cast<uint8_t>( Bits >> 8 & 0xF8 ), static_cast<uint8_t>( Bits >> 3 & 0xFC ), static_cast<uint8_t>( Bits << 3 & 0xF8 ) };
}

VColour ReadColour( const VSourceRow& i_rRow, size_t i_Pixel )
{
  const uint8_t* pThree = i_rRow.m_pBytes + 3 * i_Pixel;
  const uint8_t* pFour = i_rRow.m_pBytes + 4 * i_Pixel;
  switch( i_rRow.m_Format )
  {
    case IPixelFormat::ER8G8B8: return { pThree[0], pThree[1], pThree[2] };
    case IPixelFormat::EB8G8R8: return { pThree[2], pThree[1], pThree[0] };
    case IPixelFormat::ER8G8B8u8: return { pFour[0], pFour[1], pFour[2] };
    case IPixelFormat::EB8G8R8u8: return { pFour[2], pFour[1], pFour[0] };
    case IPixelFormat::ER5G6B5: return ReadPackedColour( i_rRow.m_pBytes + 2 * i_Pixel );
    case IPixelFormat::EU10Y10V10Y10: return TenBitsToColour( ReadYuv( i_rRow, i_Pixel ) );
    case IPixelFormat::EU8Y8V8Y8:
    case IPixelFormat::EY8U8Y8V8: return ToColour( ReadYuv( i_rRow, i_Pixel ) );
    default: return { i_rRow.m_pBytes[i_Pixel], i_rRow.m_pBytes[i_Pixel], i_rRow.m_pBytes[i_Pixel] };
  }
}

bool WriteColour( IPixelFormat::Enum i_Format, uint8_t* o_pRow, size_t i_Pixel, const VColour& i_rColour )
{
  const bool bFour = i_Format == IPixelFormat::ER8G8B8u8 || i_Format == IPixelFormat::EB8G8R8u8;
  const bool bRedFirst = i_Format == IPixelFormat::ER8G8B8 || i_Format == IPixelFormat::ER8G8B8u8;
  if( !bFour && !bRedFirst && i_Format != IPixelFormat::EB8G8R8 )
  {
    return false;
  }
  uint8_t* pPixel = o_pRow + i_Pixel * ( bFour ? 4 : 3 );
  pPixel[0] = bRedFirst ? i_rColour.m_Red : i_rColour.m_Blue;
  pPixel[1] = i_rColour.m_Green;
  pPixel[2] = bRedFirst ? i_rColour.m_Blue : i_rColour.m_Red;
  if( bFour )
  {
    pPixel[3] = 255;
  }
  return true;
}

void WriteFourTwoTwo( IPixelFormat::Enum i_Format, uint8_t* o_pRow, size_t i_Pixel, const VYuv& i_rYuv )
{
  const size_t Luma = i_Format == IPixelFormat::EU8Y8V8Y8 ? 1 : 0;
  o_pRow[2 * i_Pixel + Luma] = static_cast<uint8_t>( i_rYuv.m_Y );
  o_pRow[2 * i_Pixel + 1 - Luma] = static_cast<uint8_t>( i_Pixel % 2 == 0 ? i_rYuv.m_U : i_rYuv.m_V );
}

// Groups of six pixels in four words. The third value of a word keeps its six high bits alone.
void WriteTenBits( const VSourceRow& i_rRow, uint8_t* o_pRow )
{
  const size_t Luma = i_rRow.m_Format == IPixelFormat::EU8Y8V8Y8 ? 1 : 0;
  const auto Value = [&]( size_t i_Index ) -> uint32_t
  { return i_Index < 2 * i_rRow.m_Pixels ? i_rRow.m_pBytes[Luma == 1 ? i_Index : i_Index ^ 1U] : 0; };
  const size_t Words = ( i_rRow.m_Pixels + 47 ) / 48 * 32;
  for( size_t Word = 0; Word < Words; ++Word )
  {
    const uint32_t Bits = Value( 3 * Word ) << 2 | Value( 3 * Word + 1 ) << 12 | Value( 3 * Word + 2 ) >> 2 << 24;
    std::memcpy( o_pRow + 4 * Word, &Bits, sizeof( Bits ) );
  }
}

uint8_t ToGrey( const VSourceRow& i_rRow, size_t i_Pixel )
{
  if( i_rRow.m_Format == IPixelFormat::EU10Y10V10Y10 )
  {
    return static_cast<uint8_t>( ReadYuv( i_rRow, i_Pixel ).m_Y >> 2 );
  }
  if( IsYuv( i_rRow.m_Format ) )
  {
    return static_cast<uint8_t>( ReadYuv( i_rRow, i_Pixel ).m_Y );
  }
  const VColour Colour = ReadColour( i_rRow, i_Pixel );
  return static_cast<uint8_t>( ( Colour.m_Red + Colour.m_Green + Colour.m_Blue ) / 3 );
}

// Grey has the Y of its value and no colour; a YUV source keeps its own values.
VYuv ToFourTwoTwo( const VSourceRow& i_rRow, size_t i_Pixel )
{
  if( i_rRow.m_Format == IPixelFormat::ELuminance8 )
  {
    return { i_rRow.m_pBytes[i_Pixel], 128, 128 };
  }
  if( !IsYuv( i_rRow.m_Format ) )
  {
    return ToYuv( ReadColour( i_rRow, i_Pixel ) );
  }
  VYuv Yuv = ReadYuv( i_rRow, i_Pixel );
  if( i_rRow.m_Format == IPixelFormat::EU10Y10V10Y10 )
  {
    Yuv = { Yuv.m_Y >> 2, Yuv.m_U >> 2, Yuv.m_V >> 2 };
  }
  return Yuv;
}

bool IsSource( IPixelFormat::Enum i_Format )
{
  return i_Format == IPixelFormat::ELuminance8 || ( i_Format >= IPixelFormat::ER5G6B5 && i_Format <= IPixelFormat::EU10Y10V10Y10 );
}

bool ConvertPixel( const VSourceRow& i_rRow, IPixelFormat::Enum i_Target, uint8_t* o_pRow, size_t i_Pixel )
{
  if( IsFourTwoTwo( i_Target ) )
  {
    WriteFourTwoTwo( i_Target, o_pRow, i_Pixel, ToFourTwoTwo( i_rRow, i_Pixel ) );
    return true;
  }
  if( i_Target == IPixelFormat::ELuminance8 )
  {
    o_pRow[i_Pixel] = ToGrey( i_rRow, i_Pixel );
    return true;
  }
  return WriteColour( i_Target, o_pRow, i_Pixel, ReadColour( i_rRow, i_Pixel ) );
}

// The filter's coefficients, in sixteenths: of the pixel itself, the sum of its four diagonal neighbours, the sums of its two neighbours at a
// distance of 2 and of 1 in its column, and the same in its row.
struct VKernel
{
  int32_t m_Centre;
  int32_t m_Diagonal;
  int32_t m_ColumnFar;
  int32_t m_ColumnNear;
  int32_t m_RowFar;
  int32_t m_RowNear;
};
constexpr VKernel GreenAtColour = { 8, 0, -2, 4, -2, 4 };
constexpr VKernel OtherAtColour = { 12, 4, -3, 0, -3, 0 };
constexpr VKernel RowColourAtGreen = { 10, -2, 1, 0, -2, 8 };
constexpr VKernel ColumnColourAtGreen = { 10, -2, -2, 8, 1, 0 };

using VFiveRows = std::array<const uint8_t*, 5>;

// Rounded to the nearest byte.
uint8_t Filter( const VFiveRows& i_rRows, size_t i_Pixel, const VKernel& i_rKernel )
{
  const auto At = [&]( int i_Row, int i_Column )
  { return int32_t{ i_rRows[static_cast<size_t>( i_Row + 2 )][static_cast<std::ptrdiff_t>( i_Pixel ) + i_Column] }; };
  const int32_t Sum = i_rKernel.m_Centre * At( 0, 0 ) + i_rKernel.m_Diagonal * ( At( -1, -1 ) + At( -1, 1 ) + At( 1, -1 ) + At( 1, 1 ) ) +
    i_rKernel.m_ColumnFar * ( At( -2, 0 ) + At( 2, 0 ) ) + i_rKernel.m_ColumnNear * ( At( -1, 0 ) + At( 1, 0 ) ) +
    i_rKernel.m_RowFar * ( At( 0, -2 ) + At( 0, 2 ) ) + i_rKernel.m_RowNear * ( At( 0, -1 ) + At( 0, 1 ) );
  return ToByte( ( Sum + 8 ) >> 4 );
}

VColour Demosaic( const VFiveRows& i_rRows, VBayerRow i_Row, size_t i_Pixel )
{
  const uint8_t Own = i_rRows[2][i_Pixel];
  const bool bColour = ( i_Pixel % 2 == 0 ) == i_Row.m_bColourFirst;
  const uint8_t Green = bColour ? Filter( i_rRows, i_Pixel, GreenAtColour ) : Own;
  const uint8_t RowColour = bColour ? Own : Filter( i_rRows, i_Pixel, RowColourAtGreen );
  const uint8_t Other = Filter( i_rRows, i_Pixel, bColour ? OtherAtColour : ColumnColourAtGreen );
  return i_Row.m_bRed ? VColour{ RowColour, Green, Other } : VColour{ Other, Green, RowColour };
}

}

bool ConvertRow( VRowFormats i_Formats, const uint8_t* i_pSource, uint8_t* o_pTarget, size_t i_Pixels )
{
  const VSourceRow Row = { i_Formats.m_Source, i_pSource, i_Pixels };
  if( i_Formats.m_Target == IPixelFormat::EU10Y10V10Y10 && IsFourTwoTwo( i_Formats.m_Source ) )
  {
    WriteTenBits( Row, o_pTarget );
    return true;
  }
  bool bDone = IsSource( i_Formats.m_Source ) && i_Formats.m_Source != i_Formats.m_Target;
  for( size_t Pixel = 0; bDone && Pixel < i_Pixels; ++Pixel )
  {
    bDone = ConvertPixel( Row, i_Formats.m_Target, o_pTarget, Pixel );
  }
  return bDone;
}

bool DemosaicRow( const VFiveRows& i_rRows, VBayerRow i_Row, IPixelFormat::Enum i_Target, uint8_t* o_pTarget, size_t i_Pixels )
{
  bool bDone = true;
  for( size_t Pixel = 0; bDone && Pixel < i_Pixels; ++Pixel )
  {
    const VColour Colour = Demosaic( i_rRows, i_Row, Pixel );
    if( IsFourTwoTwo( i_Target ) )
    {
      WriteFourTwoTwo( i_Target, o_pTarget, Pixel, ToYuv( Colour ) );
    }
    else
    {
      bDone = WriteColour( i_Target, o_pTarget, Pixel, Colour );
    }
  }
  return bDone;
}

void FilterBayerRow( const std::array<const uint8_t*, 3>& i_rRows, VBayerRow i_Row, uint8_t* o_pTarget, size_t i_Pixels )
{
  for( size_t Pixel = 0; Pixel < i_Pixels; ++Pixel )
  {
    const uint8_t* pAbove = i_rRows[0] + Pixel;
    const uint8_t* pOwn = i_rRows[1] + Pixel;
    const uint8_t* pBelow = i_rRows[2] + Pixel;
    const int32_t Beside = pAbove[0] + pBelow[0] + pOwn[-1] + pOwn[1];
    const int32_t Diagonal = pAbove[-1] + pAbove[1] + pBelow[-1] + pBelow[1];
    const bool bColour = ( Pixel % 2 == 0 ) == i_Row.m_bColourFirst;
    o_pTarget[Pixel] = static_cast<uint8_t>( bColour ? ( 4 * pOwn[0] + Beside + Diagonal ) / 12 : ( 2 * pOwn[0] + Beside ) / 6 );
  }
}

}
