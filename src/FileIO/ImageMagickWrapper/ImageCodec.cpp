#include "FileIO/ImageMagickWrapper/ImageCodec.h"

#include "StageCoreRuntime/GlobalLog.h"

#include <algorithm>
#include <array>

namespace ImageMagickWrapper
{

namespace
{

using KVZ::IPixelFormat;
using UtilsMemory::VByteVector;

constexpr size_t Depth = 8;   // bits a channel

// Pixels. Version 6 ends the process where an image has none or exceeds the system's policy, which allows twice this side in a common setting.
constexpr uint32_t MaxSide = 8192;

bool IsImage( const KVZ::VideoFrameInfo& i_rInfo, const uint8_t* i_pPixels, size_t i_Size )
{
  const auto IsSide = []( uint32_t i_Side ) { return 0 < i_Side && i_Side <= MaxSide; };
  return i_pPixels && IsSide( i_rInfo.m_ImageWidth ) && IsSide( i_rInfo.m_ImageHeight ) &&
    i_Size >= KVZ::GetImageSize( i_rInfo.m_PixelFormat, i_rInfo.m_ImageWidth, i_rInfo.m_ImageHeight );
}

struct VRow
{
  int m_ImageType;
  IPixelFormat::Enum m_PixelFormat;
  const char* m_pMap;
  bool m_bWritten;   // what images of this pixel format are stored as
};

constexpr std::array Rows = {
  VRow{ ImageType::Grayscale, IPixelFormat::ELuminance8, "I", true },
  VRow{ ImageType::TrueColor, IPixelFormat::ER8G8B8, "RGB", true },
  VRow{ ImageType::Palette, IPixelFormat::ER8G8B8, "RGB", false },
};

template<class TTest>
const VRow* FindRow( TTest i_Test )
{
  const auto Found = std::find_if( Rows.begin(), Rows.end(), i_Test );
  return Found == Rows.end() ? nullptr : &*Found;
}

// One image of the library's.
class VWand
{
public:
  VWand( const VFunctions& i_rFunctions, const VFileKind& i_rKind ) : m_r( i_rFunctions ), m_rKind( i_rKind ), m_pWand( i_rFunctions.NewMagickWand() )
  {
  }
  ~VWand() { m_r.DestroyMagickWand( m_pWand ); }
  VWand( const VWand& ) = delete;
  VWand& operator=( const VWand& ) = delete;

  bool SetPixels( const KVZ::VideoFrameInfo& i_rInfo, const VRow& i_rRow, const uint8_t* i_pPixels )
  {
    return Check( m_r.MagickConstituteImage( m_pWand, i_rInfo.m_ImageWidth, i_rInfo.m_ImageHeight, i_rRow.m_pMap, CharPixel, i_pPixels ) ) &&
      Check( m_r.MagickSetImageDepth( m_pWand, Depth ) ) && Check( m_r.MagickSetImageFormat( m_pWand, m_rKind.m_pFormat ) ) &&
      Check( m_r.MagickSetImageType( m_pWand, i_rRow.m_ImageType ) );
  }

  bool GetFile( VByteVector& o_rBytes )
  {
    size_t Size = 0;
    unsigned char* const pBlob = m_r.MagickGetImageBlob( m_pWand, &Size );
    if( pBlob )
    {
      o_rBytes.assign( pBlob, pBlob + Size );
      m_r.MagickRelinquishMemory( pBlob );
    }
    return Check( pBlob != nullptr );
  }

  bool SetFile( const uint8_t* i_pBytes, size_t i_Size ) { return Check( m_r.MagickReadImageBlob( m_pWand, i_pBytes, i_Size ) ); }

  int GetType() { return m_r.MagickIdentifyImageType( m_pWand ); }
  // The type tells what the pixels are. Version 6 tells how the file stores them: a grey one may be a palette to it.
  bool IsTypeOfPixels() const { return m_r.MagickIdentifyImageType != m_r.MagickGetImageType; }
  size_t GetWidth() { return m_r.MagickGetImageWidth( m_pWand ); }
  size_t GetHeight() { return m_r.MagickGetImageHeight( m_pWand ); }

