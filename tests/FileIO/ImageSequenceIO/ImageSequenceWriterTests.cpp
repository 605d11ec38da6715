#include "FileIO/ImageSequenceIO/FileNames.h"
#include "FileIO/ImageSequenceIO/ImageSequenceWriter.h"
#include "FileIO/WriterSupport/AttributeBlock.h"
#include "Utils/UtilsIO/StreamAdapters.h"
#include "tests/support/EndlessBuffer.h"
#include "tests/support/FailingStream.h"
#include "tests/support/LogCapture.h"
#include "tests/support/TemporaryFolder.h"
#include "tests/support/TestFrames.h"

#include <gtest/gtest.h>

#include <boost/thread/thread.hpp>

#include <fstream>
#include <iterator>
#include <set>

using namespace KVZ;
using namespace TestSupport;
using ImageSequenceIO::VImageSequenceWriter;

namespace
{

std::string Content( const std::string& i_rPath )
{
  std::ifstream File( i_rPath, std::ios::binary );
  return { std::istreambuf_iterator<char>( File ), {} };
}

// An image is its payload's letter and the pixels; pixels that begin with '!' cannot be compressed.
VideoEncoding::VCompressor FakeCompressor( char i_Letter )
{
  return [i_Letter]( const VideoEncoding::VCompressionInput& i_rInput, UtilsMemory::VByteVector& o_rOutput, UtilsMemory::VByteVector& )
  {
    o_rOutput.assign( i_rInput.m_pPixels, i_rInput.m_pPixels + i_rInput.m_Size );
    o_rOutput.insert( o_rOutput.begin(), static_cast<uint8_t>( i_Letter ) );
    return i_rInput.m_pPixels[0] != '!';
  };
}

std::shared_ptr<VideoEncoding::VVideoFrameEncoder> FakeEncoder()
{
  VideoEncoding::VEncoderParts Parts;
  Parts.m_Compressors[IVideoPayload::EImageJPEG] = FakeCompressor( 'J' );
  Parts.m_Compressors[IVideoPayload::EImagePNG] = FakeCompressor( 'P' );
  Parts.m_Compressors[IVideoPayload::EImageTIFF] = FakeCompressor( 'T' );
  return std::make_shared<VideoEncoding::VVideoFrameEncoder>( VideoEncoding::EConverter::Software, Parts );
}

class ImageSequence : public testing::Test
{
protected:
  // A maker of streams that fail as the fault says, beginning with the i_First-th stream.
  static WriterSupport::VStreamMaker Failing( const VFault& i_rFault, int i_First = 0 )
  {
    return [i_rFault, Left = i_First]( const std::string& i_rPath ) mutable -> std::unique_ptr<UtilsIO::IClosableStream>
    {
      auto pFile = WriterSupport::MakeFile( i_rPath );
      return Left-- > 0 ? std::move( pFile ) : std::make_unique<VFailingStream>( std::move( pFile ), i_rFault );
    };
  }

  std::string Path( const std::string& i_rName ) const { return m_Folder.File( "shots/" + i_rName ); }

  bool OpenAndWriteHeader( VImageSequenceWriter& io_rWriter, IVideoPayload::Enum i_Payload = IVideoPayload::EImagePNG )
  {
    return io_rWriter.Open( Path( "take_%FRAME%" ) ) && io_rWriter.WriteHeader( VideoInfo(), {}, {}, {}, {}, {}, i_Payload, IAudioPayload::ENone );
  }

  static bool WriteFrame( VImageSequenceWriter& io_rWriter, uint64_t i_Key, const std::string& i_rPixels )
  {
    return io_rWriter.WriteFrame( VFrameSet{ Buffer( Bytes( i_rPixels ) ), VideoInfo(), {}, {} }, i_Key );
  }

  const VTemporaryFolder m_Folder;
  const VLogCapture m_Log{ "ImageSequenceIO" };
  VImageSequenceWriter m_Writer{ FakeEncoder() };
};

}

