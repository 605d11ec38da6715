// Captures whose frames several workers write at once, and frames that are drawn into or converted on their way.
#include "CoreVideoUtils/BurnInText.h"
#include "CoreVideoUtils/PixelFormatConverter.h"
#include "HardwareSupport/VideoInput/VideoInputDataSource/FrameConversion.h"
#include "HardwareSupport/VideoInput/VideoInputDataSource/VideoInputBufferClient.h"
#include "tests/HardwareSupport/VideoInput/VideoInputDataSource/VideoRig.h"
#include "tests/support/LogCapture.h"

#include <boost/thread/condition_variable.hpp>
#include <boost/thread/lock_guard.hpp>
#include <boost/thread/lock_types.hpp>

#include <deque>
#include <set>

namespace
{

using KVZ::IVideoContainer;
using SyncSystem::ECaptureFailure;
using SyncSystem::ECaptureState;

// What a sequence holds. Any thread.
struct VSequence
{
  void Add( uint64_t i_Key, std::vector<uint8_t> i_Bytes )
  {
    boost::lock_guard<boost::mutex> Lock( m_Mutex );
    m_Frames[i_Key] = std::move( i_Bytes );
  }
  std::map<uint64_t, std::vector<uint8_t>> Frames() const
  {
    boost::lock_guard<boost::mutex> Lock( m_Mutex );
    return m_Frames;
  }

  std::set<uint64_t> m_FailingKeys;
  std::atomic<int> m_Closes{ 0 };
  std::atomic<bool> m_bClosedWithAFrameInHand{ false };
  std::atomic<int> m_InHand{ 0 };

private:
  mutable boost::mutex m_Mutex;
  std::map<uint64_t, std::vector<uint8_t>> m_Frames GUARDED_BY( m_Mutex );
};

class VSequenceWriter : public KVZ::IVideoWriter
{
public:
  explicit VSequenceWriter( std::shared_ptr<VSequence> i_pSequence ) : m_pSequence( std::move( i_pSequence ) ) {}

  const KVZ::IVideoWriterCapabilities& GetCapabilities() const override { return KVZ::GetVideoWriterCapabilities( IVideoContainer::EIMAGES ); }
  bool Open( const std::string& ) override { return m_bOpen = true; }
  bool IsOpen() const override { return m_bOpen; }
  bool WriteHeader( const KVZ::VideoFrameInfo&, const KVZ::AudioFrameInfo&, const KVZ::VTimingRecord&, const KVZ::ITimecode&,
    const KVZ::VColourRecord&, const KVZ::IVideoAttributes&, KVZ::IVideoPayload::Enum, KVZ::IAudioPayload::Enum ) override
  {
    return true;
  }
  bool WriteFrame( const KVZ::VFrameSet&, uint64_t ) override { return false; }
  bool WriteFrame( KVZ::VBufferList& io_rVideo, const KVZ::VideoFrameInfo&, KVZ::VBufferList&, const KVZ::AudioFrameInfo&, uint64_t i_Key ) override
  {
    ++m_pSequence->m_InHand;
    const bool bWritten = m_pSequence->m_FailingKeys.count( i_Key ) == 0;
    if( bWritten )
    {
      const KVZ::IBufferConst& rImage = *io_rVideo.front();
      m_pSequence->Add( i_Key, std::vector<uint8_t>( rImage.Data(), rImage.Data() + rImage.Size() ) );
    }
    --m_pSequence->m_InHand;
    return bWritten;
  }
  bool Close() override
  {
    m_pSequence->m_bClosedWithAFrameInHand = m_pSequence->m_InHand != 0;
    ++m_pSequence->m_Closes;
    return true;
  }

private:
  const std::shared_ptr<VSequence> m_pSequence;
  bool m_bOpen = false;
};

// A queue that the test runs, and waits for where other threads fill it.
class VAwaitedService : public KVZ::IPostalService
{
public:
  void Post( std::function<void()> i_Function, unsigned int = 0 ) override
  {
    boost::lock_guard<boost::mutex> Lock( m_Mutex );
    m_Queue.push_back( std::move( i_Function ) );
    m_Posted.notify_all();
  }

