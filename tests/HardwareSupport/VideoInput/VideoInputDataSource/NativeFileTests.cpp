// Captures into real files, read back by an independent reader; and everybody at work at once.
#include "FileIO/TarvoVideo/Writer.h"
#include "NotificationSystem/AsioPostalService.h"

#include "tests/HardwareSupport/VideoInput/VideoInputDataSource/VideoRig.h"
#include "tests/support/FailingStream.h"
#include "tests/support/TvidParser.h"

#include <atomic>
#include <thread>

namespace
{

using SyncSystem::ECaptureState;

VideoInputHAL::VVideoInputDataSourceOptions WithNativeWriter( const WriterSupport::VStreamMaker& i_rStreamMaker = WriterSupport::MakeFile )
{
  auto pFactory = std::make_shared<KVZ::VVideoWriterFactory>();
  pFactory->Register( KVZ::IVideoContainer::ETVID,
    [i_rStreamMaker]( auto, std::shared_ptr<VideoEncoding::VVideoFrameEncoder> i_pEncoder )
    { return std::make_shared<TarvoVideo::VWriter>( std::move( i_pEncoder ), i_rStreamMaker ); } );
  VideoInputHAL::VVideoInputDataSourceOptions Options;
  Options.m_pWriterFactory = pFactory;
  return Options;
}

void Record( VVideoRig& io_rRig, VTestVideoSource& io_rSource, int64_t i_First, int64_t i_End )
{
  io_rRig.DeliverMany( 10 );
  io_rRig.Join( io_rSource, 1 );
  const KVZ::ICaptureHeader Header{ KVZ::VCaptureSessionId( 1 ), "Take", 0, KVZ::VGlobalSyncSessionId( 1 ) };
  io_rRig.OnStrand( io_rSource, [&] { EXPECT_TRUE( io_rSource.StartCapture( Header, At( i_First ), At( i_End ), false, 0 ) ); } );
  io_rRig.m_pWriterService->RunAll();
}

void ExpectFrames( const std::string& i_rPath, size_t i_Count, int64_t i_First )
{
  TestSupport::VTvidParser File( i_rPath );
  ASSERT_EQ( File.Frames().size(), i_Count );
  for( size_t Index = 0; Index < i_Count; ++Index )
  {
    EXPECT_EQ( File.Video( File.Frames()[Index] ), std::vector<uint8_t>( 64, static_cast<uint8_t>( static_cast<int64_t>( Index ) + i_First ) ) );
  }
}

TEST( NativeFile, HoldsTheRange )
{
  VVideoRig Rig;
  const auto pSource = Rig.Make<VTestVideoSource>( WithNativeWriter() );
  Record( Rig, *pSource, 2, 9 );
  ExpectFrames( Rig.Path(), 7, 2 );
  TestSupport::VTvidParser File( Rig.Path() );
  EXPECT_TRUE( File.IsFinished() );
  EXPECT_EQ( File.Number( "StartOffsetInTicks" ), At( 2 ).Count() );
  EXPECT_EQ( File.Number( "FramePeriodInTicks" ), Period.Count() );
  EXPECT_EQ( File.Text( "CameraHardware.DeviceURN" ), "vi:0" );
  EXPECT_EQ( File.Text( "Capture.Name" ), "Take" );
  const auto Report = Rig.m_pTargets->Reports().at( 0 );
  EXPECT_EQ( Report.m_Bytes, File.FileSize() );
  EXPECT_EQ( Report.m_FramesWritten, 7u );
}

TEST( NativeFile, OnAFullDiskStaysReadableUpToThere )
{
  VVideoRig Whole;
  const auto pWholeSource = Whole.Make<VTestVideoSource>( WithNativeWriter() );
  Record( Whole, *pWholeSource, 0, 10 );
  // In the picture of the fourth frame.
  const TestSupport::VFault Full{ .m_Offset = TestSupport::VTvidParser( Whole.Path() ).Frames().at( 3 ).m_VideoPosition + 10 };

  VVideoRig Rig;
  const auto FullDisk = [Full]( const std::string& i_rPath ) -> std::unique_ptr<UtilsIO::IClosableStream>
  { return std::make_unique<TestSupport::VFailingStream>( WriterSupport::MakeFile( i_rPath ), Full ); };
  const auto pSource = Rig.Make<VTestVideoSource>( WithNativeWriter( FullDisk ) );
  Record( Rig, *pSource, 0, 10 );
  const auto Status = pSource->GetCaptureStatus();
  EXPECT_EQ( Status.m_State, ECaptureState::Complete );
  EXPECT_EQ( Status.m_Errors, ( std::vector<std::string>{ "Failed attempting to write data to file \"" + Rig.Path() + "\"" } ) );
  const auto Report = Rig.m_pTargets->Reports().at( 0 );
  EXPECT_TRUE( Report.m_bFailed );
  EXPECT_EQ( Report.m_FramesWritten, 3u );
  EXPECT_EQ( Report.m_Bytes, Full.m_Offset );
  ExpectFrames( Rig.Path(), 3, 0 );
}

// A device, a live reader, an engine that takes one capture after another, and each capture's writing thread.
class VBusySource
{
public:
  explicit VBusySource( VVideoRig& io_rRig ) : m_rRig( io_rRig )
  {
    VideoInputHAL::VVideoInputDataSourceOptions Options;
    auto pFactory = std::make_shared<KVZ::VVideoWriterFactory>();
    pFactory->Register( KVZ::IVideoContainer::ETVID, [pDisk = m_rRig.m_pDisk]( auto, auto ) { return std::make_shared<VFakeWriter>( pDisk ); } );
    Options.m_pWriterFactory = pFactory;
    m_rRig.m_pFrames = std::make_shared<VideoInputHAL::VVideoInputDataSourceAllocator>( m_rRig.m_Memory.m_pAllocator );
    m_pSource = KVZ::MakeShared<VTestVideoSource>( nullptr, m_rRig.m_pDevice, m_rRig.m_pFrames, nullptr, nullptr, m_rRig.m_pTargets, m_rRig.m_pTime,
      Options );
    m_rRig.m_pSource = m_pSource;
    m_rRig.m_pTime->m_Now = 5.0;
  }