TEST_F( ImageSequence, EachFrameIsAFileOfItsOwnInAFolderThatIsMade )
{
  ASSERT_TRUE( OpenAndWriteHeader( m_Writer ) );
  EXPECT_TRUE( m_Writer.IsOpen() );
  EXPECT_TRUE( WriteFrame( m_Writer, 12, "abcd" ) );
  EXPECT_TRUE( WriteFrame( m_Writer, 3, "efgh" ) ) << "in any order";
  EXPECT_EQ( Content( Path( "take_00000012.png" ) ), "Pabcd" );
  EXPECT_EQ( Content( Path( "take_00000003.png" ) ), "Pefgh" );
  EXPECT_TRUE( m_Writer.Close() );
  EXPECT_FALSE( m_Writer.IsOpen() );

  ASSERT_TRUE( OpenAndWriteHeader( m_Writer, IVideoPayload::EImageJPEG ) );
  EXPECT_TRUE( WriteFrame( m_Writer, 0, "ijkl" ) );
  ASSERT_TRUE( m_Writer.Close() && OpenAndWriteHeader( m_Writer, IVideoPayload::EImageTIFF ) );
  EXPECT_TRUE( WriteFrame( m_Writer, 0, "mnop" ) );
  EXPECT_EQ( Content( Path( "take_00000000.jpg" ) ), "Jijkl" );
  EXPECT_EQ( Content( Path( "take_00000000.tiff" ) ), "Tmnop" );
  std::set<std::string> Names;
  for( const auto& rEntry : boost::filesystem::directory_iterator( m_Folder.File( "shots" ) ) )
  {
    Names.insert( rEntry.path().filename().string() );
  }
  EXPECT_EQ( Names.size(), 5u ) << "and the side file";
  EXPECT_EQ( Names.count( "take_.tarvovideoattributes" ), 1u );
  EXPECT_TRUE( m_Log.Texts().empty() );
}

TEST_F( ImageSequence, AShorterImageReplacesALongerFileWhole )
{
  std::ofstream( m_Folder.File( "take_00000001.png" ) ) << "longer than the image";
  ASSERT_TRUE( m_Writer.Open( m_Folder.File( "take_%FRAME%" ) ) );
  ASSERT_TRUE( m_Writer.WriteHeader( VideoInfo(), {}, {}, {}, {}, {}, IVideoPayload::EImagePNG, IAudioPayload::ENone ) );
  EXPECT_TRUE( WriteFrame( m_Writer, 1, "abcd" ) );
  EXPECT_EQ( Content( m_Folder.File( "take_00000001.png" ) ), "Pabcd" );
}

TEST_F( ImageSequence, TheNameFollowsTheTimecode )
{
  ITimecode Start;
  Start.m_Standard = ITimecodeStandard::ETimecode25;
  Start.m_Seconds = 59;
  ASSERT_TRUE( m_Writer.Open( Path( "%TIMECODE%" ) ) );
  ASSERT_TRUE( m_Writer.WriteHeader( VideoInfo(), {}, { 135000000, 5400000, 0 }, Start, {}, {}, IVideoPayload::EImagePNG, IAudioPayload::ENone ) );
  EXPECT_TRUE( WriteFrame( m_Writer, 26, "abcd" ) );
  EXPECT_EQ( Content( Path( "00010001.png" ) ), "Pabcd" );
}

