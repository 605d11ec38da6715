// Captures whose frames several workers write at once, and frames that are drawn into or converted on their way.
#include "CoreVideoUtils/Fonts/FontCells.h"
#include "CoreVideoUtils/PixelFormatConverter.h"
#include "HardwareSupport/VideoInput/VideoInputDataSource/FrameConversion.h"
#include "HardwareSupport/VideoInput/VideoInputDataSource/VideoInputBufferClient.h"
#include "tests/HardwareSupport/VideoInput/VideoInputDataSource/VideoRig.h"
#include "tests/support/LogCapture.h"

#include <boost/thread/thread.hpp>

namespace
{

using KVZ::IVideoContainer;
using SyncSystem::ECaptureFailure;
using SyncSystem::ECaptureState;

class ImageCapture : public ::testing::Test
{
protected:
  // The test runs the workers, unless it wants threads.
  void Make( bool i_bThreads = false, std::vector<int32_t> i_Containers = { IVideoContainer::EIMAGES } )
  {
    VideoInputHAL::VVideoInputDataSourceOptions Options;
    if( !i_bThreads )
    {
      Options.m_MakeFrameService = [this] { return m_pWorkers; };
    }
    m_Rig.m_pTargets->m_Containers = std::move( i_Containers );
    m_pSource = m_Rig.Make( Options );
    m_Rig.DeliverMany( 40 );
    m_Rig.Join( *m_pSource, 1 );
  }
  void Start( int64_t i_End ) { m_Rig.Start( *m_pSource, ++m_Captures, 0, i_End ); }
  void ClientsTurn() { m_Rig.m_pWriterService->RunAll(); }
  // Waits for a worker that calls for it.
  void AwaitedTurn()
  {
    while( !m_Rig.m_pWriterService->RunOne() )
    {
      boost::this_thread::yield();
    }
  }
  VFakeFile& Sequence() { return ( *m_Rig.m_pDisk )[m_Rig.m_Folder.File( "takes/Take_Label_%FRAME%" )]; }
  KVZ::ICaptureStatus Status() { return m_pSource->GetCaptureStatus(); }
  void ExpectFrames( uint64_t i_Count )
  {
    ASSERT_EQ( Sequence().m_Frames.size(), i_Count );
    for( uint64_t Key = 0; Key < i_Count; ++Key )
    {
      EXPECT_EQ( Sequence().m_Frames.at( Key ), std::vector<uint8_t>( 64, static_cast<uint8_t>( Key ) ) ) << Key;
    }
  }

  VVideoRig m_Rig;
  const std::shared_ptr<TestSupport::VManualPostalService> m_pWorkers = std::make_shared<TestSupport::VManualPostalService>();
  std::shared_ptr<VTestVideoSource> m_pSource;
  uint32_t m_Captures = 0;
};

const size_t Room = VideoInputHAL::VVideoInputBufferClient::FramesAtOnce();

}

TEST_F( ImageCapture, WorkersGetNoMoreThanTheyHaveRoomFor )
{
  Make();
  Start( 40 );
  ClientsTurn();
  EXPECT_EQ( m_pWorkers->Pending(), Room );
  EXPECT_TRUE( Sequence().m_Frames.empty() );
  m_pWorkers->RunOne();
  EXPECT_EQ( m_pWorkers->Pending(), Room - 1 );
  ClientsTurn();
  EXPECT_EQ( m_pWorkers->Pending(), Room );
  while( m_pWorkers->RunOne() )
  {
    EXPECT_EQ( Status().m_State, ECaptureState::Captured ) << "not before the last frame is written";
    EXPECT_EQ( Sequence().m_Closes, 0 );
    ClientsTurn();
  }
  EXPECT_EQ( Status().m_State, ECaptureState::Complete );
  EXPECT_EQ( Status().m_Failure, ECaptureFailure::None );
  EXPECT_EQ( Sequence().m_Closes, 1 );
  ExpectFrames( 40 );
  ASSERT_EQ( m_Rig.m_pTargets->Reports().size(), 1u );
  const auto Report = m_Rig.m_pTargets->Reports()[0];
  EXPECT_EQ( Report.m_FramesWritten, 40u );
  EXPECT_EQ( Report.m_Path, m_Rig.m_Folder.File( "takes/Take_Label_%FRAME%" ) );
}

