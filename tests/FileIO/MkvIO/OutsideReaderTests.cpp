// Files on disk, judged by programs of others.
#include "FileIO/VideoEncoding/ImageCompressors.h"
#include "tests/FileIO/MkvIO/SmallMovie.h"
#include "tests/support/OutsideReaders.h"
#include "tests/support/ProgramRun.h"
#include "tests/support/TemporaryFolder.h"

#include <gtest/gtest.h>

#include <random>

using namespace KVZ;
using namespace MkvIO;
using namespace TestSupport;

namespace
{

constexpr uint32_t Frames = 13;
constexpr uint32_t SamplesPerFrame = 1602;

// Alike in every run, unlike from frame to frame.
VBytes Noise( size_t i_Size, uint32_t i_Seed )
{
  std::mt19937 Source( i_Seed );
  VBytes Bytes( i_Size );
  for( uint8_t& rByte : Bytes )
  {
    rByte = static_cast<uint8_t>( Source() );
  }
  return Bytes;
}

void Append( VBytes& o_rBytes, const VBytes& i_rMore ) { o_rBytes.insert( o_rBytes.end(), i_rMore.begin(), i_rMore.end() ); }

class MkvFile : public testing::Test
{
protected:
  // All frames, with what went into them.
  void Write( const VDescription& i_rDescription, std::shared_ptr<VideoEncoding::VVideoFrameEncoder> i_pEncoder = {} )
  {
    VMkvWriter Writer( std::move( i_pEncoder ) );
    const VideoFrameInfo& rInfo = i_rDescription.m_Video;
    const size_t ImageBytes = GetImageSize( rInfo.m_PixelFormat, rInfo.m_ImageWidth, rInfo.m_ImageHeight );
    const size_t SoundBytes = SamplesPerFrame * i_rDescription.m_Audio.m_Channels * GetBytesPerSample( i_rDescription.m_Audio.m_SampleFormat );
    ASSERT_TRUE( Writer.Open( m_Path ) && i_rDescription.WriteHeader( Writer ) );
    for( uint32_t Frame = 0; Frame < Frames; ++Frame )
    {
      // As a buffer that wraps around hands it over
      const VBytes Image = Noise( ImageBytes, Frame );
      const auto Middle = Image.begin() + static_cast<std::ptrdiff_t>( Frame );
      VBufferList Video = { Buffer( { Image.begin(), Middle } ), Buffer( { Middle, Image.end() } ) };
      const VBytes Sound = Noise( SoundBytes, 1000 + Frame );
      VBufferList Audio = { Buffer( Sound ) };
      ASSERT_TRUE( Writer.WriteFrame( Video, rInfo, Audio, i_rDescription.m_Audio, Frame ) );
      Append( m_Images, Image );
      Append( m_Sound, Sound );
    }
    ASSERT_TRUE( Writer.Close() );
  }

  // Matroska's own tools, which read every element, have nothing to complain of.
  void CheckByMkvToolNix() const
  {
    const VRunResult Info = RunProgram( { "mkvinfo", "--all", "--check-mode", m_Path } );
    EXPECT_EQ( Info.m_ExitCode, 0 ) << Info.m_Error << Info.m_Output;
    for( const char* pWord : { "(Unknown element", "Warning", "warning", "Error", "error", "damaged" } )
    {
      EXPECT_EQ( Info.m_Output.find( pWord ), std::string::npos ) << Info.m_Output.substr( Info.m_Output.find( pWord ), 200 );
    }
    const VRunResult Merge = RunProgram( { "mkvmerge", "-J", m_Path } );
    EXPECT_EQ( Merge.m_ExitCode, 0 ) << Merge.m_Output;
    EXPECT_NE( Merge.m_Output.find( "\"warnings\": []" ), std::string::npos ) << Merge.m_Output;
    EXPECT_NE( Merge.m_Output.find( "\"errors\": []" ), std::string::npos ) << Merge.m_Output;
  }

  const VTemporaryFolder m_Folder;
  const std::string m_Path = m_Folder.File( "movie.mkv" );
  VBytes m_Images;
  VBytes m_Sound;
};

}

TEST_F( MkvFile, FFmpegReadsSizeRateAndCounts )
{
  VDescription Description;
  Description.m_Video = VideoInfo( IPixelFormat::EU8Y8V8Y8, 62, 34 );
  Description.m_Audio = { IAudioSampleFormat::EInt24, 48000, 5 };
  Write( Description );
  const auto Answers = AskFFprobe( m_Path );
  const auto Is = [&]( const std::string& i_rKey, const std::string& i_rValue )
  { EXPECT_TRUE( Answers.count( i_rKey ) != 0 && Answers.at( i_rKey ) == i_rValue ) << i_rKey << " " << Answers.at( i_rKey ); };
  Is( "format.format_name", "matroska,webm" );
  Is( "format.nb_streams", "2" );
  Is( "format.duration", "0.433758" );
  Is( "format.tags.Tarvo_Internal_VideoFrameInfo_PixelFormat", "U8Y8V8Y8" );
  Is( "format.tags.Tarvo_External_FramePeriodInTicks", "4504500" );
  Is( "streams.stream.0.codec_name", "rawvideo" );
  Is( "streams.stream.0.codec_tag_string", "UYVY" );
  Is( "streams.stream.0.width", "62" );
  Is( "streams.stream.0.height", "34" );
  Is( "streams.stream.0.r_frame_rate", "30000/1001" );
  Is( "streams.stream.0.avg_frame_rate", "30000/1001" );
  Is( "streams.stream.0.nb_read_frames", std::to_string( Frames ) );
  Is( "streams.stream.1.codec_name", "pcm_s24le" );
  Is( "streams.stream.1.sample_rate", "48000" );
  Is( "streams.stream.1.channels", "5" );
  Is( "streams.stream.1.nb_read_frames", std::to_string( Frames ) );
  CheckByMkvToolNix();
}

