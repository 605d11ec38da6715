#include "FileIO/JPEGIO/JPEGMarkers.h"
#include "FileIO/JPEGIO/JPEGParser.h"
#include "Utils/UtilsIO/StreamAdapters.h"
#include "tests/support/FailingStream.h"
#include "tests/support/LogCapture.h"
#include "tests/support/MemoryFile.h"
#include "tests/support/SlowJPEGParser.h"
#include "tests/support/TurboJPEG.h"

#include <gtest/gtest.h>

#include <random>

using JPEGIO::ParseJPEGSegments;
using JPEGIO::VJPEGSegment;

namespace
{

using TestSupport::VBytes;

VBytes operator+( VBytes i_Front, const VBytes& i_rBack )
{
  TestSupport::Append( i_Front, i_rBack );
  return i_Front;
}

constexpr const char* NoCleanEnd = "Did not end cleanly.  Data may be truncated or corrupt.";

const VBytes SOI = { 0xFF, 0xD8 };
const VBytes EOI = { 0xFF, 0xD9 };
const VBytes Table = { 0xFF, 0xDB, 0x00, 0x04, 0x01, 0x02 };
const VBytes Scan = { 0xFF, 0xDA, 0x00, 0x03, 0x01 };

VBytes MakeJPEG( int i_Width, int i_Height, int i_Subsampling, int i_Flags = 0 )
{
  const VBytes Noise = TestSupport::Noise( static_cast<size_t>( i_Width * i_Height ) * 3, 7 );
  return TestSupport::TurboJPEG( Noise, i_Width, i_Height, { .m_Subsampling = i_Subsampling, .m_Flags = i_Flags } );
}

// The records are packed, so their fields cannot be referred to, which the checks below would do.
uint64_t PositionOf( const VJPEGSegment& i_rSegment ) { return i_rSegment.m_Position; }
uint64_t LengthOf( const VJPEGSegment& i_rSegment ) { return i_rSegment.m_Length; }

std::string Markers( const std::vector<VJPEGSegment>& i_rSegments )
{
  std::string Text;
  for( const VJPEGSegment& rSegment : i_rSegments )
  {
    char Hex[4];
    std::snprintf( Hex, sizeof( Hex ), "%02X ", rSegment.m_Marker );
    Text += Hex;
  }
  return Text;
}

class JPEGParser : public testing::Test
{
protected:
  bool Parse( const VBytes& i_rImage )
  {
    KVZ::ISimpleInputStreamAdapter Stream( i_rImage );
    return ParseJPEGSegments( Stream, i_rImage.size(), m_Segments );
  }

  // Positions grow, nothing overlaps or lies outside, and each segment begins with its own marker.
  void ExpectInside( const VBytes& i_rImage ) const
  {
    uint64_t End = 0;
    for( const VJPEGSegment& rSegment : m_Segments )
    {
      EXPECT_GE( PositionOf( rSegment ), End );
      End = rSegment.m_Position + rSegment.m_Length;
      ASSERT_LE( End, i_rImage.size() );
      EXPECT_EQ( i_rImage[rSegment.m_Position], 0xFF );
      EXPECT_EQ( i_rImage[rSegment.m_Position + 1], rSegment.m_Marker );
    }
  }

  std::vector<VJPEGSegment> m_Segments;
  TestSupport::VLogCapture m_Log{ "JPEGIO" };
};

}

TEST_F( JPEGParser, ListsWhatTurboJPEGWrites )
{
  const VBytes Colour = MakeJPEG( 640, 360, TJSAMP_444 );
  ASSERT_GT( Colour.size(), 100000u );   // many times what the parser sees at once
  ASSERT_TRUE( Parse( Colour ) );
  EXPECT_EQ( Markers( m_Segments ), "D8 E0 DB DB C0 C4 C4 C4 C4 DA D9 " );
  ExpectInside( Colour );
  EXPECT_EQ( PositionOf( m_Segments[1] ), 2u );
  EXPECT_EQ( LengthOf( m_Segments[1] ), 18u );   // JFIF, without a thumbnail
  EXPECT_EQ( PositionOf( m_Segments.back() ), Colour.size() - 2 );
  std::vector<VJPEGSegment> FromMemory;
  ASSERT_TRUE( ParseJPEGSegments( Colour.data(), Colour.size(), FromMemory ) );
  EXPECT_EQ( Markers( FromMemory ), Markers( m_Segments ) );

  const VBytes Progressive = MakeJPEG( 61, 33, TJSAMP_420, TJFLAG_PROGRESSIVE );
  ASSERT_TRUE( Parse( Progressive ) );
  ExpectInside( Progressive );
  EXPECT_GT( std::count_if( m_Segments.begin(), m_Segments.end(), []( const VJPEGSegment& r ) { return r.m_Marker == 0xDA; } ), 5 );
}

