#include "FileIO/MovIO/AtomScope.h"
#include "tests/FileIO/MovIO/SmallMovie.h"
#include "tests/support/LogCapture.h"
#include "tests/support/SparseFile.h"

#include <gtest/gtest.h>

#include <random>

using namespace MovIO;
using namespace TestSupport;

namespace
{

struct VOutput
{
  explicit VOutput( const VFault& i_rFault = {} )
    : m_Out( std::make_shared<WriterSupport::VWatchedStream>(
        std::make_unique<VFailingStream>( std::make_unique<VMemoryFile>( m_pBytes ), i_rFault, &m_Operations ) ) )
  {
  }

  const std::shared_ptr<VBytes> m_pBytes = std::make_shared<VBytes>();
  uint64_t m_Operations = 0;
  VMovPrimitiveWriter m_Out;
};

}

TEST( MovPrimitiveWriter, NumbersAreBigEndianAndFractionsCutOff )
{
  VOutput Output;
  Output.m_Out.U8( 1 ).U16( 0x0203 ).U24( 0x040506 ).U32( 0x0708090A ).U64( 0x0B0C0D0E0F101112 );
  Output.m_Out.Fixed8_8( 1.999 ).Fixed16_16( 29.97 ).Double( -2.0 ).FourCC( "moov" ).PascalString( "ab" ).PaddedPascalString( "cd", 5 );
  ASSERT_TRUE( Output.m_Out.Close() );
  const VBytes Expected = { 1, 2, 3, 4, 5, 6, 7, 8, 9, 10, 11, 12, 13, 14, 15, 16, 17, 18,   // the numbers
    1, 0xFF,                                                                                 // 511.744 / 256
    0, 29, 0xF8, 0x51,                                                                       // 1964113.92 / 65536
    0xC0, 0, 0, 0, 0, 0, 0, 0,                                                               // IEEE 754
    'm', 'o', 'o', 'v', 2, 'a', 'b', 2, 'c', 'd', 0, 0 };
  EXPECT_EQ( *Output.m_pBytes, Expected );
}

TEST( MovPrimitiveWriter, TextsThatDoNotFitAreRefusedForGood )
{
  const auto IsTaken = []( auto i_Write )
  {
    VOutput Output;
    i_Write( Output.m_Out );
    const bool bTaken = Output.m_Out.IsOk();
    Output.m_Out.U8( 1 );
    EXPECT_EQ( Output.m_Out.Close(), bTaken );
    EXPECT_EQ( Output.m_pBytes->empty(), !bTaken );
    return bTaken;
  };
  EXPECT_FALSE( IsTaken( []( auto& o_rOut ) { o_rOut.FourCC( "mov" ); } ) );
  EXPECT_FALSE( IsTaken( []( auto& o_rOut ) { o_rOut.FourCC( "movie" ); } ) );
  EXPECT_TRUE( IsTaken( []( auto& o_rOut ) { o_rOut.PascalString( std::string( 254, 'x' ) ); } ) );
  EXPECT_FALSE( IsTaken( []( auto& o_rOut ) { o_rOut.PascalString( std::string( 255, 'x' ) ); } ) );
  EXPECT_TRUE( IsTaken( []( auto& o_rOut ) { o_rOut.PaddedPascalString( std::string( 31, 'x' ), 32 ); } ) );
  EXPECT_FALSE( IsTaken( []( auto& o_rOut ) { o_rOut.PaddedPascalString( std::string( 32, 'x' ), 32 ); } ) );
}

// Against a vector as the file that it should make.
TEST( MovPrimitiveWriter, WritesOfAllSizesAndSeeksEndWhereTheyBelong )
{
  for( uint32_t Seed = 0; Seed < 50; ++Seed )
  {
    SCOPED_TRACE( Seed );
    std::mt19937 Random( Seed );
    VOutput Output;
    VBytes Model;
    size_t Position = 0;
    for( int Step = 0; Step < 200; ++Step )
    {
      const VBytes Data( Random() % ( Random() % 10 == 0 ? 70000 : 40 ), static_cast<uint8_t>( Step + 1 ) );
      if( Random() % 4 == 0 )
      {
        Position = Random() % ( Model.size() + 1 );
        EXPECT_TRUE( Output.m_Out.Seek( Position ) );
      }
      EXPECT_EQ( Output.m_Out.Tell(), Position );
      const bool bSpans = Random() % 8 == 0;
      EXPECT_TRUE( bSpans ? Output.m_Out.Write( { { Data.data(), Data.size() } } ) : Output.m_Out.Write( Data.data(), Data.size() ) );
      Model.resize( std::max( Model.size(), Position + Data.size() ) );
      std::copy( Data.begin(), Data.end(), Model.begin() + static_cast<std::ptrdiff_t>( Position ) );
      Position += Data.size();
    }
    ASSERT_TRUE( Output.m_Out.Close() );
    ASSERT_EQ( *Output.m_pBytes, Model );
  }
}

