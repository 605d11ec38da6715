// What the writer says, and what it leaves behind, when the disk fails or the process ends.
#include "tests/FileIO/MkvIO/SmallMovie.h"
#include "tests/support/EbmlParser.h"
#include "tests/support/FileSizeLimit.h"
#include "tests/support/ProgramRun.h"
#include "tests/support/TemporaryFolder.h"

#include <gtest/gtest.h>

#include <csignal>

#include <sys/wait.h>
#include <unistd.h>

using namespace KVZ;
using namespace MkvIO;
using namespace TestSupport;

namespace
{

const std::string Pictures[] = { "AAAA", "BBBB", "CCCC", "DDDD" };

struct VResult
{
  bool m_bHeader = false;
  bool m_bClosed = false;
  size_t m_Written = 0;   // frames whose call gave true
  bool m_bLaterRefused = true;
};

// Goes on after a failure as no client would.
VResult WriteSmallMovie( VSmallMovie& io_rMovie )
{
  VResult Result;
  Result.m_bHeader = io_rMovie.Begin();
  bool bFailed = !Result.m_bHeader;
  for( const std::string& rPicture : Pictures )
  {
    const bool bWritten = io_rMovie.WriteFrame( rPicture, "sound of " + rPicture );
    Result.m_bLaterRefused = Result.m_bLaterRefused && !( bFailed && bWritten );
    Result.m_Written += bWritten;
    bFailed = bFailed || !bWritten;
  }
  Result.m_bClosed = io_rMovie.m_Writer.Close();
  return Result;
}

// Reports what is there and should not be, or the other way round. Gives whether the file could be brought to its end.
bool CheckLeftBehind( const VSmallMovie& i_rMovie, const VResult& i_rResult )
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
    EXPECT_EQ( Blocks[Block].m_Data, Text( Block % 2 == 0 ? rPicture : "sound of " + rPicture ) );
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
  VSmallMovie Whole;
  ASSERT_TRUE( WriteSmallMovie( Whole ).m_bClosed );
  ASSERT_GT( Whole.m_pBytes->size(), 600u );
  RecordProperty( "offsets", static_cast<int>( Whole.m_pBytes->size() ) );
  for( uint64_t Offset = 0; Offset < Whole.m_pBytes->size(); ++Offset )
  {
    SCOPED_TRACE( Offset );
    VSmallMovie Movie( { .m_Offset = Offset } );
    const VResult Result = WriteSmallMovie( Movie );
    EXPECT_LE( Movie.m_pBytes->size(), Offset );
    CheckLeftBehind( Movie, Result );
  }
}

// Here the stream works again after the failure, so that only the writer's own memory keeps it.
TEST( MkvWriterFailures, AnyOperationThatFailsOnceIsNeverForgotten )
{
  VSmallMovie Whole;
  ASSERT_TRUE( WriteSmallMovie( Whole ).m_bClosed );
  const uint64_t Operations = Whole.m_Operations;
  VSmallMovie HeaderAlone;
  ASSERT_TRUE( HeaderAlone.Begin() );
  const uint64_t HeaderOperations = HeaderAlone.m_Operations;
  for( uint64_t Operation = 0; Operation < Operations; ++Operation )
  {
    SCOPED_TRACE( Operation );
    VSmallMovie Movie( { .m_Operation = Operation } );
    const VResult Result = WriteSmallMovie( Movie );
    const bool bFinished = CheckLeftBehind( Movie, Result );
    // The frames before a failed frame still get their tables.
    EXPECT_TRUE( bFinished || Operation < HeaderOperations || Result.m_Written == std::size( Pictures ) );
  }
}