TEST_F( JPEGParser, EntropyCodedDataIsSkipped )
{
  // Stuffing, restart markers between the intervals, and bytes after the end
  const VBytes Data = { 0x12, 0xFF, 0x00, 0x34, 0xFF, 0xD0, 0x56, 0xFF, 0xD1, 0xFF, 0x00 };
  const VBytes Image = SOI + Table + Scan + Data + EOI + VBytes{ 0x00, 0xD9, 0x01 };
  ASSERT_TRUE( Parse( Image ) );
  EXPECT_EQ( Markers( m_Segments ), "D8 DB DA D0 D1 D9 " );
  EXPECT_EQ( LengthOf( m_Segments[2] ), 5u );
  EXPECT_EQ( PositionOf( m_Segments[3] ), 17u );
  EXPECT_EQ( LengthOf( m_Segments[3] ), 2u );
  // A marker that is cut by the parser's window, at each of its bytes
  for( size_t Filling = 4060; Filling < 4100; ++Filling )
  {
    const VBytes Large = SOI + Table + Scan + VBytes( Filling, 0x11 ) + VBytes{ 0xFF, 0x00 } + Table + EOI;
    ASSERT_TRUE( Parse( Large ) ) << Filling;
    ASSERT_EQ( Markers( m_Segments ), "D8 DB DA DB D9 " );
    ExpectInside( Large );
  }
}

TEST_F( JPEGParser, FaultsHaveTheirText )
{
  const VBytes Whole = SOI + Table + Scan + VBytes{ 0x12 } + EOI;
  ASSERT_TRUE( Parse( Whole ) );
  EXPECT_TRUE( m_Log.Texts().empty() );
  const std::vector<std::pair<VBytes, std::string>> Cases = {
    { SOI + VBytes{ 0xFF, 0x00 } + EOI, "0xff00 found outside of image scan." },
    { SOI + Table + VBytes{ 0x41 } + EOI, "Unrecognised data found in buffer at 0x8" },
    { VBytes( Whole.begin(), Whole.begin() + 4 ), NoCleanEnd },
    { VBytes( Whole.begin(), Whole.begin() + 6 ), NoCleanEnd },
    { VBytes( Whole.begin(), Whole.begin() + 9 ), NoCleanEnd },
    { Whole + VBytes{ 0xFF }, NoCleanEnd },
    { SOI + EOI, "Not enough segments.  Data may be truncated or corrupt." },
    { {}, "Not enough segments.  Data may be truncated or corrupt." },
    { Table + Table + Scan + EOI, "Missing SOI marker." },
    { SOI + Table + Scan + VBytes{ 0x12 } + Table, "Missing EOI marker." },
  };
  for( const auto& [rImage, rText] : Cases )
  {
    m_Log.Clear();
    EXPECT_FALSE( Parse( rImage ) );
    EXPECT_EQ( m_Log.Texts(), std::vector<std::string>{ rText } );
    EXPECT_EQ( TestSupport::ParseSlowly( rImage ).m_Fault, rText );
  }
}

TEST_F( JPEGParser, AStreamThatFailsOrEndsEarlyIsNoImage )
{
  const auto pBytes = std::make_shared<VBytes>( MakeJPEG( 61, 33, TJSAMP_444 ) );
  TestSupport::VFailingStream Failing( std::make_unique<TestSupport::VMemoryFile>( pBytes ), { TestSupport::VFault::Never, 1 } );
  EXPECT_FALSE( ParseJPEGSegments( Failing, pBytes->size(), m_Segments ) );
  KVZ::ISimpleInputStreamAdapter Short( *pBytes );
  EXPECT_FALSE( ParseJPEGSegments( Short, pBytes->size() + 1, m_Segments ) );
  EXPECT_EQ( m_Log.Count( NoCleanEnd ), 2u );
}

// Damaged images, read by the parser and by a second one.
TEST_F( JPEGParser, AgreesWithASlowReadingOfDamagedImages )
{
  const VBytes Whole = MakeJPEG( 48, 32, TJSAMP_420, TJFLAG_PROGRESSIVE );
  std::mt19937 Random( 20 );
  size_t Good = 0;
  for( int Round = 0; Round < 3000; ++Round )
  {
    SCOPED_TRACE( Round );
    VBytes Image = Whole;
    for( uint32_t Change = Random() % 4; Change > 0; --Change )
    {
      Image[Random() % Image.size()] = Random() % 2 ? 0xFF : static_cast<uint8_t>( Random() );
    }
    Image.resize( Random() % 4 ? Image.size() : Random() % Image.size() );
    m_Log.Clear();
    const TestSupport::VSlowJPEGResult Expected = TestSupport::ParseSlowly( Image );
    ASSERT_EQ( Parse( Image ), Expected.m_Fault.empty() );
    ASSERT_EQ( Markers( m_Segments ), Markers( Expected.m_Segments ) );
    ASSERT_TRUE( Expected.m_Fault.empty() || m_Log.Has( Expected.m_Fault ) );
    ExpectInside( Image );
    Good += Expected.m_Fault.empty();
  }
  EXPECT_GT( Good, 100u );
  EXPECT_LT( Good, 2900u );
}

TEST( JPEGMarkers, HaveATextIfTheyAreDefined )
{
  EXPECT_STREQ( JPEGIO::FindMarkerText( 0xD5 ), "Resync marker" );
  EXPECT_STREQ( JPEGIO::FindMarkerText( 0xE6 ), "APP6" );
  EXPECT_EQ( JPEGIO::FindMarkerText( 0xF0 ), nullptr );
}
