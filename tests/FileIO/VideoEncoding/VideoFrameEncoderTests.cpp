// The encoder with its real converter, compressors and text, as the plug-in composes it.
#include "FileIO/VideoEncoding/VideoFrameEncoder.h"

#include "CoreVideoUtils/BurnInText.h"
#include "CoreVideoUtils/FrameSize.h"
#include "FileIO/PNGIO/PNGIO.h"
#include "FileIO/TIFFIO/TIFFIO.h"
#include "FileIO/VideoEncoding/ImageCompressors.h"
#include "Utils/UtilsMemory/StandardBufferAllocator.h"
#include "tests/support/LogCapture.h"
#include "tests/support/SoftwareConversions.h"
#include "tests/support/Threads.h"
#include "tests/support/TurboJPEG.h"

#include <gtest/gtest.h>

#include <atomic>
#include <optional>

using namespace KVZ;
using namespace VideoEncoding;
using namespace TestSupport;

namespace
{

constexpr int Width = 64;
constexpr int Height = 40;

VideoFrameInfo Picture( IPixelFormat::Enum i_Format ) { return VideoInfo( i_Format, Width, Height ); }

VBytes NoisyFrame( IPixelFormat::Enum i_Format, uint32_t i_Seed = 1 ) { return Noise( CoreVideoUtils::GetFrameSize( Picture( i_Format ) ), i_Seed ); }

VBufferList InTwo( const VBytes& i_rBytes )
{
  return { Buffer( { i_rBytes.begin(), i_rBytes.begin() + 1000 } ), Buffer( { i_rBytes.begin() + 1000, i_rBytes.end() } ) };
}

VBytes Converted( IPixelFormat::Enum i_Source, const VBytes& i_rBytes, IPixelFormat::Enum i_Target, const VColourRecord& i_rColour = {} )
{
  return SoftwareTests::Convert( i_Source, i_rBytes, i_Target, { Width, Height }, i_rColour );
}

bool DrawText( IPixelFormatConverter& i_rConverter, const VideoFrameInfo& i_rInfo, const VBurnInSettings& i_rText, uint8_t* io_pPixels,
  size_t i_Size )
{
  return CoreVideoUtils::BurnInText( i_rConverter, i_rInfo, i_rText.m_SizeIndex, i_rText.m_X, i_rText.m_Y, i_rText.m_Text, io_pPixels, i_Size );
}

class VideoFrameEncoder : public testing::Test
{
protected:
  VideoFrameEncoder()
  {
    m_Parts.m_ConverterMakers[EConverter::Software] = [] { return std::make_shared<CoreVideoUtils::VPixelFormatConverter>(); };
    m_Parts.m_Compressors = ImageCompressors();
    m_Parts.m_DrawText = &DrawText;
    MakeEncoder();
  }

  void MakeEncoder() { m_Encoder.emplace( EConverter::Software, m_Parts ); }

  bool Encode( VBufferList& io_rVideo, IPixelFormat::Enum i_Source, IVideoPayload::Enum i_Payload,
    IPixelFormat::Enum i_Target = IPixelFormat::EUnspecified )
  {
    return m_Encoder->Encode( m_Allocator, io_rVideo, Picture( i_Source ), i_Payload, i_Target );
  }
  // What becomes of a frame; empty where it is refused.
  VBytes Encoded( VBufferList i_Video, IPixelFormat::Enum i_Source, IVideoPayload::Enum i_Payload,
    IPixelFormat::Enum i_Target = IPixelFormat::EUnspecified )
  {
    return Encode( i_Video, i_Source, i_Payload, i_Target ) ? BytesOf( i_Video ) : VBytes();
  }
  // The list stays as it is.
  void ExpectRefusal( const VBufferList& i_rVideo, IPixelFormat::Enum i_Source, IVideoPayload::Enum i_Payload, IPixelFormat::Enum i_Target )
  {
    VBufferList Video = i_rVideo;
    EXPECT_FALSE( Encode( Video, i_Source, i_Payload, i_Target ) );
    EXPECT_EQ( Video, i_rVideo );
  }

  KVZ::IStandardBufferAllocator m_Allocator{ "Test" };
  VEncoderParts m_Parts;
  std::optional<VVideoFrameEncoder> m_Encoder;
  const VLogCapture m_Log{ "VideoEncoding" };
};

}

TEST_F( VideoFrameEncoder, AnUncompressedFrameInItsFormatPassesWithoutACopy )
{
  const VBufferList Frame = InTwo( NoisyFrame( IPixelFormat::EU8Y8V8Y8 ) );
  VBufferList Video = Frame;
  EXPECT_TRUE( Encode( Video, IPixelFormat::EU8Y8V8Y8, IVideoPayload::EUncompressed, IPixelFormat::EU8Y8V8Y8 ) );
  EXPECT_EQ( Video, Frame );
  ExpectRefusal( {}, IPixelFormat::EU8Y8V8Y8, IVideoPayload::EUncompressed, IPixelFormat::EU8Y8V8Y8 );
}

