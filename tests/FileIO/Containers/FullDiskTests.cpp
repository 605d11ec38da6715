// Disks that take no more: whatever a call has said to be written can still be decoded.
#include "tests/FileIO/Containers/MovieWriters.h"
#include "tests/support/FileSizeLimit.h"
#include "tests/support/ProgramRun.h"
#include "tests/support/TemporaryFolder.h"

#include <gtest/gtest.h>

using namespace Containers;
using namespace TestSupport;

namespace
{

class FullDisk : public testing::TestWithParam<VContainerRow>
{
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
  const VRunResult Run = RunProgram(
    { "ffmpeg", "-nostdin", "-v", "error", "-i", Folder.File( "cut" ), "-map", "0:v", "-fps_mode", "passthrough", "-f", "rawvideo", "-" } );
  EXPECT_TRUE( Bytes( Run.m_Output ) == Images ) << Run.m_Output.size() << " bytes: " << Run.m_Error;
}

INSTANTIATE_TEST_SUITE_P( Containers, FullDisk, testing::Values( Mov, MP4, Avi, Mkv ),
  []( const auto& i_rInfo ) { return std::string( i_rInfo.param.m_pName ); } );