TEST_F( MkvFile, MediaInfoReadsTheSame )
{
  VDescription Description;
  Description.m_Video = VideoInfo( IPixelFormat::EU8Y8V8Y8, 62, 34 );
  Write( Description );
  EXPECT_EQ( AskMediaInfo( m_Path, "General;%Format% %Format_Version% %Encoded_Application%" ), "Matroska Version 1 Tarvo MkvWriter" );
  EXPECT_EQ( AskMediaInfo( m_Path, "Video;%Width% %Height% %FrameRate% %FrameCount% %CodecID%" ), "62 34 29.970 13 V_MS/VFW/FOURCC / UYVY" );
  EXPECT_EQ( AskMediaInfo( m_Path, "Audio;%Channels% %BitDepth% %SamplingRate% %CodecID%" ), "2 16 48000 A_PCM/INT/LIT" );
}

TEST_F( MkvFile, UncompressedPixelsComeBackBitForBit )
{
  struct VCase
  {
    IPixelFormat::Enum m_Format;
    const char* m_pDecoded;
    uint32_t m_Width;
  };
  for( const VCase& rCase :
    { VCase{ IPixelFormat::ELuminance8, "gray", 61 }, VCase{ IPixelFormat::EBayerGB8, "gray", 64 }, VCase{ IPixelFormat::ER8G8B8u8, "rgba", 63 },
      VCase{ IPixelFormat::EU8Y8V8Y8, "uyvy422", 62 }, VCase{ IPixelFormat::EY8U8Y8V8, "yuyv422", 66 } } )
  {
    SCOPED_TRACE( ToName( rCase.m_Format ) );
    m_Images.clear();
    VDescription Description;
    Description.m_Video = VideoInfo( rCase.m_Format, rCase.m_Width, 35 );
    Description.m_Audio = {};
    Write( Description );
    EXPECT_TRUE( DecodeVideo( m_Path, rCase.m_pDecoded ) == m_Images );
    CheckByMkvToolNix();
  }
}

TEST_F( MkvFile, SamplesComeBackBitForBit )
{
  const std::map<IAudioSampleFormat::Enum, std::string> Formats = { { IAudioSampleFormat::EInt16, "s16le" }, { IAudioSampleFormat::EInt24, "s24le" },
    { IAudioSampleFormat::EInt32, "s32le" }, { IAudioSampleFormat::EFloat32, "f32le" } };
  for( const auto& [Format, Decoded] : Formats )
  {
    for( const uint32_t Channels : { 1u, 16u } )
    {
      SCOPED_TRACE( ToName( Format ) + " " + std::to_string( Channels ) );
      m_Sound.clear();
      VDescription Description;
      Description.m_Audio = { Format, 48000, Channels };
      Description.m_Video = VideoInfo( IPixelFormat::ELuminance8, 16, 16 );
      Write( Description );
      EXPECT_TRUE( DecodeAudio( m_Path, Decoded ) == m_Sound );
    }
  }
}

TEST_F( MkvFile, JPEGImagesAreDecoded )
{
  VideoEncoding::VEncoderParts Parts;
  Parts.m_Compressors = VideoEncoding::ImageCompressors();
  const auto pEncoder = std::make_shared<VideoEncoding::VVideoFrameEncoder>( VideoEncoding::EConverter::Software, Parts );
  pEncoder->SetJPEGQuality( 100 );
  for( const auto& [Format, Decoded] : { std::pair( IPixelFormat::ELuminance8, "gray" ), std::pair( IPixelFormat::ER8G8B8u8, "rgba" ) } )
  {
    SCOPED_TRACE( ToName( Format ) );
    m_Images.clear();
    VDescription Description;
    Description.m_Payload = IVideoPayload::EImageJPEG;
    Description.m_Video = VideoInfo( Format, 61, 35 );
    Write( Description, pEncoder );
    const VBytes Pixels = DecodeVideo( m_Path, Decoded );
    ASSERT_EQ( Pixels.size(), m_Images.size() );
    int64_t Difference = 0;
    for( size_t Byte = 0; Byte < Pixels.size(); ++Byte )
    {
      const bool bUnused = Format == IPixelFormat::ER8G8B8u8 && Byte % 4 == 3;
      Difference += bUnused ? 0 : std::abs( int{ Pixels[Byte] } - int{ m_Images[Byte] } );
    }
    EXPECT_LT( static_cast<double>( Difference ) / static_cast<double>( Pixels.size() ), 2.0 );
    EXPECT_EQ( AskFFprobe( m_Path ).at( "streams.stream.0.codec_name" ), "mjpeg" );
    CheckByMkvToolNix();
  }
}