TEST_F( VideoFrameEncoder, LensCorrectionConvertsEvenBetweenEqualFormats )
{
  struct VLensConverter : public CoreVideoUtils::VPixelFormatConverter
  {
    void SetLensCorrection( const VLensDistortionRecord& i_rLens ) override { m_Lens = i_rLens; }
    void SetLensCorrectionEnabled( bool i_bEnabled ) override { m_bLens = i_bEnabled; }

    VLensDistortionRecord m_Lens;
    bool m_bLens = false;
  };
  const auto pConverter = std::make_shared<VLensConverter>();
  m_Parts.m_ConverterMakers[EConverter::Software] = [&] { return pConverter; };
  MakeEncoder();
  const VLensDistortionRecord Lens{ VLensDistortionRecord::ETarvo2Parameter, { 1, 2 }, { 3, 4, 0 } };
  m_Encoder->SetLensCorrection( Lens );
  m_Encoder->SetLensCorrectionEnabled( true );
  const VBytes Frame = NoisyFrame( IPixelFormat::EU8Y8V8Y8 );
  VBufferList Video = InTwo( Frame );
  EXPECT_TRUE( Encode( Video, IPixelFormat::EU8Y8V8Y8, IVideoPayload::EUncompressed, IPixelFormat::EU8Y8V8Y8 ) );
  EXPECT_EQ( Video.size(), 1u );
  EXPECT_EQ( BytesOf( Video ), Frame );
  EXPECT_TRUE( pConverter->m_bLens );
  EXPECT_EQ( pConverter->m_Lens, Lens );
}

// What each step gives by itself, one after another: two buffers joined, converted and colour corrected, text drawn, compressed.
TEST_F( VideoFrameEncoder, AFrameGoesThroughAllSteps )
{
  constexpr VColourRecord Colour = { 0.5f, 2.0f };
  const VBurnInSettings Text = { "01:02", 5, 3, 0 };
  m_Encoder->SetColour( Colour );
  m_Encoder->SetBurnIn( Text );
  for( const IPixelFormat::Enum Format : { IPixelFormat::EBayerGB8, IPixelFormat::EU8Y8V8Y8, IPixelFormat::ER8G8B8 } )
  {
    SCOPED_TRACE( ToName( Format ) );
    const VBytes Frame = NoisyFrame( Format );
    VBytes Drawn = Converted( Format, Frame, IPixelFormat::ER8G8B8, Colour );
    CoreVideoUtils::VPixelFormatConverter Converter;
    ASSERT_TRUE( DrawText( Converter, Picture( IPixelFormat::ER8G8B8 ), Text, Drawn.data(), Drawn.size() ) );
    EXPECT_EQ( Encoded( InTwo( Frame ), Format, IVideoPayload::EUncompressed, IPixelFormat::ER8G8B8 ), Drawn );
    EXPECT_EQ( Encoded( InTwo( Frame ), Format, IVideoPayload::EImageJPEG ), TurboJPEG( Drawn, Width, Height ) );
    const VBufferList Whole = { Buffer( Frame ) };
    EXPECT_EQ( Encoded( Whole, Format, IVideoPayload::EUncompressed, IPixelFormat::ER8G8B8 ), Drawn );
    EXPECT_EQ( BytesOf( Whole ), Frame ) << "text is drawn into a copy";
  }
}

TEST_F( VideoFrameEncoder, EachPayloadHasItsFormatAndItsCompressor )
{
  struct VKind
  {
    IVideoPayload::Enum m_Payload;
    decltype( &PNGIO::PNGReader ) m_pReader;
    uint8_t m_FirstByte;
  };
  for( const auto& [Source, Stored] : { std::pair{ IPixelFormat::ER8G8B8, IPixelFormat::ER8G8B8 }, { IPixelFormat::EU8Y8V8Y8, IPixelFormat::ER8G8B8 },
         { IPixelFormat::ELuminance7, IPixelFormat::ELuminance8 } } )
  {
    const VBytes Frame = NoisyFrame( Source );
    for( const VKind& rKind :
      { VKind{ IVideoPayload::EImagePNG, &PNGIO::PNGReader, 0x89 }, { IVideoPayload::EImageTIFF, &TIFFIO::TIFFReader, 'I' } } )
    {
      const VBytes File = Encoded( { Buffer( Frame ) }, Source, rKind.m_Payload );
      VideoFrameInfo Info;
      UtilsMemory::VByteVector Pixels;
      ASSERT_TRUE( rKind.m_pReader( File.data(), File.size(), Info, Pixels, ImageMagickWrapper::Instance( PNGIO::Category ) ) );
      EXPECT_EQ( File[0], rKind.m_FirstByte );
      EXPECT_EQ( VBytes( Pixels.begin(), Pixels.end() ), Converted( Source, Frame, Stored ) );
    }
  }
  const VBytes Colour = NoisyFrame( IPixelFormat::ER8G8B8 );
  m_Encoder->SetJPEGQuality( 35 );   // the steps above have the one that nobody has set
  EXPECT_EQ( Encoded( { Buffer( Colour ) }, IPixelFormat::ER8G8B8, IVideoPayload::EImageJPEG ),
    TurboJPEG( Colour, Width, Height, { .m_Quality = 35 } ) );
}

