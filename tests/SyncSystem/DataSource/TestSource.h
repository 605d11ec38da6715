// A data source whose frames a test delivers by hand, and what is needed around it: memory, a strand that runs when told, a global session.
#pragma once

#include "SyncSystem/DataSource.h"

#include "tests/support/FrameMemory.h"
#include "tests/support/ManualPostalService.h"

#include <gtest/gtest.h>

#include <memory>
#include <string>
#include <vector>

using KVZ::IClock;
using KVZ::VTick;

constexpr VTick Period( 5400000 );   // 25 frames a second
constexpr int32_t Timecode25Index = 3;

class VTestSource : public SyncSystem::VDataSource
{
public:
  explicit VTestSource( const SyncSystem::VDataSourceSettings& i_rSettings ) : VDataSource( i_rSettings ) {}

  // Delivers the frame of the next index. Its payload holds the index.
  bool Add()
  {
    const int64_t Index = m_NextIndex++;
    SyncSystem::VIncomingFrame Frame;
    Frame.m_Clocks.Set( IClock( IClock::FrameNumber, 0, SourceId() ), Period * Index );
    if( m_Timecode.IsValid() )
    {
      Frame.m_Clocks.Set( IClock( IClock::Timecode, Timecode25Index, 0 ), m_Timecode );
      m_Timecode += Period;
    }
    Frame.m_Period = Period;
    Frame.m_BeatPeriod = m_BeatPeriod;
    Frame.m_Now = m_Now == 0.0 ? 0.0 : m_Now + static_cast<double>( Index ) * Period.Seconds();
    return AddFrame( Frame, sizeof( TestSupport::VNumberedPayload ),
      [Index]( void* o_pPayload )
      {
        new( o_pPayload ) TestSupport::VNumberedPayload( Index );
        return true;
      } );
  }
  void AddMany( int i_Count )
  {
    for( int Count = 0; Count < i_Count; ++Count )
    {
      ASSERT_TRUE( Add() );
    }
  }
  // The card misses frames.
  void Miss( int64_t i_Frames ) { m_NextIndex += i_Frames; }

  IClock CounterClock() const { return IClock( IClock::CounterFromSessionStart, 0, SourceId() ); }
  using VDataSource::PostToStrand;

  int64_t m_NextIndex = 0;
  VTick m_Timecode = VTick::Invalid();   // of the next frame
  VTick m_BeatPeriod;
  double m_Now = 0.0;   // of frame 0

  // What the hooks have seen
  std::vector<uint32_t> m_Begun;
  std::vector<VTick> m_Ends;
  std::vector<bool> m_Busy;

protected:
  bool BeginCapture( const KVZ::ICaptureHeader& i_rHeader, const std::shared_ptr<const SyncSystem::VGlobalSyncSessionInfo>&, uint32_t,
    std::vector<SyncSystem::VCaptureError>& ) override
  {
    m_Begun.push_back( i_rHeader.m_CaptureSessionId.Value() );
    return true;
  }
  void OnCaptureEndChanged( KVZ::VCaptureSessionId, const IClock& i_rCounter, const KVZ::ITickInClocks& i_rEnd ) override
  {
    m_Ends.push_back( i_rEnd.Find( i_rCounter ) );
  }
  void OnBusyChanged( bool i_bBusy ) override { m_Busy.push_back( i_bBusy ); }
};

inline int64_t IndexOf( const SyncSystem::VRefCountedToken& i_rFrame ) { return TestSupport::NumberedPayload( i_rFrame.Frame() ).m_Number; }

inline SyncSystem::VDataSourceSettings SourceSettings( const TestSupport::VFrameMemory& i_rMemory, std::shared_ptr<KVZ::IPostalService> i_pService )
{
  SyncSystem::VDataSourceSettings Settings;
  Settings.m_Name = "Test";
  Settings.m_pAllocator = i_rMemory.m_pAllocator;
  Settings.m_DeleteFrame = &TestSupport::VNumberedCaptureBuffer::DestroyPayload;
  Settings.m_pPostalService = std::move( i_pService );
  Settings.m_NoticeSeconds = 0.5;
  return Settings;
}

// One source with memory for a number of frames, on a strand that runs when the test says so.
class VSourceRig
{
public:
  explicit VSourceRig( size_t i_Frames = 200 ) : m_Memory( i_Frames / 4, 4 )
  {
    m_pSource = KVZ::MakeShared<VTestSource>( SourceSettings( m_Memory, m_pService ) );
    m_pSource->OnRequestNewGlobalSyncSession().Set( [this]( KVZ::VGlobalSyncSessionId i_Id ) { m_Requests.push_back( i_Id.Value() ); } );
  }

  // Calls the source from its own strand, where it answers in place.
  template<class TFunction>
  void OnStrand( TFunction i_Function )
  {
    bool bRan = false;
    m_pSource->PostToStrand(
      [&]
      {
        i_Function();
        bRan = true;
      } );
    m_pService->RunAll();
    ASSERT_TRUE( bRan );
  }

  boost::optional<KVZ::ISourceSyncSession> Declare( uint32_t i_Id )
  {
    boost::optional<KVZ::ISourceSyncSession> Session;
    OnStrand( [&] { Session = m_pSource->DeclareGlobalSyncSession( KVZ::VGlobalSyncSessionId( i_Id ), nullptr ); } );
    return Session;
  }

  // The readings of all clocks at a global tick, for a counter that reads 0 at another.
  KVZ::ITickInClocks ReadingsAt( const KVZ::ISourceSyncSession& i_rSession, VTick i_CounterStart, VTick i_Global ) const
  {
    KVZ::ITickInClocks Ticks = KVZ::Shifted( i_rSession.m_StartTime, i_Global - i_CounterStart );
    Ticks.Set( IClock( IClock::GlobalTime, 0, 0 ), i_Global );
    return Ticks;
  }

  // Declares and starts: the source's counter reads 0 at one global tick, and readers begin at the other.
  void Join( uint32_t i_Id, VTick i_CounterStart, VTick i_LiveStart )
  {
    const auto Session = Declare( i_Id );
    ASSERT_TRUE( Session );
    m_pSource->StartGlobalSyncSession( ReadingsAt( *Session, i_CounterStart, i_LiveStart ), VTick() );
    m_pService->RunAll();
  }
  void Join( uint32_t i_Id, VTick i_CounterStart ) { Join( i_Id, i_CounterStart, i_CounterStart ); }

  KVZ::ISourceTemporal::ISourceSyncStatus SyncStatus()
  {
    KVZ::ISourceTemporal::ISourceSyncStatus Status;
    OnStrand( [&] { Status = m_pSource->GetSourceSyncStatus(); } );
    return Status;
  }

  TestSupport::VFrameMemory m_Memory;
  std::shared_ptr<TestSupport::VManualPostalService> m_pService = std::make_shared<TestSupport::VManualPostalService>();
  std::shared_ptr<VTestSource> m_pSource;
  std::vector<uint32_t> m_Requests;
};
