// The encoder with its real compressors.
#include "CoreVideoUtils/BurnInText.h"
#include "CoreVideoUtils/FrameSize.h"
#include "CoreVideoUtils/PixelFormatConverter.h"
#include "FileIO/PNGIO/PNGIO.h"
#include "FileIO/TIFFIO/TIFFIO.h"
#include "FileIO/VideoEncoding/ImageCompressors.h"
#include "FileIO/VideoEncoding/VideoFrameEncoder.h"
#include "Utils/UtilsMemory/StandardBufferAllocator.h"
#include "tests/support/LogCapture.h"
#include "tests/support/TestFrames.h"

#include <boost/thread/thread.hpp>
#include <gtest/gtest.h>
#include <turbojpeg.h>

#include <atomic>

using namespace KVZ;
using namespace VideoEncoding;
using namespace TestSupport;

namespace
{

VideoFrameInfo Picture( IPixelFormat::Enum i_Format ) { return VideoInfo( i_Format, 64, 40 ); }

VBufferList NoisyFrame( IPixelFormat::Enum i_Format, uint32_t i_Seed = 1 )
{
  return { Buffer( TestSupport::Noise( CoreVideoUtils::GetFrameSize( Picture( i_Format ) ), i_Seed ) ) };
}

// TurboJPEG's own bytes for an R8G8B8 image.
std::vector<uint8_t> TurboJPEG( const VBufferList& i_rPixels, int i_Quality )
{
  const tjhandle Handle = tjInitCompress();
  unsigned char* pImage = nullptr;
  unsigned long Size = 0;
  EXPECT_EQ( tjCompress2( Handle, i_rPixels.at( 0 )->Data(), 64, 0, 40, TJPF_RGB, &pImage, &Size, TJSAMP_444, i_Quality, 0 ), 0 );
  const std::vector<uint8_t> Image( pImage, pImage + Size );
  tjFree( pImage );
  tjDestroy( Handle );
  return Image;
}

VEncoderParts Parts( std::map<IVideoPayload::Enum, VCompressor> i_Compressors )
{
  VEncoderParts Result;
  Result.m_Compressors = std::move( i_Compressors );
  return Result;
}

// As the plug-in composes them.
VEncoderParts AllParts()
{
  VEncoderParts Result = Parts( ImageCompressors() );
  Result.m_ConverterMakers[EConverter::Software] = [] { return std::make_shared<CoreVideoUtils::VPixelFormatConverter>(); };
  Result.m_DrawText =
    []( IPixelFormatConverter& i_rConverter, const VideoFrameInfo& i_rInfo, const VBurnInSettings& i_rText, uint8_t* io_pPixels, size_t i_Size )
  { return CoreVideoUtils::BurnInText( i_rConverter, i_rInfo, i_rText.m_SizeIndex, i_rText.m_X, i_rText.m_Y, i_rText.m_Text, io_pPixels, i_Size ); };
  return Result;
}

class Compression : public testing::Test
{
protected:
  bool Encode( const VVideoFrameEncoder& i_rEncoder, VBufferList& io_rVideo, IVideoPayload::Enum i_Payload )
  {
    return i_rEncoder.Encode( m_Allocator, io_rVideo, Picture( IPixelFormat::ER8G8B8 ), i_Payload, IPixelFormat::EUnspecified );
  }

  KVZ::IStandardBufferAllocator m_Allocator{ "Test" };
};

}

TEST_F( Compression, EachPayloadHasItsCompressor )
{
  VVideoFrameEncoder Encoder( EConverter::Software, Parts( ImageCompressors() ) );
  const VBufferList Pixels = NoisyFrame( IPixelFormat::ER8G8B8 );
  VBufferList Video = Pixels;
  ASSERT_TRUE( Encode( Encoder, Video, IVideoPayload::EImageJPEG ) );
  EXPECT_EQ( BytesOf( Video ), TurboJPEG( Pixels, 90 ) );   // the quality where nobody has set one
  Encoder.SetJPEGQuality( 35 );
  Video = Pixels;
  ASSERT_TRUE( Encode( Encoder, Video, IVideoPayload::EImageJPEG ) );
  EXPECT_EQ( BytesOf( Video ), TurboJPEG( Pixels, 35 ) );

  VideoFrameInfo Read;
  UtilsMemory::VByteVector Bytes;
  Video = Pixels;
  ASSERT_TRUE( Encode( Encoder, Video, IVideoPayload::EImagePNG ) );
  ASSERT_TRUE( PNGIO::PNGReader( Video.at( 0 )->Data(), Video.at( 0 )->Size(), Read, Bytes ) );
  EXPECT_EQ( std::vector<uint8_t>( Bytes.begin(), Bytes.end() ), BytesOf( Pixels ) );
  EXPECT_EQ( BytesOf( Video ).at( 0 ), 0x89 );
  Video = Pixels;
  ASSERT_TRUE( Encode( Encoder, Video, IVideoPayload::EImageTIFF ) );
  ASSERT_TRUE( TIFFIO::TIFFReader( Video.at( 0 )->Data(), Video.at( 0 )->Size(), Read, Bytes ) );
  EXPECT_EQ( std::vector<uint8_t>( Bytes.begin(), Bytes.end() ), BytesOf( Pixels ) );
  EXPECT_EQ( BytesOf( Video ).at( 0 ), 'I' );
}