TEST_F( VideoFrameEncoder, WithoutImageMagickOnlyPNGAndTIFFAreRefused )
{
  const VLogCapture Log( PNGIO::Category );
  const ImageMagickWrapper::VLibrary Missing( { { "libNoMagickWand.so.1" } }, PNGIO::Category );
  m_Parts.m_Compressors = ImageCompressors( Missing );
  MakeEncoder();
  const VBufferList Frame = { Buffer( NoisyFrame( IPixelFormat::ER8G8B8 ) ) };
  for( const IVideoPayload::Enum Payload : { IVideoPayload::EImagePNG, IVideoPayload::EImageTIFF, IVideoPayload::EImagePNG } )
  {
    ExpectRefusal( Frame, IPixelFormat::ER8G8B8, Payload, IPixelFormat::EUnspecified );
  }
  EXPECT_FALSE( Encoded( Frame, IPixelFormat::ER8G8B8, IVideoPayload::EImageJPEG ).empty() );
  EXPECT_EQ( Log.Texts(), std::vector<std::string>{ "Could not load MagickWand DLL" } );
  EXPECT_EQ( m_Log.Texts(),
    ( std::vector<std::string>{ "Error encoding data in 'R8G8B8' pixel format to 'ImagePNG'.",
      "Error encoding data in 'R8G8B8' pixel format to 'ImageTIFF'.", "Error encoding data in 'R8G8B8' pixel format to 'ImagePNG'." } ) );
}

TEST_F( VideoFrameEncoder, RefusalsSayWhy )
{
  const VBytes Frame = NoisyFrame( IPixelFormat::EU8Y8V8Y8 );
  const VBufferList Whole = { Buffer( Frame ) };
  // Joining comes first, and a payload without a compressor is refused last, in the frame's own format.
  ExpectRefusal( InTwo( Frame ), IPixelFormat::ER8G8B8, IVideoPayload::EVideoH264, IPixelFormat::ELuminance8 );
  VBufferList Video = InTwo( Frame );
  EXPECT_FALSE( Encode( Video, IPixelFormat::EU8Y8V8Y8, IVideoPayload::EVideoH264, IPixelFormat::ELuminance8 ) );
  EXPECT_EQ( Video.size(), 1u );
  EXPECT_EQ( BytesOf( Video ), Frame );
  ExpectRefusal( Whole, IPixelFormat::EU8Y8V8Y8, IVideoPayload::ENone, IPixelFormat::ELuminance8 );
  ExpectRefusal( Whole, IPixelFormat::EU8Y8V8Y8, static_cast<IVideoPayload::Enum>( 77 ), IPixelFormat::EU8Y8V8Y8 );
  ExpectRefusal( Whole, IPixelFormat::EU8Y8V8Y8, IVideoPayload::EUncompressed, IPixelFormat::EBayerGB8 );
  m_Encoder->SetBurnIn( { "T" } );
  ExpectRefusal( { Buffer( VBytes( Frame.begin(), Frame.end() - 1 ) ) }, IPixelFormat::EU8Y8V8Y8, IVideoPayload::EUncompressed,
    IPixelFormat::EU8Y8V8Y8 );
  EXPECT_TRUE( Encoded( Whole, IPixelFormat::ELuminance7, IVideoPayload::EUncompressed, IPixelFormat::ELuminance7 ).empty() );
  m_Parts.m_DrawText = {};
  MakeEncoder();
  m_Encoder->SetBurnIn( { "T" } );
  ExpectRefusal( Whole, IPixelFormat::EU8Y8V8Y8, IVideoPayload::EUncompressed, IPixelFormat::EU8Y8V8Y8 );
  m_Parts.m_ConverterMakers.clear();
  MakeEncoder();
  ExpectRefusal( Whole, IPixelFormat::EU8Y8V8Y8, IVideoPayload::EUncompressed, IPixelFormat::ER8G8B8 );
  EXPECT_EQ( m_Log.Texts(),
    ( std::vector<std::string>{ "Unexpected buffer size when copying frame data to make contiguous.", "Unsupported video payload format 'VideoH264'.",
      "Unsupported video payload format 'None'.", "Unsupported video payload format 'Unspecified'.",
      "Error converting pixel format from 'U8Y8V8Y8' to 'BayerGB8'.", "Frame of 5119 bytes is too short for its description, which needs 5120.",
      "Error burning text into an image in 'Luminance7' pixel format.", "Burn-in text is not available.",
      "Error converting pixel format from 'U8Y8V8Y8' to 'R8G8B8'." } ) );
}

