#include "host/SyncEngine.h"

#include "tests/host/Engine/SourceTimes.h"
#include "tests/support/FakeSource.h"
#include "tests/support/ManualPostalService.h"

#include <gtest/gtest.h>

using namespace StageHost;
using KVZ::IClock;
using KVZ::VTick;
using TestSupport::VFakeSource;
using TestSupport::VManualPostalService;

namespace
{

class VManualDelays : public IDelayedCalls
{
public:
  void CallAfter( double, std::function<void()> i_Function ) override { m_Calls.push_back( std::move( i_Function ) ); }

  // One round: what a call asks for anew waits for the next.
  void RunAll()
  {
    std::vector<std::function<void()>> Calls;
    Calls.swap( m_Calls );
    for( const auto& rCall : Calls )
    {
      rCall();
    }
  }
  size_t Count() const { return m_Calls.size(); }

private:
  std::vector<std::function<void()>> m_Calls;
};

const IClock GlobalTime( IClock::GlobalTime, 0, 0 );

class SyncEngineTest : public ::testing::Test
{
protected:
  std::shared_ptr<VFakeSource> Add( const std::string& i_rName, int64_t i_Period )
  {
    auto pSource = std::make_shared<VFakeSource>( i_rName, i_Period );
    m_pEngine->AddSource( pSource );
    return pSource;
  }

  const std::shared_ptr<VManualPostalService> m_pStrand = std::make_shared<VManualPostalService>();
  const std::shared_ptr<VManualDelays> m_pDelays = std::make_shared<VManualDelays>();
  const std::shared_ptr<VSyncEngine> m_pEngine = std::make_shared<VSyncEngine>( m_pStrand, m_pDelays );
};

// The relation that every part of the host relies on.
VTick GlobalTickOf( const VFakeSource& i_rSource, VTick i_Counter )
{
  return i_Counter + i_rSource.m_StartTicks.Find( GlobalTime ) - i_rSource.m_StartTicks.Find( i_rSource.Counter() );
}

}

TEST_F( SyncEngineTest, ASourceWithTimecodeStartsAtItsFirstFrame )
{
  const auto pSource = Add( "vi:0", Period25 );
  EXPECT_FALSE( m_pEngine->GetStarted() );
  pSource->BeginSession( 100.0, OneHour );
  m_pStrand->RunAll();
  EXPECT_EQ( 1, pSource->m_Armed );
  EXPECT_EQ( 1, pSource->m_Started );
  EXPECT_EQ( OneHour + VTick( 3 * Period25 ), GlobalTickOf( *pSource, VTick( 3 * Period25 ) ) );
  EXPECT_EQ( pSource->m_StartTicks.Find( GlobalTime ), pSource->m_StartTicks.Find( IClock( IClock::Timecode, 3, 0 ) ) );
  EXPECT_EQ( Period25, m_pEngine->GetMasterClock()->GetPeriod().Count() );
}

TEST_F( SyncEngineTest, SeveralRequestsAtOnceMakeOneSession )
{
  const auto pFirst = Add( "vi:0", Period25 );
  const auto pSecond = Add( "vi:1", Period25 );
  pFirst->BeginSession( 100.0, OneHour );
  pSecond->BeginSession( 100.0, OneHour );
  pFirst->SetNewest( 2 );
  pSecond->SetNewest( 2 );
  m_pStrand->RunAll();
  EXPECT_EQ( ( std::vector<uint32_t>{ 1 } ), pFirst->m_Declared );   // the very first requests included
  EXPECT_EQ( 2u, m_pEngine->GetStarted()->m_Sources.size() );
  const uint32_t Newest = m_pEngine->GetStarted()->m_Id.Value();

  pFirst->BeginSession( 101.0, OneHour * 2 );
  pSecond->BeginSession( 101.0, OneHour * 2 );
  pFirst->SetNewest( 2 );
  pSecond->SetNewest( 2 );
  m_pStrand->RunAll();
  EXPECT_EQ( Newest + 1, m_pEngine->GetStarted()->m_Id.Value() );
  EXPECT_EQ( 2u, m_pEngine->GetStarted()->m_Sources.size() );
}

TEST_F( SyncEngineTest, ASourceThatComesLaterJoinsTheOthers )
{
  const auto pFirst = Add( "vi:0", Period25 );
  pFirst->BeginSession( 100.0, OneHour );
  pFirst->SetNewest( 2 );
  m_pStrand->RunAll();
  const auto pLate = Add( "vi:1", Period25 );
  pLate->BeginSession( 101.0, OneHour + KVZ::SecondsToTick135( 1 ) );
  pLate->SetNewest( 2 );
  m_pStrand->RunAll();
  ASSERT_EQ( 2u, m_pEngine->GetStarted()->m_Sources.size() );
  EXPECT_EQ( 2, pFirst->m_Started );
  EXPECT_EQ( 1, pLate->m_Started );
}

