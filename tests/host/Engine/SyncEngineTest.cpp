#include "tests/host/Engine/SyncEngineFixture.h"

using KVZ::IClock;
using KVZ::VTick;
using TestSupport::VFakeSource;

namespace
{

using SyncEngineTest = VSyncEngineFixture;

const IClock GlobalTime( IClock::GlobalTime, 0, 0 );

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

TEST_F( SyncEngineTest, SeveralRequestsAtOnceMakeOneSessionAndALaterSourceJoins )
{
  const auto pFirst = AddRunning( "vi:0", Period25, OneHour, 2 );
  const auto pSecond = AddRunning( "vi:1", Period25, OneHour, 2 );
  m_pStrand->RunAll();
  EXPECT_EQ( ( std::vector<uint32_t>{ 1 } ), pFirst->m_Declared );   // the very first requests included
  EXPECT_EQ( 2u, m_pEngine->GetStarted()->m_Sources.size() );

  for( const auto& pSource : { pFirst, pSecond } )
  {
    pSource->BeginSession( 101.0, OneHour * 2 );
    pSource->SetNewest( 2 );
  }
  m_pStrand->RunAll();
  EXPECT_EQ( 2u, m_pEngine->GetStarted()->m_Id.Value() );
  EXPECT_EQ( 2u, m_pEngine->GetStarted()->m_Sources.size() );

  const auto pLate = AddRunning( "vi:2", Period25, OneHour * 2, 2 );
  m_pStrand->RunAll();
  EXPECT_EQ( 3u, m_pEngine->GetStarted()->m_Sources.size() );
  EXPECT_EQ( 3, pFirst->m_Started );
  EXPECT_EQ( 1, pLate->m_Started );
}

// A module that ends takes its sources out, and none of them may be called any more.
TEST_F( SyncEngineTest, ASourceThatIsRemovedWhileItsSessionWaitsIsLetGo )
{
  const auto pStays = AddRunning( "vi:0", Period25, OneHour, 2 );
  auto pLeaves = Add( "vi:1", Period25 );
  pLeaves->BeginSession( 100.0 );   // no second frame: the start waits
  m_pStrand->RunAll();
  ASSERT_EQ( 1u, m_pDelays->Pending() );

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

TEST_F( SyncEngineTest, ASourceThatIsLaidByDeliveryIsWaitedForAndGivenUp )
{
  const auto pTimed = AddRunning( "vi:0", Period25, OneHour, 2 );
  const auto pSilent = Add( "vi:1", Period5994 );
  pSilent->BeginSession( 100.0 );
  m_pStrand->RunAll();
  EXPECT_EQ( 0, pTimed->m_Started );

  pSilent->SetNewest( 2 );
  m_pDelays->RunAll();
  EXPECT_EQ( 1, pTimed->m_Started );
  EXPECT_EQ( 1, pSilent->m_Started );

  pSilent->BeginSession( 200.0 );   // and no second frame
  m_pStrand->RunAll();
  for( int Attempt = 0; Attempt < 1000 && m_pDelays->RunOne(); ++Attempt )
  {
  }
  EXPECT_EQ( 2, pTimed->m_Started );
  EXPECT_EQ( 1, pSilent->m_Started );
  EXPECT_EQ( nullptr, m_pEngine->GetStarted()->Find( pSilent.get() ) );
}

TEST_F( SyncEngineTest, EachSourceGetsItsOwnReadingOfATimecodeClockThatTwoShare )
{
  const auto pReference = AddRunning( "vi:0", Period25, OneHour, 10 );
  const auto pForeign = AddRunning( "vi:1", Period25, OneHour * 11, 10 );   // the same clock by name, another world by time
  m_pStrand->RunAll();
  const IClock Timecode( IClock::Timecode, 3, 0 );
  const VTick Ten( 10 * Period25 );
  EXPECT_EQ( OneHour + Ten, pReference->m_StartTicks.Find( GlobalTime ) ) << "readers begin at the live edge";
  EXPECT_EQ( OneHour + Ten, pReference->m_StartTicks.Find( Timecode ) );
  EXPECT_EQ( OneHour * 11 + Ten, pForeign->m_StartTicks.Find( Timecode ) );
  EXPECT_EQ( GlobalTickOf( *pReference, Ten ), GlobalTickOf( *pForeign, Ten ) );
}

TEST_F( SyncEngineTest, SourcesAreLaidByTheirTimecodeWhereDeliveryDoesNotContradictIt )
{
  struct VLaying
  {
    VTick m_Timecode;
    double m_Delivery;
    VTick m_Start;
    bool m_bByTimecode;
  };
  struct VCase
  {
    const char* m_pName;
    VLaying m_Sources[2];
  };
  const VTick None = VTick::Invalid();
  const VTick Second = KVZ::SecondsToTick135( 1 );
  const VTick Quarter = KVZ::MillisecondsToTick135( 250 );
  for( const VCase& rCase : {
         VCase{ "delivered 100 ms late", { { OneHour, 10.0, OneHour, true }, { OneHour + Second, 11.1, OneHour + Second, true } } },
         VCase{ "ten hours apart on paper, a quarter of a second in the room",
           { { OneHour, 10.0, OneHour, true }, { OneHour * 11, 10.25, OneHour + Quarter, false } } },
         VCase{ "without timecode beside one with it", { { None, 12.0, OneHour + Second * 2, false }, { OneHour, 10.0, OneHour, true } } },
         VCase{ "by the host's clock", { { None, 12.0, Second * 12, false }, { None, 10.0, Second * 10, false } } },
       } )
  {
    SCOPED_TRACE( rCase.m_pName );
    for( const VLaying& rLaying : rCase.m_Sources )
    {
      const auto pSource = Add( "vi:0", Period25 );
      pSource->BeginSession( rLaying.m_Delivery, rLaying.m_Timecode );
      pSource->SetNewest( 2 );
    }
    m_pStrand->RunAll();
    const auto pStarted = m_pEngine->GetStarted();
    ASSERT_TRUE( pStarted );
    EXPECT_EQ( rCase.m_Sources[0].m_bByTimecode || rCase.m_Sources[1].m_bByTimecode, pStarted->m_bByTimecode );
    ASSERT_EQ( 2u, pStarted->m_Sources.size() );
    for( size_t Index = 0; Index < 2; ++Index )
    {
      const auto& rSource = pStarted->m_Sources[Index];
      EXPECT_EQ( rCase.m_Sources[Index].m_Start, rSource.m_Place.m_CounterStart );
      EXPECT_EQ( rCase.m_Sources[Index].m_bByTimecode, rSource.m_Place.m_bByTimecode );
      m_pEngine->RemoveSource( rSource.m_pSource );
    }
  }
}

TEST_F( SyncEngineTest, RemovedAndDisabledSourcesTakeNoPart )
{
  const auto pStays = AddRunning( "vi:0", Period25, OneHour, 1 );
  const auto pLeaves = AddRunning( "vi:1", Period25, OneHour, 1 );
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