  void Deliver()
  {
    while( !m_bCaptured )
    {
      if( m_Delivered - m_AtCapture < FramesAhead && m_rRig.Deliver() )
      {
        ++m_Delivered;
      }
      std::this_thread::yield();
    }
  }

  void ReadLive()
  {
    SyncSystem::VReadFrames Read;
    while( !m_bCaptured )
    {
      if( m_pSource->GetFrames( 1, Read ) != SyncSystem::EReadResult::Frames )
      {
        std::this_thread::yield();
        continue;
      }
      for( const auto& rFrame : Read.m_Frames )
      {
        const auto* pFrame = VVideoInputDataSource::FrameOf( rFrame.m_Frame.Frame() );
        m_bLiveWhole = m_bLiveWhole && pFrame->Image()[0] == pFrame->Image()[pFrame->m_ImageBytes - 1];
      }
    }
  }

  // One of four captures is cancelled, one ended by hand.
  void Capture( uint32_t i_Captures )
  {
    for( uint32_t Id = 1; Id <= i_Captures; )
    {
      const auto Session = m_pSource->DeclareGlobalSyncSession( KVZ::VGlobalSyncSessionId( ++m_Session ), nullptr );
      if( !Session )
      {
        continue;
      }
      m_AtCapture = m_Delivered.load();
      const VTick Now = Period * static_cast<int64_t>( m_pSource->GetSourceSyncStatus().m_LatestCounterFrames );
      m_AtCapture = m_Delivered.load();   // once more: the frames that the capture asks for must still come
      KVZ::ITickInClocks Ticks = KVZ::Shifted( Session->m_StartTime, Now );
      Ticks.Set( IClock( IClock::GlobalTime, 0, 0 ), Now );
      m_pSource->StartGlobalSyncSession( Ticks, VTick() );
      const KVZ::ICaptureHeader Header{ KVZ::VCaptureSessionId( Id ), "Take" + std::to_string( Id ), 0, KVZ::VGlobalSyncSessionId( m_Session ) };
      EXPECT_TRUE( m_pSource->StartCapture( Header, Now - Period * 2, Now + Period * 10, false, 0 ) );
      Watch( Id++ );
    }
    m_bCaptured = true;
  }

  void Watch( uint32_t i_Id )
  {
    while( ( m_pSource->GetCaptureStatus().m_State & SyncSystem::ECaptureState::NothingToProtect & ~ECaptureState::WaitingForStart ) == 0 )
    {
      if( i_Id % 4 == 0 )
      {
        m_pSource->CancelCapture();
      }
      else if( i_Id % 4 == 1 )
      {
        m_pSource->EndCapture( VTick::Open() );
      }
      std::this_thread::yield();
    }
  }

  static constexpr uint64_t FramesAhead = 60;   // of the capture's beginning: what it asks for is always in memory

  VVideoRig& m_rRig;
  std::shared_ptr<VTestVideoSource> m_pSource;
  std::atomic<bool> m_bCaptured{ false };
  std::atomic<bool> m_bLiveWhole{ true };
  std::atomic<uint64_t> m_Delivered{ 0 };
  std::atomic<uint64_t> m_AtCapture{ 0 };
  uint32_t m_Session = 0;
};

TEST( VideoInputDataSourceThreads, EveryFileHoldsAnUnbrokenRun )
{
  VVideoRig Rig( 240 );
  {
    VBusySource Busy( Rig );
    std::thread Device( [&] { Busy.Deliver(); } );
    std::thread Reader( [&] { Busy.ReadLive(); } );
    Busy.Capture( 40 );
    Device.join();
    Reader.join();
    EXPECT_TRUE( Busy.m_bLiveWhole );
    Rig.m_pSource.reset();
  }
  size_t Whole = 0;
  for( const auto& [Path, rFile] : *Rig.m_pDisk )
  {
    EXPECT_EQ( rFile.m_Closes, 1 ) << Path;
    for( size_t Index = 1; Index < rFile.m_Frames.size(); ++Index )
    {
      ASSERT_EQ( rFile.m_Frames[Index], std::vector<uint8_t>( 64, static_cast<uint8_t>( rFile.m_Frames[0][0] + Index ) ) ) << Path;
    }
    Whole += rFile.m_Frames.size() == 12 ? 1 : 0;
  }
  EXPECT_GE( Whole, 15u ) << "half of them are neither cancelled nor ended by hand";
  EXPECT_EQ( Rig.m_pTargets->Reports().size(), Rig.m_pDisk->size() );
}

}
