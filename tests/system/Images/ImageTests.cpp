// Recordings into image files, judged by programs that know nothing of ours.
#include "Core/VideoInterface/PixelFormat.h"
#include "tests/support/CounterReader.h"
#include "tests/support/TemporaryFolder.h"
#include "tests/support/system/Rates.h"
#include "tests/system/Images/Pictures.h"

#include <fstream>
#include <set>

using namespace SystemTests;

namespace
{

constexpr uint32_t Width = 720;
constexpr uint32_t Height = 486;
constexpr uint64_t FrameCount = 6;

VArguments SmallCard( const std::string& i_rMore = "pattern=counter,speed=4" )
{
  return { "--card", "decklink:" + i_rMore + ",standard=" + Rate2398.m_pStandard };
}

VArguments Images( const std::string& i_rPayload, uint64_t i_Frames = FrameCount )
{
  return { "--container", "images", "--video", i_rPayload, "--frames", std::to_string( i_Frames ) };
}

// The card's picture of a number, painted over that of another: highest bit first, white for 1, the next row of cells its complement.
std::vector<uint8_t> WithCounter( std::vector<uint8_t> i_Pairs, uint32_t i_Number )
{
  for( uint32_t Row = 0; Row < 32; ++Row )
  {
    const uint32_t Bits = Row < 16 ? i_Number : ~i_Number;
    for( uint32_t Column = 0; Column < 512; ++Column )
    {
      const size_t Pixel = ( Row * Width + Column ) * 2;
      i_Pairs[Pixel] = 128;
      i_Pairs[Pixel + 1] = ( Bits >> ( 31 - Column / 16 ) & 1 ) != 0 ? 235 : 16;
    }
  }
  return i_Pairs;
}

uint32_t CounterOf( const VPicture& i_rPicture )
{
  const auto Counter = TestSupport::ReadCounter( { KVZ::IPixelFormat::ER8G8B8, i_rPicture.data(), Width * 3 } );
  EXPECT_TRUE( Counter.has_value() );
  return Counter.value_or( 0 );
}

}

class ImageTest : public testing::Test
{
protected:
  VHostResult RecordHere( const VArguments& i_rArguments, const VRunOptions& i_rOptions = {} )
  {
    return Record( m_Folder.File( "out" ), i_rArguments, i_rOptions );
  }
  const TestSupport::VTemporaryFolder m_Folder;
};

struct VLosslessCase
{
  const char* m_pName;
  VArguments m_Arguments;
  const char* m_pExtension;
};

class LosslessTest : public ImageTest, public testing::WithParamInterface<VLosslessCase>
{
};

TEST_P( LosslessTest, EveryFrameHasTheCapturedPixels )
{
  const VHostResult Captured = Record( m_Folder.File( "captured" ), SmallCard() + VArguments{ "--frames", "2" } );
  const VHostResult Result = RecordHere( SmallCard() + GetParam().m_Arguments );
  ASSERT_EQ( 0, Result.m_Run.m_ExitCode ) << Describe( Result.m_Run );
  EXPECT_EQ( FrameCount, Result.Device().value( "frames_written", 0u ) );
  uint32_t First = 0;
  for( uint64_t Key = 0; Key < FrameCount; ++Key )
  {
    SCOPED_TRACE( Key );
    const VPicture Picture = FrameOf( Result, Key, GetParam().m_pExtension );
    ASSERT_EQ( Width * Height * 3, Picture.size() );
    const uint32_t Counter = CounterOf( Picture );
    First = Key == 0 ? Counter : First;
    EXPECT_EQ( First + Key, Counter );
    const std::vector<uint8_t> Expected = WithCounter( FrameOf( Captured, 0 ), Counter );
    EXPECT_TRUE( ConvertPairs( Expected.data(), Expected.size() ) == Picture ) << "pixels differ";
  }
}

