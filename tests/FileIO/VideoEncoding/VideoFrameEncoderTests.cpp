#include "FileIO/VideoEncoding/VideoFrameEncoder.h"
#include "Utils/UtilsMemory/StandardBufferAllocator.h"
#include "tests/support/LogCapture.h"
#include "tests/support/TestFrames.h"

#include <gtest/gtest.h>

#include <numeric>

using namespace KVZ;
using namespace VideoEncoding;
using namespace TestSupport;

namespace
{

VideoFrameInfo Small( IPixelFormat::Enum i_Format ) { return VideoInfo( i_Format, 4, 2 ); }

std::shared_ptr<IStandardBuffer> Counting( uint8_t i_First, size_t i_Size )
{
  auto pBuffer = std::make_shared<IStandardBuffer>( i_Size );
  std::iota( pBuffer->Bytes().begin(), pBuffer->Bytes().end(), i_First );
  return pBuffer;
}

// Grey from any format: fills the target with the source's first byte plus one.
class VFillingConverter : public IPixelFormatConverter
{
public:
  bool Convert( const VideoFrameInfo& i_rInfo, const uint8_t* i_pSource, size_t i_SourceSize, IPixelFormat::Enum i_Target, uint8_t* o_pTarget,
    size_t i_TargetSize ) override
  {
    m_Target = i_Target;
    if( i_SourceSize < GetImageSize( i_rInfo.m_PixelFormat, i_rInfo.m_ImageWidth, i_rInfo.m_ImageHeight ) || i_TargetSize == 0 )
    {
      return false;
    }
    std::fill_n( o_pTarget, i_TargetSize, static_cast<uint8_t>( *i_pSource + 1 ) );
    return true;
  }
  void SetColourCorrection( const VColourRecord& ) override {}
  void SetLensCorrection( const VLensDistortionRecord& i_rLens ) override { m_Lens = i_rLens; }
  void SetLensCorrectionEnabled( bool i_bEnabled ) override { m_bLens = i_bEnabled; }

  IPixelFormat::Enum m_Target = IPixelFormat::EUnspecified;
  VLensDistortionRecord m_Lens;
  bool m_bLens = false;
};

class VideoFrameEncoder : public testing::Test
{
protected:
  VideoFrameEncoder()
  {
    m_Parts.m_ConverterMakers[EConverter::Software] = [this] { return m_pConverter; };
    m_Parts.m_Compressors[IVideoPayload::EImagePNG] =
      [this]( const VCompressionInput& i_rInput, UtilsMemory::VByteVector& o_rOutput, UtilsMemory::VByteVector& )
    {
      m_Compressed = i_rInput.m_rInfo.m_PixelFormat;
      m_Quality = i_rInput.m_JPEGQuality;
      o_rOutput.assign( i_rInput.m_pPixels, i_rInput.m_pPixels + 1 );
      return m_bCompressorWorks;
    };
    m_Parts.m_DrawText = [this]( IPixelFormatConverter&, const VideoFrameInfo&, const VBurnInSettings& i_rSettings, uint8_t* io_pPixels, size_t )
    {
      io_pPixels[0] = static_cast<uint8_t>( i_rSettings.m_Text[0] );
      return m_bDrawerWorks;
    };
  }

  bool Encode( IPixelFormat::Enum i_Source, IVideoPayload::Enum i_Payload, IPixelFormat::Enum i_Target )
  {
    return m_Encoder->Encode( m_Allocator, m_Video, Small( i_Source ), i_Payload, i_Target );
  }

  void MakeEncoder() { m_Encoder.emplace( EConverter::Software, m_Parts ); }

  KVZ::IStandardBufferAllocator m_Allocator{ "Test" };
  std::shared_ptr<VFillingConverter> m_pConverter = std::make_shared<VFillingConverter>();
  VEncoderParts m_Parts;
  std::optional<VVideoFrameEncoder> m_Encoder;
  VBufferList m_Video{ Counting( 10, 8 ), Counting( 18, 8 ) };
  IPixelFormat::Enum m_Compressed = IPixelFormat::EUnspecified;
  int m_Quality = 0;
  bool m_bCompressorWorks = true;
  bool m_bDrawerWorks = true;
  const VLogCapture m_Log{ "VideoEncoding" };
};

}

TEST_F( VideoFrameEncoder, AnUncompressedFrameInItsFormatPassesWithoutACopy )
{
  MakeEncoder();
  const VBufferList Before = m_Video;
  EXPECT_TRUE( Encode( IPixelFormat::EU8Y8V8Y8, IVideoPayload::EUncompressed, IPixelFormat::EU8Y8V8Y8 ) );
  EXPECT_EQ( m_Video, Before );
  m_Video.clear();
  EXPECT_FALSE( Encode( IPixelFormat::EU8Y8V8Y8, IVideoPayload::EUncompressed, IPixelFormat::EU8Y8V8Y8 ) );
}