TEST( MkvWriterFailures, OnARealDisk )
{
  VMkvWriter Full;
  ASSERT_TRUE( Full.Open( "/dev/full" ) );
  EXPECT_FALSE( VDescription().WriteHeader( Full ) );
  EXPECT_FALSE( Full.Close() );
  VMkvWriter Nowhere;
  EXPECT_FALSE( Nowhere.Open( "/no such folder/file.mkv" ) );

  const VTemporaryFolder Folder;
  const VFileSizeLimit Limit( 10000 );
  VDescription Description;
  Description.m_Video = VideoInfo( IPixelFormat::ELuminance8, 40, 30 );
  Description.m_Audio = {};
  VMkvWriter Writer;
  ASSERT_TRUE( Writer.Open( Folder.File( "cut.mkv" ) ) && Description.WriteHeader( Writer ) );
  uint64_t Written = 0;
  while( Writer.WriteFrame( VFrameSet{ Buffer( VBytes( 1200, 'x' ) ), Description.m_Video, {}, {} }, Written ) )
  {
    ++Written;
  }
  EXPECT_GT( Written, 2u );
  EXPECT_LT( Written, 7u );
  EXPECT_FALSE( Writer.Close() );
  const VRunResult Probe = RunProgram( { "ffprobe", "-v", "warning", "-count_frames", "-show_entries", "stream=nb_read_frames:format=duration", "-of",
    "csv=p=0", Folder.File( "cut.mkv" ) } );
  EXPECT_EQ( Probe.m_Error, "" );
  EXPECT_EQ( Probe.m_Output.substr( 0, 4 ), std::to_string( Written ) + "\n0." ) << "as many frames, and a duration";
}

// Beside this process another one writes frames, tells each that is written, and is killed at some moment.
TEST( MkvWriterFailures, AKilledProcessLosesNoFrameThatItHasWritten )
{
  const VTemporaryFolder Folder;
  VDescription Description;
  Description.m_Video = VideoInfo( IPixelFormat::EU8Y8V8Y8, 1280, 720 );
  for( const size_t Frames : { 1u, 7u, 20u } )
  {
    SCOPED_TRACE( Frames );
    const std::string Path = Folder.File( "killed.mkv" );
    int Ends[2];
    ASSERT_EQ( pipe( Ends ), 0 );
    const pid_t Child = fork();
    if( Child == 0 )
    {
      VMkvWriter Writer;
      const VBufferList Image = { Buffer( VBytes( 1280 * 720 * 2, 'x' ) ) };
      const VBufferList Sound = { Buffer( VBytes( 1602 * 4, 's' ) ) };
      bool bGood = Writer.Open( Path ) && Description.WriteHeader( Writer );
      while( bGood )
      {
        VBufferList Video = Image;
        VBufferList Audio = Sound;
        bGood = Writer.WriteFrame( Video, Description.m_Video, Audio, SmallAudio, VMkvWriter::AppendKey ) && write( Ends[1], "", 1 ) == 1;
      }
      _exit( 1 );
    }
    close( Ends[1] );
    size_t Told = 0;
    for( char Byte = 0; read( Ends[0], &Byte, 1 ) == 1; )
    {
      if( ++Told == Frames )
      {
        kill( Child, SIGKILL );
      }
    }
    close( Ends[0] );
    waitpid( Child, nullptr, 0 );

    const VRunResult Probe = RunProgram(
      { "ffprobe", "-v", "quiet", "-count_frames", "-show_entries", "stream=codec_type,nb_read_frames", "-of", "csv=p=0", Path } );
    const auto Read = [&]( const std::string& i_rStream )
    {
      const size_t At = Probe.m_Output.find( i_rStream + "," );
      return At == std::string::npos ? 0 : std::strtoul( Probe.m_Output.c_str() + At + i_rStream.size() + 1, nullptr, 10 );
    };
    EXPECT_GE( Told, Frames );
    EXPECT_GE( Read( "video" ), Told ) << Probe.m_Output;
    EXPECT_GE( Read( "audio" ), Told ) << Probe.m_Output;
    EXPECT_LE( Read( "video" ), Told + 1 );
  }
}