TEST_F( Compression, WithoutImageMagickOnlyPNGAndTIFFAreRefused )
{
  const VLogCapture Log;
  const ImageMagickWrapper::VLibrary Missing( { { "libNoMagickWand.so.1" } }, PNGIO::Category );
  const VVideoFrameEncoder Encoder( EConverter::Software, Parts( ImageCompressors( Missing ) ) );
  const VBufferList Pixels = NoisyFrame( IPixelFormat::ER8G8B8 );
  for( const IVideoPayload::Enum Payload : { IVideoPayload::EImagePNG, IVideoPayload::EImageTIFF, IVideoPayload::EImagePNG } )
  {
    VBufferList Video = Pixels;
    EXPECT_FALSE( Encode( Encoder, Video, Payload ) );
    EXPECT_EQ( Video, Pixels );
  }
  VBufferList Video = Pixels;
  EXPECT_TRUE( Encode( Encoder, Video, IVideoPayload::EImageJPEG ) );
  Video = Pixels;
  const VideoFrameInfo RGB = Picture( IPixelFormat::ER8G8B8 );
  EXPECT_TRUE( Encoder.Encode( m_Allocator, Video, RGB, IVideoPayload::EUncompressed, IPixelFormat::ER8G8B8 ) );
  EXPECT_EQ( Log.Texts(),
    ( std::vector<std::string>{ "Could not load MagickWand DLL", "Error encoding data in 'R8G8B8' pixel format to 'ImagePNG'.",
      "Error encoding data in 'R8G8B8' pixel format to 'ImageTIFF'.", "Error encoding data in 'R8G8B8' pixel format to 'ImagePNG'." } ) );
}

// Two buffers, joined; then what each step gives by itself, one after another: converted and colour corrected, text drawn, compressed.
TEST_F( Compression, AFrameGoesThroughAllSteps )
{
  constexpr VColourRecord Colour = { 0.5f, 2.0f };
  VVideoFrameEncoder Encoder( EConverter::Software, AllParts() );
  Encoder.SetColour( Colour );
  Encoder.SetBurnIn( { "01:02", 5, 3, 0 } );
  CoreVideoUtils::VPixelFormatConverter Converter;
  Converter.SetColourCorrection( Colour );
  const VideoFrameInfo RGB = Picture( IPixelFormat::ER8G8B8 );
  for( const IPixelFormat::Enum Format : { IPixelFormat::EBayerGB8, IPixelFormat::EU8Y8V8Y8, IPixelFormat::ER8G8B8 } )
  {
    SCOPED_TRACE( ToName( Format ) );
    const std::vector<uint8_t> Pixels = BytesOf( NoisyFrame( Format ) );
    const auto pDrawn = std::make_shared<IStandardBuffer>( CoreVideoUtils::GetFrameSize( RGB ) );
    std::vector<uint8_t>& rDrawn = pDrawn->Bytes();
    ASSERT_TRUE( Converter.Convert( Picture( Format ), Pixels.data(), Pixels.size(), RGB.m_PixelFormat, rDrawn.data(), rDrawn.size() ) );
    ASSERT_TRUE( CoreVideoUtils::BurnInText( Converter, RGB, 0, 5, 3, "01:02", rDrawn.data(), rDrawn.size() ) );

    const VBufferList Halves = { Buffer( { Pixels.begin(), Pixels.begin() + 1000 } ), Buffer( { Pixels.begin() + 1000, Pixels.end() } ) };
    VBufferList Video = Halves;
    ASSERT_TRUE( Encoder.Encode( m_Allocator, Video, Picture( Format ), IVideoPayload::EUncompressed, IPixelFormat::ER8G8B8 ) );
    EXPECT_EQ( BytesOf( Video ), rDrawn );
    Video = Halves;
    ASSERT_TRUE( Encoder.Encode( m_Allocator, Video, Picture( Format ), IVideoPayload::EImageJPEG, IPixelFormat::EUnspecified ) );
    EXPECT_EQ( BytesOf( Video ), TurboJPEG( { pDrawn }, 90 ) );
  }
}

TEST_F( Compression, OneEncoderServesSeveralThreads )
{
  VVideoFrameEncoder Encoder( EConverter::Software, AllParts() );
  Encoder.SetBurnIn( { "00:00", 1, 1, 0 } );
  Encoder.SetColour( { 0.5f, 2.0f } );
  const auto Compressed = [&]( uint32_t i_Seed )
  {
    const IPixelFormat::Enum Format = i_Seed % 2 ? IPixelFormat::EBayerGB8 : IPixelFormat::EU8Y8V8Y8;
    VBufferList Video = NoisyFrame( Format, i_Seed );
    EXPECT_TRUE( Encoder.Encode( m_Allocator, Video, Picture( Format ), IVideoPayload::EImageJPEG, IPixelFormat::EUnspecified ) );
    return BytesOf( Video );
  };
  constexpr uint32_t Frames = 40;
  std::vector<std::vector<uint8_t>> Alone;
  for( uint32_t Frame = 0; Frame < Frames; ++Frame )
  {
    Alone.push_back( Compressed( Frame ) );
  }
  std::atomic<uint32_t> Next{ 0 };
  std::atomic<uint32_t> Equal{ 0 };
  boost::thread_group Threads;
  for( int Number = 0; Number < 4; ++Number )
  {
    Threads.create_thread(
      [&]
      {
        for( uint32_t Frame = Next++; Frame < Frames; Frame = Next++ )
        {
          Equal += Compressed( Frame ) == Alone[Frame];
        }
      } );
  }
  Threads.join_all();
  EXPECT_EQ( Equal, Frames );
}