TEST( MovPrimitiveWriter, SmallWritesAreCollectedAndSpansAreNot )
{
  VOutput Output;
  for( uint32_t Number = 0; Number < 160000; ++Number )
  {
    Output.m_Out.U32( Number );
  }
  EXPECT_TRUE( Output.m_Out.Flush() );
  EXPECT_LE( Output.m_Operations, 10u );   // 640000 bytes
  const uint64_t Before = Output.m_Operations;
  EXPECT_TRUE( Output.m_Out.Write( { { "a", 1 } } ) );
  EXPECT_EQ( Output.m_Operations, Before + 1 );
  EXPECT_EQ( Output.m_pBytes->back(), 'a' );
}

TEST( MovAtomScope, AnotherSizeThanTheOneLaidDownIsReportedAndCarriedOn )
{
  const VLogCapture Log( "MovIO" );
  VOutput Output;
  VAtomScope Outer( Output.m_Out, "trak" );
  VAtomScope Inner( Output.m_Out, "tkhd" );
  Output.m_Out.U32( 7 );
  EXPECT_TRUE( Inner.CloseSized( 92 ) );
  EXPECT_TRUE( Outer.CloseSized( 20 ) );
  ASSERT_TRUE( Output.m_Out.Close() );
  EXPECT_EQ( *Output.m_pBytes, ( VBytes{ 0, 0, 0, 20, 't', 'r', 'a', 'k', 0, 0, 0, 12, 't', 'k', 'h', 'd', 0, 0, 0, 7 } ) );
  EXPECT_EQ( Log.Texts(), std::vector<std::string>{ "The 'tkhd' atom was written but the size was 12, not 92 as expected." } );
}

TEST( MovAtomScope, AnAtomOf4GiBNamesTheLimit )
{
  const VLogCapture Log( "MovIO" );
  VSparseFile::VPieces Pieces;
  VMovPrimitiveWriter Out( std::make_shared<WriterSupport::VWatchedStream>( std::make_unique<VSparseFile>( Pieces ) ) );
  VAtomScope Atom( Out, "co64" );
  const VBytes MiB( 1024 * 1024 );
  EXPECT_TRUE( Out.Write( std::vector<KVZ::IOutputStream::VSpan>( 4096, { MiB.data(), MiB.size() } ) ) );
  EXPECT_FALSE( Atom.Close() );
  EXPECT_EQ( Log.Texts(),
    ( std::vector<std::string>{ "The 'co64' atom has 4294967304 bytes, more than the 4294967295 that its size can say.",
      "Could not write the 'co64' atom." } ) );
  EXPECT_TRUE( Out.IsOk() );
}

// Tables that are larger than what is collected: the disk is full in the middle of one.
TEST( MovAtomScope, OneBadWriteIsTracedThroughTheAtomsAroundIt )
{
  constexpr size_t Many = 20000;
  const VLogCapture Log( "MovIO" );
  VSmallMovie Movie( VMovieSettings::Silent(), { .m_Offset = 52 + 16 * Many + 100000 } );
  ASSERT_TRUE( Movie.Begin() );
  for( size_t Frame = 0; Frame < Many; ++Frame )
  {
    ASSERT_TRUE( Movie.Frame( VBytes( 16 ) ) );
  }
  EXPECT_FALSE( Movie.m_Writer.Close() );
  std::vector<std::string> Expected;
  for( const char* pAtom : { "co64", "stbl", "minf", "mdia", "trak", "moov", "TMSL" } )
  {
    Expected.push_back( "Could not write the '" + std::string( pAtom ) + "' atom." );
  }
  EXPECT_EQ( Log.Texts(), Expected );
}
