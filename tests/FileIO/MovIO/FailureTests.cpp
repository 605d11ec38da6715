// What the writer says, and what it leaves behind, when the disk fails.
#include "tests/FileIO/MovIO/SmallMovie.h"
#include "tests/support/LogCapture.h"

#include <gtest/gtest.h>

#include <algorithm>
#include <stdexcept>

using namespace KVZ;
using namespace MovIO;
using namespace TestSupport;

namespace
{

constexpr int Frames = 4;

VBytes Video( size_t i_Number ) { return VBytes( 16, static_cast<uint8_t>( 1 + i_Number ) ); }
VBytes Audio( size_t i_Number ) { return VBytes( 6, static_cast<uint8_t>( 0x81 + i_Number ) ); }

VSmallMovie MakeMovie( const VFault& i_rFault ) { return VSmallMovie( {}, i_rFault ); }

VFaultyRun WriteMovie( VSmallMovie& io_rMovie )
{
  return RunIntoFault( io_rMovie, Frames, [&]( size_t i_Frame ) { return io_rMovie.Frame( Video( i_Frame ), Audio( i_Frame ) ); } );
}

// Frames that a reader finds; all must be what was written. -1 for a file that cannot be read. What comes behind the tables, and may be cut off, is
// no hindrance.
int CountWholeFrames( VBytes i_Bytes )
try
{
  const VBytes Type = Bytes( "moov" );
  const auto Moov = std::search( i_Bytes.begin(), i_Bytes.end(), Type.begin(), Type.end() );
  if( Moov != i_Bytes.end() )
  {
    const size_t Size = Moov[-2] * 256u + Moov[-1];
    i_Bytes.resize( std::min( i_Bytes.size(), static_cast<size_t>( Moov - i_Bytes.begin() ) - 4 + Size ) );
  }
  const auto Parser = VMovParser::OfBytes( i_Bytes );
  const auto& rVideo = Parser.Track( "vide" );
  const auto& rAudio = Parser.Track( "soun" );
  EXPECT_EQ( rVideo.m_Samples.size(), rAudio.m_Samples.size() );
  for( size_t Frame = 0; Frame < rVideo.m_Samples.size(); ++Frame )
  {
    EXPECT_EQ( Parser.Bytes( rVideo.m_Samples[Frame] ), Video( Frame ) );
    EXPECT_EQ( Parser.Bytes( rAudio.m_Samples[Frame] ), Audio( Frame ) );
  }
  return static_cast<int>( rVideo.m_Samples.size() );
}
catch( const std::runtime_error& )
{
  return -1;
}

void CheckLeftBehind( const VSmallMovie& i_rMovie, const VFaultyRun& i_rResult )
{
  EXPECT_FALSE( i_rResult.m_bClosed );
  EXPECT_TRUE( i_rResult.m_bLaterRefused );
  EXPECT_FALSE( i_rMovie.m_Writer.IsOpen() );
  const int Found = CountWholeFrames( *i_rMovie.m_pBytes );
  EXPECT_TRUE( Found == -1 || Found == static_cast<int>( i_rResult.m_Written ) ) << Found;
  EXPECT_EQ( i_rResult.m_Written - i_rMovie.m_Writer.CountIncompleteFrames(), static_cast<size_t>( std::max( Found, 0 ) ) );
}

}

TEST( MovWriterFailures, ADiskThatIsFullAtAnyByteIsReported )
{
  VSmallMovie Whole;
  ASSERT_TRUE( WriteMovie( Whole ).m_bClosed );
  EXPECT_EQ( CountWholeFrames( *Whole.m_pBytes ), Frames );
  MeetEachFault( &VFault::m_Offset, MakeMovie, WriteMovie,
    []( const VSmallMovie& i_rMovie, const VFaultyRun& i_rRun, uint64_t ) { CheckLeftBehind( i_rMovie, i_rRun ); } );
}

// Here the stream works again after the failure, so that only the writer's own memory keeps it.
TEST( MovWriterFailures, AnyOperationThatFailsOnceIsNeverForgotten )
{
  int Playable = 0;
  const auto Check = [&]( const VSmallMovie& i_rMovie, const VFaultyRun& i_rRun, uint64_t )
  {
    CheckLeftBehind( i_rMovie, i_rRun );
    Playable += CountWholeFrames( *i_rMovie.m_pBytes ) >= 0;
  };
  MeetEachFault( &VFault::m_Operation, MakeMovie, WriteMovie, Check );
  // After a frame that could not be written, the tables of those before it still come into the file.
  EXPECT_GE( Playable, Frames );
}

// Tables that are larger than what is collected: the disk is full in the middle of one.
TEST( MovWriterFailures, OneBadWriteIsTracedThroughTheAtomsAroundIt )
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

// A stream that has run out of memory, and one that throws.
class VThrowingStream : public VMemoryFile
{
public:
  using VMemoryFile::VMemoryFile;
  using VMemoryFile::Write;
  bool Write( const void* i_pData, size_t i_Size ) override
  {
    if( i_Size == 16 )
    {
      throw std::runtime_error( "no memory" );
    }
    return VMemoryFile::Write( i_pData, i_Size );
  }
};

TEST( MovWriterFailures, NoExceptionLeavesAnOperation )
{
  const VMovieSettings Settings = VMovieSettings::Silent();
  VMovWriter Writer( IVideoContainer::EMOV, {},
    []( const std::string& ) { return std::make_unique<VThrowingStream>( std::make_shared<VBytes>() ); } );
  ASSERT_TRUE( Writer.Open( "memory" ) && Settings.WriteTo( Writer ) );
  EXPECT_FALSE( Settings.WriteFrame( Writer, VBytes( 16 ) ) );
  const VBytes Video( 16 );
  EXPECT_FALSE( Writer.WriteStoredFrame( { { Video.data(), Video.size() } }, {}, 'I' ) );
  Writer.Close();
  EXPECT_FALSE( Writer.IsOpen() );

  VMovWriter Unopened( IVideoContainer::EMOV, {}, []( const std::string& ) -> std::unique_ptr<UtilsIO::IClosableStream> { throw std::bad_alloc(); } );
  EXPECT_FALSE( Unopened.Open( "memory" ) );
}
