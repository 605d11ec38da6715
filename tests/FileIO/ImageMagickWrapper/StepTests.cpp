// The steps that PNG and TIFF go through, as the library sees them.
#include "FileIO/PNGIO/PNGIO.h"
#include "FileIO/TIFFIO/TIFFIO.h"
#include "tests/support/LogCapture.h"
#include "tests/support/TemporaryFolder.h"

#include <boost/filesystem/operations.hpp>
#include <gtest/gtest.h>

#include <dlfcn.h>

#include <optional>

using ImageMagickWrapper::VLibrary;
using KVZ::IPixelFormat;
using UtilsMemory::VByteVector;

namespace
{

class Steps : public testing::Test
{
protected:
  Steps()
  {
    // A copy, so that each test has a library that nobody else in the process has loaded.
    const std::string Path = m_Folder.File( "libMagickWand.so" );
    boost::filesystem::copy_file( FAKE_MAGICK_WAND, Path );
    m_Library.emplace( ImageMagickWrapper::VPlaces{ { Path } }, PNGIO::Category );
    void* const pHandle = dlopen( Path.c_str(), RTLD_NOW | RTLD_NOLOAD );
    m_pCalls = reinterpret_cast<std::string* (*)()>( dlsym( pHandle, "FakeCalls" ) )();
    m_pFailing = reinterpret_cast<std::string* (*)()>( dlsym( pHandle, "FakeFailing" ) )();
    m_pImageType = reinterpret_cast<int* (*)()>( dlsym( pHandle, "FakeImageType" ) )();
  }

  // What has been called since the last time.
  std::string Calls() const { return std::exchange( *m_pCalls, {} ); }

  bool Read( KVZ::VideoFrameInfo& o_rInfo, VByteVector& o_rPixels ) const
  {
    const VByteVector File( 5 );
    return PNGIO::PNGReader( File.data(), File.size(), o_rInfo, o_rPixels, *m_Library );
  }

  const TestSupport::VTemporaryFolder m_Folder;
  std::optional<VLibrary> m_Library;
  std::string* m_pCalls = nullptr;
  std::string* m_pFailing = nullptr;
  int* m_pImageType = nullptr;
};

KVZ::VideoFrameInfo Info( IPixelFormat::Enum i_Format ) { return { .m_ImageWidth = 2, .m_ImageHeight = 1, .m_PixelFormat = i_Format }; }

}

TEST_F( Steps, TheLibraryIsBegunAndEndedOnce )
{
  EXPECT_EQ( Calls(), "MagickWandGenesis\n" );
  m_Library.reset();
  EXPECT_EQ( Calls(), "MagickWandTerminus\n" );
}

TEST_F( Steps, TheOneThatFailsIsTheLastAndIsReported )
{
  for( const std::string Step : { "MagickConstituteImage", "MagickSetImageDepth", "MagickSetImageFormat", "MagickSetImageType", "MagickGetImageBlob",
         "MagickReadImageBlob", "MagickExportImagePixels" } )
  {
    SCOPED_TRACE( Step );
    const TestSupport::VLogCapture Log( "PNGIO" );
    VByteVector Bytes( 6, 9 );
    VByteVector File;
    KVZ::VideoFrameInfo Found;
    *m_pFailing = Step;
    Calls();
    const bool bReading = Step == "MagickReadImageBlob" || Step == "MagickExportImagePixels";
    EXPECT_FALSE( bReading ? Read( Found, Bytes ) : PNGIO::PNGWriter( Bytes.data(), 6, Info( IPixelFormat::ER8G8B8 ), File, *m_Library ) );
    const std::string Made = Calls();
    const size_t Failed = Made.find( Step );
    ASSERT_NE( Failed, std::string::npos );
    EXPECT_EQ( Made.substr( Made.find( '\n', Failed ) + 1 ), "MagickGetException\nMagickRelinquishMemory\nDestroyMagickWand\n" );
    EXPECT_EQ( Log.Texts(), std::vector<std::string>{ "ImageMagick exception: no more ink" } );
  }
}

// As a library tells it that knows the type of the pixels.
TEST_F( Steps, AReadImagesTypeSaysWhatItIs )
{
  const TestSupport::VLogCapture Log( "PNGIO" );
  for( int Type = 0; Type <= 9; ++Type )
  {
    SCOPED_TRACE( Type );
    *m_pImageType = Type;
    Calls();
    KVZ::VideoFrameInfo Found;
    VByteVector Pixels;
    const bool bGrey = Type == 2;
    const bool bColour = Type == 4 || Type == 6;
    ASSERT_EQ( Read( Found, Pixels ), bGrey || bColour );
    if( bGrey || bColour )
    {
      EXPECT_EQ( Found, Info( bGrey ? IPixelFormat::ELuminance8 : IPixelFormat::ER8G8B8 ) );
      EXPECT_EQ( Pixels, VByteVector( bGrey ? 2 : 6, 7 ) );
    }
    EXPECT_EQ( Calls(),
      std::string( "NewMagickWand\nMagickReadImageBlob\n" ) + ( bGrey || bColour ? "MagickExportImagePixels\n" : "" ) + "DestroyMagickWand\n" );
  }
  EXPECT_EQ( Log.Count( "Unsupported format" ), 7u );
}
