// Files that are too large for a test's disk: pictures are counted and forgotten.
#include "tests/FileIO/MkvIO/SmallMovie.h"
#include "tests/support/EbmlParser.h"
#include "tests/support/LogCapture.h"
#include "tests/support/SparseFile.h"

#include <gtest/gtest.h>

using namespace KVZ;
using namespace MkvIO;
using namespace TestSupport;

namespace
{

constexpr uint32_t Side = 32768;
constexpr uint64_t ImageBytes = uint64_t{ Side } * Side;   // 1 GiB

class MkvLargeFile : public testing::Test
{
protected:
  // Frames of 1 GiB, the same memory over and over.
  void Write( uint64_t i_Frames )
  {
    VMkvWriter Writer( {}, [&]( const std::string& ) { return std::make_unique<VSparseFile>( m_Pieces ); } );
    VDescription Description;
    Description.m_Video = VideoInfo( IPixelFormat::ELuminance8, Side, Side );
    Description.m_Audio = {};
    ASSERT_TRUE( Writer.Open( "sparse" ) && Description.WriteHeader( Writer ) );
    const VBufferList Rows( Side, Buffer( VBytes( Side ) ) );
    for( uint64_t Key = 0; Key < i_Frames; ++Key )
    {
      VBufferList Video = Rows;
      VBufferList Audio;
      ASSERT_TRUE( Writer.WriteFrame( Video, Description.m_Video, Audio, {}, Key ) );
    }
    ASSERT_TRUE( Writer.Close() );
  }

  // The pieces that make up an element behind the last picture.
  VEbmlParser ParseCues() const
  {
    const VBytes CuesId = { 0x1C, 0x53, 0xBB, 0x6B };
    const auto Found = std::find_if( m_Pieces.begin(), m_Pieces.end(),
      [&]( const auto& i_rPiece ) { return i_rPiece.second.size() > 4 && std::equal( CuesId.begin(), CuesId.end(), i_rPiece.second.begin() ); } );
    return VEbmlParser( Found == m_Pieces.end() ? VBytes() : Found->second );
  }

  // The size field of the segment's head.
  VBytes SegmentSize() const
  {
    const VBytes& rSize = m_Pieces.at( SegmentData - 5 );
    return { rSize.begin(), rSize.end() };
  }

  static constexpr uint64_t SegmentData = 40 + 4 + 5;   // behind the EBML head, the segment's id and its size
  VSparseFile::VPieces m_Pieces;
};

}

TEST_F( MkvLargeFile, PositionsBeyond4GiBAreIndexed )
{
  constexpr uint64_t Frames = 6;
  Write( Frames );
  const VEbmlParser Cues = ParseCues();
  const auto Positions = Cues.FindAll( { Ebml::Cues, Ebml::CuePoint, Ebml::CueTrackPositions, Ebml::CueClusterPosition } );
  ASSERT_EQ( Positions.size(), Frames );
  const VBytes ClusterId = { 0x1F, 0x43, 0xB6, 0x75 };
  for( uint64_t Frame = 0; Frame < Frames; ++Frame )
  {
    const uint64_t Position = SegmentData + Cues.NumberOf( *Positions[Frame] );
    EXPECT_GE( Position, Frame * ImageBytes );
    const VBytes& rHead = m_Pieces.at( Position );
    EXPECT_TRUE( std::equal( ClusterId.begin(), ClusterId.end(), rHead.begin() ) );
  }
  // A size in five bytes: 6 GiB and what stands before and behind the pictures
  const VBytes Size = SegmentSize();
  EXPECT_EQ( Size.at( 0 ), 0x08 + 0x01 );
  EXPECT_EQ( Size.at( 1 ), 0x80 );
}

TEST_F( MkvLargeFile, ASizeThatItsFieldCannotHoldStaysUnknown )
{
  const VLogCapture Log( "MkvIO" );
  Write( 33 );
  EXPECT_EQ( m_Pieces.count( SegmentData - 5 ), 0u ) << "nothing is written over the mark that was made with the head";
  const VBytes& rHead = m_Pieces.at( 40 );
  EXPECT_EQ( rHead, ( VBytes{ 0x18, 0x53, 0x80, 0x67, 0x0F, 0xFF, 0xFF, 0xFF, 0xFF } ) );
  ASSERT_EQ( Log.Texts().size(), 1u );
  EXPECT_NE( Log.Texts()[0].find( "it stays marked unknown" ), std::string::npos );
  EXPECT_EQ( ParseCues().FindAll( { Ebml::Cues, Ebml::CuePoint } ).size(), 33u );
}