// Of several frames that fail it is always the first that counts; what comes behind it is not begun any more.
TEST_F( ImageCapture, TheFirstFailureEndsTheCaptureOnce )
{
  Make();
  Sequence().m_FailingKeys = { 1, 3 };
  const TestSupport::VLogCapture Log( "VideoInputDataSource", 2 );
  Start( 40 );
  ClientsTurn();
  for( int Job = 0; Job < 4; ++Job )
  {
    m_pWorkers->RunOne();
  }
  ClientsTurn();
  EXPECT_EQ( Status().m_State, ECaptureState::Complete );
  EXPECT_EQ( Status().m_Failure, ECaptureFailure::ReportedErrors );
  EXPECT_EQ( Status().m_Errors,
    ( std::vector<std::string>{ "Failed attempting to write data to file \"" + m_Rig.m_Folder.File( "takes/Take_Label_%FRAME%" ) + "\"" } ) );
  EXPECT_EQ( Log.Texts(), ( std::vector<std::string>{ "Error writing capture file with container format 'IMAGES'." } ) );
  const auto Report = m_Rig.m_pTargets->Reports().at( 0 );
  EXPECT_TRUE( Report.m_bFailed );
  EXPECT_EQ( Report.m_FramesWritten, 1u ) << "up to the first that is missing";
  m_pWorkers->RunAll();
  EXPECT_EQ( Sequence().m_Frames.size(), 2u ) << "frames 0 and 2";
  EXPECT_EQ( Sequence().m_Closes, 1 );
}

TEST_F( ImageCapture, ACancelDropsWhatHasNotBegun )
{
  Make();
  Start( 60 );
  ClientsTurn();
  m_pWorkers->RunOne();
  m_pWorkers->RunOne();
  m_Rig.Cancel( *m_pSource );
  ClientsTurn();
  EXPECT_EQ( Status().m_State, ECaptureState::Cancelled );
  m_pWorkers->RunAll();
  ExpectFrames( 2 );
  EXPECT_EQ( m_Rig.m_pTargets->Reports().at( 0 ).m_FramesWritten, 2u );
  EXPECT_EQ( Sequence().m_Closes, 1 );
}

TEST_F( ImageCapture, ASourceThatGoesDropsThemToo )
{
  Make();
  Start( 60 );
  ClientsTurn();
  m_pWorkers->RunOne();
  m_Rig.m_pSource.reset();
  m_pSource.reset();
  EXPECT_EQ( Sequence().m_Closes, 1 );
  EXPECT_EQ( m_Rig.m_pTargets->Reports().at( 0 ).m_FramesWritten, 1u );
  m_pWorkers->RunAll();
  ClientsTurn();
  EXPECT_EQ( Sequence().m_Frames.size(), 1u );
}

// The other file fails first: the frames that it had before that are in the sequence too.
TEST_F( ImageCapture, AnotherFilesFailureWaitsForTheWorkers )
{
  Make( false, { IVideoContainer::EIMAGES, IVideoContainer::ETVID } );
  ( *m_Rig.m_pDisk )[m_Rig.Path()].m_FailingCall = 2 + 2;   // its third frame
  Start( 40 );
  ClientsTurn();
  EXPECT_EQ( m_pWorkers->Pending(), 3u );
  EXPECT_EQ( Status().m_Failure, ECaptureFailure::None );
  m_pWorkers->RunAll();
  ClientsTurn();
  EXPECT_EQ( Status().m_Failure, ECaptureFailure::ReportedErrors );
  EXPECT_EQ( Status().m_Errors, ( std::vector<std::string>{ "Failed attempting to write data to file \"" + m_Rig.Path() + "\"" } ) );
  ExpectFrames( 3 );
  EXPECT_EQ( m_Rig.m_pTargets->Reports().size(), 2u );
}

TEST_F( ImageCapture, AStopFromAnotherThreadWaitsForTheFramesInHand )
{
  Make( true );
  Start( 60 );
  AwaitedTurn();
  AwaitedTurn();
  m_Rig.m_pSource.reset();
  m_pSource.reset();
  EXPECT_EQ( Sequence().m_Closes, 1 );
  EXPECT_FALSE( Sequence().m_bClosedWithAFrameInHand );
  ExpectFrames( m_Rig.m_pTargets->Reports().at( 0 ).m_FramesWritten );
}

namespace
{

// The parts that the composing place gives the encoders of a module.
class ConvertedCapture : public ImageCapture
{
protected:
  // A text is drawn by its letters in place of the first pixels.
  void SetUp() override
  {
    VideoEncoding::VEncoderParts& rParts = VideoEncoding::DefaultEncoderParts();
    rParts.m_ConverterMakers[VideoEncoding::EConverter::Software] = [] { return std::make_shared<CoreVideoUtils::VPixelFormatConverter>(); };
    rParts.m_DrawText = []( auto&, const auto&, const VideoEncoding::VBurnInSettings& i_rText, uint8_t* io_pPixels, size_t )
    {
      std::copy( i_rText.m_Text.begin(), i_rText.m_Text.end(), io_pPixels );
      return true;
    };
    m_Rig.m_Timecode.m_Standard = KVZ::ITimecodeStandard::ETimecode25;
  }
  void TearDown() override { VideoEncoding::DefaultEncoderParts() = {}; }
};

}

