// A live input: what a program draws into a window.
#include "tests/support/TemporaryFolder.h"
#include "tests/support/TvidParser.h"
#include "tests/support/system/BackgroundProgram.h"
#include "tests/support/system/StageHost.h"

#include <gtest/gtest.h>

#include <set>

using namespace SystemTests;

TEST( Screen, AWindowIsRecordedAsItMovesByBothKindsOfCard )
{
  constexpr double PatienceSeconds = 30.0;
  constexpr size_t FrameCount = 75;
  const VPrivateDisplay Display;

  VBackgroundProgram Player( { "ffplay", "-v", "info", "-stats", "-f", "lavfi", "-i", "testsrc2=s=720x576:r=25", "-noborder" },
    { "DISPLAY=" + Display.Name(), "SDL_VIDEODRIVER=x11", "SDL_AUDIODRIVER=dummy" } );
  ASSERT_TRUE( Player.WaitFor( "M-V:", PatienceSeconds ) ) << Player.Printed();

  const TestSupport::VTemporaryFolder Folder;
  const std::string Input = ":standard=SD_720_576I_5000,input=-f x11grab -framerate 25 -video_size 720x576 -i " + Display.Name();
  const VRecordResult Result = Record( Folder.File( "out" ),
    { "--card", "decklink" + Input, "--card", "bluefish444" + Input, "--pixel-format", "U8Y8V8Y8", "--frames", std::to_string( FrameCount ) } );
  EXPECT_EQ( 0, Result.m_Run.m_ExitCode ) << Describe( Result.m_Run );
  for( size_t Device = 0; Device < 2; ++Device )
  {
    EXPECT_EQ( FrameCount, TestSupport::VTvidParser( Result.Path( Device ) ).Frames().size() );
    const nlohmann::json Told = Inspect( Result.Path( Device ), true );
    std::set<std::string> Pictures;
    for( const nlohmann::json& rFrame : Told.value( "frames", nlohmann::json::array() ) )
    {
      Pictures.insert( rFrame.value( "video_crc32", "" ) );
    }
    EXPECT_GT( Pictures.size(), FrameCount / 4 ) << "the window stood still";
  }
}