// A module that ends takes its sources out, and none of them may be called any more.
TEST_F( SyncEngineTest, ASourceThatIsRemovedWhileItsSessionWaitsIsLetGo )
{
  const auto pStays = Add( "vi:0", Period25 );
  auto pLeaves = Add( "vi:1", Period25 );
  pStays->BeginSession( 100.0, OneHour );
  pLeaves->BeginSession( 100.0 );   // no second frame: the start waits
  pStays->SetNewest( 2 );
  m_pStrand->RunAll();
  ASSERT_EQ( 1u, m_pDelays->Count() );

  pLeaves->BeginSession( 101.0 );   // its request is under way
  m_pEngine->RemoveSource( pLeaves );
  const std::weak_ptr<VFakeSource> pGone = pLeaves;
  pLeaves.reset();
  EXPECT_TRUE( pGone.expired() );
  m_pStrand->RunAll();
  m_pDelays->RunAll();
  ASSERT_TRUE( m_pEngine->GetStarted() );
  EXPECT_EQ( 1u, m_pEngine->GetStarted()->m_Sources.size() );
  EXPECT_EQ( ( std::vector<uint32_t>{ 1 } ), pStays->m_Declared );
}

TEST_F( SyncEngineTest, ReadersBeginAtTheLiveEdge )
{
  const auto pSource = Add( "vi:0", Period25 );
  pSource->BeginSession( 100.0, OneHour );
  pSource->SetNewest( 50 );
  m_pStrand->RunAll();
  EXPECT_EQ( OneHour + VTick( 50 * Period25 ), pSource->m_StartTicks.Find( GlobalTime ) );
}

TEST_F( SyncEngineTest, ASourceThatIsLaidByDeliveryIsWaitedForAndGivenUp )
{
  const auto pTimed = Add( "vi:0", Period25 );
  const auto pSilent = Add( "vi:1", Period5994 );
  pTimed->BeginSession( 100.0, OneHour );
  pSilent->BeginSession( 100.0 );
  pTimed->SetNewest( 2 );
  m_pStrand->RunAll();
  EXPECT_EQ( 0, pTimed->m_Started );

  pSilent->SetNewest( 2 );
  m_pDelays->RunAll();
  EXPECT_EQ( 1, pTimed->m_Started );
  EXPECT_EQ( 1, pSilent->m_Started );

  pSilent->BeginSession( 200.0 );   // and no second frame
  m_pStrand->RunAll();
  for( int Round = 0; Round < 1000 && m_pDelays->Count() != 0; ++Round )
  {
    m_pDelays->RunAll();
  }
  EXPECT_EQ( 2, pTimed->m_Started );
  EXPECT_EQ( 1, pSilent->m_Started );
  EXPECT_EQ( nullptr, m_pEngine->GetStarted()->Find( pSilent.get() ) );
}

TEST_F( SyncEngineTest, EachSourceGetsItsOwnReadingOfATimecodeClockThatTwoShare )
{
  const auto pReference = Add( "vi:0", Period25 );
  const auto pForeign = Add( "vi:1", Period25 );
  pReference->BeginSession( 100.0, OneHour );
  pForeign->BeginSession( 100.0, OneHour * 11 );   // the same clock by name, another world by time
  pReference->SetNewest( 10 );
  pForeign->SetNewest( 10 );
  m_pStrand->RunAll();
  const IClock Timecode( IClock::Timecode, 3, 0 );
  const VTick Ten( 10 * Period25 );
  EXPECT_EQ( OneHour + Ten, pReference->m_StartTicks.Find( Timecode ) );
  EXPECT_EQ( OneHour * 11 + Ten, pForeign->m_StartTicks.Find( Timecode ) );
  EXPECT_EQ( GlobalTickOf( *pReference, Ten ), GlobalTickOf( *pForeign, Ten ) );
}

TEST_F( SyncEngineTest, RemovedAndDisabledSourcesTakeNoPart )
{
  const auto pStays = Add( "vi:0", Period25 );
  const auto pLeaves = Add( "vi:1", Period25 );
  pStays->BeginSession( 100.0, OneHour );
  pLeaves->BeginSession( 100.0, OneHour );
  pStays->SetNewest( 1 );
  pLeaves->SetNewest( 1 );
  m_pStrand->RunAll();
  ASSERT_NE( nullptr, m_pEngine->GetStarted()->Find( pLeaves.get() ) );
  m_pEngine->RemoveSource( pLeaves );
  EXPECT_EQ( nullptr, m_pEngine->GetStarted()->Find( pLeaves.get() ) );
  EXPECT_EQ( 1u, m_pEngine->GetSources().size() );

  const int Started = pStays->m_Started;
  pStays->SetEnabled( false );
  pStays->BeginSession( 101.0, OneHour );
  m_pStrand->RunAll();
  EXPECT_EQ( Started, pStays->m_Started );
}
