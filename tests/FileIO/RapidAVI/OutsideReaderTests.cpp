// What programs of others make of our files.
#include "FileIO/VideoEncoding/ImageCompressors.h"
#include "Utils/UtilsMemory/StandardBufferAllocator.h"
#include "tests/FileIO/RapidAVI/AviFile.h"
#include "tests/support/OutsideReaders.h"
#include "tests/support/ProgramRun.h"
#include "tests/support/TemporaryFolder.h"

#include <gtest/gtest.h>

#include <sys/wait.h>
#include <unistd.h>

#include <csignal>
#include <fstream>

using namespace KVZ;
using namespace RapidAVI;

namespace
{

constexpr uint32_t Width = 50;
constexpr uint32_t Height = 6;
constexpr uint32_t Frames = 5;

struct VPixelCase
{
  const char* m_pName;
  IPixelFormat::Enum m_Format;
  const char* m_pTag;         // as ffprobe shows the codec's tag
  const char* m_pDecodedAs;   // to compare with
  uint32_t m_Copies = 1;      // of each stored byte in what is decoded
};

constexpr VPixelCase PixelCases[] = {
  { "Luminance8", IPixelFormat::ELuminance8, "[0][0][0][0]", "rgb24", 3 },
  { "BayerRG8", IPixelFormat::EBayerRG8, "[0][0][0][0]", "rgb24", 3 },
  { "BayerGB8", IPixelFormat::EBayerGB8, "[0][0][0][0]", "rgb24", 3 },
  { "BayerGR8", IPixelFormat::EBayerGR8, "[0][0][0][0]", "rgb24", 3 },
  { "BayerBG8", IPixelFormat::EBayerBG8, "[0][0][0][0]", "rgb24", 3 },
  { "B8G8R8", IPixelFormat::EB8G8R8, "[0][0][0][0]", "bgr24" },
  { "B8G8R8u8", IPixelFormat::EB8G8R8u8, "[0][0][0][0]", "bgra" },
  { "U8Y8V8Y8", IPixelFormat::EU8Y8V8Y8, "UYVY", "uyvy422" },
  { "Y8U8Y8V8", IPixelFormat::EY8U8Y8V8, "YUY2", "yuyv422" },
};

VBytes Repeat( const VBytes& i_rBytes, uint32_t i_Copies )
{
  VBytes Result;
  for( const uint8_t Byte : i_rBytes )
  {
    Result.insert( Result.end(), i_Copies, Byte );
  }
  return Result;
}

// Samples of so many frames of the case's video are written from the same noise.
VBytes WriteFrames( VRapidAVIWriter& io_rWriter, const VSettings& i_rSettings, uint32_t i_Frames )
{
  VBytes All;
  for( uint32_t Frame = 0; Frame < i_Frames; ++Frame )
  {
    const VBytes Image = Noise(
      GetImageSize( i_rSettings.m_Video.m_PixelFormat, i_rSettings.m_Video.m_ImageWidth, i_rSettings.m_Video.m_ImageHeight ), Frame );
    All.insert( All.end(), Image.begin(), Image.end() );
    const uint32_t Samples = Frame % 2 == 0 ? 1601 : 1602;
    const VBytes Sound = Noise( Samples * i_rSettings.m_Audio.m_Channels * GetBytesPerSample( i_rSettings.m_Audio.m_SampleFormat ), Frame );
    EXPECT_TRUE( i_rSettings.WriteFrame( io_rWriter, Frame, Image, Sound ) );
  }
  return All;
}

VBytes ExpectedSound( const VSettings& i_rSettings, uint32_t i_Frames )
{
  VBytes All;
  for( uint32_t Frame = 0; Frame < i_Frames; ++Frame )
  {
    const uint32_t Samples = Frame % 2 == 0 ? 1601 : 1602;
    const VBytes Sound = Noise( Samples * i_rSettings.m_Audio.m_Channels * GetBytesPerSample( i_rSettings.m_Audio.m_SampleFormat ), Frame );
    All.insert( All.end(), Sound.begin(), Sound.end() );
  }
  return All;
}

VBytes WriteFile( const std::string& i_rPath, const VSettings& i_rSettings, uint32_t i_Frames, const VSegmentLimits& i_rLimits = {} )
{
  VRapidAVIWriter Writer( {}, WriterSupport::MakeFile, i_rLimits );
  EXPECT_TRUE( Writer.Open( i_rPath ) );
  EXPECT_TRUE( i_rSettings.WriteHeader( Writer ) );
  const VBytes All = WriteFrames( Writer, i_rSettings, i_Frames );
  EXPECT_TRUE( Writer.Close() );
  return All;
}

constexpr VTimingRecord Rate2997{ 135000000, 4504500, 0 };

class AviPixels : public testing::TestWithParam<VPixelCase>
{
};

}

