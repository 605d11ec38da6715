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
    // Version 6 has no such function.
    Find( i_pHandle, r.MagickIdentifyImageType, "MagickIdentifyImageType", "MagickGetImageType" ) &&
    Find( i_pHandle, r.MagickGetImageHeight, "MagickGetImageHeight" ) && Find( i_pHandle, r.MagickGetImageWidth, "MagickGetImageWidth" ) &&
    Find( i_pHandle, r.MagickReadImageBlob, "MagickReadImageBlob" ) && Find( i_pHandle, r.MagickGetException, "MagickGetException" ) &&
    Find( i_pHandle, r.MagickExportImagePixels, "MagickExportImagePixels" ) && Find( i_pHandle, r.MagickGetColorspace, "MagickGetColorspace" ) &&
    Find( i_pHandle, r.MagickRelinquishMemory, "MagickRelinquishMemory" );
}

// Points an ImageMagick that is shipped beside the program to its coder modules there. One that belongs to the system knows where its own
// are and would find none of them any more if it were sent to a folder without them. A person's own setting stays in force.
void SetCoderPath( const boost::filesystem::path& i_rFolder )
{
  boost::system::error_code Error;
  if( boost::filesystem::exists( i_rFolder / "png.la", Error ) || boost::filesystem::exists( i_rFolder / "png.so", Error ) )
  {
    setenv( "MAGICK_CODER_MODULE_PATH", i_rFolder.c_str(), 0 );
  }
}

}

VPlaces SystemPlaces()
{
  return { { "libMagickWand-7.Q16HDRI.so.10", "libMagickWand-7.Q16.so.10", "libMagickWand-7.Q8HDRI.so.10", "libMagickWand-7.Q8.so.10",
    "libMagickWand-6.Q16HDRI.so.7", "libMagickWand-6.Q16.so.7", "libMagickWand-6.Q16HDRI.so.6", "libMagickWand-6.Q16.so.6",
    "libMagickWand-6.Q8.so.6" } };
}

VLibrary::VLibrary( const VPlaces& i_rPlaces, const char* i_pCategory )
{
  const char* pFault = nullptr;
  boost::system::error_code Error;
  const boost::filesystem::path Program = boost::filesystem::read_symlink( i_rPlaces.m_ProgramLink, Error );
  if( Error )
  {
    pFault = "Could not get module handle.";
  }
  else if( !Program.has_parent_path() )
  {
    pFault = "Could not get module filename.";
  }
  else
  {
    SetCoderPath( Program.parent_path() );
    pFault = Open( i_rPlaces.m_Libraries );
  }
  if( pFault )
  {
    KVZ_LOG_ERROR( std::string( i_pCategory ), pFault );
  }
}

VLibrary::~VLibrary()
{
  if( m_bReady && !m_bForeign )
  {
    m_Functions.MagickWandTerminus();
  }
}

// Null where all went well, otherwise what did not.
const char* VLibrary::Open( const std::vector<std::string>& i_rNames )
{
  void* pHandle = nullptr;
  for( auto Name = i_rNames.begin(); Name != i_rNames.end() && !pHandle; ++Name )
  {
    m_bForeign = dlopen( Name->c_str(), RTLD_NOW | RTLD_LOCAL | RTLD_NOLOAD ) != nullptr;
    pHandle = dlopen( Name->c_str(), RTLD_NOW | RTLD_LOCAL );
  }
  if( !pHandle )
  {
    return "Could not load MagickWand DLL";
  }
  if( !FindAll( pHandle, m_Functions ) )
  {
    return "Could not set up function pointers for ImageMagick library.";
  }
  m_Functions.MagickWandGenesis();
  m_bReady = true;
  return nullptr;
}

const VLibrary& Instance( const char* i_pCategory )
{
  static const VLibrary s_Library( SystemPlaces(), i_pCategory );
  return s_Library;
}

}
