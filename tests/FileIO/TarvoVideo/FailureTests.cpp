// What the writer says, and what it leaves behind, when the disk fails.
#include "tests/FileIO/TarvoVideo/SmallFile.h"

#include <gtest/gtest.h>

using namespace KVZ;
using namespace TarvoVideo;
using namespace TestSupport;

namespace
{

constexpr uint64_t Keys[] = { 4, 2, 9, 5 };

VFrameContent Content( uint64_t i_Key, uint8_t i_Version = 0 )
{
  const auto Byte = static_cast<uint8_t>( i_Key * 16 + i_Version );
  return { VBytes( 4, Byte ), VBytes( 6, static_cast<uint8_t>( Byte + 1 ) ) };
}

VSmallFile MakeSmallFile( const VFault& i_rFault ) { return VSmallFile( i_rFault ); }

// Four frames, and the second one once more.
VFaultyRun WriteSmallFile( VSmallFile& io_rFile )
{
  const auto WriteFrame = [&]( size_t i_Frame )
  {
    const bool bAgain = i_Frame == std::size( Keys );
    const uint64_t Key = bAgain ? Keys[1] : Keys[i_Frame];
    return io_rFile.WriteFrame( Key, Content( Key, bAgain ) );
  };
  return RunIntoFault( io_rFile, std::size( Keys ) + 1, WriteFrame );
}

// Every frame that a reader finds by its key is one that was written, and whole.
void CheckLeftBehind( const VSmallFile& i_rFile, const VFaultyRun& i_rResult )
{
  EXPECT_FALSE( i_rResult.m_bClosed );
  EXPECT_TRUE( i_rResult.m_bLaterRefused );
  EXPECT_FALSE( i_rFile.m_Writer.IsOpen() );
  const VFound Found = ReadAll( *i_rFile.m_pBytes );
  if( i_rResult.m_bHeader && i_rResult.m_Written < std::size( Keys ) )
  {
    EXPECT_EQ( Found.m_Frames.size(), i_rResult.m_Written - i_rFile.m_Writer.CountIncompleteFrames() );
  }
  if( Found.m_bFinished )
  {
    EXPECT_EQ( Found.m_Error, "" );
    for( const auto& [Key, rContent] : Found.m_Frames )
    {
      EXPECT_TRUE( rContent == Content( Key ) || rContent == Content( Key, 1 ) ) << "key " << Key;
    }
  }
  else if( i_rResult.m_bHeader )
  {
    EXPECT_EQ( Found.m_Error, "" );
    EXPECT_GE( Found.m_Frames.size(), std::min<size_t>( i_rResult.m_Written, std::size( Keys ) ) - ( i_rResult.m_Written ? 1 : 0 ) );
  }
}

}

TEST( TarvoWriterFailures, ADiskThatIsFullAtAnyByteIsReportedAndLeavesNoWrongFrame )
{
  VSmallFile Whole;
  ASSERT_TRUE( WriteSmallFile( Whole ).m_bClosed );
  EXPECT_EQ( ReadAll( *Whole.m_pBytes ).m_Frames.size(), std::size( Keys ) );
  MeetEachFault( &VFault::m_Offset, MakeSmallFile, WriteSmallFile,
    []( const VSmallFile& i_rFile, const VFaultyRun& i_rRun, uint64_t ) { CheckLeftBehind( i_rFile, i_rRun ); } );
}

// Here the stream works again after the failure, so that only the writer's own memory keeps it.
TEST( TarvoWriterFailures, AnyOperationThatFailsOnceIsNeverForgotten )
{
  uint64_t Operations = 0;
  uint64_t Finished = 0;
  const auto Check = [&]( const VSmallFile& i_rFile, const VFaultyRun& i_rRun, uint64_t )
  {
    CheckLeftBehind( i_rFile, i_rRun );
    ++Operations;
    Finished += ReadAll( *i_rFile.m_pBytes ).m_bFinished;
  };
  MeetEachFault( &VFault::m_Operation, MakeSmallFile, WriteSmallFile, Check );
  // The frames before the failure are still brought into an index.
  EXPECT_GT( Finished, Operations / 2 );
}
