// What OpenGL cannot do, and what becomes of the frame then.
#include "tests/CoreVideoUtilsOpenGL/Images.h"
#include "tests/support/LogCapture.h"
#include "tests/support/TemporaryFolder.h"

#include <boost/filesystem/operations.hpp>

#include <algorithm>
#include <cstdlib>
#include <fstream>

using namespace OpenGLTests;

namespace
{

constexpr char LensText[] = "Lens un-distortion not supported in software conversion.";

// Another display, or none, while it lives.
class VOtherDisplay
{
public:
  explicit VOtherDisplay( const char* i_pDisplay ) : m_Former( std::getenv( "DISPLAY" ) ? std::getenv( "DISPLAY" ) : "" )
  {
    setenv( "DISPLAY", i_pDisplay, 1 );
  }
  ~VOtherDisplay() { setenv( "DISPLAY", m_Former.c_str(), 1 ); }
  VOtherDisplay( const VOtherDisplay& ) = delete;
  VOtherDisplay& operator=( const VOtherDisplay& ) = delete;

private:
  const std::string m_Former;
};

size_t CountBeginningWith( const TestSupport::VLogCapture& i_rLog, const std::string& i_rText )
{
  const auto Texts = i_rLog.Texts();
  return static_cast<size_t>(
    std::count_if( Texts.begin(), Texts.end(), [&]( const std::string& i_rLine ) { return i_rLine.compare( 0, i_rText.size(), i_rText ) == 0; } ) );
}

KVZ::VLensDistortionRecord SomeLens()
{
  KVZ::VLensDistortionRecord Lens;
  Lens.m_RadialModel = KVZ::VLensDistortionRecord::ETarvo2Parameter;
  Lens.m_Centre = { 24.0, 8.0 };
  Lens.m_Parameters = { 1e-4, 0.0, 0.0 };
  return Lens;
}

}

TEST( OpenGLFailure, RefusesOtherOutputsAndShortBuffers )
{
  VPixelFormatConverterOpenGL Converter( {} );
  for( const IPixelFormat::Enum Target : { IPixelFormat::EU8Y8V8Y8, IPixelFormat::EBayerGB7, IPixelFormat::EUnspecified } )
  {
    EXPECT_FALSE( Convert( Converter, MakeNoise( IPixelFormat::ER8G8B8, 16, 8 ), Target ) );
  }
  EXPECT_FALSE( Convert( Converter, MakeNoise( IPixelFormat::EUnspecified, 16, 8 ), IPixelFormat::ER8G8B8 ) );
  const VImage Image = MakeNoise( IPixelFormat::ER8G8B8, 16, 8 );
  VBytes Target( 16 * 8 * 4 );
  EXPECT_FALSE( Converter.Convert( Image.m_Info, Image.m_Bytes.data(), 16 * 8 * 3 - 1, IPixelFormat::EB8G8R8u8, Target.data(), Target.size() ) );
  EXPECT_FALSE( Converter.Convert( Image.m_Info, Image.m_Bytes.data(), 16 * 8 * 3, IPixelFormat::EB8G8R8u8, Target.data(), Target.size() - 1 ) );
  EXPECT_TRUE( Converter.Convert( Image.m_Info, Image.m_Bytes.data(), 16 * 8 * 3, IPixelFormat::EB8G8R8u8, Target.data(), Target.size() ) );
}

// Wider than any texture. Images without pixels are done at once.
TEST( OpenGLFailure, RefusesImagesOfSizesThatTexturesCannotHave )
{
  VPixelFormatConverterOpenGL Converter( {} );
  EXPECT_FALSE( Convert( Converter, MakeNoise( IPixelFormat::ELuminance8, 70000, 1 ), IPixelFormat::ER8G8B8 ) );
  EXPECT_TRUE( Convert( Converter, MakeNoise( IPixelFormat::ELuminance8, 0, 4 ), IPixelFormat::ER8G8B8 ) );
  EXPECT_TRUE( Convert( Converter, MakeNoise( IPixelFormat::ELuminance8, 4, 4 ), IPixelFormat::ER8G8B8 ) );
}

// Where OpenGL is wanted for the lens alone, the software converter takes what it cannot do, and says what is missing.
TEST( OpenGLFailure, LeavesOtherOutputsToSoftwareWhereItMay )
{
  const TestSupport::VLogCapture Log( "CoreVideoUtilsOpenGL" );
  VPixelFormatConverterOpenGL Converter( { EUse::LensAlone } );
  const VImage Image = MakeNoise( IPixelFormat::ER8G8B8, 48, 16 );
  EXPECT_TRUE( Convert( Converter, Image, IPixelFormat::EU8Y8V8Y8 ) );
  EXPECT_EQ( 0u, Log.Count( LensText ) );
  Converter.SetLensCorrection( SomeLens() );
  Converter.SetLensCorrectionEnabled( true );
  EXPECT_EQ( InSoftware( Image, IPixelFormat::EU8Y8V8Y8 ), Convert( Converter, Image, IPixelFormat::EU8Y8V8Y8 ) );
  EXPECT_EQ( 1u, Log.Count( LensText ) );
}

// Without a display, and with one that is not there: where Qt is asked for a context it ends the process.
TEST( OpenGLFailure, ConvertsInSoftwareWithoutAContext )
{
  for( const auto& [Use, pDisplay] : { std::pair{ EUse::Always, "" }, { EUse::LensAlone, "" }, { EUse::Always, ":8765" } } )
  {
    const VOtherDisplay Other( pDisplay );
    const TestSupport::VLogCapture Log( "CoreVideoUtilsOpenGL" );
    VPixelFormatConverterOpenGL Converter( { Use } );
    Converter.SetColourCorrection( { 0.5f, 1.5f } );
    Converter.SetLensCorrection( SomeLens() );
    Converter.SetLensCorrectionEnabled( true );
    const VImage Image = MakeNoise( IPixelFormat::EBayerRG8, 48, 16 );
    for( int Round = 0; Round < 2; ++Round )
    {
      EXPECT_EQ( InSoftware( Image, IPixelFormat::ER8G8B8, { 0.5f, 1.5f } ), Convert( Converter, Image, IPixelFormat::ER8G8B8 ) );
    }
    EXPECT_EQ( 1u, Log.Count( "OpenGL cannot be used: there is no X display. Pixel formats are converted in software." ) );
    EXPECT_EQ( 2u, Log.Count( LensText ) );
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
