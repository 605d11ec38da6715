// A process is killed while it writes as fast as it can. What it had told to be written must be readable.
#include "tests/FileIO/Containers/MovieWriters.h"
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

struct VKilledCase
{
  VContainerRow m_Row;
  uint64_t m_RiffBytes;
  const char* m_pName;
};

class KilledWriter : public testing::TestWithParam<VKilledCase>
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
      const auto pWriter = MakeWriter( GetParam().m_Row.m_Container, { .m_RiffBytes = GetParam().m_RiffBytes } );
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

TEST_P( KilledWriter, LosesNoFrameThatItHasWritten )
{
  for( const size_t Frames : { 1u, 7u, 30u } )
  {
    SCOPED_TRACE( Frames );
    const size_t Told = WriteAndKill( Frames );
    // The last frame may be cut short, which FFmpeg says
    const VRunResult Run = RunProgram(
      { "ffmpeg", "-nostdin", "-v", "error", "-i", m_Path, "-map", "0:v", "-fps_mode", "passthrough", "-f", "rawvideo", "-" } );
    const size_t Decoded = Run.m_Output.size() / m_Image.size();
    EXPECT_GE( Told, Frames );
    EXPECT_GE( Decoded, Told );
    EXPECT_LE( Decoded, Told + 1 );
    for( size_t Frame = 0; Frame < std::min( Decoded, Told ); ++Frame )
    {
      EXPECT_TRUE( std::equal( m_Image.begin(), m_Image.end(), Run.m_Output.begin() + static_cast<std::ptrdiff_t>( Frame * m_Image.size() ),
        []( uint8_t i_Byte, char i_Char ) { return i_Byte == static_cast<uint8_t>( i_Char ); } ) )
        << Frame;
    }
  }
}

INSTANTIATE_TEST_SUITE_P( Containers, KilledWriter,
  testing::Values( VKilledCase{ Avi, 0, "Avi" }, VKilledCase{ Avi, 5000000, "AviOfManyRiffs" }, VKilledCase{ Mkv, 0, "Mkv" } ),
  []( const auto& i_rInfo ) { return std::string( i_rInfo.param.m_pName ); } );
