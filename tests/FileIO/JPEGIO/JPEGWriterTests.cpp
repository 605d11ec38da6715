#include "FileIO/JPEGIO/JPEGWriter.h"
#include "tests/support/AssertionCapture.h"
#include "tests/support/LogCapture.h"
#include "tests/support/TestFrames.h"

#include <gtest/gtest.h>
#include <turbojpeg.h>

#include <dlfcn.h>

using KVZ::IPixelFormat;
using UtilsMemory::VByteVector;
using namespace TestSupport;

namespace
{

constexpr int Quality = 83;

int s_Flags = 0;   // of the last compression

template<class TFunction>
TFunction* Real( const char* i_pName )
{
  return reinterpret_cast<TFunction*>( dlsym( RTLD_NEXT, i_pName ) );
}

}

// TurboJPEG's own functions, looked at on the way. What the library does with the flags leaves no trace in an image.
extern "C" int tjCompress2( tjhandle i_Handle, const unsigned char* i_pPixels, int i_Width, int i_Pitch, int i_Height, int i_Format,
  unsigned char** io_ppImage, unsigned long* io_pSize, int i_Subsampling, int i_Quality, int i_Flags )
{
  s_Flags = i_Flags;
  return Real<decltype( tjCompress2 )>(
    "tjCompress2" )( i_Handle, i_pPixels, i_Width, i_Pitch, i_Height, i_Format, io_ppImage, io_pSize, i_Subsampling, i_Quality, i_Flags );
}

extern "C" int tjCompressFromYUV( tjhandle i_Handle, const unsigned char* i_pPlanes, int i_Width, int i_Padding, int i_Height, int i_Subsampling,
  unsigned char** io_ppImage, unsigned long* io_pSize, int i_Quality, int i_Flags )
{
  s_Flags = i_Flags;
  return Real<decltype( tjCompressFromYUV )>(
    "tjCompressFromYUV" )( i_Handle, i_pPlanes, i_Width, i_Padding, i_Height, i_Subsampling, io_ppImage, io_pSize, i_Quality, i_Flags );
}

namespace
{

// Every i_Step-th byte from i_First on.
std::vector<uint8_t> Plane( const std::vector<uint8_t>& i_rBytes, size_t i_First, size_t i_Step )
{
  std::vector<uint8_t> Result;
  for( size_t Index = i_First; Index < i_rBytes.size(); Index += i_Step )
  {
    Result.push_back( i_rBytes[Index] );
  }
  return Result;
}

// What TurboJPEG makes by itself, in memory of its own.
class VTurboJPEG
{
public:
  VTurboJPEG() = default;
  ~VTurboJPEG()
  {
    tjFree( m_pImage );
    tjDestroy( m_Handle );
  }
  VTurboJPEG( const VTurboJPEG& ) = delete;
  VTurboJPEG& operator=( const VTurboJPEG& ) = delete;

  std::vector<uint8_t> Packed( const std::vector<uint8_t>& i_rPixels, const KVZ::VideoFrameInfo& i_rInfo, int i_Format, int i_Subsampling )
  {
    EXPECT_EQ( tjCompress2( m_Handle, i_rPixels.data(), static_cast<int>( i_rInfo.m_ImageWidth ), 0, static_cast<int>( i_rInfo.m_ImageHeight ),
                 i_Format, &m_pImage, &m_Size, i_Subsampling, Quality, 0 ),
      0 );
    return { m_pImage, m_pImage + m_Size };
  }

  std::vector<uint8_t> Planar( const std::array<std::vector<uint8_t>, 3>& i_rPlanes, const KVZ::VideoFrameInfo& i_rInfo )
  {
    const unsigned char* Planes[] = { i_rPlanes[0].data(), i_rPlanes[1].data(), i_rPlanes[2].data() };
    EXPECT_EQ( tjCompressFromYUVPlanes( m_Handle, Planes, static_cast<int>( i_rInfo.m_ImageWidth ), nullptr,
                 static_cast<int>( i_rInfo.m_ImageHeight ), TJSAMP_422, &m_pImage, &m_Size, Quality, 0 ),
      0 );
    return { m_pImage, m_pImage + m_Size };
  }

private:
  const tjhandle m_Handle = tjInitCompress();
  unsigned char* m_pImage = nullptr;
  unsigned long m_Size = 0;
};

std::vector<uint8_t> Write( const std::vector<uint8_t>& i_rPixels, const KVZ::VideoFrameInfo& i_rInfo )
{
  VByteVector Output{ 1, 2, 3 };
  VByteVector Scratch;
  EXPECT_TRUE( JPEGIO::JPEGWriter( i_rPixels.data(), i_rPixels.size(), i_rInfo, Quality, Output, Scratch ) );
  return { Output.begin(), Output.end() };
}

}

