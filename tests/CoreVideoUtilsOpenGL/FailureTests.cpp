// What OpenGL cannot do, and what becomes of the frame then.
#include "tests/CoreVideoUtilsOpenGL/Images.h"
#include "tests/support/TemporaryFolder.h"

#include <QtGui/QOffscreenSurface>
#include <QtGui/QOpenGLContext>

#include <boost/filesystem/operations.hpp>

#include <fstream>

using namespace OpenGLTests;
using CoreVideoUtilsOpenGL::EStep;

namespace
{

constexpr char LensText[] = "Lens un-distortion not supported in software conversion.";

const VLensDistortionRecord Lens = MakeLensRecord( { 24.0, 8.0 }, { 1e-4, 0.0, 0.0 } );

}

TEST( OpenGLFailure, RefusesOtherFormatsShortBuffersAndImagesWiderThanTextures )
{
  VPixelFormatConverterOpenGL Converter( {} );
  for( const IPixelFormat::Enum Target : { IPixelFormat::EU8Y8V8Y8, IPixelFormat::EBayerGB7, IPixelFormat::EUnspecified } )
  {
    EXPECT_FALSE( Convert( Converter, MakeNoise( IPixelFormat::ER8G8B8, 16, 8 ), Target ) );
  }
  EXPECT_FALSE( Convert( Converter, MakeNoise( IPixelFormat::EUnspecified, 16, 8 ), IPixelFormat::ER8G8B8 ) );
  EXPECT_FALSE( Convert( Converter, MakeNoise( IPixelFormat::ELuminance8, 70000, 1 ), IPixelFormat::ER8G8B8 ) );
  EXPECT_TRUE( Convert( Converter, MakeNoise( IPixelFormat::ELuminance8, 0, 4 ), IPixelFormat::ER8G8B8 ) );
  const VImage Image = MakeNoise( IPixelFormat::ER8G8B8, 16, 8 );
  VBytes Target( 16 * 8 * 4 );
  const auto Run = [&]( size_t i_SourceSize, size_t i_TargetSize )
  { return Converter.Convert( Image.m_Info, Image.m_Bytes.data(), i_SourceSize, IPixelFormat::EB8G8R8u8, Target.data(), i_TargetSize ); };
  EXPECT_FALSE( Run( 16 * 8 * 3 - 1, Target.size() ) );
  EXPECT_FALSE( Run( 16 * 8 * 3, Target.size() - 1 ) );
  EXPECT_TRUE( Run( 16 * 8 * 3, Target.size() ) );
}

// Where OpenGL is wanted for the lens alone, the software converter takes what has none and what OpenGL cannot do, and says what is missing then.
TEST( OpenGLFailure, LeavesToSoftwareWhatItMay )
{
  const TestSupport::VLogCapture Log( "CoreVideoUtilsOpenGL" );
  VPixelFormatConverterOpenGL Converter( { EUse::LensAlone } );
  const VImage Image = MakeNoise( IPixelFormat::ER8G8B8, 48, 16 );
  const VBytes Software = InSoftware( Image, IPixelFormat::EB8G8R8u8 );   // with fourth bytes of 255
  EXPECT_EQ( Software, Convert( Converter, Image, IPixelFormat::EB8G8R8u8 ) );
  SetLens( Converter, Lens );
  const std::optional<VBytes> Drawn = Convert( Converter, Image, IPixelFormat::EB8G8R8u8 );
  EXPECT_EQ( Corrected( Image, IPixelFormat::EB8G8R8u8, Lens ), Drawn );
  EXPECT_NE( Software, Drawn );
  EXPECT_EQ( 0u, Log.Count( LensText ) );
  EXPECT_EQ( InSoftware( Image, IPixelFormat::EU8Y8V8Y8 ), Convert( Converter, Image, IPixelFormat::EU8Y8V8Y8 ) );
  EXPECT_EQ( 1u, Log.Count( LensText ) );
}

// Without a display, and with one that is not there: where Qt is asked for a context it ends the process. EGL is told to look for that display too.
TEST( OpenGLFailure, ConvertsInSoftwareWithoutAContext )
{
  for( const auto& [Use, pDisplay] : { std::pair{ EUse::Always, "" }, { EUse::LensAlone, "" }, { EUse::Always, ":8765" } } )
  {
    const VOtherVariable Display( "DISPLAY", pDisplay );
    const VOtherVariable Platform( "EGL_PLATFORM", "x11" );
    const TestSupport::VLogCapture Log( "CoreVideoUtilsOpenGL" );
    VPixelFormatConverterOpenGL Converter( { Use } );
    Converter.SetColourCorrection( { 0.5f, 1.5f } );
    SetLens( Converter, Lens );
    const VImage Image = MakeNoise( IPixelFormat::EBayerRG8, 48, 16 );
    for( int Round = 0; Round < 2; ++Round )
    {
      EXPECT_EQ( InSoftware( Image, IPixelFormat::ER8G8B8, { 0.5f, 1.5f } ), Convert( Converter, Image, IPixelFormat::ER8G8B8 ) );
    }
    EXPECT_EQ( 1u, Log.Count( "OpenGL cannot be used: there is no X display. Pixel formats are converted in software." ) );
    EXPECT_EQ( 2u, Log.Count( LensText ) );
  }
}