TEST_P( AviPixels, AreReadAsTheyWereWritten )
{
  const VPixelCase& rCase = GetParam();
  const TestSupport::VTemporaryFolder Folder;
  const std::string Path = Folder.File( "file.avi" );
  const VSettings Settings{ .m_Video = Video( rCase.m_Format, Width, Height ), .m_Timing = Rate2997 };
  const VBytes Images = WriteFile( Path, Settings, Frames );

  auto Answers = TestSupport::AskFFprobe( Path );
  EXPECT_EQ( Answers["format.format_name"], "avi" );
  EXPECT_EQ( Answers["streams.stream.0.codec_name"], "rawvideo" );
  EXPECT_EQ( Answers["streams.stream.0.codec_tag_string"], rCase.m_pTag );
  EXPECT_EQ( Answers["streams.stream.0.width"], std::to_string( Width ) );
  EXPECT_EQ( Answers["streams.stream.0.height"], std::to_string( Height ) );
  EXPECT_EQ( Answers["streams.stream.0.r_frame_rate"], "30000/1001" );
  EXPECT_EQ( Answers["streams.stream.0.nb_frames"], std::to_string( Frames ) );
  EXPECT_EQ( Answers["streams.stream.0.nb_read_frames"], std::to_string( Frames ) );
  EXPECT_EQ( Answers["streams.stream.0.duration"], "0.166833" );
  EXPECT_EQ( Answers["streams.stream.1.codec_name"], "pcm_s16le" );
  EXPECT_EQ( Answers["streams.stream.1.nb_frames"], "8007" );
  EXPECT_EQ( TestSupport::DecodeVideo( Path, rCase.m_pDecodedAs ), Repeat( Images, rCase.m_Copies ) );
  EXPECT_EQ( TestSupport::DecodeAudio( Path, "s16le" ), ExpectedSound( Settings, Frames ) );
  EXPECT_EQ( TestSupport::AskMediaInfo( Path, "Video;%Width% %Height% %FrameCount% %FrameRate%" ), "50 6 5 29.970" );
}

INSTANTIATE_TEST_SUITE_P( Formats, AviPixels, testing::ValuesIn( PixelCases ),
  []( const auto& i_rInfo ) { return std::string( i_rInfo.param.m_pName ); } );

TEST( AviOutside, ImagesThatAreStoredBottomUpAreShownUpright )
{
  const TestSupport::VTemporaryFolder Folder;
  const std::string Path = Folder.File( "file.avi" );
  VSettings Settings{ .m_Video = Video( IPixelFormat::EB8G8R8, 4, 3 ), .m_Timing = Rate2997 };
  Settings.m_Video.m_bInverted = true;
  const VBytes Stored = WriteFile( Path, Settings, 1 );
  VBytes Upright;
  for( const ptrdiff_t Row : { 2, 1, 0 } )
  {
    Upright.insert( Upright.end(), Stored.begin() + Row * 12, Stored.begin() + ( Row + 1 ) * 12 );
  }
  EXPECT_EQ( TestSupport::DecodeVideo( Path, "bgr24" ), Upright );
}

TEST( AviOutside, EverySampleFormatIsReadAsItWasWritten )
{
  struct VCase
  {
    IAudioSampleFormat::Enum m_Format;
    uint32_t m_Channels;
    const char* m_pCodec;
    const char* m_pRaw;
    const char* m_pLayout;
  };
  constexpr VCase Cases[] = {
    { IAudioSampleFormat::EInt16, 1, "pcm_s16le", "s16le", "mono" },
    { IAudioSampleFormat::EInt24, 2, "pcm_s24le", "s24le", "stereo" },
    { IAudioSampleFormat::EInt32, 3, "pcm_s32le", "s32le", "3.0" },
    { IAudioSampleFormat::EFloat32, 4, "pcm_f32le", "f32le", "quad" },
    { IAudioSampleFormat::EUInt8, 8, "pcm_u8", "u8", "7.1" },
  };
  const TestSupport::VTemporaryFolder Folder;
  const std::string Path = Folder.File( "file.avi" );
  for( const VCase& rCase : Cases )
  {
    SCOPED_TRACE( testing::Message() << ToName( rCase.m_Format ) << " x " << rCase.m_Channels );
    VSettings Settings{ .m_Timing = Rate2997 };
    Settings.m_Audio = { rCase.m_Format, 48000, rCase.m_Channels };
    WriteFile( Path, Settings, Frames );
    auto Answers = TestSupport::AskFFprobe( Path );
    EXPECT_EQ( Answers["streams.stream.1.codec_name"], rCase.m_pCodec );
    EXPECT_EQ( Answers["streams.stream.1.channels"], std::to_string( rCase.m_Channels ) );
    EXPECT_EQ( Answers["streams.stream.1.channel_layout"], rCase.m_pLayout );
    EXPECT_EQ( Answers["streams.stream.1.nb_frames"], "8007" );
    EXPECT_EQ( TestSupport::DecodeAudio( Path, rCase.m_pRaw ), ExpectedSound( Settings, Frames ) );
  }
}

