// Captures into files, with writers that fail where they are told to.
#include "tests/HardwareSupport/VideoInput/VideoInputDataSource/VideoRig.h"

#include "SyncSystem/CaptureTypes.h"
#include "tests/support/LogCapture.h"

namespace
{

using SyncSystem::ECaptureFailure;
using SyncSystem::ECaptureState;

class BufferClient : public ::testing::Test
{
protected:
  void SetUp() override
  {
    m_Rig.m_Timecode.m_Standard = KVZ::ITimecodeStandard::ETimecode25;
    m_Rig.m_Timecode.m_Hours = 10;
    m_Rig.DeliverMany( 10 );
    m_Rig.Join( *m_pSource, 1 );
  }
  void Start( uint32_t i_Id, int64_t i_First, int64_t i_End, const std::string& i_rName = "Take" )
  {
    m_Rig.Start( *m_pSource, i_Id, i_First, i_End, i_rName );
  }
  // The writing thread's turn.
  void Write() { m_Rig.m_pWriterService->RunAll(); }
  KVZ::ICaptureStatus Status() { return m_pSource->GetCaptureStatus(); }
  void ExpectFailed( const std::string& i_rError )
  {
    EXPECT_EQ( Status().m_Errors, std::vector<std::string>{ i_rError } );
    EXPECT_EQ( Status().m_Failure, ECaptureFailure::ReportedErrors );
    EXPECT_EQ( Status().m_State, ECaptureState::Complete );
  }
  std::vector<StageCorePluginInterface::VCaptureFileReport> Reports() const { return m_Rig.m_pTargets->Reports(); }
  std::string CreateError() const { return "Could not create capture file: \"" + m_Rig.Path() + "\""; }
  std::string WriteError() const { return "Failed attempting to write data to file \"" + m_Rig.Path() + "\""; }
  VFakeFile& File( const std::string& i_rExtension = "tvid" ) { return ( *m_Rig.m_pDisk )[m_Rig.Path( "Take", i_rExtension )]; }
  void UseTwoContainers() { m_Rig.m_pTargets->m_Containers = { KVZ::IVideoContainer::EMOV, KVZ::IVideoContainer::ETVID }; }