TEST_F( ImageSequence, TheSideFileKeepsBothAttributeMaps )
{
  IVideoAttributes Attributes;
  Attributes.Set( "Saturation", std::string( "the caller's" ) );
  Attributes.Set( "Take", std::string( "one" ) );
  VideoFrameInfo Captured = VideoInfo();
  Captured.m_PixelFormat = IPixelFormat::EU8Y8V8Y8;
  ASSERT_TRUE( m_Writer.Open( Path( "take_%FRAME%" ) ) );
  ASSERT_TRUE( m_Writer.WriteHeader( Captured, { IAudioSampleFormat::EInt16, 48000, 2 }, {}, {}, { 0.5f, 2.0f }, Attributes, IVideoPayload::EImagePNG,
    IAudioPayload::ENone ) );

  const std::string Text = Content( Path( "take_.tarvovideoattributes" ) );
  const VBytes Blocks = Bytes( Text );
  ISimpleInputStreamAdapter Stream( Blocks );
  IVideoAttributes Internal;
  IVideoAttributes External;
  std::string Error;
  ASSERT_TRUE( WriterSupport::ReadAttributeBlock( Stream, Blocks.size(), Internal, Error ) ) << Error;
  ASSERT_TRUE( WriterSupport::ReadAttributeBlock( Stream, Blocks.size(), External, Error ) ) << Error;
  uint8_t Byte = 0;
  EXPECT_FALSE( Stream.Read( &Byte, 1 ) ) << "nothing behind them";

  VideoFrameInfo Stored;
  AudioFrameInfo Sound{ IAudioSampleFormat::EInt16, 1, 1 };
  ASSERT_TRUE( Stored.ReadAttributes( Internal ) && Sound.ReadAttributes( Internal ) );
  EXPECT_EQ( Stored.m_PixelFormat, IPixelFormat::ER8G8B8 ) << "as the images have it";
  EXPECT_EQ( Stored.m_ImageWidth, 4u );
  EXPECT_TRUE( Sound.IsEmpty() );
  VTimingRecord Timing;
  VColourRecord Colour;
  ITimecode Timecode;
  std::string Take;
  ASSERT_TRUE( Timing.ReadAttributes( External ) && Colour.ReadAttributes( External ) && KVZ::ReadAttributes( Timecode, External ) );
  EXPECT_EQ( Colour, ( VColourRecord{ 0.5f, 2.0f } ) ) << "also with the timing that nobody has set";
  EXPECT_TRUE( IsSameReading( Timecode, ITimecode() ) );
  EXPECT_TRUE( External.Get( "Take", Take ) );
  EXPECT_EQ( Take, "one" );
}

TEST_F( ImageSequence, RefusalsSayWhy )
{
  std::ofstream( m_Folder.File( "taken" ) ) << "a file";
  EXPECT_FALSE( m_Writer.Open( m_Folder.File( "taken/take_%FRAME%" ) ) );
  EXPECT_FALSE( m_Writer.Open( m_Folder.File( "nothing" ) + "/" ) );
  EXPECT_FALSE( m_Writer.IsOpen() );
  ASSERT_TRUE( OpenAndWriteHeader( m_Writer ) );
  EXPECT_FALSE( WriteFrame( m_Writer, ImageSequenceIO::NoFrameNumber, "abcd" ) );
  EXPECT_EQ( m_Log.Texts(), ( std::vector<std::string>{ "File could not be opened.", "File could not be opened.", "Frame index must be set." } ) );
}

TEST_F( ImageSequence, AFrameThatCannotBeEncodedLeavesAnEmptyFile )
{
  ASSERT_TRUE( OpenAndWriteHeader( m_Writer ) );
  EXPECT_FALSE( WriteFrame( m_Writer, 1, "!bcd" ) );
  EXPECT_TRUE( boost::filesystem::exists( Path( "take_00000001.png" ) ) );
  EXPECT_EQ( Content( Path( "take_00000001.png" ) ), "" );
  EXPECT_EQ( m_Log.Texts(), std::vector<std::string>{ "Encoding to 'ImagePNG' failed." } );
  EXPECT_TRUE( WriteFrame( m_Writer, 2, "efgh" ) ) << "the others go on";
}

TEST_F( ImageSequence, AFrameForWhichThereIsNoMemoryLeavesAnEmptyFileToo )
{
  VideoFrameInfo Largest = VideoInfo();
  Largest.m_ImageWidth = 0xFFFFFFFF;
  Largest.m_ImageHeight = 0xFFFFFFFF;
  const size_t Size = size_t{ Largest.m_ImageWidth } * Largest.m_ImageHeight;
  VBufferList Video = { Buffer( { 0 } ), std::make_shared<VEndlessBuffer>( Size - 1 ) };   // to be joined
  VBufferList Audio;
  ASSERT_TRUE( OpenAndWriteHeader( m_Writer ) );
  EXPECT_FALSE( m_Writer.WriteFrame( Video, Largest, Audio, {}, 1 ) );
  EXPECT_TRUE( boost::filesystem::exists( Path( "take_00000001.png" ) ) );
  EXPECT_EQ( m_Log.Texts(),
    ( std::vector<std::string>{ "Could not create buffer of size 18446744065119617025 bytes.", "Encoding to 'ImagePNG' failed." } ) );
}