TEST( AviOutside, FramesOfLaterRiffsAreFoundAndSeekedTo )
{
  constexpr uint32_t Many = 100;
  const TestSupport::VTemporaryFolder Folder;
  const std::string Path = Folder.File( "file.avi" );
  const VSettings Settings{ .m_Video = Video( IPixelFormat::EU8Y8V8Y8, Width, Height ) };
  // Eight frames a RIFF
  const VBytes Images = WriteFile( Path, Settings, Many, { 30000, 30000 } );
  ASSERT_GT( TestSupport::VAviParser( TestSupport::VRiffParser::ReadFile( Path ) ).SuperIndexEntries( 0 ), 10u );
  EXPECT_EQ( TestSupport::AskFFprobe( Path )["streams.stream.0.nb_read_frames"], std::to_string( Many ) );
  EXPECT_EQ( TestSupport::DecodeVideo( Path, "uyvy422" ), Images );
  EXPECT_EQ( TestSupport::DecodeAudio( Path, "s16le" ), ExpectedSound( Settings, Many ) );
  const size_t FrameBytes = Images.size() / Many;
  for( const uint32_t Frame : { Many - 1, Many / 2, 7u, 8u } )
  {
    const TestSupport::VRunResult Run = TestSupport::RunProgram(
      { "ffmpeg", "-v", "warning", "-ss", std::to_string( Frame * 0.04 ), "-i", Path, "-frames:v", "1", "-f", "rawvideo", "-" } );
    EXPECT_EQ( VBytes( Run.m_Output.begin(), Run.m_Output.end() ), Noise( FrameBytes, Frame ) ) << Frame << Run.m_Error;
  }
}

// FFmpeg opens no file without a list of frames.
TEST( AviOutside, AFileWithoutARateOrWithoutFramesIsStillOpened )
{
  const TestSupport::VTemporaryFolder Folder;
  const std::string Path = Folder.File( "file.avi" );
  VSettings Settings{ .m_Timing = {} };
  WriteFile( Path, Settings, 2 );
  const TestSupport::VRunResult Rate = TestSupport::RunProgram(
    { "ffprobe", "-v", "error", "-show_entries", "stream=r_frame_rate", "-select_streams", "v", "-of", "csv=p=0", Path } );
  EXPECT_EQ( Rate.m_Output, "25/1\n" );
  WriteFile( Path, VSettings(), 0 );
  EXPECT_EQ( TestSupport::AskMediaInfo( Path, "Video;%Width% %Height% %CodecID%" ), "4 1 UYVY" );
}

class AviImages : public testing::TestWithParam<VPixelCase>
{
};

TEST_P( AviImages, AreDecodedAsInFilesOfTheirOwn )
{
  const VPixelCase& rCase = GetParam();
  const TestSupport::VTemporaryFolder Folder;
  VideoEncoding::VEncoderParts Parts;
  Parts.m_Compressors = VideoEncoding::ImageCompressors();
  VideoEncoding::VVideoFrameEncoder Encoder( VideoEncoding::EConverter::Software, Parts );
  VSettings Settings{ .m_Video = Video( rCase.m_Format, 64, 48 ), .m_Audio = {}, .m_Payload = IVideoPayload::EImageJPEG };
  VRapidAVIWriter Writer( std::make_shared<VideoEncoding::VVideoFrameEncoder>( VideoEncoding::EConverter::Software, Parts ) );
  ASSERT_TRUE( Writer.Open( Folder.File( "file.avi" ) ) );
  ASSERT_TRUE( Settings.WriteHeader( Writer ) );
  VBytes Expected;
  for( uint32_t Frame = 0; Frame < Frames; ++Frame )
  {
    const VBytes Image = Noise( GetImageSize( rCase.m_Format, 64, 48 ), Frame );
    ASSERT_TRUE( Settings.WriteFrame( Writer, Frame, Image, {} ) );
    VBufferList List{ Buffer( Image ) };
    KVZ::IStandardBufferAllocator Allocator( "Test" );
    ASSERT_TRUE( Encoder.Encode( Allocator, List, Settings.m_Video, IVideoPayload::EImageJPEG, rCase.m_Format ) );
    const std::string Path = Folder.File( "image.jpg" );
    std::ofstream( Path, std::ios::binary )
      .write( reinterpret_cast<const char*>( List.front()->Data() ), static_cast<std::streamsize>( List.front()->Size() ) );
    const VBytes Decoded = TestSupport::DecodeVideo( Path, rCase.m_pDecodedAs );
    Expected.insert( Expected.end(), Decoded.begin(), Decoded.end() );
  }
  ASSERT_TRUE( Writer.Close() );
  auto Answers = TestSupport::AskFFprobe( Folder.File( "file.avi" ) );
  EXPECT_EQ( Answers["streams.stream.0.codec_name"], "mjpeg" );
  EXPECT_EQ( Answers["streams.stream.0.codec_tag_string"], rCase.m_pTag );
  EXPECT_EQ( Answers["streams.stream.0.nb_read_frames"], std::to_string( Frames ) );
  EXPECT_EQ( TestSupport::DecodeVideo( Folder.File( "file.avi" ), rCase.m_pDecodedAs ), Expected );
}

