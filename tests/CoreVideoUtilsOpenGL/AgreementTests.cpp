// What the graphics card makes of a frame is what the processor makes of it.
#include "CoreVideoUtilsOpenGL/FrameUpload.h"
#include "tests/CoreVideoUtilsOpenGL/Images.h"
#include "tests/support/AssertionCapture.h"
#include "tests/support/Threads.h"

#include <QtGui/QGuiApplication>
#include <QtGui/QSurfaceFormat>

#include <algorithm>
#include <atomic>

using namespace OpenGLTests;

namespace
{

void ExpectAgreement( VPixelFormatConverterOpenGL& i_rConverter, const VImage& i_rImage )
{
  SCOPED_TRACE( KVZ::ToName( i_rImage.m_Info.m_PixelFormat ) + ", " + std::to_string( i_rImage.m_Info.m_ImageWidth ) + " wide" );
  for( const IPixelFormat::Enum Target : { IPixelFormat::ER8G8B8, IPixelFormat::EB8G8R8, IPixelFormat::ER8G8B8u8, IPixelFormat::EB8G8R8u8 } )
  {
    const bool bFourthByte = Target == IPixelFormat::ER8G8B8u8 || Target == IPixelFormat::EB8G8R8u8;
    const VBytes Drawn = Convert( i_rConverter, i_rImage, Target ).value_or( VBytes() );
    EXPECT_LE( LargestDifference( InSoftware( i_rImage, Target ), Drawn, bFourthByte ), 1 ) << "to " << KVZ::ToName( Target );
  }
}

VBytes DrawnWithLens()
{
  VImage Ramp = MakeImage( IPixelFormat::ELuminance8, 1920, 24 );
  for( size_t Index = 0; Index < Ramp.m_Bytes.size(); ++Index )
  {
    Ramp.m_Bytes[Index] = static_cast<uint8_t>( Index % 1920 / 8 );
  }
  return Corrected( Ramp, IPixelFormat::ER8G8B8, MakeLensRecord( { 960.0, 12.0 }, { -2e-7, 0.0, 0.0 } ) );
}

// What OpenGL ES draws, of images as wide as video's, and where the lens moves them to.
void ExpectAgreementOfOpenGLES( const VBytes& i_rWithLens )
{
  const TestSupport::VLogCapture Log( "CoreVideoUtilsOpenGL" );
  VPixelFormatConverterOpenGL Converter( {} );
  for( const IPixelFormat::Enum Source :
    { IPixelFormat::EB8G8R8, IPixelFormat::EBayerGB7, IPixelFormat::ELuminance8, IPixelFormat::EY8U8Y8V8, IPixelFormat::EU10Y10V10Y10 } )
  {
    ExpectAgreement( Converter, MakeNoise( Source, 1920, 16 ) );
  }
  const VImage Grey = MakeNoise( IPixelFormat::ELuminance8, 51, 20 );
  EXPECT_EQ( Grey.m_Bytes, Convert( Converter, Grey, IPixelFormat::ELuminance8 ) );
  EXPECT_LE( LargestDifference( i_rWithLens, DrawnWithLens() ), 2 );
  EXPECT_EQ( 2u, CountBeginningWith( Log, "OpenGL OpenGL ES " ) );
}

}

TEST( OpenGLAgreement, HoldsForNoiseInEveryFormat )
{
  const TestSupport::VAssertionCapture Assertions;   // of the software converter, for ten bits and an odd number of pixels
  VPixelFormatConverterOpenGL Converter( {} );
  for( int32_t Source = 1; Source < KVZ::PixelFormatCount; ++Source )
  {
    for( const auto& [Width, Height] : { std::pair{ 96u, 40u }, { 131u, 57u }, { 2u, 2u }, { 1u, 1u } } )
    {
      ExpectAgreement( Converter, MakeNoise( static_cast<IPixelFormat::Enum>( Source ), Width, Height ) );
    }
  }
}

// The software corrector has bytes between demosaic, gamma and saturation, where the shader rounds once.
TEST( OpenGLAgreement, HoldsForCorrectedColours )
{
  const VImage Bayer = MakeNoise( IPixelFormat::EBayerGB8, 640, 360 );
  for( const KVZ::VColourRecord& rColour : { KVZ::VColourRecord{ 0.5f, 1.0f }, { 0.0f, 1.3f }, { 1.25f, 0.8f }, { 1.0f, 1.8f } } )
  {
    const VBytes Software = InSoftware( Bayer, IPixelFormat::ER8G8B8, rColour );
    const VBytes OpenGL = InOpenGL( Bayer, IPixelFormat::ER8G8B8, rColour );
    ASSERT_EQ( Software.size(), OpenGL.size() );
    // Near black a gamma above 1 lifts one level of the demosaic by many.
    int Largest = 0;
    for( size_t Index = 0; Index < Software.size(); ++Index )
    {
      const bool bSteep = rColour.m_GammaCorrection > 1.0f && std::min( Software[Index], OpenGL[Index] ) < 96;
      Largest = std::max( Largest, bSteep ? 0 : std::abs( Software[Index] - OpenGL[Index] ) );
    }
    EXPECT_LE( Largest, 2 ) << rColour.m_Saturation << ", " << rColour.m_GammaCorrection;
  }
  const VImage Yuv = MakeNoise( IPixelFormat::EU8Y8V8Y8, 64, 8 );
  EXPECT_EQ( InOpenGL( Yuv, IPixelFormat::ER8G8B8 ), InOpenGL( Yuv, IPixelFormat::ER8G8B8, { 0.0f, 2.0f } ) );
}

