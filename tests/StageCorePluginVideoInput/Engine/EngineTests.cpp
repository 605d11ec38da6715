// The engine between a host that listens and virtual cards that are stepped by hand. The thread that steps is the vendor's thread.
#include "StageCorePluginVideoInput/VideoInputEngine.h"

#include "HardwareSupport/VideoInput/VideoInputHAL/DeviceStatusSchema.h"
#include "StageCoreDataStoreTypes/DeviceSchemas.h"
#include "tests/StageCorePluginVideoInput/Engine/ListeningHost.h"
#include "tests/support/CardFixture.h"
#include "tests/support/FakeFlowServices.h"
#include "tests/support/LogCapture.h"
#include "tests/support/Threads.h"

#include <atomic>
#include <future>
#include <stdexcept>

namespace
{

using TestSupport::WaitUntil;
using EStatus = VideoInputHAL::IVideoInputDevice::EStatus;
using VTexts = std::vector<std::string>;

class VideoInputEngine : public VCardsFixture
{
protected:
  // Loaded before anybody looks for the vendor's library, which is then this one: it has the same file name.
  VideoInputEngine() : VCardsFixture( ControlOf( VIRTUAL_DECKLINK_LIBRARY ) ) {}

  void SetUp() override
  {
    m_Heard.Clear();
    m_pHost = std::make_unique<VListeningHost>();
  }
  // What came from the card has gone back when engine and host have ended.
  void TearDown() override
  {
    End();
    RemoveCards();
    m_Cards.clear();
    EXPECT_EQ( Control().ReferencesHeld(), 0 );
    EXPECT_EQ( Control().ReleaseErrors(), 0 );
  }

  void MakeAndStart()
  {
    m_pEngine = std::make_unique<VVideoInputEngine>( *m_pHost );
    m_pEngine->Start();
  }
  // Cards that are there are found on this thread.
  void MakeAndFindCards()
  {
    MakeAndStart();
    m_pHost->m_pHardwareStart->Fire();
  }
  // As a host ends a module that it has started: nothing waits in between.
  void End()
  {
    m_pEngine.reset();
    if( m_pHost )
    {
      const auto Sources = m_pHost->m_pSources->m_All;
      m_pHost->m_pShutdown->Shutdown();
      m_pHost.reset();
      for( const auto& pSource : Sources )   // a call that was posted to its thread may be its last owner for a moment
      {
        WaitUntil( [&] { return pSource.expired(); } );
      }
    }
  }
  void AddCard() { VCardsFixture::AddCard( "decklink:standard=SD_720_576I_5000" ); }
  void WaitFor( const std::string& i_rText )
  {
    WaitUntil( [&] { return m_Heard.Has( i_rText ); } );
  }
  // Every device is enabled unless somebody has said otherwise: it starts as soon as it is wired.
  void WaitUntilCapturing( const std::string& i_rURN )
  {
    const VDataPath Path = DeviceSchemas::VideoInput::Status( DeviceSchemas::VideoInput::Path( i_rURN ) );
    const auto IsCapturing = [&]
    {
      EStatus::Enum Status{};
      return GetTyped( VDataReader( *m_pHost->GetDataStore() ), Path, Status ) && Status == EStatus::ECapturing;
    };
    WaitUntil( IsCapturing );
  }
  // The device finds its signal, and the source begins a session with the next frame.
  void StartCard()
  {
    WaitUntilCapturing( "vi:0" );
    Step();
    WaitUntil( [this] { return Status().m_bEnabled; } );
  }
  // Of the only source.
  KVZ::ISourceTemporal::ISourceSyncStatus Status() { return m_pHost->m_pSources->GetSources().at( 0 )->Temporal().GetSourceSyncStatus(); }
  // Of its present session.
  uint64_t Frames() { return Status().m_Session.m_Id == 0 ? 0 : Status().m_LatestCounterFrames + 1; }
  // Frames that the card has handed to its client.
  uint64_t Delivered() { return Counters().m_FramesDelivered; }
  VTexts Sources( const std::string& i_rVerb ) const
  {
    VTexts Found = m_Heard.Texts();
    std::erase_if( Found, [&]( const std::string& i_rText ) { return !i_rText.starts_with( i_rVerb ); } );
    return Found;
  }