  VVideoRig m_Rig;
  std::shared_ptr<VTestVideoSource> m_pSource = m_Rig.Make();
};

TEST_F( BufferClient, WritesTheRangeAndSaysWhatAReaderNeeds )
{
  const TestSupport::VLogCapture Log( "VideoInputDataSource" );
  Start( 3, 4, 14 );
  EXPECT_TRUE( m_Rig.m_pDisk->empty() ) << "the writing thread makes the files";
  Write();
  EXPECT_EQ( File().m_Frames.size(), 6u );
  m_Rig.DeliverMany( 10 );
  Write();
  const VFakeFile& rFile = File();
  ASSERT_EQ( rFile.m_Frames.size(), 10u );
  for( size_t Index = 0; Index < rFile.m_Frames.size(); ++Index )
  {
    EXPECT_EQ( rFile.m_Frames.at( Index ), std::vector<uint8_t>( 64, static_cast<uint8_t>( Index + 4 ) ) );
    ASSERT_EQ( rFile.m_Sound.at( Index ).size(), 160u );
    EXPECT_EQ( rFile.m_Sound.at( Index )[7], Index + 4 + 7 );
  }
  SyncSystem::VToken Token{ KVZ::VBufferSessionId( 1 ), 5, nullptr };
  SyncSystem::VRefCountedToken Frame;
  ASSERT_TRUE( m_pSource->Buffer()->Read( Token, Frame ) );
  EXPECT_EQ( rFile.m_Addresses.at( 0 ), VVideoInputDataSource::FrameOf( Frame.Frame() )->Image() ) << "handed on without a copy";
  EXPECT_EQ( rFile.m_Closes, 1 );
  EXPECT_EQ( rFile.m_Timing, ( KVZ::VTimingRecord{ 135000000, 5400000, At( 4 ).Count() } ) );
  EXPECT_EQ( KVZ::ToText( rFile.m_Timecode ), "10:00:00:04" );
  EXPECT_EQ( rFile.m_Audio.m_Channels, 4u );
  EXPECT_EQ( rFile.m_CaptureName, "Take" );
  EXPECT_EQ( rFile.m_Camera, ( KVZ::VCameraHardwareRecord{ "vi:0", "TestDriver", "Test Card (1)", 8, 4, 0.0 } ) );
  EXPECT_EQ( rFile.m_Conversion, ( std::vector<KVZ::VConversionRecord>{ { "TVID", "Uncompressed", "Uncompressed", "U8Y8V8Y8" } } ) );
  EXPECT_TRUE( Log.Has( "Writing file with start timecode = 10:0:0:4 . 0" ) );
  EXPECT_TRUE( Log.Has( "Client 1 finished writing 0.4 seconds of data." ) );

  ASSERT_EQ( Reports().size(), 1u );
  const auto Report = Reports()[0];
  EXPECT_EQ( Report.m_Path, m_Rig.Path() );
  EXPECT_EQ( Report.m_CaptureSessionId, KVZ::VCaptureSessionId( 3 ) );
  EXPECT_EQ( Report.m_DeviceURN, "vi:0" );
  EXPECT_EQ( Report.m_FramesWritten, 10u );
  EXPECT_FALSE( Report.m_bFailed );
  EXPECT_EQ( Report.m_StartTick, At( 4 ) );
  EXPECT_EQ( Report.m_Period, Period );
  EXPECT_EQ( KVZ::ToText( Report.m_StartTimecode ), "10:00:00:04" );
  EXPECT_EQ( Status().m_State, ECaptureState::Complete );
  EXPECT_EQ( Status().m_Failure, ECaptureFailure::None );
}

TEST_F( BufferClient, KeepsTheChannelsThatTheTargetAsksFor )
{
  m_Rig.m_pTargets->m_Target.m_AudioChannels = 3;
  Start( 1, 2, 4 );
  Write();
  EXPECT_EQ( File().m_Audio.m_Channels, 3u );
  std::vector<uint8_t> Expected;
  for( int Sample = 0; Sample < 20; ++Sample )
  {
    for( int Byte = 0; Byte < 6; ++Byte )
    {
      Expected.push_back( static_cast<uint8_t>( 2 + Sample * 8 + Byte ) );
    }
  }
  EXPECT_EQ( File().m_Sound.at( 0 ), Expected );

  m_Rig.m_pTargets->m_Target.m_AudioChannels = 0;
  m_Rig.m_pDisk->clear();
  Start( 2, 2, 4 );
  Write();
  EXPECT_EQ( File().m_Audio, KVZ::AudioFrameInfo() );
  EXPECT_EQ( File().m_AudioPayload, KVZ::IAudioPayload::ENone );
  EXPECT_TRUE( File().m_Sound.at( 0 ).empty() );
}

TEST_F( BufferClient, OneFileThatFailsEndsTheClientAndClosesTheOther )
{
  UseTwoContainers();
  const TestSupport::VLogCapture Log( "VideoInputDataSource", 2 );
  uint32_t Id = 0;
  for( const auto& [FailingCall, Frames, OthersFrames, Error] :
    { std::tuple( 0u, 0u, 0u, CreateError() ), std::tuple( 2u + 3u, 3u, 4u, WriteError() ) } )   // cannot be made; its fourth frame
  {
    SCOPED_TRACE( Error );
    m_Rig.m_pDisk->clear();
    File( "tvid" ).m_FailingCall = FailingCall;
    Start( ++Id, 0, 8 );
    Write();
    EXPECT_EQ( File( "mov" ).m_Frames.size(), OthersFrames );
    EXPECT_EQ( File( "mov" ).m_Closes, 1 );
    EXPECT_EQ( File( "tvid" ).m_Frames.size(), Frames );
    EXPECT_FALSE( File( "tvid" ).m_bOpen ) << "playable up to there";
    ExpectFailed( Error );
    ASSERT_EQ( Reports().size(), 2 * Id );
    EXPECT_FALSE( Reports()[2 * Id - 2].m_bFailed );
    EXPECT_EQ( Reports()[2 * Id - 2].m_FramesWritten, OthersFrames );
    EXPECT_TRUE( Reports().back().m_bFailed );
    EXPECT_EQ( Reports().back().m_FramesWritten, Frames );
  }
  EXPECT_TRUE( Log.Has( "Error writing capture file with container format 'TVID'." ) );
}

// Wherever the writer fails, or memory runs out beside it, the capture says so once and nothing stays open.
TEST_F( BufferClient, AFailureAnywhereIsTold )
{
  const uint64_t AtClose = VFakeFile::Never;
  const struct
  {
    uint64_t m_FailingCall;
    uint64_t m_FramesWritten;
    std::string m_Error;
    bool m_bThrows = false;
  } Cases[] = { { 0, 0, CreateError() }, { 1, 0, WriteError() }, { 2, 0, WriteError() }, { 3, 1, WriteError() }, { 4, 2, WriteError() },
    { 5, 3, WriteError() }, { AtClose, 3, WriteError() }, { 3, 1, "A frame could not be prepared for its files: std::bad_alloc", true } };
  for( uint32_t Id = 1; const auto& rCase : Cases )
  {
    SCOPED_TRACE( Id );
    m_Rig.m_pDisk->clear();
    File().m_FailingCall = rCase.m_FailingCall;
    File().m_bThrows = rCase.m_bThrows;
    File().m_bCloseFails = rCase.m_FailingCall == AtClose;
    File().m_IncompleteFrames = rCase.m_FailingCall == AtClose ? 1 : 0;   // the last of four is not whole
    Start( Id, 0, 4 );
    Write();
    ExpectFailed( rCase.m_Error );
    EXPECT_FALSE( File().m_bOpen );
    EXPECT_EQ( File().m_Closes, rCase.m_FailingCall == 0 ? 0 : 1 );
    ASSERT_EQ( Reports().size(), Id++ );
    EXPECT_TRUE( Reports().back().m_bFailed );
    EXPECT_EQ( Reports().back().m_Error, rCase.m_Error );
    EXPECT_EQ( Reports().back().m_FramesWritten, rCase.m_FramesWritten );
  }
}

TEST_F( BufferClient, AnotherFormatInMidCaptureEndsItAndNamesBoth )
{
  Start( 1, 5, 40 );
  m_Rig.m_Format.m_Width = 16;
  m_Rig.m_Format.m_PixelFormat = KVZ::IPixelFormat::ER8G8B8;
  m_Rig.DeliverMany( 3 );
  Write();
  EXPECT_EQ( File().m_Frames.size(), 5u );
  EXPECT_EQ( File().m_Closes, 1 );
  EXPECT_EQ( Status().m_Failure, ECaptureFailure::ReportedErrors );
  EXPECT_EQ( Status().m_Errors,
    std::vector<std::string>{ WriteError() +
      ": the format of the frames changed from 8 x 4 U8Y8V8Y8, 4 channels of Int16 at 48000 Hz to 16 x 4 R8G8B8, 4 channels of Int16 at 48000 Hz" } );

  m_Rig.OnStrand( *m_pSource, [&] { m_pSource->EndCapture( VTick::Open() ); } );
  m_Rig.m_Format = {};
  m_Rig.DeliverMany( 2 );
  Start( 2, 13, 30, "Second" );
  m_Rig.m_Format.m_Audio = {};
  m_Rig.DeliverMany( 1 );
  Write();
  ASSERT_EQ( Status().m_Errors.size(), 1u );
  EXPECT_NE( Status().m_Errors[0].find( "to 8 x 4 U8Y8V8Y8 without audio" ), std::string::npos ) << Status().m_Errors[0];
}

TEST_F( BufferClient, ACancelledCaptureKeepsWhatItHasWrittenIfAnything )
{
  const TestSupport::VLogCapture Log( "VideoInputDataSource" );
  Start( 1, 20, 30 );
  m_Rig.Cancel( *m_pSource );
  Write();
  EXPECT_EQ( Log.Texts(), ( std::vector<std::string>{ "Client 1 cancelled after writing 0 seconds of data." } ) );
  EXPECT_EQ( Status().m_State, ECaptureState::Cancelled );
  EXPECT_EQ( Status().m_Start, VTick::Open() );
  EXPECT_TRUE( m_Rig.m_pDisk->empty() );
  EXPECT_TRUE( Reports().empty() );

  Start( 2, 0, 30 );
  Write();
  m_Rig.Cancel( *m_pSource );
  EXPECT_EQ( Status().m_State, ECaptureState::Cancelling );
  m_Rig.DeliverMany( 2 );
  Write();
  EXPECT_TRUE( Log.Has( "Client 2 cancelled after writing 0.4 seconds of data." ) );
  EXPECT_EQ( Status().m_State, ECaptureState::Cancelled );
  EXPECT_EQ( Status().m_Failure, ECaptureFailure::Cancelled );
  EXPECT_EQ( Status().m_CapturedDuration, Period * 10 ) << "what there was when it was cancelled";
  EXPECT_EQ( File().m_Frames.size(), 10u );
  EXPECT_EQ( File().m_Closes, 1 );
  EXPECT_EQ( Reports().at( 0 ).m_FramesWritten, 10u );
}

TEST_F( BufferClient, TargetsThatCannotBeHadAreTold )
{
  UseTwoContainers();
  m_Rig.m_pTargets->m_RefusedContainer = KVZ::IVideoContainer::EMOV;
  Start( 1, 0, 4 );
  Write();
  EXPECT_EQ( File( "tvid" ).m_Frames.size(), 4u ) << "the other one is written";
  EXPECT_EQ( Status().m_Errors, ( std::vector<std::string>{ "Failed to get capture target for video capture device 'Test Card (1)'." } ) );
  EXPECT_EQ( Status().m_Failure, ECaptureFailure::ReportedErrors );

  m_Rig.m_pTargets->m_Containers = { KVZ::IVideoContainer::ETVID, KVZ::IVideoContainer::EAVI };
  const TestSupport::VLogCapture Log( "VideoInputDataSource", 2 );
  Start( 2, 0, 4, "Second" );
  Write();
  EXPECT_TRUE( Log.Has( "Unsupported video container format for capture." ) );
  EXPECT_EQ( Status().m_State, ECaptureState::Idle );
  EXPECT_EQ( Status().m_Failure, ECaptureFailure::ReportedErrors );
  EXPECT_EQ( Reports().size(), 1u );

  m_Rig.m_pTargets->m_Containers = { KVZ::IVideoContainer::ETVID };
  Start( 2, 0, 4, "Second" );
  Write();
  EXPECT_EQ( Status().m_Failure, ECaptureFailure::None ) << "another try prepares anew";
  EXPECT_EQ( Reports().size(), 2u );
}

}