TEST( JPEGWriter, GivesTheBytesOfTurboJPEG )
{
  struct VCase
  {
    IPixelFormat::Enum m_Format;
    int m_TurboFormat;
    int m_Subsampling;
    size_t m_PixelBytes;
  };
  const VCase Cases[] = { { IPixelFormat::ELuminance8, TJPF_GRAY, TJSAMP_GRAY, 1 }, { IPixelFormat::ER8G8B8, TJPF_RGB, TJSAMP_444, 3 },
    { IPixelFormat::EB8G8R8, TJPF_BGR, TJSAMP_444, 3 }, { IPixelFormat::ER8G8B8u8, TJPF_RGBX, TJSAMP_444, 4 },
    { IPixelFormat::EB8G8R8u8, TJPF_BGRX, TJSAMP_444, 4 } };
  for( const VCase& rCase : Cases )
  {
    SCOPED_TRACE( rCase.m_Format );
    const KVZ::VideoFrameInfo Image = VideoInfo( rCase.m_Format, 67, 35 );
    const std::vector<uint8_t> Pixels = Noise( 67 * 35 * rCase.m_PixelBytes, 3 );
    EXPECT_EQ( Write( Pixels, Image ), VTurboJPEG().Packed( Pixels, Image, rCase.m_TurboFormat, rCase.m_Subsampling ) );
  }
  // Two pixels in four bytes: U Y V Y and Y U Y V
  const std::vector<uint8_t> Pixels = Noise( 66 * 35 * 2, 3 );
  const KVZ::VideoFrameInfo UYVY = VideoInfo( IPixelFormat::EU8Y8V8Y8, 66, 35 );
  const KVZ::VideoFrameInfo YUYV = VideoInfo( IPixelFormat::EY8U8Y8V8, 66, 35 );
  EXPECT_EQ( Write( Pixels, UYVY ), VTurboJPEG().Planar( { Plane( Pixels, 1, 2 ), Plane( Pixels, 0, 4 ), Plane( Pixels, 2, 4 ) }, UYVY ) );
  EXPECT_EQ( Write( Pixels, YUYV ), VTurboJPEG().Planar( { Plane( Pixels, 0, 2 ), Plane( Pixels, 1, 4 ), Plane( Pixels, 3, 4 ) }, YUYV ) );
}

TEST( JPEGWriter, KeepsTurboJPEGFromReallocating )
{
  for( const IPixelFormat::Enum Format : { IPixelFormat::ELuminance8, IPixelFormat::ER8G8B8, IPixelFormat::EU8Y8V8Y8 } )
  {
    s_Flags = 0;
    Write( Noise( 8 * 8 * 3, 3 ), VideoInfo( Format, 8, 8 ) );
    EXPECT_EQ( s_Flags, 0x400 ) << Format;
  }
}

TEST( JPEGWriter, RefusesWhatItCannotTake )
{
  const VAssertionCapture Assertions;
  const std::vector<uint8_t> Pixels = Noise( 64 * 4, 3 );
  VByteVector Output;
  VByteVector Scratch;
  const auto bWritten = [&]( const KVZ::VideoFrameInfo& i_rInfo, size_t i_Size )
  { return JPEGIO::JPEGWriter( Pixels.data(), i_Size, i_rInfo, Quality, Output, Scratch ); };
  EXPECT_TRUE( bWritten( VideoInfo( IPixelFormat::ELuminance8, 8, 8 ), 64 ) );
  EXPECT_FALSE( bWritten( VideoInfo( IPixelFormat::ELuminance8, 8, 8 ), 63 ) );
  EXPECT_FALSE( bWritten( VideoInfo( IPixelFormat::ELuminance8, 0, 8 ), 64 ) );
  EXPECT_FALSE( bWritten( VideoInfo( IPixelFormat::EU8Y8V8Y8, 7, 8 ), 256 ) );
  EXPECT_FALSE( bWritten( VideoInfo( IPixelFormat::EU10Y10V10Y10, 8, 1 ), 256 ) );
  EXPECT_TRUE( Assertions.Expressions().empty() );
}

TEST( JPEGWriter, AssertsThatTurboJPEGSucceeds )
{
  const VAssertionCapture Assertions;
  const VLogCapture Log( "JPEGIO" );
  const std::vector<uint8_t> Pixels = Noise( 64, 3 );
  VByteVector Output;
  VByteVector Scratch;
  EXPECT_FALSE( JPEGIO::JPEGWriter( Pixels.data(), Pixels.size(), VideoInfo( IPixelFormat::ELuminance8, 8, 8 ), 101, Output, Scratch ) );
  EXPECT_EQ( Assertions.Expressions(), std::vector<std::string>{ "Result == 0" } );
  EXPECT_EQ( Log.Texts(), std::vector<std::string>{ "TurboJPEG: tjCompress2(): Invalid argument" } );
  EXPECT_TRUE( Output.empty() );
}
