#include "FileIO/MovIO/AtomScope.h"
#include "FileIO/MovIO/MovFileCheck.h"
#include "tests/FileIO/MovIO/SmallMovie.h"
#include "tests/support/LogCapture.h"
#include "tests/support/SparseFile.h"

#include <gtest/gtest.h>

#include <algorithm>

using namespace KVZ;
using namespace MovIO;
using namespace TestSupport;

namespace
{

constexpr uint64_t MiB = 1024 * 1024;

class MovWriterOfLargeFiles : public testing::Test
{
protected:
  MovWriterOfLargeFiles() : m_Writer( IVideoContainer::EMOV, {}, [this]( const std::string& ) { return std::make_unique<VSparseFile>( m_Pieces ); } )
  {
  }

  bool WriteFrame( size_t i_MiB, const VBytes& i_rAudio )
  {
    VBufferList Video( i_MiB, m_pMiB );
    VBufferList Audio = { Buffer( i_rAudio ) };
    return m_Writer.WriteFrame( Video, m_Settings.m_Video, Audio, m_Settings.m_Audio, AppendKey );
  }

  // Later pieces lie over earlier ones at a lower position: the size of the media data over its header.
  VBytes Read( uint64_t i_Position, uint64_t i_Size ) const
  {
    VBytes Bytes( i_Size );
    for( const auto& [Start, rPiece] : m_Pieces )
    {
      for( uint64_t Byte = std::max( Start, i_Position ); Byte < std::min( Start + rPiece.size(), i_Position + i_Size ); ++Byte )
      {
        Bytes[Byte - i_Position] = rPiece[Byte - Start];
      }
    }
    return Bytes;
  }

  VMovParser Parse() const
  {
    return VMovParser( [this]( uint64_t i_Position, uint64_t i_Size ) { return Read( i_Position, i_Size ); },
      m_Pieces.rbegin()->first + m_Pieces.rbegin()->second.size() );
  }

  const VLogCapture m_Log{ "MovIO" };
  VSparseFile::VPieces m_Pieces;
  const std::shared_ptr<const IBufferConst> m_pMiB = Buffer( VBytes( MiB ) );
  VMovieSettings m_Settings;
  VMovWriter m_Writer;
};

}

// Its bytes are in the file by then, and the frames behind it are found all the same.
TEST_F( MovWriterOfLargeFiles, AFrameOf4GiBIsRefused )
{
  m_Settings.m_Video = VideoInfo( IPixelFormat::EB8G8R8u8, 65535, 65535 );
  ASSERT_TRUE( m_Writer.Open( "sparse" ) && m_Settings.WriteTo( m_Writer ) );
  EXPECT_FALSE( WriteFrame( 4096, VBytes( 2 ) ) );
  EXPECT_EQ( m_Log.Texts(), std::vector<std::string>{ "Video frames of more than 2^32 bytes are not permitted." } );
  EXPECT_TRUE( WriteFrame( 4095, { 7, 8 } ) );
  EXPECT_TRUE( m_Writer.Close() );
  const auto Parser = Parse();
  EXPECT_EQ( Parser.Track( "vide" ).m_Samples.at( 0 ).m_Position, 52 + 4096 * MiB );
  EXPECT_EQ( Parser.Bytes( Parser.Track( "soun" ).m_Samples.at( 0 ) ), ( VBytes{ 7, 8 } ) );
}

TEST_F( MovWriterOfLargeFiles, AnAtomOf4GiBNamesTheLimit )
{
  const auto pStream = std::make_shared<WriterSupport::VWatchedStream>( std::make_unique<VSparseFile>( m_Pieces ) );
  VMovPrimitiveWriter Out( pStream );
  VAtomScope Atom( Out, "co64" );
  const VBytes Bytes( MiB );
  EXPECT_TRUE( Out.Write( std::vector<IOutputStream::VSpan>( 4096, { Bytes.data(), Bytes.size() } ) ) );
  EXPECT_FALSE( Atom.Close() );
  EXPECT_EQ( m_Log.Texts(),
    ( std::vector<std::string>{ "The 'co64' atom has 4294967304 bytes, more than the 4294967295 that its size can say.",
      "Could not write the 'co64' atom." } ) );
  EXPECT_TRUE( Out.IsOk() );
}
