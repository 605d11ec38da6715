// What programs of others make of our files.
#include "tests/FileIO/Containers/MovieWriters.h"
#include "tests/support/OutsideReaders.h"
#include "tests/support/ProgramRun.h"
#include "tests/support/TemporaryFolder.h"

#include <gtest/gtest.h>

using namespace KVZ;
using namespace Containers;
using namespace TestSupport;

namespace
{

constexpr uint32_t FewFrames = 7;
constexpr uint32_t SamplesAFrame = 1601;

// 29.97 frames a second with drop-frame labels.
VHeader Header2997( IPixelFormat::Enum i_Format = IPixelFormat::EU8Y8V8Y8, uint32_t i_Width = 96 )
{
  VHeader Header = MovieHeader( i_Width, 34 );
  Header.m_Video.m_PixelFormat = i_Format;
  Header.m_Timing = Rate2997;
  Header.m_Timecode = { ITimecodeStandard::ETimecode30Drop, 10, 11, 12, 13 };
  return Header;
}

// Samples of ten bits, three in four bytes, get none of the values that are kept for timing: the upper two bits are 01.
VBytes Image( const VHeader& i_rHeader, uint32_t i_Frame )
{
  VBytes Result = Noise( i_rHeader.ImageBytes(), i_Frame );
  for( size_t Word = 0; Word < Result.size() && i_rHeader.m_Video.m_PixelFormat == IPixelFormat::EU10Y10V10Y10; Word += 4 )
  {
    Result[Word + 1] = static_cast<uint8_t>( ( Result[Word + 1] & 0xFC ) | 0x01 );
    Result[Word + 2] = static_cast<uint8_t>( ( Result[Word + 2] & 0xF3 ) | 0x04 );
    Result[Word + 3] = static_cast<uint8_t>( ( Result[Word + 3] & 0x0F ) | 0x10 );
  }
  return Result;
}

class VOutsideFile
{
public:
  explicit VOutsideFile( const VContainerRow& i_rRow ) : m_Row( i_rRow ) {}

  // All frames, with what went into them. Images come in two buffers, as from a buffer that wraps around.
  void Write( const VHeader& i_rHeader, uint32_t i_Frames = FewFrames )
  {
    const auto pWriter = MakeWriter( m_Row.m_Container, { .m_bCompressors = true } );
    ASSERT_TRUE( pWriter->Open( m_Path ) && i_rHeader.WriteTo( *pWriter ) );
    for( uint32_t Frame = 0; Frame < i_Frames; ++Frame )
    {
      const VBytes Pixels = Image( i_rHeader, Frame );
      const VBytes Samples = Noise( SamplesAFrame * i_rHeader.SampleBytes(), 1000 + Frame );
      VBufferList Video = { Buffer( { Pixels.begin(), Pixels.begin() + 1 + Frame } ), Buffer( { Pixels.begin() + 1 + Frame, Pixels.end() } ) };
      VBufferList Audio = { Buffer( Samples ) };
      ASSERT_TRUE( pWriter->WriteFrame( Video, i_rHeader.m_Video, Audio, i_rHeader.m_Audio, Frame ) );
      Append( m_Images, Pixels );
      Append( m_Sound, Samples );
    }
    ASSERT_TRUE( pWriter->Close() );
  }

  // Timecode is the last track of MOV and MP4, and nothing that ffprobe could count frames of.
  void ExpectAnswers( const std::map<std::string, std::string>& i_rExpected ) const
  {
    const bool bTimecode = m_Row.m_Container == IVideoContainer::EMOV || m_Row.m_Container == IVideoContainer::EMP4;
    auto Answers = AskFFprobe( m_Path, bTimecode ? "Unsupported codec with id 0 for input stream 2\n" : "" );
    for( const auto& [rKey, rValue] : i_rExpected )
    {
      EXPECT_EQ( Answers[rKey], rValue ) << rKey;
    }
  }

