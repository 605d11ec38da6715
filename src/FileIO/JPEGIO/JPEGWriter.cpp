#include "FileIO/JPEGIO/JPEGWriter.h"

#include "StageCoreRuntime/DebugServices.h"
#include "StageCoreRuntime/GlobalLog.h"

#include <turbojpeg.h>

#include <array>
#include <memory>
#include <type_traits>

namespace JPEGIO
{

namespace
{

using KVZ::IPixelFormat;
using UtilsMemory::VByteVector;

// The output vector is large enough for any image; TurboJPEG shall not make a buffer of its own.
constexpr int Flags = 0x400;
static_assert( Flags == TJFLAG_NOREALLOC );

constexpr uint32_t MaxSide = 65500;   // pixels; the library's own limit

// Where a 4:2:2 image has its first bytes of each plane: luma every 2 bytes, the others every 4.
struct VPlaneStarts
{
  size_t m_Y;
  size_t m_U;
  size_t m_V;
};

struct VRow
{
  IPixelFormat::Enum m_Format;
  int m_TurboFormat;   // TJPF_UNKNOWN: planar
  int m_Subsampling;
  uint32_t m_PixelBytes;
  VPlaneStarts m_Starts;

  bool IsPlanar() const { return m_TurboFormat == TJPF_UNKNOWN; }
};

constexpr std::array Rows = {
  VRow{ IPixelFormat::ELuminance8, TJPF_GRAY, TJSAMP_GRAY, 1, {} },
  VRow{ IPixelFormat::ER8G8B8, TJPF_RGB, TJSAMP_444, 3, {} },
  VRow{ IPixelFormat::EB8G8R8, TJPF_BGR, TJSAMP_444, 3, {} },
  VRow{ IPixelFormat::ER8G8B8u8, TJPF_RGBX, TJSAMP_444, 4, {} },
  VRow{ IPixelFormat::EB8G8R8u8, TJPF_BGRX, TJSAMP_444, 4, {} },
  VRow{ IPixelFormat::EU8Y8V8Y8, TJPF_UNKNOWN, TJSAMP_422, 2, { 1, 0, 2 } },
  VRow{ IPixelFormat::EY8U8Y8V8, TJPF_UNKNOWN, TJSAMP_422, 2, { 0, 1, 3 } },
};

const VRow* FindRow( IPixelFormat::Enum i_Format )
{
  for( const VRow& rRow : Rows )
  {
    if( rRow.m_Format == i_Format )
    {
      return &rRow;
    }
  }
  return nullptr;
}

// Y whole, then U, then V.
void TakeApart( const uint8_t* i_pSource, size_t i_Pixels, const VPlaneStarts& i_rStarts, uint8_t* o_pPlanes )
{
  uint8_t* const pU = o_pPlanes + i_Pixels;
  uint8_t* const pV = pU + i_Pixels / 2;
  for( size_t Pixel = 0; Pixel < i_Pixels; ++Pixel )
  {
    o_pPlanes[Pixel] = i_pSource[i_rStarts.m_Y + 2 * Pixel];
  }
  for( size_t Pair = 0; Pair < i_Pixels / 2; ++Pair )
  {
    pU[Pair] = i_pSource[i_rStarts.m_U + 4 * Pair];
    pV[Pair] = i_pSource[i_rStarts.m_V + 4 * Pair];
  }
}

struct VDestroy
{
  void operator()( void* i_pCompressor ) const { tjDestroy( i_pCompressor ); }
};
using VCompressor = std::unique_ptr<std::remove_pointer_t<tjhandle>, VDestroy>;

struct VImage
{
  const uint8_t* m_pPixels;
  int m_Width;
  int m_Height;
  const VRow& m_rRow;
  int m_Quality;

  size_t CountPixels() const { return static_cast<size_t>( m_Width ) * static_cast<size_t>( m_Height ); }
};

// Both give TurboJPEG's result; the output's address and room go in, what became of them comes back.

int CompressPacked( tjhandle i_Compressor, const VImage& i_rImage, unsigned char** io_ppBuffer, unsigned long* io_pSize )
{
  const int Pitch = i_rImage.m_Width * static_cast<int>( i_rImage.m_rRow.m_PixelBytes );
  return tjCompress2( i_Compressor, i_rImage.m_pPixels, i_rImage.m_Width, Pitch, i_rImage.m_Height, i_rImage.m_rRow.m_TurboFormat, io_ppBuffer,
    io_pSize, i_rImage.m_rRow.m_Subsampling, i_rImage.m_Quality, Flags );
}

int CompressPlanar( tjhandle i_Compressor, const VImage& i_rImage, VByteVector& io_rScratch, unsigned char** io_ppBuffer, unsigned long* io_pSize )
{
  constexpr int Padding = 1;
  io_rScratch.resize( i_rImage.CountPixels() * i_rImage.m_rRow.m_PixelBytes );
  TakeApart( i_rImage.m_pPixels, i_rImage.CountPixels(), i_rImage.m_rRow.m_Starts, io_rScratch.data() );
  return tjCompressFromYUV( i_Compressor, io_rScratch.data(), i_rImage.m_Width, Padding, i_rImage.m_Height, i_rImage.m_rRow.m_Subsampling,
    io_ppBuffer, io_pSize, i_rImage.m_Quality, Flags );
}

bool Compress( const VImage& i_rImage, VByteVector& o_rBuffer, VByteVector& io_rScratch )
{
  const VCompressor pCompressor( tjInitCompress() );
  const unsigned long WorstCaseSize = tjBufSize( i_rImage.m_Width, i_rImage.m_Height, i_rImage.m_rRow.m_Subsampling );
  o_rBuffer.resize( WorstCaseSize );
  unsigned char* pBuffer = o_rBuffer.data();
  unsigned long Size = WorstCaseSize;
  const int Result = i_rImage.m_rRow.IsPlanar() ? CompressPlanar( pCompressor.get(), i_rImage, io_rScratch, &pBuffer, &Size )
                                                : CompressPacked( pCompressor.get(), i_rImage, &pBuffer, &Size );
  // clang-format off
  const bool bInPlace = KVZ_ASSERT( pBuffer == &o_rBuffer[ 0 ] );
  // clang-format on
  const bool bCompressed = KVZ_ASSERT( Result == 0 );
  const bool bFits = KVZ_ASSERT( Size <= WorstCaseSize );
  if( !bCompressed )
  {
    KVZ_LOG_ERROR( "JPEGIO", "TurboJPEG: %s", tjGetErrorStr2( pCompressor.get() ) );
  }
  const bool bGood = bInPlace && bCompressed && bFits;
  o_rBuffer.resize( bGood ? Size : 0 );
  return bGood;
}

}

bool JPEGWriter( const uint8_t* i_pSource, size_t i_Size, const KVZ::VideoFrameInfo& i_rInfo, int i_Quality, VByteVector& o_rBuffer,
  VByteVector& io_rScratch )
{
  const uint32_t Width = i_rInfo.m_ImageWidth;
  const uint32_t Height = i_rInfo.m_ImageHeight;
  const VRow* const pRow = FindRow( i_rInfo.m_PixelFormat );
  if( !pRow || Width == 0 || Height == 0 || Width > MaxSide || Height > MaxSide || ( pRow->IsPlanar() && Width % 2 != 0 ) )
  {
    return false;
  }
  const VImage Image{ i_pSource, static_cast<int>( Width ), static_cast<int>( Height ), *pRow, i_Quality };
  return i_Size >= Image.CountPixels() * pRow->m_PixelBytes && Compress( Image, o_rBuffer, io_rScratch );
}

}
