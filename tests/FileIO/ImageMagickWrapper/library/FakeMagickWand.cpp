// Stands in for MagickWand: writes its calls down, fails one of them if it is told to, and has an image of 2 by 1 pixels to read.
#include <cstddef>
#include <cstdint>
#include <cstdlib>
#include <cstring>
#include <sstream>
#include <string>

namespace
{

std::string s_Calls;
std::string s_Failing;
int s_ImageType = 6;
char s_Wand = 0;

// 1 for a call that does not fail.
template<class... TArguments>
int Note( const char* i_pName, const TArguments&... i_rArguments )
{
  std::ostringstream Text;
  Text << i_pName;
  ( ( Text << ' ' << i_rArguments ), ... );
  s_Calls += Text.str() + "\n";
  return s_Failing == i_pName ? 0 : 1;
}

}

extern "C"
{
  std::string* FakeCalls() { return &s_Calls; }
  std::string* FakeFailing() { return &s_Failing; }
  int* FakeImageType() { return &s_ImageType; }

  void MagickWandGenesis() { Note( "MagickWandGenesis" ); }
  void MagickWandTerminus() { Note( "MagickWandTerminus" ); }
  void* NewMagickWand() { return Note( "NewMagickWand" ) ? &s_Wand : nullptr; }
  void* DestroyMagickWand( void* )
  {
    Note( "DestroyMagickWand" );
    return nullptr;
  }
  int MagickConstituteImage( void*, size_t i_Columns, size_t i_Rows, const char* i_pMap, int i_Storage, const void* i_pPixels )
  {
    return Note( "MagickConstituteImage", i_Columns, i_Rows, i_pMap, i_Storage, int{ *static_cast<const uint8_t*>( i_pPixels ) } );
  }
  int MagickSetImageDepth( void*, size_t i_Bits ) { return Note( "MagickSetImageDepth", i_Bits ); }
  int MagickSetImageFormat( void*, const char* i_pFormat ) { return Note( "MagickSetImageFormat", i_pFormat ); }
  int MagickSetImageType( void*, int i_Type ) { return Note( "MagickSetImageType", i_Type ); }
  unsigned char* MagickGetImageBlob( void*, size_t* o_pSize )
  {
    if( !Note( "MagickGetImageBlob" ) )
    {
      return nullptr;
    }
    *o_pSize = 4;
    return reinterpret_cast<unsigned char*>( strdup( "file" ) );
  }
  void* MagickRelinquishMemory( void* i_pMemory )
  {
    Note( "MagickRelinquishMemory" );
    std::free( i_pMemory );
    return nullptr;
  }
  char* MagickGetException( const void*, int* )
  {
    Note( "MagickGetException" );
    return strdup( "no more ink" );
  }
  int MagickReadImageBlob( void*, const void*, size_t i_Size ) { return Note( "MagickReadImageBlob", i_Size ); }
  int MagickIdentifyImageType( void* ) { return s_ImageType; }
  int MagickGetImageType( void* ) { return 0; }
  size_t MagickGetImageWidth( void* ) { return 2; }
  size_t MagickGetImageHeight( void* ) { return 1; }
  size_t MagickGetImageDepth( void* ) { return 8; }
  int MagickGetColorspace( void* ) { return 0; }
  int MagickExportImagePixels( void*, intptr_t, intptr_t, size_t i_Columns, size_t i_Rows, const char* i_pMap, int i_Storage, void* o_pPixels )
  {
    std::memset( o_pPixels, 7, i_Columns * i_Rows * std::strlen( i_pMap ) );
    return Note( "MagickExportImagePixels", i_Columns, i_Rows, i_pMap, i_Storage );
  }
}