INSTANTIATE_TEST_SUITE_P( Forms, LosslessTest,
  testing::Values( VLosslessCase{ "PNG", Images( "png" ), "png" }, VLosslessCase{ "TIFF", Images( "tiff" ), "tiff" },
    VLosslessCase{ "RGB", { "--pixel-format", "R8G8B8", "--frames", std::to_string( FrameCount ) }, "" } ),
  []( const auto& i_rInfo ) { return std::string( i_rInfo.param.m_pName ); } );

TEST_F( ImageTest, TheReportCountsWhatLiesInTheFolder )
{
  const VHostResult Result = RecordHere( SmallCard() + SmallCard( "pattern=bars,speed=4" ) + Images( "jpeg", 12 ) );
  ASSERT_EQ( 0, Result.m_Run.m_ExitCode ) << Describe( Result.m_Run );
  ASSERT_EQ( 2u, Result.m_Devices.size() );
  for( size_t Device = 0; Device < 2; ++Device )
  {
    const std::string Name = "take_vi" + std::to_string( Device );
    EXPECT_EQ( m_Folder.File( "out/" + Name ), Result.Path( Device ) ) << "a folder of its own";
    std::set<std::string> Names;
    uint64_t Bytes = 0;
    for( const auto& rEntry : boost::filesystem::directory_iterator( Result.Path( Device ) ) )
    {
      Names.insert( rEntry.path().filename().string() );
      Bytes += boost::filesystem::file_size( rEntry.path() );
    }
    EXPECT_EQ( Bytes, Result.Device( Device ).value( "bytes", uint64_t{ 0 } ) );
    EXPECT_EQ( 12u, Result.Device( Device ).value( "frames_written", 0u ) );
    EXPECT_EQ( 13u, Names.size() );
    EXPECT_EQ( 1u, Names.count( Name + "_.tarvovideoattributes" ) );
    EXPECT_EQ( 1u, Names.count( Name + "_00000011.jpg" ) );
  }
}

// A person's clip, compressed at the quality that nobody chose.
TEST_F( ImageTest, JpegIsCloseToItsSource )
{
  constexpr size_t PairBytes = 1920 * 1080 * 2;
  constexpr uint64_t Frames = 5;
  const std::string Path = STAGECORE_SOURCE_DIR "/tests/data/bunny.mp4";
  const std::vector<uint8_t> Decoded = TestSupport::DecodeVideo( Path, "uyvy422" );
  const size_t ClipFrames = Decoded.size() / PairBytes;
  ASSERT_GT( ClipFrames, Frames );
  const auto Source = [&]( size_t i_Frame, size_t i_Bytes ) { return ConvertPairs( Decoded.data() + i_Frame % ClipFrames * PairBytes, i_Bytes ); };

  const VHostResult Result = RecordHere(
    VArguments{ "--card", "decklink:input=" + Path } + Images( "jpeg", Frames ) + VArguments{ "--quality", "90" } );
  ASSERT_EQ( 0, Result.m_Run.m_ExitCode ) << Describe( Result.m_Run );
  constexpr size_t StripBytes = PairBytes / 20;   // enough to tell one frame of the clip from another
  VPicture Strip = FrameOf( Result, 0, "jpg" );
  Strip.resize( StripBytes / 2 * 3 );
  size_t First = 0;
  double Best = 0.0;
  for( size_t Frame = 0; Frame < ClipFrames; ++Frame )
  {
    const double Likeness = SignalToNoise( Strip, Source( Frame, StripBytes ) );
    First = Likeness > Best ? Frame : First;
    Best = std::max( Best, Likeness );
  }
  for( uint64_t Key = 0; Key < Frames; ++Key )
  {
    const VPicture Picture = FrameOf( Result, Key, "jpg" );
    EXPECT_GE( SignalToNoise( Picture, Source( First + Key, PairBytes ) ), 40.0 )
      << "image " << Key << ", the clip's " << ( First + Key ) % ClipFrames;
  }
}

