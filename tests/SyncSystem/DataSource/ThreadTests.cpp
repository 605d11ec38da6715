// Everybody at once: a device, a live reader, an engine that joins and captures, a client that reads captures, and who asks for the status.
#include "tests/SyncSystem/DataSource/TestSource.h"

#include "NotificationSystem/AsioPostalService.h"

#include <atomic>
#include <future>
#include <thread>

namespace
{

using SyncSystem::EClientResult;

constexpr int Frames = 1500;
constexpr int MaxFrames = 10000000;   // where the others have not had their turns

struct VCrowd
{
  explicit VCrowd( std::shared_ptr<VTestSource> i_pSource ) : m_pSource( std::move( i_pSource ) ) {}

  void Deliver()
  {
    for( int Count = 0; Count < Frames || ( Count < MaxFrames && ( m_Captures < 5 || m_Reads < 50 ) ); ++Count )
    {
      if( Count % 400 == 399 )
      {
        m_pSource->Miss( 2 );
      }
      m_pSource->Add();
      std::this_thread::yield();
    }
    m_bDelivered = true;
  }

  void ReadLive()
  {
    SyncSystem::VReadFrames Read;
    int64_t Last = -1;
    KVZ::VGlobalSyncSessionId Session;
    while( !m_bDelivered )
    {
      if( m_pSource->ReadFramesOrSleep( 10, 1, Read ) != SyncSystem::EReadResult::Frames )
      {
        std::this_thread::yield();
        continue;
      }
      for( const auto& rFrame : Read.m_Frames )
      {
        m_bInOrder = m_bInOrder && ( rFrame.m_GlobalSession != Session || IndexOf( rFrame.m_Frame ) > Last );
        Session = rFrame.m_GlobalSession;
        Last = IndexOf( rFrame.m_Frame );
      }
      ++m_Reads;
    }
  }

  void Engine()
  {
    uint32_t Id = 0;
    while( !m_bDelivered )
    {
      const auto Session = m_pSource->DeclareGlobalSyncSession( KVZ::VGlobalSyncSessionId( ++Id ), nullptr );
      if( !Session )
      {
        continue;
      }
      const VTick Now = Period * static_cast<int64_t>( m_pSource->GetSourceSyncStatus().m_LatestCounterFrames );
      KVZ::ITickInClocks Ticks = KVZ::Shifted( Session->m_StartTime, Now );
      Ticks.Set( IClock( IClock::GlobalTime, 0, 0 ), Now );
      m_pSource->StartGlobalSyncSession( Ticks, VTick() );
      const KVZ::ICaptureHeader Header{ KVZ::VCaptureSessionId( Id ), "Take", 0, KVZ::VGlobalSyncSessionId( Id ) };
      if( m_pSource->StartCapture( Header, Now - Period * 3, Id % 3 == 0 ? VTick::Open() : Now + Period * 20, false, 0 ) )
      {
        Watch( Id );
      }
    }
  }

  void Watch( uint32_t i_Id )
  {
    for( uint32_t State = 0; ( State & SyncSystem::ECaptureState::NothingToProtect ) == 0 && !m_bDelivered; std::this_thread::yield() )
    {
      State = m_pSource->GetCaptureStatus().m_State;
      if( i_Id % 3 == 0 )
      {
        m_pSource->EndCapture( VTick::Open() );
      }
      else if( i_Id % 5 == 0 )
      {
        m_pSource->CancelCapture();
      }
    }
    ++m_Captures;
  }

  // A client on a thread of its own, woken by the buffer.
  void Client()
  {
    SyncSystem::VRefCountedToken Frame;
    SyncSystem::VClientRead Read;
    int64_t Last = -1;
    KVZ::VCaptureSessionId Capture;
    for( bool bMore = true; bMore; )
    {
      if( !m_pSource->Buffer()->ClientNextFrame( m_ClientId, Frame, Read ) )
      {
        return;
      }
      if( Frame )
      {
        const int64_t Index = IndexOf( Frame );
        m_bWhole = m_bWhole && ( Read.m_CaptureSessionId != Capture || Index == Last + 1 );
        Last = Index;
        Capture = Read.m_CaptureSessionId;
      }
      bMore = Read.m_Result == EClientResult::MoreToCome || Read.m_Result == EClientResult::Finished;
    }
  }

  const std::shared_ptr<VTestSource> m_pSource;
  uint32_t m_ClientId = 0;
  std::atomic<bool> m_bDelivered{ false };
  std::atomic<bool> m_bInOrder{ true };
  std::atomic<bool> m_bWhole{ true };
  std::atomic<int> m_Reads{ 0 };
  std::atomic<int> m_Captures{ 0 };
};

TEST( DataSourceThreads, FramesStayWholeAndInOrder )
{
  TestSupport::VFrameMemory Memory( 60, 4 );
  SyncSystem::VDataSourceSettings Settings;
  Settings.m_Name = "Crowd";
  Settings.m_pAllocator = Memory.m_pAllocator;
  Settings.m_DeleteFrame = &TestSupport::VNumberedCaptureBuffer::DestroyPayload;
  Settings.m_pPostalService = std::make_shared<NotificationSystem::VAsioPostalService>( "Strand" );
  const auto pSource = KVZ::MakeShared<VTestSource>( Settings );
  pSource->m_Now = 1.0;
  VCrowd Crowd( pSource );
  std::atomic<uint64_t> Wakes{ 0 };
  pSource->OnNewFrames().Set( [&]( uint64_t ) { ++Wakes; } );
  {
    NotificationSystem::VAsioPostalService ClientService( "Client" );
    Crowd.m_ClientId = pSource->Buffer()->RegisterClient( [&] { ClientService.Post( [&] { Crowd.Client(); } ); } );
    std::thread Engine( [&] { Crowd.Engine(); } );
    std::thread Reader( [&] { Crowd.ReadLive(); } );
    std::thread Device( [&] { Crowd.Deliver(); } );
    std::thread Status(
      [&]
      {
        while( !Crowd.m_bDelivered )
        {
          pSource->GetSourceTimingInfo();
          pSource->GetOldestGlobalSyncSession();
          pSource->GetCaptureStatus();
        }
      } );
    for( std::thread* pThread : { &Engine, &Reader, &Device, &Status } )
    {
      pThread->join();
    }
    pSource->Buffer()->UnregisterClient( Crowd.m_ClientId );
  }
  EXPECT_TRUE( Crowd.m_bInOrder );
  EXPECT_TRUE( Crowd.m_bWhole );
  EXPECT_GT( Crowd.m_Reads, 0 );
  EXPECT_GT( Crowd.m_Captures, 0 );
}

}