  // Waits for the next one.
  void RunOne()
  {
    std::function<void()> Function;
    {
      boost::unique_lock<boost::mutex> Lock( m_Mutex );
      m_Posted.wait( Lock, [this] { return !m_Queue.empty(); } );
      Function = std::move( m_Queue.front() );
      m_Queue.pop_front();
    }
    Function();
  }

private:
  boost::mutex m_Mutex;
  boost::condition_variable m_Posted;
  std::deque<std::function<void()>> m_Queue;
};

class ImageCapture : public ::testing::Test
{
protected:
  // The test runs the workers, unless it wants threads.
  void Make( bool i_bThreads = false, std::vector<int32_t> i_Containers = { IVideoContainer::EIMAGES } )
  {
    auto pFactory = std::make_shared<KVZ::VVideoWriterFactory>();
    pFactory->Register( IVideoContainer::EIMAGES, [this]( auto, auto ) { return std::make_shared<VSequenceWriter>( m_pSequence ); } );
    pFactory->Register( IVideoContainer::ETVID, [this]( auto, auto ) { return std::make_shared<VFakeWriter>( m_Rig.m_pDisk ); } );
    VideoInputHAL::VVideoInputDataSourceOptions Options;
    Options.m_pWriterFactory = pFactory;
    if( i_bThreads )
    {
      Options.m_MakeWriterService = [this] { return m_pAwaited; };
    }
    else
    {
      Options.m_MakeFrameService = [this] { return m_pWorkers; };
    }
    m_Rig.m_pTargets->m_Containers = std::move( i_Containers );
    m_pSource = m_Rig.Make<VTestVideoSource>( Options );
    m_Rig.DeliverMany( 40 );
    m_Rig.Join( *m_pSource, 1 );
  }
  void Start( int64_t i_End )
  {
    const KVZ::ICaptureHeader Header{ KVZ::VCaptureSessionId( ++m_Captures ), "Take", 0, KVZ::VGlobalSyncSessionId( 1 ) };
    m_Rig.OnStrand( *m_pSource, [&] { EXPECT_TRUE( m_pSource->StartCapture( Header, At( 0 ), At( i_End ), false, 0 ) ); } );
  }
  void ClientsTurn() { m_Rig.m_pWriterService->RunAll(); }
  KVZ::ICaptureStatus Status() { return m_pSource->GetCaptureStatus(); }
  void ExpectFrames( uint64_t i_Count )
  {
    const auto Frames = m_pSequence->Frames();
    ASSERT_EQ( Frames.size(), i_Count );
    for( uint64_t Key = 0; Key < i_Count; ++Key )
    {
      EXPECT_EQ( Frames.at( Key ), std::vector<uint8_t>( 64, static_cast<uint8_t>( Key ) ) ) << Key;
    }
  }

