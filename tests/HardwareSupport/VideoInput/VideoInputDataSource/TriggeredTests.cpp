#include "HardwareSupport/VideoInput/VideoInputDataSource/VideoInputDataSourceTriggered.h"

#include "tests/HardwareSupport/VideoInput/VideoInputDataSource/VideoRig.h"
#include "tests/support/LogCapture.h"

namespace
{

using VideoInputHAL::VVideoInputDataSourceTriggered;

// Time passes when the test says so.
class VHandTimer : public VideoInputHAL::IDeadlineTimer
{
public:
  void Set( int64_t i_Microseconds, std::function<void()> i_Function ) override
  {
    m_Left = i_Microseconds;
    m_Former = std::move( m_Function );
    m_Function = std::move( i_Function );
  }
  void Cancel() override { m_Function = nullptr; }

  void Pass( int64_t i_Microseconds )
  {
    m_Left -= i_Microseconds;
    if( m_Left <= 0 && m_Function )
    {
      std::exchange( m_Function, nullptr )();
    }
  }

  int64_t m_Left = 0;
  std::function<void()> m_Function;
  std::function<void()> m_Former;   // replaced, and perhaps on its way
};

constexpr int64_t Second = 1000000;

class VTestTriggeredSource : public VVideoInputDataSourceTriggered
{
public:
  template<class... TArgs>
  explicit VTestTriggeredSource( std::shared_ptr<VideoInputHAL::VVideoInputDeviceManager> i_pManager,
    std::shared_ptr<VideoInputHAL::IVideoInputDevice> i_pDevice, std::shared_ptr<VideoInputHAL::VVideoInputDataSourceAllocator> i_pAllocator,
    TArgs... i_Args )
    : VVideoInputDataSourceTriggered( i_pManager, i_pDevice, i_pAllocator, nullptr, i_Args... )
  {
  }
  using VDataSource::PostToStrand;
};

class TriggeredSource : public ::testing::Test
{
protected:
  void SetUp() override
  {
    VideoInputHAL::VVideoInputDataSourceOptions Options;
    Options.m_MakeTimer = [this]
    {
      auto pTimer = std::make_unique<VHandTimer>();
      m_pTimer = pTimer.get();
      return pTimer;
    };
    m_pSource = m_Rig.Make<VTestTriggeredSource>( Options );
    m_pSource->OnRequestNewGlobalSyncSession().Set( [this]( KVZ::VGlobalSyncSessionId ) { ++m_Requests; } );
  }

  VVideoRig m_Rig;
  VHandTimer* m_pTimer = nullptr;
  std::shared_ptr<VTestTriggeredSource> m_pSource;
  int m_Requests = 0;
};

TEST_F( TriggeredSource, RunsOnceItsFramesHaveStoppedForFiveSeconds )
{
  EXPECT_FALSE( m_Rig.Deliver() ) << "nothing has been armed";
  m_Rig.OnStrand( *m_pSource, [this] { m_pSource->ArmGlobalSyncSession(); } );
  EXPECT_EQ( m_pSource->GetState(), VVideoInputDataSourceTriggered::Armed );
  for( int Count = 0; Count < 12; ++Count )
  {
    m_pTimer->Pass( Second );
    EXPECT_FALSE( m_Rig.Deliver() );
  }
  ASSERT_TRUE( m_pTimer->m_Former );
  m_pTimer->m_Former();   // a wait that was replaced, on its way when the frame came
  m_pTimer->Pass( 4 * Second );
  EXPECT_EQ( m_pSource->GetState(), VVideoInputDataSourceTriggered::Armed ) << "a frame every second keeps it waiting";
  EXPECT_EQ( m_Requests, 0 );
  m_pTimer->Pass( Second );
  m_Rig.m_pStrand->RunAll();
  EXPECT_EQ( m_pSource->GetState(), VVideoInputDataSourceTriggered::Running );
  EXPECT_EQ( m_Requests, 1 );

  m_Rig.m_Timecode.m_Standard = KVZ::ITimecodeStandard::ETimecode25;
  m_Rig.DeliverMany( 2 );
  m_Rig.m_NextIndex += 50;
  m_Rig.DeliverMany( 2 );
  KVZ::ISourceSyncSession Session;
  EXPECT_EQ( m_pSource->Buffer()->NewestSessionId(), 1u ) << "a gap in the numbers is none";
  ASSERT_TRUE( m_pSource->Buffer()->GetSourceSyncSession( 1, Session ) );
  EXPECT_EQ( Session.m_StartTime.m_TickByClock.size(), 1u ) << "no clock but the counter";
  EXPECT_EQ( Session.m_BeatPeriod, Period );
}

TEST_F( TriggeredSource, OffersASessionOfItsOwnPeriod )
{
  const TestSupport::VLogCapture Log( "Hal.vi:0" );
  boost::optional<KVZ::ISourceSyncSession> Session;
  m_Rig.OnStrand( *m_pSource, [&] { Session = m_pSource->DeclareGlobalSyncSession( KVZ::VGlobalSyncSessionId( 1 ), nullptr ); } );
  ASSERT_TRUE( Session );
  EXPECT_EQ( Session->m_Period, VTick( 2700000 ) );
  EXPECT_EQ( Session->m_BeatPeriod, VTick( 2700000 ) );
  EXPECT_EQ( Session->Validate(), "" );
  EXPECT_TRUE( Log.Has( "Creating new triggered buffer session 1" ) );
  EXPECT_TRUE( Log.Has( "DeclareGlobalSyncSession(1): Source prepping for Triggered session - will use source sync session 1" ) );
}

}
