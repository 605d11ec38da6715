#include "FileIO/JPEGIO/JPEGWriter.h"
#include "tests/support/AssertionCapture.h"
#include "tests/support/LogCapture.h"
#include "tests/support/TurboJPEG.h"

#include <gtest/gtest.h>

using KVZ::IPixelFormat;
using UtilsMemory::VByteVector;
using namespace TestSupport;

namespace
{

constexpr int Quality = 83;

VBytes Write( const VBytes& i_rPixels, const KVZ::VideoFrameInfo& i_rInfo )
{
  VByteVector Output{ 1, 2, 3 };
  VByteVector Scratch;
  EXPECT_TRUE( JPEGIO::JPEGWriter( i_rPixels.data(), i_rPixels.size(), i_rInfo, Quality, Output, Scratch ) );
  return { Output.begin(), Output.end() };
}

// Every i_Step-th byte from i_First on.
VBytes Plane( const VBytes& i_rBytes, size_t i_First, size_t i_Step )
{
  VBytes Result;
  for( size_t Index = i_First; Index < i_rBytes.size(); Index += i_Step )
  {
    Result.push_back( i_rBytes[Index] );
  }
  return Result;
}

VBytes TurboPlanes( const VBytes& i_rY, const VBytes& i_rU, const VBytes& i_rV, int i_Width, int i_Height )
{
  const unsigned char* Planes[] = { i_rY.data(), i_rU.data(), i_rV.data() };
  return MakeTurboJPEG( [&]( tjhandle i_Handle, unsigned char** o_ppImage, unsigned long* o_pSize )
    { return tjCompressFromYUVPlanes( i_Handle, Planes, i_Width, nullptr, i_Height, TJSAMP_422, o_ppImage, o_pSize, Quality, 0 ); } );
}

}

TEST( JPEGWriter, GivesTheBytesOfTurboJPEG )
{
  struct VCase
  {
    IPixelFormat::Enum m_Format;
    int m_TurboFormat;
    int m_Subsampling;
  };
  const VCase Cases[] = { { IPixelFormat::ELuminance8, TJPF_GRAY, TJSAMP_GRAY }, { IPixelFormat::ER8G8B8, TJPF_RGB, TJSAMP_444 },
    { IPixelFormat::EB8G8R8, TJPF_BGR, TJSAMP_444 }, { IPixelFormat::ER8G8B8u8, TJPF_RGBX, TJSAMP_444 },
    { IPixelFormat::EB8G8R8u8, TJPF_BGRX, TJSAMP_444 } };
  for( const VCase& rCase : Cases )
  {
    const VBytes Pixels = Noise( KVZ::GetImageSize( rCase.m_Format, 67, 35 ), 3 );
    EXPECT_EQ( Write( Pixels, VideoInfo( rCase.m_Format, 67, 35 ) ),
      TurboJPEG( Pixels, 67, 35, { rCase.m_TurboFormat, rCase.m_Subsampling, Quality } ) )
      << rCase.m_Format;
  }
  // Two pixels in four bytes: U Y V Y and Y U Y V
  const VBytes Pixels = Noise( 66 * 35 * 2, 3 );
  EXPECT_EQ( Write( Pixels, VideoInfo( IPixelFormat::EU8Y8V8Y8, 66, 35 ) ),
    TurboPlanes( Plane( Pixels, 1, 2 ), Plane( Pixels, 0, 4 ), Plane( Pixels, 2, 4 ), 66, 35 ) );
  EXPECT_EQ( Write( Pixels, VideoInfo( IPixelFormat::EY8U8Y8V8, 66, 35 ) ),
    TurboPlanes( Plane( Pixels, 0, 2 ), Plane( Pixels, 1, 4 ), Plane( Pixels, 3, 4 ), 66, 35 ) );
}

TEST( JPEGWriter, RefusesWhatItCannotTakeAndAssertsThatTurboJPEGTakesTheRest )
{
  const VAssertionCapture Assertions;
  const VLogCapture Log( "JPEGIO" );
  const VBytes Pixels = Noise( 64 * 4, 3 );
  VByteVector Output;
  VByteVector Scratch;
  const auto bWritten = [&]( const KVZ::VideoFrameInfo& i_rInfo, size_t i_Size, int i_Quality = Quality )
  { return JPEGIO::JPEGWriter( Pixels.data(), i_Size, i_rInfo, i_Quality, Output, Scratch ); };
  EXPECT_TRUE( bWritten( VideoInfo( IPixelFormat::ELuminance8, 8, 8 ), 64 ) );
  EXPECT_FALSE( bWritten( VideoInfo( IPixelFormat::ELuminance8, 8, 8 ), 63 ) );
  EXPECT_FALSE( bWritten( VideoInfo( IPixelFormat::ELuminance8, 0, 8 ), 64 ) );
  EXPECT_FALSE( bWritten( VideoInfo( IPixelFormat::EU8Y8V8Y8, 7, 8 ), 256 ) );
  EXPECT_FALSE( bWritten( VideoInfo( IPixelFormat::EU10Y10V10Y10, 8, 1 ), 256 ) );
  EXPECT_TRUE( Assertions.Expressions().empty() );

  EXPECT_FALSE( bWritten( VideoInfo( IPixelFormat::ELuminance8, 8, 8 ), 64, 101 ) );
  EXPECT_EQ( Assertions.Expressions(), std::vector<std::string>{ "Result == 0" } );
  EXPECT_EQ( Log.Texts(), std::vector<std::string>{ "TurboJPEG: tjCompress2(): Invalid argument" } );
  EXPECT_TRUE( Output.empty() );
}