// The surface is taken from under a context with frames still to come: one fails, or is done in software, and the next has a new context.
TEST( OpenGLFailure, GoesOnAfterAContextIsLost )
{
  const VImage Image = MakeNoise( IPixelFormat::EB8G8R8, 48, 16 );
  for( const EUse Use : { EUse::Always, EUse::LensAlone } )
  {
    const TestSupport::VLogCapture Log( "CoreVideoUtilsOpenGL" );
    bool bLose = true;
    VPixelFormatConverterOpenGL Converter( { Use, ":",
      [&]( EStep i_Step )
      {
        if( bLose && i_Step == EStep::ReadBack )
        {
          dynamic_cast<QOffscreenSurface&>( *QOpenGLContext::currentContext()->surface() ).destroy();
        }
      } } );
    SetLens( Converter, Lens );
    const std::optional<VBytes> Drawn = Convert( Converter, Image, IPixelFormat::ER8G8B8 );
    ASSERT_TRUE( Drawn );
    bLose = false;
    const std::optional<VBytes> Instead = Use == EUse::Always ? std::nullopt : std::optional( InSoftware( Image, IPixelFormat::ER8G8B8 ) );
    EXPECT_EQ( Instead, Convert( Converter, Image, IPixelFormat::ER8G8B8 ) );
    EXPECT_EQ( 1u, Log.Count( "The OpenGL context is lost with a frame to convert. The next frame gets a new one." ) );
    EXPECT_EQ( Use == EUse::Always ? 0u : 1u, Log.Count( LensText ) );
    EXPECT_EQ( Drawn, Convert( Converter, Image, IPixelFormat::ER8G8B8 ) );
  }
}

// A shader with a fault and one that is missing: conversions that need them fail, the others go on.
TEST( OpenGLFailure, FailsWithAShaderThatDoesNotCompile )
{
  const TestSupport::VTemporaryFolder Folder;
  boost::filesystem::create_directories( Folder.File( "VertexShaders" ) );
  boost::filesystem::create_directories( Folder.File( "FragmentShaders" ) );
  std::ofstream( Folder.File( "VertexShaders/Video.glsl" ) )
    << "attribute vec2 a_Position;\nvoid main() { gl_Position = vec4( a_Position, 0.0, 1.0 ); }\n";
  std::ofstream( Folder.File( "FragmentShaders/VideoRaw.glsl" ) ) << "void main() { gl_FragColor = NoSuchThing; }\n";
  std::ofstream( Folder.File( "FragmentShaders/VideoLuminance.glsl" ) ) << "void main() { gl_FragColor = vec4( 1.0 ); }\n";

  const TestSupport::VLogCapture Log( "CoreVideoUtilsOpenGL" );
  VPixelFormatConverterOpenGL Converter( { EUse::Always, Folder.File( "" ) } );
  EXPECT_FALSE( Convert( Converter, MakeNoise( IPixelFormat::ER8G8B8, 8, 8 ), IPixelFormat::ER8G8B8 ) );
  EXPECT_FALSE( Convert( Converter, MakeNoise( IPixelFormat::ER8G8B8, 8, 8 ), IPixelFormat::ER8G8B8 ) );
  EXPECT_FALSE( Convert( Converter, MakeNoise( IPixelFormat::EU8Y8V8Y8, 8, 8 ), IPixelFormat::ER8G8B8 ) );
  EXPECT_TRUE( Convert( Converter, MakeNoise( IPixelFormat::ELuminance8, 8, 8 ), IPixelFormat::ER8G8B8 ) );
  const std::string Fragments = Folder.File( "" ) + "/FragmentShaders/";
  EXPECT_EQ( 1u, CountBeginningWith( Log, "Shader Failed To Compile<" + Fragments + "VideoRaw.glsl> Log=<" ) );
  EXPECT_TRUE( Log.Has( "Failed to open " + Fragments + "VideoYUV.glsl" ) );
  EXPECT_TRUE( Log.Has( "Loading shader file " + Fragments + "VideoLuminance.glsl" ) );
}