  TestSupport::VLogCapture m_Heard{ "Host" };
  std::unique_ptr<VListeningHost> m_pHost;
  std::unique_ptr<VVideoInputEngine> m_pEngine;
};

TEST_F( VideoInputEngine, IsBuiltInOrderAndHandsItsOwnShutdownObjectOverLast )
{
  m_pEngine = std::make_unique<VVideoInputEngine>( *m_pHost );
  EXPECT_EQ( m_Heard.Texts(),
    ( VTexts{ "AddShutdownObject KVZ::Detail::VShutdownObject<VideoInputHAL::VVideoInputDeviceManager>",
      "SetFileFilters 2 *.avi *.mov *.mp4 *.tvid *.mkv", "AddParameterGroup System.VideoInput",
      "AddShutdownObject KVZ::Detail::VShutdownObject<VVideoInputSystemParameterHandler>",
      "AddShutdownObject KVZ::Detail::VShutdownObject<VVideoInputEngine::VImpl>" } ) );
  EXPECT_TRUE( m_pHost->m_pParameters->GetGroups().front()->GetParameters().empty() );

  // Without cards nothing comes, and nothing goes.
  m_Heard.Clear();
  m_pEngine->Start();
  m_pHost->m_pHardwareStart->Fire();
  EXPECT_FALSE( m_pEngine->StartCapture( "vi:0" ) );
  EXPECT_FALSE( m_pEngine->StopCapture( "vi:0" ) );
  m_pEngine.reset();
  EXPECT_EQ( m_Heard.Texts(), ( VTexts{ "RemoveParameterGroup System.VideoInput" } ) );
}

TEST_F( VideoInputEngine, AStartOfHardwareAfterItsEndDoesNothing )
{
  AddCard();
  MakeAndStart();
  m_pEngine.reset();
  m_pHost->m_pHardwareStart->Fire();
  EXPECT_EQ( Control().ReferencesHeld(), 0 );
}

TEST_F( VideoInputEngine, WiresADeviceOnItsOwnThreadAndRegistersItsSourceLast )
{
  AddCard();
  MakeAndStart();
  m_Heard.Clear();
  m_pHost->m_pSources->m_OnAdd = []( const std::string& ) { EXPECT_EQ( DebugServices::GetThreadName(), "Video Input Engine0" ); };
  m_pHost->m_pHardwareStart->Fire();   // finds the card on this thread
  WaitFor( "AddSource vi:0" );
  EXPECT_EQ( m_Heard.Texts(), ( VTexts{ "AddParameterGroup VideoInput.vi:0", "AddSource vi:0" } ) );
}

TEST_F( VideoInputEngine, FramesReachTheSourceUntilItIsTakenOut )
{
  AddCard();
  MakeAndFindCards();
  StartCard();
  Step( 6 );
  EXPECT_EQ( Frames(), 6u );

  EXPECT_TRUE( m_pEngine->StopCapture( "vi:0" ) );
  Step( 3 );
  EXPECT_EQ( Frames(), 6u );
  EXPECT_TRUE( m_pEngine->StartCapture( "vi:0" ) );
  EXPECT_FALSE( m_pEngine->StartCapture( "vi:1" ) );
  StartCard();
  m_pHost->m_pSources->m_OnRemove = [&]( const std::string& )
  {
    const uint64_t Before = Delivered();
    Step( 3 );
    EXPECT_EQ( Delivered(), Before );
  };
  m_pEngine.reset();
  EXPECT_TRUE( m_Heard.Has( "RemoveSource vi:0" ) );
}

// Nodes may be made before their device is there and outlive the engine.
TEST_F( VideoInputEngine, FlowNodesFindTheSourcesOfTheMoment )
{
  AddCard();
  MakeAndStart();
  const auto pFactory = m_pHost->FlowNodes().Find( "VideoInputDataSource" );
  const auto pNode = pFactory->CreateNode();
  pNode->ParameterTexts() = { { "DeviceURN", "vi:0" } };
  const auto pServices = std::make_shared<TestSupport::VFakeFlowServices>();
  const auto Starts = [&]
  {
    const bool bStarts = !KVZ::IsFlowFailure( pNode->PreProcessChecked( pServices ) );
    pNode->PostProcessChecked();
    return bStarts;
  };
  EXPECT_FALSE( Starts() );
  m_pHost->m_pHardwareStart->Fire();
  WaitUntilCapturing( "vi:0" );
  EXPECT_TRUE( Starts() );
  m_pEngine.reset();
  EXPECT_FALSE( Starts() );
}

TEST_F( VideoInputEngine, TakesItsSourcesOutInTheOrderInWhichTheyCame )
{
  AddCard();
  MakeAndFindCards();
  AddCard();
  AddCard();
  WaitFor( "AddSource vi:2" );
  WaitUntilCapturing( "vi:2" );
  EXPECT_EQ( Sources( "AddSource" ), ( VTexts{ "AddSource vi:0", "AddSource vi:1", "AddSource vi:2" } ) );
  m_Heard.Clear();
  m_pEngine.reset();
  EXPECT_EQ( m_Heard.Texts(),
    ( VTexts{ "RemoveParameterGroup VideoInput.vi:0", "RemoveParameterGroup VideoInput.vi:1", "RemoveParameterGroup VideoInput.vi:2",
      "RemoveSource vi:0", "RemoveSource vi:1", "RemoveSource vi:2", "RemoveParameterGroup System.VideoInput" } ) );
}

TEST_F( VideoInputEngine, ADeviceThatTheHostRefusesCostsThatDeviceOnly )
{
  TestSupport::VLogCapture Log( "NotificationSystem", 2 );
  m_pHost->m_pSources->m_OnAdd = []( const std::string& i_rName )
  {
    if( i_rName == "vi:0" )
    {
      throw std::runtime_error( "no room" );
    }
  };
  AddCard();
  AddCard();
  MakeAndFindCards();
  WaitFor( "AddSource vi:1" );
  m_pEngine.reset();
  EXPECT_EQ( Log.Texts(), ( VTexts{ "A posted function ended with an exception: no room" } ) );
  EXPECT_EQ( Sources( "RemoveSource" ), ( VTexts{ "RemoveSource vi:1" } ) );
}

TEST_F( VideoInputEngine, MayEndInMidStream )
{
  for( int Round = 0; Round < 5; ++Round )
  {
    SCOPED_TRACE( Round );
    SetUp();
    AddCard();
    MakeAndFindCards();
    StartCard();
    std::promise<void> Streaming;
    std::atomic<bool> bEnd{ false };
    boost::thread Vendor(
      [&]
      {
        Step();
        Streaming.set_value();
        while( !bEnd )
        {
          Step();
        }
      } );
    Streaming.get_future().wait();
    End();
    const uint64_t AtEnd = Delivered();
    bEnd = true;
    Vendor.join();
    Step( 2 );
    EXPECT_EQ( Delivered(), AtEnd );
    TearDown();
  }
}

// The arrival owns the engine's insides while it runs. They must end with the engine all the same, on the host's thread: afterwards there
// is no host any more.
TEST_F( VideoInputEngine, MayEndWhileADeviceArrives )
{
  AddCard();
  for( int Round = 0; Round < 10; ++Round )
  {
    SCOPED_TRACE( Round );
    SetUp();
    std::promise<void> Reached;
    std::promise<void> Opened;
    m_pHost->m_pSources->m_OnAdd = [&]( const std::string& )
    {
      Reached.set_value();
      Opened.get_future().wait();
    };
    MakeAndFindCards();
    Reached.get_future().wait();
    const auto pSources = m_pHost->m_pSources;
    std::promise<void> Ending;
    std::atomic<bool> bEnded{ false };
    boost::thread Host(
      [&]
      {
        const boost::thread::id Id = boost::this_thread::get_id();
        pSources->m_OnRemove = [Id]( const std::string& ) { EXPECT_EQ( boost::this_thread::get_id(), Id ); };
        Ending.set_value();
        End();
        bEnded = true;
      } );
    Ending.get_future().wait();
    EXPECT_FALSE( bEnded );   // it has to wait for the arrival
    Opened.set_value();
    Host.join();
    EXPECT_TRUE( pSources->GetSources().empty() );
    EXPECT_TRUE( m_Heard.Has( "RemoveSource vi:0" ) );
  }
}

// A card comes while the engine ends: it is wired or not, but never left behind.
TEST_F( VideoInputEngine, MayEndWhileCardsAreAnnounced )
{
  for( int Round = 0; Round < 10; ++Round )
  {
    SCOPED_TRACE( Round );
    SetUp();
    MakeAndFindCards();
    boost::thread Vendor( [&] { AddCard(); } );
    if( Round % 2 == 0 )
    {
      WaitFor( "AddSource vi:0" );
    }
    m_pEngine.reset();
    EXPECT_EQ( Sources( "RemoveSource" ).size(), Sources( "AddSource" ).size() );
    EXPECT_TRUE( m_pHost->m_pParameters->GetGroups().empty() );
    Vendor.join();
    TearDown();
  }
}

}
