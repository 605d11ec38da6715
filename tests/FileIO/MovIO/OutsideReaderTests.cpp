// Files on disk, judged by programs of others.
#include "FileIO/VideoEncoding/ImageCompressors.h"
#include "tests/FileIO/MovIO/SmallMovie.h"
#include "tests/support/OutsideReaders.h"
#include "tests/support/ProgramRun.h"
#include "tests/support/TemporaryFolder.h"

#include <gtest/gtest.h>

#include <fstream>
#include <random>

using namespace KVZ;
using namespace MovIO;
using namespace TestSupport;

namespace
{

constexpr uint32_t Frames = 7;
constexpr uint32_t SamplesPerFrame = 1601;

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

// Three samples of 10 bits in four bytes, none of the values that are kept for timing.
VBytes Noise10( size_t i_Size, uint32_t i_Seed )
{
  std::mt19937 Source( i_Seed );
  VBytes Bytes( i_Size );
  for( size_t Word = 0; Word < i_Size / 4; ++Word )
  {
    uint32_t Samples = 0;
    for( int Sample = 0; Sample < 3; ++Sample )
    {
      Samples = Samples << 10 | ( 4 + Source() % 1016 );
    }
    for( int Byte = 0; Byte < 4; ++Byte )
    {
      Bytes[4 * Word + static_cast<size_t>( Byte )] = static_cast<uint8_t>( Samples >> 8 * Byte );
    }
  }
  return Bytes;
}

void Append( VBytes& o_rBytes, const VBytes& i_rMore ) { o_rBytes.insert( o_rBytes.end(), i_rMore.begin(), i_rMore.end() ); }

// 29.97 frames a second with drop-frame labels.
VMovieSettings Settings2997()
{
  VMovieSettings Settings;
  Settings.m_Video = VideoInfo( 96, 34, IPixelFormat::EU8Y8V8Y8 );
  Settings.m_Timing.m_FramePeriodInTicks = 4504500;
  Settings.m_Timecode = { ITimecodeStandard::ETimecode30Drop, 10, 11, 12, 13 };
  return Settings;
}

class MovFile : public testing::Test
{
protected:
  // All frames, with what went into them.
  void Write( const VMovieSettings& i_rSettings )
  {
    VideoEncoding::VEncoderParts Parts;
    Parts.m_Compressors = VideoEncoding::ImageCompressors();
    VMovWriter Writer( i_rSettings.m_Container, std::make_shared<VideoEncoding::VVideoFrameEncoder>( VideoEncoding::EConverter::Software, Parts ) );
    const VideoFrameInfo& rInfo = i_rSettings.m_Video;
    const size_t ImageBytes = GetImageSize( rInfo.m_PixelFormat, rInfo.m_ImageWidth, rInfo.m_ImageHeight );
    const size_t SoundBytes = SamplesPerFrame * i_rSettings.m_Audio.m_Channels * GetBytesPerSample( i_rSettings.m_Audio.m_SampleFormat );
    ASSERT_TRUE( Writer.Open( m_Path ) && WriteHeader( Writer, i_rSettings ) );
    for( uint32_t Frame = 0; Frame < Frames; ++Frame )
    {
      const bool bTenBits = rInfo.m_PixelFormat == IPixelFormat::EU10Y10V10Y10;
      const VBytes Image = bTenBits ? Noise10( ImageBytes, Frame ) : Noise( ImageBytes, Frame );
      const VBytes Sound = Noise( SoundBytes, 1000 + Frame );
      ASSERT_TRUE( AppendFrame( Writer, i_rSettings, Image, Sound ) );
      Append( m_Images, Image );
      Append( m_Sound, Sound );
    }
    ASSERT_TRUE( Writer.Close() );
  }

  // Timecode is the last track, and nothing that ffprobe could count frames of.
  void ExpectAnswers( const std::map<std::string, std::string>& i_rExpected )
  {
    auto Answers = AskFFprobe( m_Path, "Unsupported codec with id 0 for input stream 2\n" );
    for( const auto& [rKey, rValue] : i_rExpected )
    {
      EXPECT_EQ( Answers[rKey], rValue ) << rKey;
    }
  }