// The mean of the colours that the same program makes.
TEST( OpenGLAgreement, MakesLuminanceOfTheMean )
{
  for( const IPixelFormat::Enum Source : { IPixelFormat::ER8G8B8, IPixelFormat::EB8G8R8u8, IPixelFormat::ER5G6B5, IPixelFormat::ELuminance8,
         IPixelFormat::EBayerBG8, IPixelFormat::EY8U8Y8V8 } )
  {
    const VImage Image = MakeNoise( Source, 51, 20 );
    const VBytes Colour = InOpenGL( Image, IPixelFormat::ER8G8B8 );
    VBytes Mean;
    for( size_t Index = 0; Index + 2 < Colour.size(); Index += 3 )
    {
      Mean.push_back( static_cast<uint8_t>( ( Colour[Index] + Colour[Index + 1] + Colour[Index + 2] + 1 ) / 3 ) );
    }
    EXPECT_LE( LargestDifference( Mean, InOpenGL( Image, IPixelFormat::ELuminance8 ) ), 1 ) << KVZ::ToName( Source );
  }
  const VImage Grey = MakeNoise( IPixelFormat::ELuminance7, 51, 20 );
  EXPECT_EQ( InSoftware( Grey, IPixelFormat::ELuminance8 ), InOpenGL( Grey, IPixelFormat::ELuminance8 ) );
}

// A host has an application object of its own, with windows and on another thread, and wants OpenGL ES.
TEST( OpenGLAgreement, HoldsForOpenGLESInAHostWithWindows )
{
  const VBytes WithLens = DrawnWithLens();
  const VOtherVariable Integration( "QT_XCB_GL_INTEGRATION", "xcb_egl" );
  std::string Name = "host";
  std::string Option = "-platform";
  std::string Platform = "xcb";
  std::array<char*, 4> Arguments = { Name.data(), Option.data(), Platform.data(), nullptr };
  int Count = 3;
  const QSurfaceFormat Former = QSurfaceFormat::defaultFormat();
  QSurfaceFormat Format = Former;
  Format.setRenderableType( QSurfaceFormat::OpenGLES );
  QSurfaceFormat::setDefaultFormat( Format );
  {
    const QGuiApplication Application( Count, Arguments.data() );
    ExpectAgreementOfOpenGLES( WithLens );
  }
  QSurfaceFormat::setDefaultFormat( Former );
}

// The environment that makes it so is gone when it is drawn, and what the host has set is still there.
TEST( OpenGLAgreement, HoldsWithoutADisplay )
{
  const VBytes WithLens = DrawnWithLens();
  for( const char* pDisplay : { "", ":8765" } )
  {
    const VOtherVariable Display( "DISPLAY", pDisplay );
    ExpectAgreementOfOpenGLES( WithLens );
    EXPECT_EQ( nullptr, std::getenv( "EGL_PLATFORM" ) );
    EXPECT_STREQ( pDisplay, std::getenv( "DISPLAY" ) );
  }
}

// Eight bits a component are all that some have: the frame's own bytes, and ten bits cut to them.
TEST( OpenGLAgreement, GivesTexturesOfEightBitsWhatTheyHold )
{
  const VImage Eight = MakeNoise( IPixelFormat::EY8U8Y8V8, 6, 1 );
  std::vector<uint8_t> Scratch;
  const CoreVideoUtilsOpenGL::VTextureKinds Kinds = { false, false };
  const auto Upload = PrepareUpload( Eight.m_Info, Eight.m_Bytes.data(), Kinds, Scratch );
  EXPECT_EQ( Eight.m_Bytes.data(), Upload.m_pPixels );
  EXPECT_EQ( ( VideoGraphics::VTextureLayout{ 3, 1, GL_RGBA, GL_RGBA, GL_UNSIGNED_BYTE } ), Upload.m_Layout );
  const VImage Ten = { TestSupport::VideoInfo( IPixelFormat::EU10Y10V10Y10, 6, 1 ), InSoftware( Eight, IPixelFormat::EU10Y10V10Y10 ) };
  const auto Cut = PrepareUpload( Ten.m_Info, Ten.m_Bytes.data(), Kinds, Scratch );
  EXPECT_EQ( Upload.m_Layout, Cut.m_Layout );
  EXPECT_LE( LargestDifference( Eight.m_Bytes, VBytes( Cut.m_pPixels, Cut.m_pPixels + 12 ) ), 3 );   // its way to ten bits took two from some
}

// Frames of several sizes and formats through one converter, from several threads at once: each gets its own back.
TEST( OpenGLAgreement, HoldsForFramesFromSeveralThreads )
{
  VPixelFormatConverterOpenGL Converter( {} );
  std::atomic<int> Wrong{ 0 };
  TestSupport::RunOnThreads( 4,
    [&]( uint32_t i_Thread )
    {
      const VImage Image = MakeNoise( i_Thread % 2 == 0 ? IPixelFormat::EBayerRG8 : IPixelFormat::ER8G8B8, 32 + 16 * ( i_Thread / 2 ), 24 );
      const VBytes Expected = InSoftware( Image, IPixelFormat::EB8G8R8 );
      for( int Round = 0; Round < 10; ++Round )
      {
        Wrong += LargestDifference( Expected, Convert( Converter, Image, IPixelFormat::EB8G8R8 ).value_or( VBytes() ) ) > 1 ? 1 : 0;
      }
    } );
  EXPECT_EQ( 0, Wrong );
}