  bool GetPixels( const KVZ::VideoFrameInfo& i_rInfo, const VRow& i_rRow, uint8_t* o_pPixels )
  {
    return Check( m_r.MagickExportImagePixels( m_pWand, 0, 0, i_rInfo.m_ImageWidth, i_rInfo.m_ImageHeight, i_rRow.m_pMap, CharPixel, o_pPixels ) );
  }

private:
  bool Check( int i_Result )
  {
    if( i_Result != MagickTrue )
    {
      int Severity = 0;
      char* const pText = m_r.MagickGetException( m_pWand, &Severity );
      KVZ_LOG_ERROR( std::string( m_rKind.m_pCategory ), "ImageMagick exception: %s", pText );
      m_r.MagickRelinquishMemory( pText );
    }
    return i_Result == MagickTrue;
  }

  const VFunctions& m_r;
  const VFileKind& m_rKind;
  MagickWand* const m_pWand;
};

// Makes an R8G8B8 image whose channels are equal everywhere a Luminance8 one.
void MakeGreyIfItIs( KVZ::VideoFrameInfo& io_rInfo, VByteVector& io_rPixels )
{
  for( size_t Index = 0; Index < io_rPixels.size(); Index += 3 )
  {
    if( io_rPixels[Index] != io_rPixels[Index + 1] || io_rPixels[Index] != io_rPixels[Index + 2] )
    {
      return;
    }
  }
  for( size_t Pixel = 0; Pixel < io_rPixels.size() / 3; ++Pixel )
  {
    io_rPixels[Pixel] = io_rPixels[3 * Pixel];
  }
  io_rPixels.resize( io_rPixels.size() / 3 );
  io_rInfo.m_PixelFormat = IPixelFormat::ELuminance8;
}

}

bool EncodeImage( const VLibrary& i_rLibrary, const VFileKind& i_rKind, const uint8_t* i_pPixels, size_t i_Size, const KVZ::VideoFrameInfo& i_rInfo,
  VByteVector& o_rBytes )
{
  const VFunctions* const pFunctions = i_rLibrary.Functions();
  const VRow* const pRow = FindRow( [&]( const VRow& i_rRow ) { return i_rRow.m_bWritten && i_rRow.m_PixelFormat == i_rInfo.m_PixelFormat; } );
  if( !pFunctions || !pRow || !IsImage( i_rInfo, i_pPixels, i_Size ) )
  {
    return false;
  }
  VWand Wand( *pFunctions, i_rKind );
  return Wand.SetPixels( i_rInfo, *pRow, i_pPixels ) && Wand.GetFile( o_rBytes );
}

bool DecodeImage( const VLibrary& i_rLibrary, const VFileKind& i_rKind, const uint8_t* i_pBytes, size_t i_Size, KVZ::VideoFrameInfo& o_rInfo,
  VByteVector& o_rPixels )
{
  const VFunctions* const pFunctions = i_rLibrary.Functions();
  if( !pFunctions )
  {
    return false;
  }
  VWand Wand( *pFunctions, i_rKind );
  if( !Wand.SetFile( i_pBytes, i_Size ) )
  {
    return false;
  }
  const VRow* const pRow = FindRow( [Type = Wand.GetType()]( const VRow& i_rRow ) { return i_rRow.m_ImageType == Type; } );
  if( !pRow )
  {
    KVZ_LOG_ERROR( std::string( i_rKind.m_pCategory ), "Unsupported format" );
    return false;
  }
  KVZ::VideoFrameInfo Info;
  Info.m_ImageWidth = static_cast<uint32_t>( Wand.GetWidth() );
  Info.m_ImageHeight = static_cast<uint32_t>( Wand.GetHeight() );
  Info.m_PixelFormat = pRow->m_PixelFormat;
  VByteVector Pixels( KVZ::GetImageSize( Info.m_PixelFormat, Info.m_ImageWidth, Info.m_ImageHeight ) );
  if( !Wand.GetPixels( Info, *pRow, Pixels.data() ) )
  {
    return false;
  }
  if( pRow->m_PixelFormat == IPixelFormat::ER8G8B8 && !Wand.IsTypeOfPixels() )
  {
    MakeGreyIfItIs( Info, Pixels );
  }
  o_rInfo = Info;
  o_rPixels = std::move( Pixels );
  return true;
}

}