TEST_F( VideoFrameEncoder, TheArgumentChoosesTheConverter )
{
  std::string Made;
  const auto Maker = [&Made]( char i_Name )
  {
    return [&Made, i_Name]
    {
      Made += i_Name;
      return nullptr;
    };
  };
  m_Parts.m_ConverterMakers = { { EConverter::OpenGLFirst, Maker( '1' ) }, { EConverter::Software, Maker( '2' ) },
    { EConverter::OpenGLSecond, Maker( '3' ) } };
  VEncoderParts WithoutOpenGL;
  WithoutOpenGL.m_ConverterMakers = { { EConverter::Software, Maker( 's' ) } };
  for( const int Argument : { 1, 2, 3, 0, 17 } )
  {
    VVideoFrameEncoder( static_cast<EConverter>( Argument ), m_Parts );
    VVideoFrameEncoder( static_cast<EConverter>( Argument ), WithoutOpenGL );
  }
  EXPECT_EQ( Made, "1s2s3s3s3s" );
  EXPECT_EQ( 4u, m_Log.Count( "There is no OpenGL in this build: pixel formats are converted in software." ) );
}

TEST_F( VideoFrameEncoder, OneServesSeveralThreads )
{
  m_Encoder->SetBurnIn( { "00:00", 1, 1, 0 } );
  m_Encoder->SetColour( { 0.5f, 2.0f } );
  const auto Compressed = [&]( uint32_t i_Seed )
  {
    const IPixelFormat::Enum Format = i_Seed % 2 ? IPixelFormat::EBayerGB8 : IPixelFormat::EU8Y8V8Y8;
    return Encoded( { Buffer( NoisyFrame( Format, i_Seed ) ) }, Format, IVideoPayload::EImageJPEG );
  };
  constexpr uint32_t Frames = 40;
  std::vector<VBytes> Alone;
  for( uint32_t Frame = 0; Frame < Frames; ++Frame )
  {
    Alone.push_back( Compressed( Frame ) );
  }
  std::atomic<uint32_t> Next{ 0 };
  std::atomic<uint32_t> Equal{ 0 };
  RunOnThreads( 4,
    [&]( uint32_t )
    {
      for( uint32_t Frame = Next++; Frame < Frames; Frame = Next++ )
      {
        Equal += Compressed( Frame ) == Alone[Frame];
      }
    } );
  EXPECT_EQ( Equal, Frames );
}

TEST_F( VideoFrameEncoder, PixelFormatForPayloadFormatTellsWhatIsStored )
{
  for( int32_t Value = 0; Value < PixelFormatCount; ++Value )
  {
    const auto Source = static_cast<IPixelFormat::Enum>( Value );
    const bool bGrey = Source == IPixelFormat::ELuminance8 || Source == IPixelFormat::ELuminance7 || Source == IPixelFormat::ELuminance6;
    const bool bKept = Source == IPixelFormat::ELuminance8 || ( Source >= IPixelFormat::ER8G8B8 && Source <= IPixelFormat::EB8G8R8u8 );
    for( const auto& [Payload, Expected] : { std::pair{ IVideoPayload::ENone, IPixelFormat::EUnspecified }, { IVideoPayload::EUncompressed, Source },
           { IVideoPayload::EImageJPEG, bKept ? Source : IPixelFormat::ER8G8B8 },
           { IVideoPayload::EImagePNG, bGrey ? IPixelFormat::ELuminance8 : IPixelFormat::ER8G8B8 },
           { IVideoPayload::EImageTIFF, bGrey ? IPixelFormat::ELuminance8 : IPixelFormat::ER8G8B8 } } )
    {
      auto Stored = static_cast<IPixelFormat::Enum>( -1 );
      EXPECT_TRUE( PixelFormatForPayloadFormat( Payload, Source, Stored ) );
      EXPECT_EQ( Stored, Expected ) << ToName( Source ) << " as " << ToName( Payload );
    }
  }
  auto Kept = IPixelFormat::ER5G6B5;
  EXPECT_FALSE( PixelFormatForPayloadFormat( IVideoPayload::EVideoH264, IPixelFormat::ER8G8B8, Kept ) );
  EXPECT_EQ( Kept, IPixelFormat::ER5G6B5 );
  EXPECT_EQ( m_Log.Texts(), std::vector<std::string>{ "Unsupported video payload format 'VideoH264'." } );
}