// Whichever operation of a file fails, its call says so and leaves what fitted; the other frames are whole.
TEST_F( ImageSequence, AFullDiskIsTold )
{
  for( uint64_t Operation = 0; Operation < 2; ++Operation )
  {
    SCOPED_TRACE( Operation );
    VImageSequenceWriter Writer( FakeEncoder(), Failing( { VFault::Never, Operation }, 2 ) );
    ASSERT_TRUE( OpenAndWriteHeader( Writer ) );
    EXPECT_TRUE( WriteFrame( Writer, 0, "abcd" ) );
    EXPECT_FALSE( WriteFrame( Writer, 1, "efgh" ) );
    EXPECT_TRUE( m_Log.Has( "Image file \"" + Path( "take_00000001.png" ) + "\" could not be written." ) );
    EXPECT_EQ( Content( Path( "take_00000000.png" ) ), "Pabcd" );
  }
  VImageSequenceWriter Writer( FakeEncoder(), Failing( { 3, VFault::Never }, 1 ) );
  ASSERT_TRUE( OpenAndWriteHeader( Writer ) );
  EXPECT_FALSE( WriteFrame( Writer, 2, "efgh" ) );
  EXPECT_EQ( Content( Path( "take_00000002.png" ) ), "Pef" );

  boost::filesystem::create_directory( Path( "take_00000003.png" ) );
  ASSERT_TRUE( OpenAndWriteHeader( m_Writer ) );
  EXPECT_FALSE( WriteFrame( m_Writer, 3, "ijkl" ) );
  EXPECT_TRUE( m_Log.Has( "Image file \"" + Path( "take_00000003.png" ) + "\" could not be opened." ) );
}

TEST_F( ImageSequence, AHeaderWithoutItsSideFileFails )
{
  for( const VFault& rFault : { VFault{ VFault::Never, 0 }, { VFault::Never, 1 }, { VFault::Never, 2 }, { 500, VFault::Never } } )
  {
    VImageSequenceWriter Writer( FakeEncoder(), Failing( rFault ) );
    EXPECT_FALSE( OpenAndWriteHeader( Writer ) );
    EXPECT_FALSE( WriteFrame( Writer, 0, "abcd" ) );
  }
  boost::filesystem::remove( Path( "take_.tarvovideoattributes" ) );
  boost::filesystem::create_directory( Path( "take_.tarvovideoattributes" ) );
  EXPECT_FALSE( OpenAndWriteHeader( m_Writer ) );
  EXPECT_TRUE( m_Log.Has( "Attributes could not be written to \"" + Path( "take_.tarvovideoattributes" ) + "\"." ) );
}

TEST_F( ImageSequence, ManyThreadsWriteAtOnce )
{
  constexpr uint64_t FramesEach = 40;
  constexpr uint64_t Threads = 4;
  const auto PixelsOf = []( uint64_t i_Key ) { return std::string( 4, static_cast<char>( 'A' + i_Key % 26 ) ); };
  ASSERT_TRUE( OpenAndWriteHeader( m_Writer ) );
  boost::thread_group Group;
  for( uint64_t Thread = 0; Thread < Threads; ++Thread )
  {
    Group.create_thread(
      [&, Thread]
      {
        for( uint64_t Frame = 0; Frame < FramesEach; ++Frame )
        {
          const uint64_t Key = Frame * Threads + Thread;
          EXPECT_TRUE( WriteFrame( m_Writer, Key, PixelsOf( Key ) ) );
        }
      } );
  }
  Group.join_all();
  for( uint64_t Key = 0; Key < FramesEach * Threads; ++Key )
  {
    EXPECT_EQ( Content( Path( ImageSequenceIO::MakeFileName( "take_%FRAME%", { Key } ) + ".png" ) ), "P" + PixelsOf( Key ) );
  }
}
