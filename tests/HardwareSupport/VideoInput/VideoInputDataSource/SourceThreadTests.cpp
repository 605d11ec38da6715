// Everybody at work at once: a device that misses frames, a live reader, an engine that joins and captures, the writing threads, and who asks
// for the status.
#include "tests/HardwareSupport/VideoInput/VideoInputDataSource/VideoRig.h"

#include <atomic>
#include <thread>

namespace
{

using SyncSystem::ECaptureState;

// A device, a live reader, an engine that takes one capture after another, and each capture's writing thread.
class VBusySource
{
public:
  explicit VBusySource( VVideoRig& io_rRig ) : m_rRig( io_rRig )
  {
    m_rRig.m_bThreads = true;
    m_pSource = m_rRig.Make();
    m_rRig.m_pTime->m_Now = 5.0;
  }

  void Deliver()
  {
    while( !m_bCaptured )
    {
      if( m_Delivered - m_AtCapture < FramesAhead && m_rRig.Deliver() && ++m_Delivered % 400 == 0 )
      {
        m_rRig.m_NextIndex += 2;
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

  void AskForStatus()
  {
    while( !m_bCaptured )
    {
      m_pSource->GetSourceTimingInfo();
      m_pSource->GetOldestGlobalSyncSession();
      m_pSource->GetCaptureStatus();
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
    std::thread Status( [&] { Busy.AskForStatus(); } );
    Busy.Capture( 40 );
    Device.join();
    Reader.join();
    Status.join();
    EXPECT_TRUE( Busy.m_bLiveWhole );
    Rig.m_pSource.reset();
  }
  size_t Whole = 0;
  for( const auto& [Path, rFile] : *Rig.m_pDisk )
  {
    EXPECT_EQ( rFile.m_Closes, 1 ) << Path;
    for( size_t Index = 1; Index < rFile.m_Frames.size(); ++Index )
    {
      ASSERT_EQ( rFile.m_Frames.at( Index ), std::vector<uint8_t>( 64, static_cast<uint8_t>( rFile.m_Frames.at( 0 )[0] + Index ) ) ) << Path;
    }
    Whole += rFile.m_Frames.size() == 12 ? 1 : 0;
  }
  EXPECT_GE( Whole, 15u ) << "half of them are neither cancelled nor ended by hand";
  EXPECT_EQ( Rig.m_pTargets->Reports().size(), Rig.m_pDisk->size() );
}

}