  VVideoRig m_Rig;
  const std::shared_ptr<VSequence> m_pSequence = std::make_shared<VSequence>();
  const std::shared_ptr<TestSupport::VManualPostalService> m_pWorkers = std::make_shared<TestSupport::VManualPostalService>();
  const std::shared_ptr<VAwaitedService> m_pAwaited = std::make_shared<VAwaitedService>();
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
  EXPECT_TRUE( m_pSequence->Frames().empty() );
  m_pWorkers->RunOne();
  EXPECT_EQ( m_pWorkers->Pending(), Room - 1 );
  ClientsTurn();
  EXPECT_EQ( m_pWorkers->Pending(), Room );
  while( m_pWorkers->RunOne() )
  {
    EXPECT_EQ( Status().m_State, ECaptureState::Captured ) << "not before the last frame is written";
    EXPECT_EQ( m_pSequence->m_Closes, 0 );
    ClientsTurn();
  }
  EXPECT_EQ( Status().m_State, ECaptureState::Complete );
  EXPECT_EQ( Status().m_Failure, ECaptureFailure::None );
  EXPECT_EQ( m_pSequence->m_Closes, 1 );
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
  m_pSequence->m_FailingKeys = { 1, 3 };
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
  EXPECT_EQ( m_pSequence->Frames().size(), 2u ) << "frames 0 and 2";
  EXPECT_EQ( m_pSequence->m_Closes, 1 );
}

TEST_F( ImageCapture, ACancelDropsWhatHasNotBegun )
{
  Make();
  Start( 60 );
  ClientsTurn();
  m_pWorkers->RunOne();
  m_pWorkers->RunOne();
  m_Rig.OnStrand( *m_pSource, [&] { m_pSource->CancelCapture(); } );
  ClientsTurn();
  EXPECT_EQ( Status().m_State, ECaptureState::Cancelled );
  m_pWorkers->RunAll();
  ExpectFrames( 2 );
  EXPECT_EQ( m_Rig.m_pTargets->Reports().at( 0 ).m_FramesWritten, 2u );
  EXPECT_EQ( m_pSequence->m_Closes, 1 );
}

TEST_F( ImageCapture, ASourceThatGoesDropsThemToo )
{
  Make();
  Start( 60 );
  ClientsTurn();
  m_pWorkers->RunOne();
  m_Rig.m_pSource.reset();
  m_pSource.reset();
  EXPECT_EQ( m_pSequence->m_Closes, 1 );
  EXPECT_EQ( m_Rig.m_pTargets->Reports().at( 0 ).m_FramesWritten, 1u );
  m_pWorkers->RunAll();
  ClientsTurn();
  EXPECT_EQ( m_pSequence->Frames().size(), 1u );
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
  m_pAwaited->RunOne();
  m_pAwaited->RunOne();
  m_Rig.m_pSource.reset();
  m_pSource.reset();
  EXPECT_EQ( m_pSequence->m_Closes, 1 );
  EXPECT_FALSE( m_pSequence->m_bClosedWithAFrameInHand );
  const auto Frames = m_pSequence->Frames();
  EXPECT_EQ( m_Rig.m_pTargets->Reports().at( 0 ).m_FramesWritten, Frames.size() );
  EXPECT_TRUE( Frames.empty() || Frames.rbegin()->first == Frames.size() - 1 ) << "no gap";
}

namespace
{

// The parts that the composing place gives the encoders of a module.
class ConvertedCapture : public ImageCapture
{
protected:
  void SetUp() override
  {
    VideoEncoding::VEncoderParts& rParts = VideoEncoding::DefaultEncoderParts();
    rParts.m_ConverterMakers[VideoEncoding::EConverter::Software] = [] { return std::make_shared<CoreVideoUtils::VPixelFormatConverter>(); };
    rParts.m_DrawText = []( KVZ::IPixelFormatConverter& i_rConverter, const KVZ::VideoFrameInfo& i_rInfo,
                          const VideoEncoding::VBurnInSettings& i_rText, uint8_t* io_pPixels, size_t i_Size ) {
      return CoreVideoUtils::BurnInText( i_rConverter, i_rInfo, i_rText.m_SizeIndex, i_rText.m_X, i_rText.m_Y, i_rText.m_Text, io_pPixels, i_Size );
    };
    m_Rig.m_Timecode.m_Standard = KVZ::ITimecodeStandard::ETimecode25;
    m_Rig.m_Timecode.m_Hours = 10;
  }
  void TearDown() override { VideoEncoding::DefaultEncoderParts() = {}; }