  const VTemporaryFolder m_Folder;
  const std::string m_Path = m_Folder.File( "movie.mov" );
  VBytes m_Images;
  VBytes m_Sound;
};

}

TEST_F( MovFile, FFmpegReadsTimesTagsAndCounts )
{
  Write( Settings2997() );
  ExpectAnswers( {
    { "format.nb_streams", "3" },
    { "format.tags.major_brand", "qt  " },
    { "streams.stream.0.codec_tag_string", "2vuy" },
    { "streams.stream.0.width", "96" },
    { "streams.stream.0.height", "34" },
    { "streams.stream.0.r_frame_rate", "30000/1001" },
    { "streams.stream.0.avg_frame_rate", "30000/1001" },
    { "streams.stream.0.time_base", "1/240000" },
    { "streams.stream.0.duration_ts", "56056" },   // 7 x 8008
    { "streams.stream.0.nb_read_frames", "7" },
    { "streams.stream.0.tags.timecode", "10:11:12;13" },
    { "streams.stream.0.tags.encoder", "Uncompressed 8-bit 4:2:2" },
    { "streams.stream.1.codec_name", "pcm_s16le" },
    { "streams.stream.1.sample_rate", "48000" },
    { "streams.stream.1.channels", "1" },
    { "streams.stream.1.duration_ts", "56035" },   // 7 x 1601 x 5
    { "streams.stream.2.codec_tag_string", "tmcd" },
    { "streams.stream.2.tags.timecode", "10:11:12;13" },
  } );
}

TEST_F( MovFile, FFmpegReadsAnMP4AndATimecodeWithoutDropFrame )
{
  VMovieSettings Settings = Settings2997();
  Settings.m_Container = IVideoContainer::EMP4;
  Settings.m_Timecode.m_Standard = ITimecodeStandard::ETimecode30Drift;
  Settings.m_Audio = { IAudioSampleFormat::EInt24, 48000, 16 };
  Write( Settings );
  ExpectAnswers( {
    { "format.tags.major_brand", "mp42" },
    { "streams.stream.0.r_frame_rate", "30000/1001" },
    { "streams.stream.0.nb_read_frames", "7" },
    { "streams.stream.1.codec_name", "pcm_s24le" },
    { "streams.stream.1.channels", "16" },
    { "streams.stream.2.tags.timecode", "10:11:12:13" },
  } );
  EXPECT_EQ( DecodeVideo( m_Path, "uyvy422" ), m_Images );
  EXPECT_EQ( DecodeAudio( m_Path, "s24le" ), m_Sound );
}

TEST_F( MovFile, MediaInfoReadsTheSame )
{
  Write( Settings2997() );
  EXPECT_EQ( AskMediaInfo( m_Path, "General;%Format% %Format_Profile% %VideoCount% %AudioCount%" ), "MPEG-4 QuickTime 1 1" );
  EXPECT_EQ( AskMediaInfo( m_Path, "Video;%Width% %Height% %FrameRate% %FrameCount% %CodecID% %Duration%" ), "96 34 29.970 7 2vuy 234" );
  EXPECT_EQ( AskMediaInfo( m_Path, "Audio;%Channels% %BitDepth% %SamplingRate% %CodecID%" ), "1 16 48000 lpcm" );
  EXPECT_EQ( AskMediaInfo( m_Path, "Other;%Type% %TimeCode_FirstFrame%" ), "Time code 10:11:12;13" );
}

struct VPixels
{
  IPixelFormat::Enum m_Format;
  const char* m_pName;   // FFmpeg's
};

class MovPixels : public MovFile, public testing::WithParamInterface<VPixels>
{
};

TEST_P( MovPixels, DecodeToTheBytesThatWereWritten )
{
  for( const auto Container : { IVideoContainer::EMOV, IVideoContainer::EMP4 } )
  {
    SCOPED_TRACE( Container );
    VMovieSettings Settings = Settings2997();
    Settings.m_Container = Container;
    Settings.m_Video.m_PixelFormat = GetParam().m_Format;
    m_Images.clear();
    Write( Settings );
    EXPECT_EQ( DecodeVideo( m_Path, GetParam().m_pName ), m_Images );
  }
}

