// A lens that is undone on the way to the file, with a display to draw on and without.
#include "tests/support/TemporaryFolder.h"
#include "tests/support/system/PrivateDisplay.h"
#include "tests/system/Images/Pictures.h"

#include <gtest/gtest.h>

#include <algorithm>
#include <tuple>

using namespace SystemTests;

namespace
{

constexpr size_t LensWidth = 720;
constexpr size_t LensHeight = 576;
constexpr uint64_t Frames = 4;

const VArguments Card = { "--card", "decklink:standard=SD_720_576I_5000", "--frames", std::to_string( Frames ) };
const VArguments Packed = { "--pixel-format", "B8G8R8u8" };
// A corner is drawn a quarter of its way nearer to the middle.
const VArguments Lens = { "--lens", "360,288,-1.2e-6,0" };

// The fourth bytes that there are, lowest and highest.
std::pair<int, int> FourthBytes( const std::vector<uint8_t>& i_rFrame )
{
  std::pair<int, int> Range = { 255, 0 };
  for( size_t Byte = 3; Byte < i_rFrame.size(); Byte += 4 )
  {
    Range = { std::min<int>( Range.first, i_rFrame[Byte] ), std::max<int>( Range.second, i_rFrame[Byte] ) };
  }
  return Range;
}

class LensTest : public testing::Test
{
protected:
  VHostResult RecordOn( const std::string& i_rDisplay, const VArguments& i_rMore, const std::string& i_rVariable = "LIBGL_ALWAYS_SOFTWARE=1" )
  {
    VRunOptions Options;
    Options.m_Environment = { "DISPLAY=" + i_rDisplay, i_rVariable };
    return Record( m_Folder.File( "recording" ), Card + i_rMore, Options );
  }

  const TestSupport::VTemporaryFolder m_Folder;
};

}

#if defined( STAGECORE_OPENGL )

// Once the first frame is on its way, the server ends and with it the context. The file that was promised a lens undone fails and is whole so far;
// the one that takes what there is goes on without.
TEST_F( LensTest, IsLeftFromWhereTheDisplayEnds )
{
  for( const auto& [pConverter, Wanted, ExitCode] : { std::tuple{ "opengl", 200u, 1 }, { "auto", 100u, 0 } } )
  {
    VPrivateDisplay Display;
    VRunOptions Options;
    Options.m_Environment = { "DISPLAY=" + Display.Name(), "LIBGL_ALWAYS_SOFTWARE=1" };
    Options.m_OnErrorText = [&, bSent = false]( pid_t, const std::string& i_rText ) mutable
    {
      if( !bSent && i_rText.find( "Loading shader file :/FragmentShaders/VideoYUV.glsl" ) != std::string::npos )
      {
        bSent = true;
        Display.Interrupt();
        Display.WaitForEnd( 30.0 );
      }
    };
    const VHostResult Result = Record( m_Folder.File( pConverter ),
      { "--card", "decklink:standard=SD_720_576I_5000", "--frames", std::to_string( Wanted ), "--pixel-format", "Luminance8", "--converter",
        pConverter, "--lens", "360,288,-1.2e-6,0", "--verbose" },
      Options );
    EXPECT_EQ( ExitCode, Result.m_Run.m_ExitCode ) << Describe( Result.m_Run );
    EXPECT_NE( std::string::npos, Result.m_Run.m_Error.find( "The OpenGL context is lost" ) ) << Describe( Result.m_Run );
    const uint64_t Written = Result.Device().value( "frames_written", uint64_t{ 0 } );
    EXPECT_TRUE( ExitCode == 0 ? Written == Wanted : Written > 0 && Written < Wanted ) << Written;
    EXPECT_EQ( Written, Inspect( Result.Path() ).value( "frame_count", uint64_t{ 0 } ) );
  }
}

TEST_F( LensTest, IsUndoneByOpenGL )
{
  const VPrivateDisplay Display;
  for( const auto& [Name, pConverter] : { std::pair{ Display.Name(), "opengl" }, { Display.Name(), "auto" }, { std::string(), "opengl" } } )
  {
    const VHostResult Result = RecordOn( Name, Packed + Lens + VArguments{ "--overwrite", "--converter", pConverter } );
    ASSERT_EQ( 0, Result.m_Run.m_ExitCode ) << Describe( Result.m_Run );
    EXPECT_EQ( Frames, Result.Device().value( "frames_written", uint64_t{ 0 } ) );
    const std::vector<uint8_t> Frame = FrameOf( Result, 0 );
    ASSERT_EQ( LensWidth * LensHeight * 4, Frame.size() );
    const auto [Lowest, Highest] = FourthBytes( Frame );
    EXPECT_TRUE( Lowest >= 127 && Highest <= 128 ) << Lowest << " to " << Highest;
    EXPECT_EQ( 0, Frame[0] + Frame[1] + Frame[2] );
    // The bars' left one is grey, at a point that comes from the image's left edge, where nothing moves up or down.
    const size_t Left = ( LensHeight / 2 * LensWidth + 80 ) * 4;
    EXPECT_GT( Frame[Left], 100 );
  }
}

#endif

TEST_F( LensTest, IsLeftAsItIsWithoutOpenGL )
{
  const VHostResult Result = RecordOn( "", Packed + Lens, "EGL_PLATFORM=x11" );
  EXPECT_EQ( 0, Result.m_Run.m_ExitCode ) << Describe( Result.m_Run );
  EXPECT_EQ( Frames, Result.Device().value( "frames_written", uint64_t{ 0 } ) );
  EXPECT_EQ( std::make_pair( 255, 255 ), FourthBytes( FrameOf( Result, 0 ) ) );
  EXPECT_NE( std::string::npos, Result.m_Run.m_Error.find( "ixel formats are converted in software." ) ) << Describe( Result.m_Run );
}
