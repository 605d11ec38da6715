// What the writer says, and what it leaves behind, when the disk fails or the process ends.
#include "tests/FileIO/MkvIO/SmallMovie.h"
#include "tests/support/EbmlParser.h"

#include <gtest/gtest.h>

using namespace KVZ;
using namespace MkvIO;
using namespace TestSupport;

namespace
{

const std::string Pictures[] = { "AAAA", "BBBB", "CCCC", "DDDD" };

VSmallMovie MakeSmallMovie( const VFault& i_rFault ) { return VSmallMovie( {}, i_rFault ); }

VFaultyRun WriteSmallMovie( VSmallMovie& io_rMovie )
{
  return RunIntoFault( io_rMovie, std::size( Pictures ),
    [&]( size_t i_Frame ) { return io_rMovie.WriteFrame( Pictures[i_Frame], "sound of " + Pictures[i_Frame] ); } );
}

// Reports what is there and should not be, or the other way round. Gives whether the file could be brought to its end.
bool CheckLeftBehind( const VSmallMovie& i_rMovie, const VFaultyRun& i_rResult )
{
  EXPECT_FALSE( i_rResult.m_bClosed );
  EXPECT_TRUE( i_rResult.m_bLaterRefused );
  EXPECT_FALSE( i_rMovie.m_Writer.IsOpen() );
  if( !i_rResult.m_bHeader )
  {
    return false;
  }
  const VEbmlParser File( *i_rMovie.m_pBytes );
  const auto Blocks = ReadBlocks( File );
  EXPECT_GE( Blocks.size(), 2 * i_rResult.m_Written );
  EXPECT_LE( Blocks.size(), 2 * std::size( Pictures ) );
  for( size_t Block = 0; Block < Blocks.size(); ++Block )
  {
    const std::string& rPicture = Pictures[Block / 2];
    EXPECT_EQ( Blocks[Block].m_Data, Bytes( Block % 2 == 0 ? rPicture : "sound of " + rPicture ) );
  }
  const VEbmlElement& rSegment = File.Find( { Ebml::Segment } );
  const auto IsAt = [&]( uint64_t i_Position, uint32_t i_Id )
  {
    return std::any_of( rSegment.m_Children.begin(), rSegment.m_Children.end(),
      [&]( const VEbmlElement& i_rElement ) { return i_rElement.m_Position == i_Position && i_rElement.m_Id == i_Id; } );
  };
  for( const VMatroskaSeek& rSeek : ReadSeeks( File ) )
  {
    EXPECT_TRUE( IsAt( rSeek.m_Position, rSeek.m_Id ) );
  }
  for( const VMatroskaCue& rCue : ReadCues( File ) )
  {
    EXPECT_TRUE( IsAt( rCue.m_Cluster, Ebml::Cluster ) );
  }
  if( !rSegment.m_bUnknownSize )
  {
    EXPECT_EQ( rSegment.End(), i_rMovie.m_pBytes->size() );
    EXPECT_EQ( ReadCues( File ).size(), 2 * i_rResult.m_Written );
  }
  return !rSegment.m_bUnknownSize;
}

}

TEST( MkvWriterFailures, ADiskThatIsFullAtAnyByteIsReportedAndLeavesTheWholeFrames )
{
  MeetEachFault( &VFault::m_Offset, MakeSmallMovie, WriteSmallMovie,
    []( const VSmallMovie& i_rMovie, const VFaultyRun& i_rRun, uint64_t ) { CheckLeftBehind( i_rMovie, i_rRun ); } );
}

// Here the stream works again after the failure, so that only the writer's own memory keeps it.
TEST( MkvWriterFailures, AnyOperationThatFailsOnceIsNeverForgotten )
{
  VSmallMovie HeaderAlone;
  ASSERT_TRUE( HeaderAlone.Begin() );
  const auto Check = [&]( const VSmallMovie& i_rMovie, const VFaultyRun& i_rRun, uint64_t i_Operation )
  {
    const bool bFinished = CheckLeftBehind( i_rMovie, i_rRun );
    // The frames before a failed frame still get their tables.
    EXPECT_TRUE( bFinished || i_Operation < HeaderAlone.m_Operations || i_rRun.m_Written == std::size( Pictures ) );
  };
  MeetEachFault( &VFault::m_Operation, MakeSmallMovie, WriteSmallMovie, Check );
}