// With two sets of tables and with one
INSTANTIATE_TEST_SUITE_P( Formats, AviImages,
  testing::Values( VPixelCase{ "R8G8B8", IPixelFormat::ER8G8B8, "MJPG", "yuvj444p" },
    VPixelCase{ "Luminance8", IPixelFormat::ELuminance8, "MJPG", "gray" } ),
  []( const auto& i_rInfo ) { return std::string( i_rInfo.param.m_pName ); } );

// The process is killed while it writes as fast as it can. What it had reported as written must be readable.
TEST( AviOutside, WhatAKilledWriterHadWrittenIsRead )
{
  const VSettings Settings{ .m_Video = Video( IPixelFormat::EU8Y8V8Y8, 640, 480 ) };
  const size_t FrameBytes = 640 * 480 * 2;
  const VBytes Image = Noise( FrameBytes, 1 );
  const VBytes Sound = Noise( 1920 * 2, 1 );
  for( const uint32_t Reported : { 1u, 7u, 30u } )
  {
    for( const uint64_t Limit : { uint64_t{ 1 } << 30, uint64_t{ 5000000 } } )
    {
      SCOPED_TRACE( testing::Message() << Reported << " frames, limit " << Limit );
      const TestSupport::VTemporaryFolder Folder;
      const std::string Path = Folder.File( "file.avi" );
      int Pipe[2];
      ASSERT_EQ( pipe( Pipe ), 0 );
      const pid_t Child = fork();
      if( Child == 0 )
      {
        VRapidAVIWriter Writer( {}, WriterSupport::MakeFile, { Limit, Limit } );
        bool bGood = Writer.Open( Path ) && Settings.WriteHeader( Writer );
        for( uint64_t Frame = 0; bGood && Frame < 2000; ++Frame )
        {
          bGood = Settings.WriteFrame( Writer, Frame, Image, Sound ) && write( Pipe[1], "f", 1 ) == 1;
        }
        _exit( 1 );
      }
      close( Pipe[1] );
      char Byte = 0;
      for( uint32_t Frame = 0; Frame < Reported; ++Frame )
      {
        ASSERT_EQ( read( Pipe[0], &Byte, 1 ), 1 );
      }
      kill( Child, SIGKILL );
      int Status = 0;
      ASSERT_EQ( waitpid( Child, &Status, 0 ), Child );
      EXPECT_TRUE( WIFSIGNALED( Status ) );
      size_t Written = Reported;
      while( read( Pipe[0], &Byte, 1 ) == 1 )
      {
        ++Written;
      }
      close( Pipe[0] );

      // The last frame may be cut short, which FFmpeg says.
      const TestSupport::VRunResult Run = TestSupport::RunProgram(
        { "ffmpeg", "-nostdin", "-v", "error", "-i", Path, "-map", "0:v", "-fps_mode", "passthrough", "-f", "rawvideo", "-" } );
      const size_t Decoded = Run.m_Output.size() / FrameBytes;
      EXPECT_GE( Decoded, Written );
      EXPECT_LE( Decoded, Written + 1 );
      for( size_t Frame = 0; Frame < std::min( Decoded, Written ); ++Frame )
      {
        EXPECT_EQ( Run.m_Output.compare( Frame * FrameBytes, FrameBytes, reinterpret_cast<const char*>( Image.data() ), FrameBytes ), 0 ) << Frame;
      }
    }
  }
}
