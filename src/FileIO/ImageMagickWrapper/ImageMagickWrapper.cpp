#include "FileIO/ImageMagickWrapper/ImageMagickWrapper.h"

#include "StageCoreRuntime/GlobalLog.h"

#include <boost/filesystem/operations.hpp>
#include <boost/filesystem/path.hpp>

#include <dlfcn.h>

#include <cstdlib>

namespace ImageMagickWrapper
{

namespace
{

constexpr const char* CoderPathVariable = "MAGICK_CODER_MODULE_PATH";

// Takes the function of the first of the two names that is there.
template<class TFunction>
bool Find( void* i_pHandle, TFunction& o_rFunction, const char* i_pName, const char* i_pOtherName = nullptr )
{
  void* pSymbol = dlsym( i_pHandle, i_pName );
  if( !pSymbol && i_pOtherName )
  {
    pSymbol = dlsym( i_pHandle, i_pOtherName );
  }
  o_rFunction = reinterpret_cast<TFunction>( pSymbol );
  return pSymbol != nullptr;
}

bool FindAll( void* i_pHandle, VFunctions& o_rFunctions )
{
  VFunctions& r = o_rFunctions;
  return Find( i_pHandle, r.MagickWandGenesis, "MagickWandGenesis" ) && Find( i_pHandle, r.MagickWandTerminus, "MagickWandTerminus" ) &&
    Find( i_pHandle, r.NewMagickWand, "NewMagickWand" ) && Find( i_pHandle, r.MagickConstituteImage, "MagickConstituteImage" ) &&
    Find( i_pHandle, r.MagickSetImageFormat, "MagickSetImageFormat" ) && Find( i_pHandle, r.MagickSetImageType, "MagickSetImageType" ) &&
    Find( i_pHandle, r.MagickGetImageBlob, "MagickGetImageBlob" ) && Find( i_pHandle, r.DestroyMagickWand, "DestroyMagickWand" ) &&
    Find( i_pHandle, r.MagickGetImageDepth, "MagickGetImageDepth" ) && Find( i_pHandle, r.MagickSetImageDepth, "MagickSetImageDepth" ) &&
    Find( i_pHandle, r.MagickGetImageType, "MagickGetImageType" ) &&
    // Version 6 has no such function: there the query of the type identifies already.
    Find( i_pHandle, r.MagickIdentifyImageType, "MagickIdentifyImageType", "MagickGetImageType" ) &&
    Find( i_pHandle, r.MagickGetImageHeight, "MagickGetImageHeight" ) && Find( i_pHandle, r.MagickGetImageWidth, "MagickGetImageWidth" ) &&
    Find( i_pHandle, r.MagickReadImageBlob, "MagickReadImageBlob" ) && Find( i_pHandle, r.MagickGetException, "MagickGetException" ) &&
    Find( i_pHandle, r.MagickExportImagePixels, "MagickExportImagePixels" ) && Find( i_pHandle, r.MagickGetColorspace, "MagickGetColorspace" ) &&
    Find( i_pHandle, r.MagickRelinquishMemory, "MagickRelinquishMemory" );
}

bool HasCoders( const boost::filesystem::path& i_rFolder )
{
  boost::system::error_code Error;
  return boost::filesystem::exists( i_rFolder / "png.la", Error ) || boost::filesystem::exists( i_rFolder / "png.so", Error );
}

}

VPlaces SystemPlaces()
{
  return { { "libMagickWand-7.Q16HDRI.so.10", "libMagickWand-7.Q16.so.10", "libMagickWand-7.Q8HDRI.so.10", "libMagickWand-7.Q8.so.10",
    "libMagickWand-6.Q16HDRI.so.7", "libMagickWand-6.Q16.so.7", "libMagickWand-6.Q16HDRI.so.6", "libMagickWand-6.Q16.so.6",
    "libMagickWand-6.Q8.so.6" } };
}

VLibrary::VLibrary( const VPlaces& i_rPlaces )
{
  if( !dlopen( nullptr, RTLD_NOW ) )
  {
    KVZ_LOG_ERROR( "ImageMagickWrapper", "Could not get module handle." );
  }
  else if( !SetCoderPath( i_rPlaces.m_ProgramLink ) )
  {
    KVZ_LOG_ERROR( "ImageMagickWrapper", "Could not get module filename." );
  }
  else if( !Load( i_rPlaces.m_Libraries ) )
  {
    KVZ_LOG_ERROR( "ImageMagickWrapper", "Could not load MagickWand DLL" );
  }
  else if( !FindAll( m_pHandle, m_Functions ) )
  {
    KVZ_LOG_ERROR( "ImageMagickWrapper", "Could not set up function pointers for ImageMagick library." );
  }
  else
  {
    m_Functions.MagickWandGenesis();
    m_bReady = true;
  }
}

VLibrary::~VLibrary()
{
  if( m_bReady && !m_bForeign )
  {
    m_Functions.MagickWandTerminus();
  }
}

// Points an ImageMagick that is shipped beside the program to its coder modules there. One that belongs to the system knows where its own
// are and would find none of them any more if it were sent to a folder without them. A person's own setting stays in force.
bool VLibrary::SetCoderPath( const std::string& i_rProgramLink ) const
{
  boost::system::error_code Error;
  const boost::filesystem::path Program = boost::filesystem::read_symlink( i_rProgramLink, Error );
  if( Error || !Program.has_parent_path() )
  {
    return false;
  }
  const boost::filesystem::path Folder = Program.parent_path();
  if( HasCoders( Folder ) )
  {
    setenv( CoderPathVariable, Folder.c_str(), 0 );
  }
  return true;
}

bool VLibrary::Load( const std::vector<std::string>& i_rNames )
{
  for( const std::string& rName : i_rNames )
  {
    m_bForeign = dlopen( rName.c_str(), RTLD_NOW | RTLD_LOCAL | RTLD_NOLOAD ) != nullptr;
    m_pHandle = dlopen( rName.c_str(), RTLD_NOW | RTLD_LOCAL );
    if( m_pHandle )
    {
      return true;
    }
  }
  return false;
}

const VLibrary& Instance()
{
  static const VLibrary s_Library( SystemPlaces() );
  return s_Library;
}

}