INSTANTIATE_TEST_SUITE_P( All, MovPixels,
  testing::Values( VPixels{ IPixelFormat::ER8G8B8, "rgb24" }, VPixels{ IPixelFormat::EB8G8R8, "bgr24" }, VPixels{ IPixelFormat::ER8G8B8u8, "rgba" },
    VPixels{ IPixelFormat::EB8G8R8u8, "bgra" }, VPixels{ IPixelFormat::EU8Y8V8Y8, "uyvy422" }, VPixels{ IPixelFormat::EY8U8Y8V8, "yuyv422" } ),
  []( const auto& i_rInfo ) { return std::string( i_rInfo.param.m_pName ); } );

// Decoded to 10-bit planes, and packed again by FFmpeg.
TEST_F( MovFile, TenBitImagesDecodeToTheBytesThatWereWritten )
{
  VMovieSettings Settings = Settings2997();
  Settings.m_Video.m_PixelFormat = IPixelFormat::EU10Y10V10Y10;
  Write( Settings );
  ExpectAnswers( { { "streams.stream.0.codec_name", "v210" }, { "streams.stream.0.pix_fmt", "yuv422p10le" } } );
  const VRunResult Packed = RunProgram( { "ffmpeg", "-nostdin", "-v", "error", "-i", m_Path, "-map", "0:v", "-c:v", "v210", "-f", "rawvideo", "-" } );
  EXPECT_EQ( Bytes( Packed.m_Output ), m_Images ) << Packed.m_Error;
}

TEST_F( MovFile, SoundOfEachFormatDecodesToTheBytesThatWereWritten )
{
  const std::pair<IAudioSampleFormat::Enum, const char*> Formats[] = { { IAudioSampleFormat::EInt16, "s16le" },
    { IAudioSampleFormat::EInt24, "s24le" }, { IAudioSampleFormat::EInt32, "s32le" } };
  for( const auto& [Format, pName] : Formats )
  {
    SCOPED_TRACE( pName );
    VMovieSettings Settings = Settings2997();
    Settings.m_Audio = { Format, 48000, 2 };
    m_Sound.clear();
    Write( Settings );
    EXPECT_EQ( DecodeAudio( m_Path, pName ), m_Sound );
  }
}

// Without loss PNG and TIFF give the pixels back; a JPEG gives what it gives in a file of its own.
TEST_F( MovFile, ImagesDecodeToWhatWasWritten )
{
  for( const auto Payload : { IVideoPayload::EImagePNG, IVideoPayload::EImageTIFF, IVideoPayload::EImageJPEG } )
  {
    SCOPED_TRACE( ToName( Payload ) );
    VMovieSettings Settings = Settings2997();
    Settings.m_Video.m_PixelFormat = IPixelFormat::ER8G8B8;
    Settings.m_VideoPayload = Payload;
    m_Images.clear();
    Write( Settings );
    VBytes Expected = m_Images;
    if( Payload == IVideoPayload::EImageJPEG )
    {
      Expected.clear();
      const auto Parser = VMovParser::OfFile( m_Path );
      for( const auto& rSample : Parser.Track( "vide" ).m_Samples )
      {
        const VBytes Image = Parser.Bytes( rSample );
        const std::string Path = m_Folder.File( "image.jpg" );
        std::ofstream( Path, std::ios::binary ).write( reinterpret_cast<const char*>( Image.data() ), static_cast<std::streamsize>( Image.size() ) );
        Append( Expected, DecodeVideo( Path, "yuvj444p" ) );
      }
    }
    EXPECT_EQ( Expected.size(), Frames * 96u * 34u * 3u );
    EXPECT_EQ( DecodeVideo( m_Path, Payload == IVideoPayload::EImageJPEG ? "yuvj444p" : "rgb24" ), Expected );
  }
}
