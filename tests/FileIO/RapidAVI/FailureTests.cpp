// What the writer says, and what it leaves behind, when the disk fails.
#include "tests/FileIO/RapidAVI/AviFile.h"

#include <gtest/gtest.h>

#include <set>

using namespace KVZ;
using namespace RapidAVI;
using namespace TestSupport;

namespace
{

constexpr uint32_t Frames = 7;
constexpr VSegmentLimits ThreeRiffs{ 80, 80 };

VFaultyRun WriteSmallFile( VAviFile& io_rFile )
{
  const auto WriteFrame = [&]( size_t i_Frame )
  {
    const auto Number = static_cast<uint32_t>( i_Frame );
    return io_rFile.Frame( Noise( 8, Number ), Noise( 2, Number ) );
  };
  return RunIntoFault( io_rFile, Frames, WriteFrame );
}

// The frames that a walk finds up to the first place that makes no sense.
std::vector<VBytes> WalkFrames( const VBytes& i_rBytes )
{
  std::vector<VBytes> Found;
  const std::string Text( i_rBytes.begin(), i_rBytes.end() );
  for( size_t Position = Text.find( "00db\x08", Text.find( "movi" ) ); Position < Text.size(); Position = Text.find( "00db\x08", Position + 16 ) )
  {
    // Of an index, the id is followed by the base.
    if( Text.compare( Position + 5, 3, std::string( 3, '\0' ) ) == 0 && Position + 16 <= Text.size() && Text[Position - 4] != '\x01' )
    {
      Found.emplace_back( i_rBytes.begin() + static_cast<std::ptrdiff_t>( Position + 8 ),
        i_rBytes.begin() + static_cast<std::ptrdiff_t>( Position + 16 ) );
    }
  }
  return Found;
}

void CheckLeftBehind( const VAviFile& i_rFile, const VFaultyRun& i_rResult )
{
  EXPECT_FALSE( i_rResult.m_bClosed );
  EXPECT_TRUE( i_rResult.m_bLaterRefused );
  EXPECT_FALSE( i_rFile.m_Writer.IsOpen() );
  const std::vector<VBytes> Found = WalkFrames( *i_rFile.m_pBytes );
  EXPECT_GE( Found.size(), i_rResult.m_Written );
  for( uint32_t Frame = 0; Frame < std::min<size_t>( Found.size(), i_rResult.m_Written ); ++Frame )
  {
    EXPECT_EQ( Found[Frame], Noise( 8, Frame ) );
  }
}

// Whether the file is whole but for what was refused, with every index right.
bool IsConsistent( const VAviFile& i_rFile, const VFaultyRun& i_rResult )
{
  try
  {
    const VAviParser Parser = i_rFile.Parse();
    EXPECT_GE( Parser.TotalFrames(), i_rResult.m_Written );
    EXPECT_EQ( Parser.Chunks( 0 ).size(), Parser.TotalFrames() );
    return Parser.CountIndexed( 0 ) == Parser.TotalFrames();
  }
  catch( const std::runtime_error& )
  {
    return false;
  }
}

// Beginning, content and end of every chunk.
void AddBoundaries( const std::vector<VRiffChunk>& i_rChunks, std::set<uint64_t>& o_rOffsets )
{
  for( const VRiffChunk& rChunk : i_rChunks )
  {
    for( const uint64_t Boundary : { rChunk.m_Position, rChunk.m_Position + 4, rChunk.m_Data, rChunk.m_Data + rChunk.m_Size } )
    {
      o_rOffsets.insert( { Boundary - ( Boundary != 0 ), Boundary, Boundary + 1 } );
    }
    AddBoundaries( rChunk.m_Children, o_rOffsets );
  }
}

// Every byte behind the headers, and in them, where a place is like its neighbours, the boundaries and some places between.
std::set<uint64_t> FaultOffsets( const VAviFile& i_rWhole, uint64_t i_HeaderEnd )
{
  std::set<uint64_t> Offsets;
  AddBoundaries( i_rWhole.Parse().Riff().Riffs(), Offsets );
  const uint64_t Size = i_rWhole.m_pBytes->size();
  for( uint64_t Offset = 0; Offset < Size; Offset += Offset + 97 < i_HeaderEnd ? 97 : 1 )
  {
    Offsets.insert( Offset );
  }
  Offsets.erase( Offsets.lower_bound( Size ), Offsets.end() );
  return Offsets;
}

}

TEST( AviWriterFailures, ADiskThatIsFullAtAnyByteIsReportedAndLeavesNoWrongFrame )
{
  VAviFile Whole( VSettings(), ThreeRiffs );
  ASSERT_TRUE( WriteSmallFile( Whole ).m_bClosed );
  ASSERT_EQ( WalkFrames( *Whole.m_pBytes ).size(), Frames );
  const uint64_t HeaderEnd = Whole.Parse().Headers().m_Data + Whole.Parse().Headers().m_Size;
  const std::set<uint64_t> Offsets = FaultOffsets( Whole, HeaderEnd );
  ASSERT_GT( Offsets.size(), 600u );
  RecordProperty( "offsets", static_cast<int>( Offsets.size() ) );
  for( const uint64_t Offset : Offsets )
  {
    SCOPED_TRACE( Offset );
    VAviFile File( VSettings(), ThreeRiffs, { .m_Offset = Offset } );
    const VFaultyRun Result = WriteSmallFile( File );
    EXPECT_LE( File.m_pBytes->size(), Offset );
    EXPECT_EQ( Result.m_bHeader, Offset >= HeaderEnd );
    CheckLeftBehind( File, Result );
  }
}

// Here the stream works again after the failure, so that only the writer's own memory keeps it.
TEST( AviWriterFailures, AnyOperationThatFailsOnceIsNeverForgotten )
{
  size_t Consistent = 0;
  size_t InFrames = 0;
  const auto Check = [&]( const VAviFile& i_rFile, const VFaultyRun& i_rRun, uint64_t )
  {
    CheckLeftBehind( i_rFile, i_rRun );
    if( i_rRun.m_bHeader && i_rRun.m_Written < Frames )
    {
      // What was written before is brought into the indexes all the same.
      ++InFrames;
      Consistent += IsConsistent( i_rFile, i_rRun ) ? 1 : 0;
    }
  };
  const auto Make = []( const VFault& i_rFault ) { return VAviFile( VSettings(), ThreeRiffs, i_rFault ); };
  MeetEachFault( &VFault::m_Operation, Make, WriteSmallFile, Check );
  EXPECT_GT( InFrames, 50u );
  EXPECT_EQ( Consistent, InFrames );
}