  const VContainerRow m_Row;
  const VTemporaryFolder m_Folder;
  const std::string m_Path = m_Folder.File( std::string( "movie." ) + m_Row.m_pName );
  VBytes m_Images;
  VBytes m_Sound;
};

struct VPixelCase
{
  VContainerRow m_Row;
  IPixelFormat::Enum m_Format;
  const char* m_pDecoded;   // FFmpeg's name of the pixels to compare with
  uint32_t m_Width = 96;
  uint32_t m_Copies = 1;   // of each stored byte in what is decoded
};

constexpr VPixelCase PixelCases[] = {
  { Mov, IPixelFormat::ER8G8B8, "rgb24" },
  { Mov, IPixelFormat::EB8G8R8, "bgr24" },
  { Mov, IPixelFormat::ER8G8B8u8, "rgba" },
  { Mov, IPixelFormat::EB8G8R8u8, "bgra" },
  { Mov, IPixelFormat::EU8Y8V8Y8, "uyvy422" },
  { Mov, IPixelFormat::EY8U8Y8V8, "yuyv422" },
  { Mov, IPixelFormat::EU10Y10V10Y10, "v210" },
  { MP4, IPixelFormat::EU8Y8V8Y8, "uyvy422" },
  { Avi, IPixelFormat::ELuminance8, "rgb24", 50, 3 },
  { Avi, IPixelFormat::EBayerRG8, "rgb24", 50, 3 },
  { Avi, IPixelFormat::EBayerGB8, "rgb24", 50, 3 },
  { Avi, IPixelFormat::EBayerGR8, "rgb24", 50, 3 },
  { Avi, IPixelFormat::EBayerBG8, "rgb24", 50, 3 },
  { Avi, IPixelFormat::EB8G8R8, "bgr24", 50 },
  { Avi, IPixelFormat::EB8G8R8u8, "bgra", 50 },
  { Avi, IPixelFormat::EU8Y8V8Y8, "uyvy422", 50 },
  { Avi, IPixelFormat::EY8U8Y8V8, "yuyv422", 50 },
  { Mkv, IPixelFormat::ELuminance8, "gray", 61 },
  { Mkv, IPixelFormat::EBayerGB8, "gray", 64 },
  { Mkv, IPixelFormat::ER8G8B8u8, "rgba", 63 },
  { Mkv, IPixelFormat::EU8Y8V8Y8, "uyvy422", 62 },
  { Mkv, IPixelFormat::EY8U8Y8V8, "yuyv422", 66 },
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

struct VSoundCase
{
  VContainerRow m_Row;
  IAudioSampleFormat::Enum m_Format;
  uint32_t m_Channels;
  const char* m_pRaw;                // FFmpeg's name
  const char* m_pLayout = nullptr;   // where the file tells it
};

constexpr VSoundCase SoundCases[] = {
  { Mov, IAudioSampleFormat::EInt16, 2, "s16le" },
  { Mov, IAudioSampleFormat::EInt24, 2, "s24le" },
  { Mov, IAudioSampleFormat::EInt32, 2, "s32le" },
  { MP4, IAudioSampleFormat::EInt24, 16, "s24le" },
  { Avi, IAudioSampleFormat::EInt16, 1, "s16le", "mono" },
  { Avi, IAudioSampleFormat::EInt24, 2, "s24le", "stereo" },
  { Avi, IAudioSampleFormat::EInt32, 3, "s32le", "3.0" },
  { Avi, IAudioSampleFormat::EFloat32, 4, "f32le", "quad" },
  { Avi, IAudioSampleFormat::EUInt8, 8, "u8", "7.1" },
  { Mkv, IAudioSampleFormat::EInt16, 1, "s16le" },
  { Mkv, IAudioSampleFormat::EInt24, 16, "s24le" },
  { Mkv, IAudioSampleFormat::EInt32, 5, "s32le" },
  { Mkv, IAudioSampleFormat::EFloat32, 16, "f32le" },
};

struct VImageCase
{
  VContainerRow m_Row;
  IVideoPayload::Enum m_Payload;
  const char* m_pExtension;
  IPixelFormat::Enum m_Format;
  const char* m_pDecoded;
};

// JPEG with two sets of tables and with one.
constexpr VImageCase ImageCases[] = {
  { Mov, IVideoPayload::EImageJPEG, "jpg", IPixelFormat::ER8G8B8, "yuvj444p" },
  { Mov, IVideoPayload::EImagePNG, "png", IPixelFormat::ER8G8B8, "rgb24" },
  { Mov, IVideoPayload::EImageTIFF, "tiff", IPixelFormat::ER8G8B8, "rgb24" },
  { Avi, IVideoPayload::EImageJPEG, "jpg", IPixelFormat::ER8G8B8, "yuvj444p" },
  { Avi, IVideoPayload::EImageJPEG, "jpg", IPixelFormat::ELuminance8, "gray" },
  { Mkv, IVideoPayload::EImageJPEG, "jpg", IPixelFormat::ELuminance8, "gray" },
  { Mkv, IVideoPayload::EImageJPEG, "jpg", IPixelFormat::ER8G8B8u8, "yuvj444p" },
};

}

TEST( OutsideReaders, DecodeThePixelsThatWereWritten )
{
  for( const VPixelCase& rCase : PixelCases )
  {
    SCOPED_TRACE( std::string( rCase.m_Row.m_pName ) + " " + ToName( rCase.m_Format ) );
    VOutsideFile File( rCase.m_Row );
    File.Write( Header2997( rCase.m_Format, rCase.m_Width ) );
    const std::string Width = std::to_string( rCase.m_Width );
    File.ExpectAnswers( { { "streams.stream.0.width", Width }, { "streams.stream.0.height", "34" }, { "streams.stream.0.r_frame_rate", "30000/1001" },
      { "streams.stream.0.nb_read_frames", "7" } } );
    EXPECT_EQ( AskMediaInfo( File.m_Path, "Video;%Width% %Height% %FrameCount% %FrameRate%" ), Width + " 34 7 29.970" );
    if( rCase.m_Format == IPixelFormat::EU10Y10V10Y10 )
    {
      // Decoded to planes, and packed again by FFmpeg
      const VRunResult Packed = RunProgram(
        { "ffmpeg", "-nostdin", "-v", "error", "-i", File.m_Path, "-map", "0:v", "-c:v", rCase.m_pDecoded, "-f", "rawvideo", "-" } );
      EXPECT_TRUE( Bytes( Packed.m_Output ) == File.m_Images ) << Packed.m_Error;
      continue;
    }
    EXPECT_TRUE( DecodeVideo( File.m_Path, rCase.m_pDecoded ) == Repeat( File.m_Images, rCase.m_Copies ) );
  }
}

TEST( OutsideReaders, DecodeTheSamplesThatWereWritten )
{
  for( const VSoundCase& rCase : SoundCases )
  {
    SCOPED_TRACE( testing::Message() << rCase.m_Row.m_pName << " " << ToName( rCase.m_Format ) << " x " << rCase.m_Channels );
    VHeader Header = Header2997();
    Header.m_Audio = { rCase.m_Format, 48000, rCase.m_Channels };
    VOutsideFile File( rCase.m_Row );
    File.Write( Header );
    std::map<std::string, std::string> Answers = { { "streams.stream.1.codec_name", std::string( "pcm_" ) + rCase.m_pRaw },
      { "streams.stream.1.channels", std::to_string( rCase.m_Channels ) }, { "streams.stream.1.sample_rate", "48000" } };
    if( rCase.m_pLayout )
    {
      Answers["streams.stream.1.channel_layout"] = rCase.m_pLayout;
    }
    File.ExpectAnswers( Answers );
    EXPECT_TRUE( DecodeAudio( File.m_Path, rCase.m_pRaw ) == File.m_Sound );
  }
}

TEST( OutsideReaders, DecodeImagesAsInFilesOfTheirOwn )
{
  for( const VImageCase& rCase : ImageCases )
  {
    SCOPED_TRACE( std::string( rCase.m_Row.m_pName ) + " " + ToName( rCase.m_Payload ) + " of " + ToName( rCase.m_Format ) );
    VHeader Header = Header2997( rCase.m_Format );
    Header.m_Payload = rCase.m_Payload;
    VOutsideFile File( rCase.m_Row );
    File.Write( Header );
    File.ExpectAnswers( { { "streams.stream.0.nb_read_frames", "7" } } );
    VOutsideFile Sequence( Images );
    Header.m_AudioPayload = IAudioPayload::ENone;
    Sequence.Write( Header );
    const VBytes Expected = DecodeVideo( Sequence.m_Folder.File( std::string( "movie.%08d." ) + rCase.m_pExtension ), rCase.m_pDecoded );
    EXPECT_FALSE( Expected.empty() );
    EXPECT_TRUE( DecodeVideo( File.m_Path, rCase.m_pDecoded ) == Expected );
  }
}

TEST( OutsideReaders, ShowAviImagesUprightThatAreStoredBottomUp )
{
  VHeader Header = Header2997( IPixelFormat::EB8G8R8, 4 );
  Header.m_Video.m_ImageHeight = 3;
  Header.m_Video.m_bInverted = true;
  VOutsideFile File( Avi );
  File.Write( Header, 1 );
  VBytes Upright;
  for( const std::ptrdiff_t Row : { 2, 1, 0 } )
  {
    Append( Upright, { File.m_Images.begin() + Row * 12, File.m_Images.begin() + ( Row + 1 ) * 12 } );
  }
  EXPECT_EQ( DecodeVideo( File.m_Path, "bgr24" ), Upright );
}

// FFmpeg opens no file without a list of frames.
TEST( OutsideReaders, OpenAnAviWithoutARateOrWithoutFrames )
{
  VHeader Header = MovieHeader( 4, 1 );
  VOutsideFile Empty( Avi );
  Empty.Write( Header, 0 );
  EXPECT_EQ( AskMediaInfo( Empty.m_Path, "Video;%Width% %Height% %CodecID%" ), "4 1 UYVY" );
  Header.m_Timing = {};
  VOutsideFile Untimed( Avi );
  Untimed.Write( Header, 2 );
  const VRunResult Rate = RunProgram(
    { "ffprobe", "-v", "error", "-show_entries", "stream=r_frame_rate", "-select_streams", "v", "-of", "csv=p=0", Untimed.m_Path } );
  EXPECT_EQ( Rate.m_Output, "25/1\n" );
}
