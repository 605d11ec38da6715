#include "FileIO/ImageSequenceIO/FileNames.h"
#include "FileIO/ImageSequenceIO/ImageSequenceWriter.h"
#include "FileIO/WriterSupport/WatchedStream.h"
#include "tests/support/EndlessBuffer.h"
#include "tests/support/FailingStream.h"
#include "tests/support/LogCapture.h"
#include "tests/support/TemporaryFolder.h"
#include "tests/support/TestFrames.h"
#include "tests/support/WholeFile.h"

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

using TestSupport::ReadFile;

// An image is its payload's letter and the pixels; pixels that begin with '!' cannot be compressed.
std::shared_ptr<VideoEncoding::VVideoFrameEncoder> FakeEncoder()
{
  VideoEncoding::VEncoderParts Parts;
  for( const auto& [Payload, Letter] :
    { std::pair( IVideoPayload::EImageJPEG, 'J' ), std::pair( IVideoPayload::EImagePNG, 'P' ), std::pair( IVideoPayload::EImageTIFF, 'T' ) } )
  {
    Parts.m_Compressors[Payload] =
      [Letter = Letter]( const VideoEncoding::VCompressionInput& i_rInput, UtilsMemory::VByteVector& o_rOutput, UtilsMemory::VByteVector& )
    {
      o_rOutput.assign( i_rInput.m_pPixels, i_rInput.m_pPixels + i_rInput.m_Size );
      o_rOutput.insert( o_rOutput.begin(), static_cast<uint8_t>( Letter ) );
      return i_rInput.m_pPixels[0] != '!';
    };
  }
  return std::make_shared<VideoEncoding::VVideoFrameEncoder>( VideoEncoding::EConverter::Software, Parts );
}

class ImageSequence : public testing::Test
{
protected:
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
  EXPECT_EQ( ReadFile( Path( "take_00000012.png" ) ), "Pabcd" );
  EXPECT_EQ( ReadFile( Path( "take_00000003.png" ) ), "Pefgh" );
  EXPECT_TRUE( m_Writer.Close() );
  EXPECT_FALSE( m_Writer.IsOpen() );

  ASSERT_TRUE( OpenAndWriteHeader( m_Writer, IVideoPayload::EImageJPEG ) );
  EXPECT_TRUE( WriteFrame( m_Writer, 0, "ijkl" ) );
  ASSERT_TRUE( m_Writer.Close() && OpenAndWriteHeader( m_Writer, IVideoPayload::EImageTIFF ) );
  EXPECT_TRUE( WriteFrame( m_Writer, 0, "mnop" ) );
  EXPECT_EQ( ReadFile( Path( "take_00000000.jpg" ) ), "Jijkl" );
  EXPECT_EQ( ReadFile( Path( "take_00000000.tiff" ) ), "Tmnop" );
  std::set<std::string> Names;
  for( const auto& rEntry : boost::filesystem::directory_iterator( m_Folder.File( "shots" ) ) )
  {
    Names.insert( rEntry.path().filename().string() );
  }
  EXPECT_EQ( Names.size(), 5u ) << "and the side file";
  EXPECT_EQ( Names.count( "take_.tarvovideoattributes" ), 1u );
  EXPECT_TRUE( m_Log.Texts().empty() );
}

TEST_F( ImageSequence, TheNameFollowsTheTimecode )
{
  ITimecode Start;
  Start.m_Standard = ITimecodeStandard::ETimecode25;
  Start.m_Seconds = 59;
  std::ofstream( m_Folder.File( "00010001.png" ) ) << "longer than the image that replaces it";
  ASSERT_TRUE( m_Writer.Open( m_Folder.File( "%TIMECODE%" ) ) );
  ASSERT_TRUE( m_Writer.WriteHeader( VideoInfo(), {}, { 135000000, 5400000, 0 }, Start, {}, {}, IVideoPayload::EImagePNG, IAudioPayload::ENone ) );
  EXPECT_TRUE( WriteFrame( m_Writer, 26, "abcd" ) );
  EXPECT_EQ( ReadFile( m_Folder.File( "00010001.png" ) ), "Pabcd" );
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
  EXPECT_TRUE( WriteFrame( m_Writer, 2, "efgh" ) ) << "the others go on";

  const VideoFrameInfo Largest = VideoInfo( IPixelFormat::ELuminance8, 0xFFFFFFFF, 0xFFFFFFFF );
  const size_t Size = size_t{ Largest.m_ImageWidth } * Largest.m_ImageHeight;
  VBufferList Video = { Buffer( { 0 } ), std::make_shared<VEndlessBuffer>( Size - 1 ) };   // to be joined in more memory than there is
  VBufferList Audio;
  EXPECT_FALSE( m_Writer.WriteFrame( Video, Largest, Audio, {}, 3 ) );
  for( const char* pName : { "take_00000001.png", "take_00000003.png" } )
  {
    EXPECT_TRUE( boost::filesystem::exists( Path( pName ) ) && ReadFile( Path( pName ) ).empty() ) << pName;
  }
  const std::string Failed = "Encoding to 'ImagePNG' failed.";
  EXPECT_EQ( m_Log.Texts(), ( std::vector<std::string>{ Failed, "Could not create buffer of size 18446744065119617025 bytes.", Failed } ) );
}

TEST_F( ImageSequence, AFileThatCannotBeWrittenIsNamedAndKeepsWhatFits )
{
  // The disk is full in every file of four bytes and more but the first, which is the side file.
  const auto MakeStream = [Count = 0]( const std::string& i_rPath ) mutable -> std::unique_ptr<UtilsIO::IClosableStream>
  {
    auto pFile = WriterSupport::MakeFile( i_rPath );
    return Count++ == 0 ? std::move( pFile ) : std::make_unique<VFailingStream>( std::move( pFile ), VFault{ .m_Offset = 3 } );
  };
  VImageSequenceWriter Writer( FakeEncoder(), MakeStream );
  ASSERT_TRUE( OpenAndWriteHeader( Writer ) );
  EXPECT_FALSE( WriteFrame( Writer, 2, "efgh" ) );
  EXPECT_EQ( ReadFile( Path( "take_00000002.png" ) ), "Pef" );
  ASSERT_TRUE( Writer.Close() );
  EXPECT_FALSE( OpenAndWriteHeader( Writer ) );

  ASSERT_TRUE( OpenAndWriteHeader( m_Writer ) );
  boost::filesystem::create_directory( Path( "take_00000003.png" ) );
  EXPECT_FALSE( WriteFrame( m_Writer, 3, "ijkl" ) );
  EXPECT_TRUE( WriteFrame( m_Writer, 4, "mnop" ) );
  EXPECT_EQ( m_Log.Texts(),
    ( std::vector<std::string>{ "Image file \"" + Path( "take_00000002.png" ) + "\" could not be written.",
      "Attributes could not be written to \"" + Path( "take_.tarvovideoattributes" ) + "\".",
      "Image file \"" + Path( "take_00000003.png" ) + "\" could not be opened." } ) );
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
    EXPECT_EQ( ReadFile( Path( ImageSequenceIO::MakeFileName( "take_%FRAME%", { Key } ) + ".png" ) ), "P" + PixelsOf( Key ) );
  }
}