  void UsePicture( uint32_t i_Width, uint32_t i_Height, KVZ::IPixelFormat::Enum i_Format )
  {
    m_Rig.m_Format.m_Width = i_Width;
    m_Rig.m_Format.m_Height = i_Height;
    m_Rig.m_Format.m_PixelFormat = i_Format;
  }
  const VFakeFile& WriteTvid( int64_t i_Frames )
  {
    Make( false, { IVideoContainer::ETVID } );
    Start( i_Frames );
    ClientsTurn();
    EXPECT_EQ( Status().m_State, ECaptureState::Complete );
    return ( *m_Rig.m_pDisk )[m_Rig.Path()];
  }
  // A frame's picture with a text in it, where the capture draws it.
  std::vector<uint8_t> Expected( int i_Frame, const std::string& i_rText ) const
  {
    KVZ::VideoFrameInfo Info;
    Info.m_ImageWidth = m_Rig.m_Format.m_Width;
    Info.m_ImageHeight = m_Rig.m_Format.m_Height;
    Info.m_PixelFormat = m_Rig.m_Format.m_PixelFormat;
    std::vector<uint8_t> Image( KVZ::GetImageSize( Info.m_PixelFormat, Info.m_ImageWidth, Info.m_ImageHeight ), static_cast<uint8_t>( i_Frame ) );
    CoreVideoUtils::VPixelFormatConverter Converter;
    EXPECT_TRUE( CoreVideoUtils::BurnInText( Converter, Info, 0, 4, 20, i_rText, Image.data(), Image.size() ) );
    return Image;
  }
};

}

// 11 characters of 12 x 20 pixels, in the middle of 140 x 60, one line below the upper edge.
TEST_F( ConvertedCapture, EachFrameCarriesItsOwnTimecode )
{
  UsePicture( 140, 60, KVZ::IPixelFormat::ELuminance8 );
  m_Rig.m_pTargets->m_bBurnInTimecode = true;
  const VFakeFile& rFile = WriteTvid( 30 );
  ASSERT_EQ( rFile.m_Frames.size(), 30u );
  EXPECT_EQ( rFile.m_Frames[0], Expected( 0, "10:00:00:00" ) );
  EXPECT_EQ( rFile.m_Frames[9], Expected( 9, "10:00:00:09" ) );
  EXPECT_EQ( rFile.m_Frames[26], Expected( 26, "10:00:01:01" ) );
  SyncSystem::VRefCountedToken Frame;
  SyncSystem::VToken Token{ KVZ::VBufferSessionId( 1 ), 1, nullptr };
  ASSERT_TRUE( m_pSource->Buffer()->Read( Token, Frame ) );
  const auto* pFrame = VVideoInputDataSource::FrameOf( Frame.Frame() );
  EXPECT_EQ( std::count( pFrame->Image(), pFrame->Image() + pFrame->m_ImageBytes, pFrame->Image()[0] ), pFrame->m_ImageBytes ) << "only in the file";
}

TEST_F( ConvertedCapture, ThreadsWriteAndDrawEveryFrameBeforeTheFileIsClosed )
{
  UsePicture( 140, 60, KVZ::IPixelFormat::ELuminance8 );
  m_Rig.m_pTargets->m_bBurnInTimecode = true;
  Make( true );
  Start( 30 );
  while( Status().m_State != ECaptureState::Complete )
  {
    m_pAwaited->RunOne();
  }
  EXPECT_EQ( m_pSequence->m_Closes, 1 );
  EXPECT_FALSE( m_pSequence->m_bClosedWithAFrameInHand );
  const auto Frames = m_pSequence->Frames();
  ASSERT_EQ( Frames.size(), 30u );
  for( int Frame = 0; Frame < 30; ++Frame )
  {
    const std::string Label = "10:00:0" + std::to_string( Frame / 25 ) + ":" + ( Frame % 25 < 10 ? "0" : "" ) + std::to_string( Frame % 25 );
    EXPECT_EQ( Frames.at( static_cast<uint64_t>( Frame ) ), Expected( Frame, Label ) ) << Frame;
  }
}

TEST_F( ConvertedCapture, UncompressedVideoIsStoredInTheFormatThatIsWanted )
{
  m_Rig.m_pTargets->m_PixelFormat = KVZ::IPixelFormat::ELuminance8;
  const VFakeFile& rFile = WriteTvid( 5 );
  EXPECT_EQ( rFile.m_Video.m_PixelFormat, KVZ::IPixelFormat::ELuminance8 );
  EXPECT_EQ( rFile.m_Conversion.at( 0 ).m_PixelFormat, "Luminance8" );
  ASSERT_EQ( rFile.m_Frames.size(), 5u );
  EXPECT_EQ( rFile.m_Frames[3], std::vector<uint8_t>( 32, 3 ) );
}

TEST_F( ConvertedCapture, AFormatThatCannotBeHadFailsTheFile )
{
  m_Rig.m_pTargets->m_PixelFormat = KVZ::IPixelFormat::EBayerGB6;
  WriteTvid( 5 );
  EXPECT_EQ( Status().m_Failure, ECaptureFailure::ReportedErrors );
  EXPECT_EQ( m_Rig.m_pTargets->Reports().at( 0 ).m_FramesWritten, 0u );
}

TEST( BurnInTimecode, TellsFramesOfOneLabelApart )
{
  KVZ::ITimecode Timecode;
  EXPECT_EQ( VideoInputHAL::BurnInTextOf( Timecode ), "--:--:--:--" );
  Timecode.m_Standard = KVZ::ITimecodeStandard::ETimecode30Drop;
  Timecode.m_Frames = 7;
  EXPECT_EQ( VideoInputHAL::BurnInTextOf( Timecode ), "00:00:00;07" );
  Timecode.m_SubFramePeriod = 4504500;
  EXPECT_EQ( VideoInputHAL::BurnInTextOf( Timecode ), "00:00:00;07" ) << "a frame a label";
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