TEST_F( ImageTest, ALowerQualityMakesSmallerImages )
{
  const auto Bytes = [this]( const std::string& i_rQuality )
  {
    const VHostResult Result = Record( m_Folder.File( i_rQuality ),
      SmallCard( "pattern=noise,speed=4" ) + Images( "jpeg", 2 ) + VArguments{ "--quality", i_rQuality } );
    EXPECT_EQ( 0, Result.m_Run.m_ExitCode ) << Describe( Result.m_Run );
    return Result.Device().value( "bytes", uint64_t{ 0 } );
  };
  const uint64_t Coarse = Bytes( "20" );
  EXPECT_GT( Coarse, 0u );
  EXPECT_GT( Bytes( "95" ), 2 * Coarse );
}

// Nothing is written over without being asked for, and a shorter sequence leaves nothing of a longer one.
TEST_F( ImageTest, ASequenceIsReplacedAsAWhole )
{
  ASSERT_EQ( 0, RecordHere( SmallCard() + Images( "jpeg", 5 ) ).m_Run.m_ExitCode );
  const std::string Folder = m_Folder.File( "out/take_vi0" );
  std::ofstream( Folder + "/notes.txt" ) << "mine";
  const VHostResult Refused = RecordHere( SmallCard() + Images( "png", 2 ) );
  EXPECT_EQ( 1, Refused.m_Run.m_ExitCode );
  EXPECT_NE( std::string::npos, Refused.m_Run.m_Error.find( "\"" + Folder + "\"" ) ) << Describe( Refused.m_Run );
  EXPECT_FALSE( boost::filesystem::exists( FramePath( Folder, 0, "png" ) ) );

  const VHostResult Result = RecordHere( SmallCard() + Images( "png", 2 ) + VArguments{ "--overwrite" } );
  EXPECT_EQ( 0, Result.m_Run.m_ExitCode ) << Describe( Result.m_Run );
  EXPECT_FALSE( boost::filesystem::exists( FramePath( Folder, 0, "jpg" ) ) );
  EXPECT_TRUE( boost::filesystem::exists( FramePath( Folder, 1, "png" ) ) );
  EXPECT_TRUE( boost::filesystem::exists( Folder + "/notes.txt" ) );
}

// A file that cannot grow, and one that cannot be made: the recording ends there, says where, and what lies before it is whole.
TEST_F( ImageTest, AnImageThatCannotBeWrittenEndsTheRecording )
{
  VRunOptions Options;
  Options.m_FileSizeLimit = 20000;   // the attributes fit, an image does not
  const VHostResult Full = RecordHere( SmallCard( "pattern=noise,speed=4" ) + Images( "tiff" ), Options );
  EXPECT_EQ( 1, Full.m_Run.m_ExitCode ) << Describe( Full.m_Run );
  EXPECT_NE( std::string::npos, Full.m_Run.m_Error.find( "File too large" ) ) << Describe( Full.m_Run );
  EXPECT_NE( std::string::npos, Full.m_Run.m_Error.find( "take_vi0_00000000.tiff" ) ) << Describe( Full.m_Run );
  EXPECT_NE( 0u, Full.Device().value( "failure", 0u ) & 8 );
  EXPECT_EQ( 0u, Full.Device().value( "frames_written", 1u ) );

  const std::string Folder = m_Folder.File( "other/take_vi0" );
  boost::filesystem::create_directories( FramePath( Folder, 3, "png" ) + "/in the way" );
  const VHostResult Blocked = Record( m_Folder.File( "other" ), SmallCard() + Images( "png", 30 ) + VArguments{ "--overwrite" } );
  EXPECT_EQ( 1, Blocked.m_Run.m_ExitCode ) << Describe( Blocked.m_Run );
  EXPECT_EQ( 3u, Blocked.Device().value( "frames_written", 0u ) );
  EXPECT_NE( std::string::npos, Blocked.m_Run.m_Error.find( "take_vi0_00000003.png" ) ) << Describe( Blocked.m_Run );
  for( uint64_t Key = 0; Key < 3; ++Key )
  {
    EXPECT_EQ( Width * Height * 3, FrameOf( Blocked, Key, "png" ).size() ) << Key;
  }
}
