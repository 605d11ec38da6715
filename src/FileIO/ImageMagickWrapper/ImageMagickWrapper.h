// ImageMagick's MagickWand interface, opened at run time: where it is not installed PNG and TIFF cannot be had, and all else works.
//
// Any thread may use the library, each on wands of its own. Faults of opening it go to the log once, in the category of who was first to want it.
#pragma once

#include <cstddef>
#include <cstdint>
#include <string>
#include <vector>

namespace ImageMagickWrapper
{

struct MagickWand;   // the library's own

// Values that versions 6 and 7 agree on
namespace ImageType
{
constexpr int Grayscale = 2;
constexpr int Palette = 4;
constexpr int TrueColor = 6;
}
constexpr int CharPixel = 1;    // storage of one byte a channel
constexpr int MagickTrue = 1;   // a call that has done what it should

// By the library's names. Sizes are of pixels, maps name the channels of a pixel in order: "I" grey, "RGB".
struct VFunctions
{
  void ( *MagickWandGenesis )() = nullptr;
  void ( *MagickWandTerminus )() = nullptr;
  MagickWand* ( *NewMagickWand )() = nullptr;
  int ( *MagickConstituteImage )( MagickWand*, size_t i_Columns, size_t i_Rows, const char* i_pMap, int i_Storage, const void* ) = nullptr;
  int ( *MagickSetImageFormat )( MagickWand*, const char* ) = nullptr;
  int ( *MagickSetImageType )( MagickWand*, int ) = nullptr;
  unsigned char* ( *MagickGetImageBlob )( MagickWand*, size_t* o_pSize ) = nullptr;
  MagickWand* ( *DestroyMagickWand )( MagickWand* ) = nullptr;
  size_t ( *MagickGetImageDepth )( MagickWand* ) = nullptr;
  int ( *MagickSetImageDepth )( MagickWand*, size_t i_Bits ) = nullptr;
  int ( *MagickGetImageType )( MagickWand* ) = nullptr;
  int ( *MagickIdentifyImageType )( MagickWand* ) = nullptr;
  size_t ( *MagickGetImageHeight )( MagickWand* ) = nullptr;
  size_t ( *MagickGetImageWidth )( MagickWand* ) = nullptr;
  int ( *MagickReadImageBlob )( MagickWand*, const void*, size_t ) = nullptr;
  char* ( *MagickGetException )( const MagickWand*, int* o_pSeverity ) = nullptr;
  int ( *MagickExportImagePixels )( MagickWand*, intptr_t i_X, intptr_t i_Y, size_t i_Columns, size_t i_Rows, const char* i_pMap, int i_Storage,
    void* ) = nullptr;
  int ( *MagickGetColorspace )( MagickWand* ) = nullptr;
  void* ( *MagickRelinquishMemory )( void* ) = nullptr;
};

// Where things are looked for.
struct VPlaces
{
  std::vector<std::string> m_Libraries;           // file names for the loader's normal path; the first that opens is taken
  std::string m_ProgramLink = "/proc/self/exe";   // leads to the running program
};
VPlaces SystemPlaces();

class VLibrary
{
public:
  // Opens the library and makes it ready; a fault has been reported when this returns.
  VLibrary( const VPlaces& i_rPlaces, const char* i_pCategory );
  // Ends the library's work, unless it was in the process before. It stays loaded: its helper threads know nothing of us.
  ~VLibrary();
  VLibrary( const VLibrary& ) = delete;
  VLibrary& operator=( const VLibrary& ) = delete;

  // Null where the library cannot be used.
  const VFunctions* Functions() const { return m_bReady ? &m_Functions : nullptr; }

private:
  const char* Open( const std::vector<std::string>& i_rNames );

  VFunctions m_Functions;
  bool m_bForeign = false;   // somebody else loaded it first
  bool m_bReady = false;
};

// The process's one, made by the first call.
const VLibrary& Instance( const char* i_pCategory );

}
