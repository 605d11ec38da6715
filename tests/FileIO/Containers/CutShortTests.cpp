// Files that were never finished, on a full disk or by a process that was killed: whatever a call has said to be written can still be decoded.
#include "tests/FileIO/Containers/MovieWriters.h"
#include "tests/support/FileSizeLimit.h"
#include "tests/support/ProgramRun.h"
#include "tests/support/TemporaryFolder.h"

#include <gtest/gtest.h>

#include <csignal>

#include <sys/wait.h>
#include <unistd.h>

using namespace Containers;
using namespace TestSupport;

namespace
{

// The last frame may be cut short, which FFmpeg says.
VBytes DecodeCutFile( const std::string& i_rPath )
{
  return Bytes(
    RunProgram( { "ffmpeg", "-nostdin", "-v", "quiet", "-i", i_rPath, "-map", "0:v", "-fps_mode", "passthrough", "-f", "rawvideo", "-" } ).m_Output );
}

class FullDisk : public testing::TestWithParam<VContainerRow>
{
};

class KilledWriter : public testing::TestWithParam<VContainerRow>
{
protected:
  // Gives the frames that a child process had told when it was killed after so many.
  size_t WriteAndKill( size_t i_Frames )
  {
    int Ends[2];
    EXPECT_EQ( pipe( Ends ), 0 );
    const pid_t Child = fork();
    if( Child == 0 )
    {
      const auto pWriter = MakeWriter( GetParam().m_Container, { .m_RiffBytes = 5000000 } );
      bool bGood = pWriter->Open( m_Path ) && m_Header.WriteTo( *pWriter );
      while( bGood )
      {
        bGood = m_Header.WriteFrame( *pWriter, m_Image, VBytes( 1920 * 2, 's' ) ) && write( Ends[1], "", 1 ) == 1;
      }
      _exit( 1 );
    }
    close( Ends[1] );
    size_t Told = 0;
    for( char Byte = 0; read( Ends[0], &Byte, 1 ) == 1; )
    {
      if( ++Told == i_Frames )
      {
        kill( Child, SIGKILL );
      }
    }
    close( Ends[0] );
    int Status = 0;
    waitpid( Child, &Status, 0 );
    EXPECT_TRUE( WIFSIGNALED( Status ) );
    return Told;
  }

  const VHeader m_Header = MovieHeader( 640, 480 );
  const VBytes m_Image = Noise( m_Header.ImageBytes(), 1 );
  const VTemporaryFolder m_Folder;
  const std::string m_Path = m_Folder.File( "killed" );
};

}

TEST_P( FullDisk, EndsTheFileBehindItsLastWholeFrame )
{
  VHeader Header = MovieHeader( 100, 100 );
  Header.m_Audio = {};
  const auto pFull = MakeWriter( GetParam().m_Container );
  ASSERT_TRUE( pFull->Open( "/dev/full" ) );
  EXPECT_FALSE( Header.WriteTo( *pFull ) );
  EXPECT_FALSE( pFull->Close() );

  const VTemporaryFolder Folder;
  VBytes Images;
  {
    const VFileSizeLimit Limit( 95000 );
    const auto pWriter = MakeWriter( GetParam().m_Container );
    ASSERT_TRUE( pWriter->Open( Folder.File( "cut" ) ) && Header.WriteTo( *pWriter ) );
    for( uint32_t Frame = 0; Header.WriteFrame( *pWriter, Noise( Header.ImageBytes(), Frame ) ); ++Frame )
    {
      Append( Images, Noise( Header.ImageBytes(), Frame ) );
    }
    EXPECT_FALSE( pWriter->Close() );
  }
  EXPECT_GE( Images.size(), 3 * Header.ImageBytes() );
  EXPECT_TRUE( DecodeCutFile( Folder.File( "cut" ) ) == Images );
}

INSTANTIATE_TEST_SUITE_P( Containers, FullDisk, testing::Values( Mov, MP4, Avi, Mkv ), testing::PrintToStringParamName() );

TEST_P( KilledWriter, LosesNoFrameThatItHasWritten )
{
  for( const size_t Frames : { 1u, 7u, 30u } )
  {
    SCOPED_TRACE( Frames );
    const size_t Told = WriteAndKill( Frames );
    const VBytes Decoded = DecodeCutFile( m_Path );
    EXPECT_GE( Told, Frames );
    EXPECT_LE( Decoded.size(), ( Told + 1 ) * m_Image.size() );
    ASSERT_GE( Decoded.size(), Told * m_Image.size() );
    for( size_t Frame = 0; Frame < Told; ++Frame )
    {
      EXPECT_TRUE( std::equal( m_Image.begin(), m_Image.end(), Decoded.begin() + static_cast<std::ptrdiff_t>( Frame * m_Image.size() ) ) ) << Frame;
    }
  }
}

INSTANTIATE_TEST_SUITE_P( Containers, KilledWriter, testing::Values( Avi, Mkv ), testing::PrintToStringParamName() );