TEST_F( ConvertedCapture, ThreadsWriteAndDrawEveryFrameBeforeTheFileIsClosed )
{
  m_Rig.m_pTargets->m_Target.m_bBurnInTimecode = true;
  Make( true );
  Start( 30 );
  while( Status().m_State != ECaptureState::Complete )
  {
    AwaitedTurn();
  }
  EXPECT_EQ( Sequence().m_Closes, 1 );
  EXPECT_FALSE( Sequence().m_bClosedWithAFrameInHand );
  const auto& rFrames = Sequence().m_Frames;
  ASSERT_EQ( rFrames.size(), 30u );
  for( int Frame = 0; Frame < 30; ++Frame )
  {
    const std::string Label = "00:00:0" + std::to_string( Frame / 25 ) + ":" + ( Frame % 25 < 10 ? "0" : "" ) + std::to_string( Frame % 25 );
    std::vector<uint8_t> Expected( 64, static_cast<uint8_t>( Frame ) );
    std::copy( Label.begin(), Label.end(), Expected.begin() );
    EXPECT_EQ( rFrames.at( static_cast<uint64_t>( Frame ) ), Expected ) << Frame;
  }
}

TEST_F( ConvertedCapture, UncompressedVideoIsStoredInTheFormatThatIsWantedOrNotAtAll )
{
  m_Rig.m_pTargets->m_Target.m_PixelFormat = KVZ::IPixelFormat::ELuminance8;
  Make( false, { IVideoContainer::ETVID } );
  Start( 5 );
  ClientsTurn();
  const VFakeFile& rFile = m_Rig.m_pDisk->at( m_Rig.Path() );
  EXPECT_EQ( rFile.m_Video.m_PixelFormat, KVZ::IPixelFormat::ELuminance8 );
  EXPECT_EQ( rFile.m_Conversion.at( 0 ).m_PixelFormat, "Luminance8" );
  ASSERT_EQ( rFile.m_Frames.size(), 5u );
  EXPECT_EQ( rFile.m_Frames.at( 3 ), std::vector<uint8_t>( 32, 3 ) );

  m_Rig.m_pDisk->clear();
  m_Rig.m_pTargets->m_Target.m_PixelFormat = KVZ::IPixelFormat::EBayerGB6;
  Start( 5 );
  ClientsTurn();
  EXPECT_EQ( Status().m_Failure, ECaptureFailure::ReportedErrors );
  EXPECT_EQ( m_Rig.m_pTargets->Reports().at( 1 ).m_FramesWritten, 0u );
}

TEST( BurnInTimecode, TellsFramesOfOneLabelApart )
{
  KVZ::ITimecode Timecode;
  EXPECT_EQ( VideoInputHAL::BurnInTextOf( Timecode ), "--:--:--:--" );
  Timecode.m_Standard = KVZ::ITimecodeStandard::ETimecode30Drop;
  Timecode.m_Frames = 7;
  Timecode.m_SubFramePeriod = 2252250;
  EXPECT_EQ( VideoInputHAL::BurnInTextOf( Timecode ), "00:00:00;07.0" );
  Timecode.m_TickRemainder = 2252250;
  EXPECT_EQ( VideoInputHAL::BurnInTextOf( Timecode ), "00:00:00;07.1" );
}

TEST( BurnInTimecode, FitsThePicture )
{
  KVZ::VideoFrameInfo Info;
  for( const auto& [Width, Height, Size] :
    { std::tuple{ 1920u, 1080u, 4u }, { 1280u, 720u, 2u }, { 720u, 576u, 1u }, { 720u, 486u, 1u }, { 160u, 90u, 0u }, { 8u, 4u, 0u } } )
  {
    Info.m_ImageWidth = Width;
    Info.m_ImageHeight = Height;
    const auto Place = VideoInputHAL::BurnInPlaceFor( "10:00:00:00", Info );
    const CoreVideoUtils::VFontCell Cell = CoreVideoUtils::FontCells[Place.m_SizeIndex];
    EXPECT_EQ( Place.m_SizeIndex, Size ) << Height;
    EXPECT_EQ( Place.m_X % 2, 0u );
    EXPECT_TRUE( Height < 90 || ( Place.m_X + 11 * Cell.m_Width <= Width && Place.m_Y + Cell.m_Height <= Height ) );
  }
}