TEST_F( VideoFrameEncoder, LensCorrectionConvertsEvenBetweenEqualFormats )
{
  MakeEncoder();
  const VLensDistortionRecord Lens{ VLensDistortionRecord::ETarvo2Parameter, { 1, 2 }, { 3, 4, 0 } };
  m_Encoder->SetLensCorrection( Lens );
  m_Encoder->SetLensCorrectionEnabled( true );
  EXPECT_TRUE( Encode( IPixelFormat::EU8Y8V8Y8, IVideoPayload::EUncompressed, IPixelFormat::EU8Y8V8Y8 ) );
  EXPECT_EQ( BytesOf( m_Video ), std::vector<uint8_t>( 16, 11 ) );
  EXPECT_TRUE( m_pConverter->m_bLens );
  EXPECT_EQ( m_pConverter->m_Lens, Lens );
}

TEST_F( VideoFrameEncoder, TextIsDrawnIntoACopy )
{
  MakeEncoder();
  m_Encoder->SetBurnIn( { "T" } );
  const std::shared_ptr<IStandardBuffer> pCaptured = Counting( 10, 16 );
  m_Video = { pCaptured };
  EXPECT_TRUE( Encode( IPixelFormat::EU8Y8V8Y8, IVideoPayload::EUncompressed, IPixelFormat::EU8Y8V8Y8 ) );
  std::vector<uint8_t> Expected = pCaptured->Bytes();
  EXPECT_EQ( Expected[0], 10 );
  Expected[0] = 'T';
  EXPECT_EQ( BytesOf( m_Video ), Expected );

  m_Video = { Counting( 10, 15 ) };
  EXPECT_FALSE( Encode( IPixelFormat::EU8Y8V8Y8, IVideoPayload::EUncompressed, IPixelFormat::EU8Y8V8Y8 ) );
}

TEST_F( VideoFrameEncoder, ACompressedPayloadChoosesItsOwnFormat )
{
  MakeEncoder();
  m_Encoder->SetJPEGQuality( 75 );
  EXPECT_TRUE( Encode( IPixelFormat::EU8Y8V8Y8, IVideoPayload::EImagePNG, IPixelFormat::EU8Y8V8Y8 ) );
  EXPECT_EQ( m_pConverter->m_Target, IPixelFormat::ER8G8B8 );
  EXPECT_EQ( m_Compressed, IPixelFormat::ER8G8B8 );
  EXPECT_EQ( m_Quality, 75 );
  EXPECT_EQ( BytesOf( m_Video ), std::vector<uint8_t>( 1, 11 ) );

  m_bCompressorWorks = false;
  m_Video = { Counting( 10, 8 ) };
  EXPECT_FALSE( Encode( IPixelFormat::ELuminance7, IVideoPayload::EImagePNG, IPixelFormat::EUnspecified ) );
  EXPECT_EQ( m_pConverter->m_Target, IPixelFormat::ELuminance8 );
  EXPECT_EQ( m_Log.Texts(), std::vector<std::string>{ "Error encoding data in 'Luminance8' pixel format to 'ImagePNG'." } );
}

// All steps before compression are gone through first, and change nothing.
TEST_F( VideoFrameEncoder, APayloadWithoutACompressorIsRefusedLast )
{
  MakeEncoder();
  const VBufferList Before = m_Video;
  EXPECT_FALSE( Encode( IPixelFormat::ER8G8B8, IVideoPayload::EVideoH264, IPixelFormat::ELuminance8 ) );
  EXPECT_EQ( m_Video, Before );
  EXPECT_FALSE( Encode( IPixelFormat::EU8Y8V8Y8, IVideoPayload::EVideoH264, IPixelFormat::ELuminance8 ) );
  EXPECT_EQ( m_Video.size(), 1u );
  EXPECT_EQ( m_pConverter->m_Target, IPixelFormat::EUnspecified );
  EXPECT_FALSE( Encode( IPixelFormat::EU8Y8V8Y8, IVideoPayload::ENone, IPixelFormat::ELuminance8 ) );
  EXPECT_FALSE( Encode( IPixelFormat::EU8Y8V8Y8, static_cast<IVideoPayload::Enum>( 77 ), IPixelFormat::EU8Y8V8Y8 ) );
  EXPECT_EQ( m_Log.Texts(),
    ( std::vector<std::string>{ "Unexpected buffer size when copying frame data to make contiguous.", "Unsupported video payload format 'VideoH264'.",
      "Unsupported video payload format 'None'.", "Unsupported video payload format 'Unspecified'." } ) );
}

