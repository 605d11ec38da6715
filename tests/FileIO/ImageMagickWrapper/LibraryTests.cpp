#include "FileIO/ImageMagickWrapper/ImageMagickWrapper.h"
#include "tests/support/LogCapture.h"
#include "tests/support/TemporaryFolder.h"

#include <gtest/gtest.h>

#include <cstdlib>
#include <fstream>

using ImageMagickWrapper::SystemPlaces;
using ImageMagickWrapper::VLibrary;
using ImageMagickWrapper::VPlaces;

namespace
{

constexpr const char* Category = "PNGIO";
constexpr const char* CoderPath = "MAGICK_CODER_MODULE_PATH";

class Library : public testing::Test
{
protected:
  Library()
  {
    // The process's one comes first, so that none of those made here ends its work.
    EXPECT_NE( ImageMagickWrapper::Instance( Category ).Functions(), nullptr );
    m_Log.Clear();
  }
  ~Library() override { unsetenv( CoderPath ); }

  // A link as the system's to the running program.
  std::string ProgramLink( const std::string& i_rTarget ) const
  {
    const std::string Link = m_Folder.File( "exe" );
    boost::filesystem::remove( Link );
    boost::filesystem::create_symlink( i_rTarget, Link );
    return Link;
  }

  const TestSupport::VTemporaryFolder m_Folder;
  TestSupport::VLogCapture m_Log{ Category };
};

}

TEST_F( Library, FaultsOfOpeningAreToldOnce )
{
  const std::vector<std::pair<VPlaces, std::string>> Cases = {
    { { SystemPlaces().m_Libraries, m_Folder.File( "none" ) }, "Could not get module handle." },
    { { SystemPlaces().m_Libraries, ProgramLink( "program" ) }, "Could not get module filename." },
    { { { "libNoMagickWand.so.1", "libNoMagickWand.so.2" } }, "Could not load MagickWand DLL" },
    { { {} }, "Could not load MagickWand DLL" },
    { { { "libNoMagickWand.so.1", "libm.so.6" } }, "Could not set up function pointers for ImageMagick library." },
  };
  for( const auto& [rPlaces, rText] : Cases )
  {
    m_Log.Clear();
    const VLibrary Faulty( rPlaces, Category );
    EXPECT_EQ( Faulty.Functions(), nullptr );
    EXPECT_EQ( Faulty.Functions(), nullptr );
    EXPECT_EQ( m_Log.Texts(), std::vector<std::string>{ rText } );
  }
}

TEST_F( Library, ItsCodersAreLookedForBesideTheProgramIfTheyAreThere )
{
  const VPlaces Places{ { "libNoMagickWand.so.1" }, ProgramLink( m_Folder.File( "program" ) ) };
  VLibrary( Places, Category );
  EXPECT_EQ( std::getenv( CoderPath ), nullptr );

  std::ofstream( m_Folder.File( "png.la" ) ) << "coder";
  VLibrary( Places, Category );
  EXPECT_EQ( std::string( std::getenv( CoderPath ) ) + "/program", m_Folder.File( "program" ) );

  setenv( CoderPath, "/own", 1 );
  VLibrary( Places, Category );
  EXPECT_STREQ( std::getenv( CoderPath ), "/own" );
}
