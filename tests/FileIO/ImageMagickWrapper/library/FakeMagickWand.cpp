// Stands in for MagickWand: writes its calls down, fails one of them if it is told to, and has an image of 2 by 1 pixels to read.
#include <cstddef>
#include <cstdint>
#include <cstdlib>
#include <cstring>
#include <string>

namespace
{

std::string s_Calls;
std::string s_Failing;
int s_ImageType = 6;
char s_Wand = 0;

// 1 for a call that does not fail.
int Note( const std::string& i_rName )
{
  s_Calls += i_rName + "\n";
  return s_Failing == i_rName ? 0 : 1;
}

}

extern "C"
{
  std::string* FakeCalls() { return &s_Calls; }
  std::string* FakeFailing() { return &s_Failing; }
  int* FakeImageType() { return &s_ImageType; }

  void MagickWandGenesis() { Note( "MagickWandGenesis" ); }
  void MagickWandTerminus() { Note( "MagickWandTerminus" ); }
  void* NewMagickWand()
  {
    Note( "NewMagickWand" );
    return &s_Wand;
  }
  void* DestroyMagickWand( void* )
  {
    Note( "DestroyMagickWand" );
    return nullptr;
  }
  int MagickConstituteImage( void*, size_t, size_t, const char*, int, const void* ) { return Note( "MagickConstituteImage" ); }
  int MagickSetImageDepth( void*, size_t ) { return Note( "MagickSetImageDepth" ); }
  int MagickSetImageFormat( void*, const char* ) { return Note( "MagickSetImageFormat" ); }
  int MagickSetImageType( void*, int ) { return Note( "MagickSetImageType" ); }
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
  int MagickReadImageBlob( void*, const void*, size_t ) { return Note( "MagickReadImageBlob" ); }
  int MagickIdentifyImageType( void* ) { return s_ImageType; }
  int MagickGetImageType( void* ) { return 0; }
  size_t MagickGetImageWidth( void* ) { return 2; }
  size_t MagickGetImageHeight( void* ) { return 1; }
  size_t MagickGetImageDepth( void* ) { return 8; }
  int MagickGetColorspace( void* ) { return 0; }
  int MagickExportImagePixels( void*, intptr_t, intptr_t, size_t i_Columns, size_t i_Rows, const char* i_pMap, int, void* o_pPixels )
  {
    std::memset( o_pPixels, 7, i_Columns * i_Rows * std::strlen( i_pMap ) );
    return Note( "MagickExportImagePixels" );
  }
}