TEST_F( VideoFrameEncoder, RefusalsSayWhy )
{
  MakeEncoder();
  EXPECT_FALSE( Encode( IPixelFormat::ER8G8B8, IVideoPayload::EUncompressed, IPixelFormat::ELuminance8 ) );
  m_Encoder->SetBurnIn( { "T" } );
  m_bDrawerWorks = false;
  EXPECT_FALSE( Encode( IPixelFormat::EU8Y8V8Y8, IVideoPayload::EUncompressed, IPixelFormat::EU8Y8V8Y8 ) );
  m_Parts.m_ConverterMakers.clear();
  m_Parts.m_DrawText = {};
  MakeEncoder();
  EXPECT_FALSE( Encode( IPixelFormat::EU8Y8V8Y8, IVideoPayload::EUncompressed, IPixelFormat::ELuminance8 ) );
  m_Encoder->SetBurnIn( { "T" } );
  EXPECT_FALSE( Encode( IPixelFormat::EU8Y8V8Y8, IVideoPayload::EUncompressed, IPixelFormat::EU8Y8V8Y8 ) );
  EXPECT_EQ( m_Log.Texts(),
    ( std::vector<std::string>{ "Unexpected buffer size when copying frame data to make contiguous.",
      "Error burning text into an image in 'U8Y8V8Y8' pixel format.", "Error converting pixel format from 'U8Y8V8Y8' to 'Luminance8'.",
      "Burn-in text is not available." } ) );
}

TEST_F( VideoFrameEncoder, TheArgumentChoosesTheConverter )
{
  std::string Made;
  for( const EConverter Converter : { EConverter::OpenGLFirst, EConverter::Software, EConverter::OpenGLSecond } )
  {
    m_Parts.m_ConverterMakers[Converter] = [this, &Made, Converter]
    {
      Made += std::to_string( static_cast<int>( Converter ) );
      return m_pConverter;
    };
  }
  for( const int Argument : { 1, 2, 3, 0, 17 } )
  {
    VVideoFrameEncoder( static_cast<EConverter>( Argument ), m_Parts );
  }
  EXPECT_EQ( Made, "12333" );
  m_Parts.m_ConverterMakers.erase( EConverter::OpenGLFirst );
  m_Parts.m_ConverterMakers.erase( EConverter::OpenGLSecond );
  for( const int Argument : { 1, 2, 3 } )
  {
    VVideoFrameEncoder( static_cast<EConverter>( Argument ), m_Parts );
  }
  EXPECT_EQ( Made, "12333222" );
  EXPECT_EQ( 2u, m_Log.Count( "There is no OpenGL in this build: pixel formats are converted in software." ) );
}

TEST( PixelFormatForPayload, EachKeepsWhatItsCompressorTakes )
{
  for( int32_t Value = 0; Value < PixelFormatCount; ++Value )
  {
    const auto Source = static_cast<IPixelFormat::Enum>( Value );
    SCOPED_TRACE( ToName( Source ) );
    const auto Stored = [Source]( IVideoPayload::Enum i_Payload )
    {
      auto Result = static_cast<IPixelFormat::Enum>( -1 );
      EXPECT_TRUE( PixelFormatForPayloadFormat( i_Payload, Source, Result ) );
      return Result;
    };
    const bool bGrey = Value == IPixelFormat::ELuminance8 || Value == IPixelFormat::ELuminance7 || Value == IPixelFormat::ELuminance6;
    const bool bKept = Value == IPixelFormat::ELuminance8 || ( Value >= IPixelFormat::ER8G8B8 && Value <= IPixelFormat::EB8G8R8u8 );
    EXPECT_EQ( Stored( IVideoPayload::ENone ), IPixelFormat::EUnspecified );
    EXPECT_EQ( Stored( IVideoPayload::EUncompressed ), Source );
    EXPECT_EQ( Stored( IVideoPayload::EImageJPEG ), bKept ? Source : IPixelFormat::ER8G8B8 );
    EXPECT_EQ( Stored( IVideoPayload::EImagePNG ), bGrey ? IPixelFormat::ELuminance8 : IPixelFormat::ER8G8B8 );
    EXPECT_EQ( Stored( IVideoPayload::EImageTIFF ), bGrey ? IPixelFormat::ELuminance8 : IPixelFormat::ER8G8B8 );
  }
  const VLogCapture Log( "VideoEncoding" );
  auto Kept = IPixelFormat::ER5G6B5;
  EXPECT_FALSE( PixelFormatForPayloadFormat( IVideoPayload::EVideoH264, IPixelFormat::ER8G8B8, Kept ) );
  EXPECT_EQ( Kept, IPixelFormat::ER5G6B5 );
  EXPECT_EQ( Log.Texts(), std::vector<std::string>{ "Unsupported video payload format 'VideoH264'." } );
}
