#include "CoreVideoUtils/PixelConversions.h"
#include "CoreVideoUtils/ReferencePixels.h"
#include "tests/CoreVideoUtils/GuardedBytes.h"
#include "tests/support/AssertionCapture.h"
#include "tests/support/LogCapture.h"
#include "tests/support/SoftwareConversions.h"
#include "tests/support/Threads.h"

#include <gtest/gtest.h>

#include <atomic>
#include <map>
#include <sstream>
#include <string>

using namespace CoreVideoUtils;
using namespace SoftwareTests;
using TestSupport::Noise;

namespace
{

const std::string AllButPackedColour = "R8G8B8 B8G8R8 R8G8B8u8 B8G8R8u8 U8Y8V8Y8 Y8U8Y8V8 U10Y10V10Y10 BayerRG8 BayerGB8 BayerGR8 BayerBG8 BayerGB7 "
                                       "BayerGB6 Luminance8 Luminance7 Luminance6 ";
const std::string All = AllButPackedColour + "R5G6B5 ";

// What each format can be made of, beside itself
const std::map<std::string, std::string> SourcesOf = {
  { "Luminance8", AllButPackedColour },
  { "BayerGB8", "BayerGB7 BayerGB6" },
  { "R8G8B8", All },
  { "B8G8R8", All },
  { "R8G8B8u8", All },
  { "B8G8R8u8", All },
  { "U8Y8V8Y8", All },
  { "Y8U8Y8V8", "R8G8B8 U8Y8V8Y8" },
  { "U10Y10V10Y10", "U8Y8V8Y8 Y8U8Y8V8" },
  { "BayerGB7", "BayerGB8" },
  { "BayerGB6", "BayerGB8" },
  { "Luminance7", "Luminance8" },
  { "Luminance6", "Luminance8" },
};

bool IsPossible( IPixelFormat::Enum i_Source, IPixelFormat::Enum i_Target )
{
  const auto Found = SourcesOf.find( KVZ::ToName( i_Target ) );
  std::istringstream Names( Found == SourcesOf.end() ? "" : Found->second );
  bool bPossible = i_Source == i_Target;
  for( std::string Name; !bPossible && Names >> Name; )
  {
    bPossible = Name == KVZ::ToName( i_Source );
  }
  return bPossible;
}

// With nothing readable after either image, and one byte less of each.
void CheckPair( IPixelFormat::Enum i_Source, IPixelFormat::Enum i_Target, VSize i_Size )
{
  SCOPED_TRACE( KVZ::ToName( i_Source ) + " to " + KVZ::ToName( i_Target ) + ", " + std::to_string( i_Size.m_Width ) + " by " +
    std::to_string( i_Size.m_Height ) );
  VPixelFormatConverter Converter;
  const KVZ::VideoFrameInfo Info = MakeInfo( i_Source, i_Size );
  VGuardedBytes Source( SizeOf( i_Source, i_Size ) );
  VGuardedBytes Target( SizeOf( i_Target, i_Size ) );
  const auto Run = [&]( size_t i_SourceSize, size_t i_TargetSize )
  { return Converter.Convert( Info, Source.Data(), i_SourceSize, i_Target, Target.Data(), i_TargetSize ); };
  EXPECT_EQ( IsPossible( i_Source, i_Target ), Run( Source.Size(), Target.Size() ) );
  EXPECT_TRUE( Source.IsFrontWhole() && Target.IsFrontWhole() );
  if( Source.Size() > 0 )
  {
    EXPECT_FALSE( Run( Source.Size() - 1, Target.Size() ) );
  }
  if( Target.Size() > 0 )
  {
    EXPECT_FALSE( Run( Source.Size(), Target.Size() - 1 ) );
  }
}

TEST( PixelFormatConverter, ConvertsWhatTheTableHasAndRefusesTheRest )
{
  const TestSupport::VAssertionCapture Assertions;
  for( const VSize Size : { VSize{ 0, 0 }, { 0, 4 }, { 4, 0 }, { 1, 1 }, { 2, 1 }, { 1, 3 }, { 5, 3 }, { 49, 5 }, { 96, 2 }, { 131, 7 } } )
  {
    for( int32_t Source = -1; Source <= KVZ::PixelFormatCount; ++Source )
    {
      for( int32_t Target = -1; Target <= KVZ::PixelFormatCount; ++Target )
      {
        CheckPair( static_cast<IPixelFormat::Enum>( Source ), static_cast<IPixelFormat::Enum>( Target ), Size );
      }
    }
  }
}

TEST( PixelFormatConverter, CopiesEqualFormatsFromLongerBuffers )
{
  VPixelFormatConverter Converter;
  const VBytes Source = Noise( 40, 1 );
  VBytes Target( 50, 0xA5 );
  ASSERT_TRUE( Converter.Convert( MakeInfo( IPixelFormat::EBayerGB7, { 5, 7 } ), Source.data(), Source.size(), IPixelFormat::EBayerGB7, Target.data(),
    Target.size() ) );
  EXPECT_TRUE( std::equal( Source.begin(), Source.begin() + 31, Target.begin() ) );   // 35 pixels, 245 bits
  EXPECT_EQ( 19, std::count( Target.begin() + 31, Target.end(), 0xA5 ) );
}

// Rows of odd widths stand for themselves; others are converted all at once.
TEST( PixelFormatConverter, ConvertsEachRowAsTheReferenceDoes )
{
  const TestSupport::VAssertionCapture Assertions;
  for( const uint32_t Width : { 7U, 8U, 48U, 50U, 51U } )
  {
    const VSize Size = { Width, 3 };
    for( const VRowFormats Formats : { VRowFormats{ IPixelFormat::EU8Y8V8Y8, IPixelFormat::ER8G8B8 },
           VRowFormats{ IPixelFormat::EY8U8Y8V8, IPixelFormat::EU10Y10V10Y10 }, VRowFormats{ IPixelFormat::EU10Y10V10Y10, IPixelFormat::EB8G8R8u8 },
           VRowFormats{ IPixelFormat::EB8G8R8, IPixelFormat::EU8Y8V8Y8 }, VRowFormats{ IPixelFormat::ER5G6B5, IPixelFormat::ER8G8B8 } } )
    {
      const VBytes Source = Noise( SizeOf( Formats.m_Source, Size ), Width );
      VBytes Expected( SizeOf( Formats.m_Target, Size ) );
      for( uint32_t Row = 0; Row < Size.m_Height; ++Row )
      {
        Reference::ConvertRow( Formats, Source.data() + Row * SizeOf( Formats.m_Source, { Width, 1 } ),
          Expected.data() + Row * SizeOf( Formats.m_Target, { Width, 1 } ), Width );
      }
      EXPECT_EQ( Expected, Convert( Formats.m_Source, Source, Formats.m_Target, Size ) ) << Width << ", format " << Formats.m_Source;
    }
  }
}

VBytes Swapped( VBytes i_Pairs )
{
  for( size_t Byte = 0; Byte < i_Pairs.size(); Byte += 2 )
  {
    std::swap( i_Pairs[Byte], i_Pairs[Byte + 1] );
  }
  return i_Pairs;
}

const VBytes Colours = {
  255, 255, 255,   // Y 65535 * 255 / 65536, U and V in the middle
  255, 255, 255,   //
  255, 0, 0,       // U: (8388608 - 9642 * 255) / 65536
  255, 0, 0,       // V: 284, limited
  0, 255, 0,       // U: (8388608 - 18930 * 255) / 65536
  0, 255, 0,       // V: -4, limited
  0, 0, 255,       // U: (8388608 + 28573 * 255) / 65536
  0, 0, 255,       // V: (8388608 - 6554 * 255) / 65536
};
const VBytes YuvOfColours = { 128, 254, 128, 254, 90, 76, 255, 76, 54, 149, 0, 149, 239, 29, 102, 29 };
const VBytes Pairs = {
  128, 128, 255, 255,   // R: 128 + 91947 * 127 / 65536, limited; G: 2446024 / 65536; and with Y 255: 10769032 / 65536
  0, 16, 0, 235,        // R and B limited; G: 9923584 / 65536; then R: 3631744 / 65536, G limited, B: 553216 / 65536
};

// A row of each.
const struct VExample
{
  IPixelFormat::Enum m_Source;
  VBytes m_Pixels;
  IPixelFormat::Enum m_Target;
  VBytes m_Expected;
} Examples[] = {
  { IPixelFormat::ER8G8B8, Colours, IPixelFormat::EU8Y8V8Y8, YuvOfColours },
  { IPixelFormat::ER8G8B8, Colours, IPixelFormat::EY8U8Y8V8, Swapped( YuvOfColours ) },
  { IPixelFormat::EU8Y8V8Y8, YuvOfColours, IPixelFormat::EY8U8Y8V8, Swapped( YuvOfColours ) },
  { IPixelFormat::EU8Y8V8Y8, Pairs, IPixelFormat::ER8G8B8, { 255, 37, 128, 255, 164, 255, 0, 151, 0, 55, 255, 8 } },
  { IPixelFormat::EU8Y8V8Y8, Pairs, IPixelFormat::EB8G8R8u8, { 128, 37, 255, 255, 255, 164, 255, 255, 0, 151, 0, 255, 8, 255, 55, 255 } },
  // The last pixel of three has its own U, and the V of the pair before; one alone has the V in the middle.
  { IPixelFormat::EU8Y8V8Y8, { 128, 100, 200, 100, 90, 100 }, IPixelFormat::ER8G8B8, { 201, 48, 100, 201, 48, 100, 201, 61, 32 } },
  { IPixelFormat::EY8U8Y8V8, { 100, 90 }, IPixelFormat::ER8G8B8, { 100, 113, 32 } },
  // U 1023, Y 512, V 0; Y 1023. R: (8388608 - 22986 * 512) / 65536; G: 11497988 / 65536; B: 128 + 28999 * 511 / 65536; then R: 4991999 / 65536
  { IPixelFormat::EU10Y10V10Y10, { 0xFF, 0x03, 0x08, 0x00, 0xFF, 0x03 }, IPixelFormat::ER8G8B8, { 0, 175, 255, 76, 255, 255 } },
  { IPixelFormat::ER8G8B8u8, { 1, 2, 251, 9, 255, 255, 255, 0 }, IPixelFormat::ELuminance8, { 84, 255 } },
  { IPixelFormat::EU8Y8V8Y8, { 1, 7, 2, 9 }, IPixelFormat::ELuminance8, { 7, 9 } },
  { IPixelFormat::EY8U8Y8V8, { 7, 1, 9, 2 }, IPixelFormat::ELuminance8, { 7, 9 } },
  { IPixelFormat::ELuminance8, { 7, 9 }, IPixelFormat::EU8Y8V8Y8, { 128, 7, 128, 9 } },
  { IPixelFormat::ELuminance8, { 7 }, IPixelFormat::ER8G8B8u8, { 7, 7, 7, 255 } },
  { IPixelFormat::ER5G6B5, { 0x47, 0xCD }, IPixelFormat::ER8G8B8, { 0xC8, 0xA8, 0x38 } },   // 11001 101010 00111
};

TEST( PixelFormatConverter, GivesExactlyTheseBytes )
{
  for( const VExample& rExample : Examples )
  {
    const VSize Size = { static_cast<uint32_t>( rExample.m_Expected.size() / SizeOf( rExample.m_Target, { 1, 1 } ) ), 1 };
    VBytes Source = rExample.m_Pixels;
    Source.resize( SizeOf( rExample.m_Source, Size ) );
    EXPECT_EQ( rExample.m_Expected, Convert( rExample.m_Source, Source, rExample.m_Target, Size ) ) << "example " << &rExample - Examples;
  }
}

// Seven pixels: a group of six, one of one, and zeros up to 48.
TEST( PixelFormatConverter, PacksTenBits )
{
  const VBytes Seven = { 0xFF, 0x01, 0xFF, 0x02, 0x03, 0xFE, 0x04, 0x05, 0x87, 0x06, 0x08, 0xFF, 0x10, 0x20 };
  VBytes Expected = {
    0xFC, 0x13, 0x00, 0x3F,   // U 0xFF, Y 0x01, V 0xFF less two bits
    0x08, 0x30, 0x00, 0x3F,   // Y 0x02, U 0x03, Y 0xFE less two bits
    0x10, 0x50, 0x00, 0x21,   // V 0x04, Y 0x05, U 0x87 less two bits
    0x18, 0x80, 0x00, 0x3F,   // Y 0x06, V 0x08, Y 0xFF less two bits
    0x40, 0x00, 0x02, 0x00,   // U 0x10, Y 0x20
  };
  Expected.resize( 128 );
  EXPECT_EQ( Expected, Convert( IPixelFormat::EU8Y8V8Y8, Seven, IPixelFormat::EU10Y10V10Y10, { 7, 1 } ) );
  EXPECT_EQ( Expected, Convert( IPixelFormat::EY8U8Y8V8, Swapped( Seven ), IPixelFormat::EU10Y10V10Y10, { 7, 1 } ) );

  const VBytes Kept = { 0xFF, 0x01, 0xFC, 0x02, 0x03, 0xFC, 0x04, 0x05, 0x84, 0x06, 0x08, 0xFC, 0x10, 0x20 };
  EXPECT_EQ( Kept, Convert( IPixelFormat::EU10Y10V10Y10, Expected, IPixelFormat::EU8Y8V8Y8, { 7, 1 } ) );
  EXPECT_EQ( ( VBytes{ 1, 2, 0xFC, 5, 6, 0xFC, 0x20 } ), Convert( IPixelFormat::EU10Y10V10Y10, Expected, IPixelFormat::ELuminance8, { 7, 1 } ) );
}

TEST( PixelFormatConverter, AssertsPairsOfTenBitPixels )
{
  const TestSupport::VAssertionCapture Assertions;
  EXPECT_FALSE( Convert( IPixelFormat::EU10Y10V10Y10, VBytes( 3 * 128 ), IPixelFormat::ER8G8B8, { 3, 2 } ).empty() );
  EXPECT_TRUE( Assertions.Expressions().empty() );
  EXPECT_FALSE( Convert( IPixelFormat::EU10Y10V10Y10, VBytes( 3 * 128 ), IPixelFormat::ER8G8B8, { 3, 3 } ).empty() );
  EXPECT_EQ( std::vector<std::string>{ "( ( i_Width * i_Height ) % 2 ) == 0" }, Assertions.Expressions() );
}

// The bits of each value from its highest one on, one after another.
VBytes PackedBitByBit( const VBytes& i_rValues, size_t i_Bits )
{
  VBytes Packed( ( i_rValues.size() * i_Bits + 7 ) / 8 );
  for( size_t Bit = 0; Bit < i_rValues.size() * i_Bits; ++Bit )
  {
    const bool bSet = ( i_rValues[Bit / i_Bits] << Bit % i_Bits & 0x80 ) != 0;
    Packed[Bit / 8] = static_cast<uint8_t>( Packed[Bit / 8] | ( bSet ? 0x80 >> Bit % 8 : 0 ) );
  }
  return Packed;
}

TEST( PixelFormatConverter, PacksAndUnpacksEveryLength )
{
  for( uint32_t Width = 1; Width < 70; ++Width )
  {
    for( const size_t Bits : { 7U, 6U } )
    {
      const IPixelFormat::Enum Packed = Bits == 7 ? IPixelFormat::ELuminance7 : IPixelFormat::ELuminance6;
      VBytes Values = Noise( Width, Width );
      const VBytes Expected = PackedBitByBit( Values, Bits );
      ASSERT_EQ( Expected, Convert( IPixelFormat::ELuminance8, Values, Packed, { Width, 1 } ) ) << Width;
      for( uint8_t& rValue : Values )
      {
        rValue = static_cast<uint8_t>( rValue & 0xFF << ( 8 - Bits ) );
      }
      ASSERT_EQ( Values, Convert( Packed, Expected, IPixelFormat::ELuminance8, { Width, 1 } ) ) << Width;
    }
  }
}

// A packed image is the unpacked one.
TEST( PixelFormatConverter, ConvertsPackedImages )
{
  const VSize Size = { 13, 5 };
  for( const IPixelFormat::Enum Packed : { IPixelFormat::EBayerGB7, IPixelFormat::EBayerGB6, IPixelFormat::ELuminance7, IPixelFormat::ELuminance6 } )
  {
    const bool bBayer = Packed == IPixelFormat::EBayerGB7 || Packed == IPixelFormat::EBayerGB6;
    const IPixelFormat::Enum Bytes = bBayer ? IPixelFormat::EBayerGB8 : IPixelFormat::ELuminance8;
    const VBytes Source = Noise( SizeOf( Packed, Size ), 3 );
    const VBytes Unpacked = Convert( Packed, Source, Bytes, Size );
    for( const IPixelFormat::Enum Target : { IPixelFormat::EB8G8R8, IPixelFormat::EU8Y8V8Y8, IPixelFormat::ELuminance8 } )
    {
      EXPECT_EQ( Convert( Bytes, Unpacked, Target, Size ), Convert( Packed, Source, Target, Size ) ) << Packed << " to " << Target;
    }
  }
}

TEST( PixelFormatConverter, LogsLensCorrectionAndChangesNothing )
{
  const TestSupport::VLogCapture Log( "CoreVideoUtils" );
  VPixelFormatConverter Converter;
  Converter.SetLensCorrection( {} );
  Converter.SetLensCorrectionEnabled( true );
  EXPECT_EQ( 2U, Log.Count( "Lens distortion correction not supported in software converter." ) );
  EXPECT_EQ( ( VBytes{ 3, 2, 1 } ), Convert( Converter, IPixelFormat::ER8G8B8, { 1, 2, 3 }, IPixelFormat::EB8G8R8, { 1, 1 } ) );
}

TEST( PixelFormatConverter, LogsFormatsThatAreNotAConversionsOwn )
{
  uint8_t Bytes[128] = {};
  VConversion Conversion;
  Conversion.m_Width = Conversion.m_Height = 1;
  Conversion.m_pSource = Conversion.m_pTarget = Bytes;
  Conversion.m_Source = IPixelFormat::EBayerRG8;
  Conversion.m_Target = IPixelFormat::ER8G8B8;
  const TestSupport::VLogCapture Log( "CoreVideoUtils" );
  for( bool ( *const pConvert )( const VConversion& ) : { &ConvertFromYuv, &ConvertToPairs, &ConvertToTenBits, &SwapPairs } )
  {
    EXPECT_FALSE( pConvert( Conversion ) );
  }
  EXPECT_EQ( 4U, Log.Count( "Unsupported video format [BayerRG8]" ) );
}

// Setters change beside conversions; each conversion has one setting or the other throughout.
TEST( PixelFormatConverter, ConvertsOnSeveralThreads )
{
  const VSize Size = { 62, 40 };
  const VBytes Source = Noise( SizeOf( IPixelFormat::EBayerRG8, Size ), 4 );
  const KVZ::VColourRecord Strong = { 0.25f, 2.2f };
  const VBytes Expected[] = { Convert( IPixelFormat::EBayerRG8, Source, IPixelFormat::ER8G8B8, Size ),
    Convert( IPixelFormat::EBayerRG8, Source, IPixelFormat::ER8G8B8, Size, Strong ) };
  ASSERT_NE( Expected[0], Expected[1] );

  VPixelFormatConverter Shared;
  std::atomic<int> Wrong{ 0 };
  TestSupport::RunOnThreads( 3,
    [&]( uint32_t )
    {
      for( int Round = 0; Round < 50; ++Round )
      {
        Shared.SetColourCorrection( Round % 2 == 0 ? KVZ::VColourRecord() : Strong );
        const VBytes Result = Convert( Shared, IPixelFormat::EBayerRG8, Source, IPixelFormat::ER8G8B8, Size );
        Wrong += Result != Expected[0] && Result != Expected[1];
      }
    } );
  EXPECT_EQ( 0, Wrong );
}

}
