#include "host/Recording.h"

#include "host/DataStore.h"
#include "tests/host/Engine/SyncEngineFixture.h"
#include "tests/support/HandTime.h"

using namespace StageHost;
using KVZ::VTick;
using TestSupport::VFakeSource;

namespace
{

constexpr uint32_t Capturing = 4;
constexpr uint32_t Complete = 32;

class RecordingTest : public VSyncEngineFixture
{
protected:
  std::shared_ptr<VFakeSource> Add( const std::string& i_rName, int64_t i_Period, VTick i_Timecode, uint64_t i_Newest )
  {
    auto pSource = AddRunning( i_rName, i_Period, i_Timecode, i_Newest );
    m_pStrand->RunAll();
    return pSource;
  }

  static VRecordingRequest Frames( std::vector<std::string> i_URNs, uint64_t i_Count, int i_PreRollSeconds = 0 )
  {
    VRecordingRequest Request;
    Request.m_DeviceURNs = std::move( i_URNs );
    Request.m_Frames = i_Count;
    Request.m_PreRoll = KVZ::SecondsToTick135( i_PreRollSeconds );
    Request.m_Name = "take";
    return Request;
  }

  const std::shared_ptr<VCaptureTargets> m_pTargets = std::make_shared<VCaptureTargets>( std::make_shared<VDataStore>() );
  TestSupport::VHandTime m_Time;
  VRecording m_Recording{ *m_pEngine, *m_pTargets, m_Time };
  std::string m_Error;
};

}

TEST_F( RecordingTest, IsReadyOnceThePreRollIsInMemory )
{
  const auto pSource = Add( "vi:0", Period25, OneHour, 74 );
  EXPECT_TRUE( m_Recording.IsReady( Frames( { "vi:0" }, 10 ) ) );
  EXPECT_FALSE( m_Recording.IsReady( Frames( { "vi:0" }, 10, 3 ) ) );
  pSource->SetNewest( 75 );
  EXPECT_TRUE( m_Recording.IsReady( Frames( { "vi:0" }, 10, 3 ) ) );
  EXPECT_FALSE( m_Recording.IsReady( Frames( { "vi:0", "vi:1" }, 10 ) ) );
  pSource->SetEnabled( false );
  EXPECT_FALSE( m_Recording.IsReady( Frames( { "vi:0" }, 10 ) ) );
}

TEST_F( RecordingTest, AsksForExactlyTheFramesOfEachDevice )
{
  const auto pSlow = Add( "vi:0", Period25, OneHour, 100 );
  const auto pFast = Add( "vi:1", Period5994, OneHour + VTick( 1000 ), 200 );
  ASSERT_TRUE( m_Recording.Start( Frames( { "vi:0", "vi:1" }, 30 ), m_Error ) ) << m_Error;
  const VTick Now = std::max( OneHour + VTick( 100 * Period25 ), OneHour + VTick( 1000 + 200 * Period5994 ) );
  for( const VFakeSource* pSource : { pSlow.get(), pFast.get() } )
  {
    const int64_t Period = pSource == pSlow.get() ? Period25 : Period5994;
    EXPECT_GE( pSource->m_CaptureStart, Now );
    EXPECT_LT( pSource->m_CaptureStart, Now + VTick( Period ) );
    EXPECT_EQ( pSource->m_CaptureStart + VTick( 30 * Period ), pSource->m_CaptureEnd );
  }
}

TEST_F( RecordingTest, ARefusedDeviceLeavesNoCaptureRunning )
{
  const auto pFirst = Add( "vi:0", Period25, OneHour, 100 );
  const auto pSecond = Add( "vi:1", Period25, OneHour, 100 );
  pSecond->m_bRefuseCapture = true;
  EXPECT_FALSE( m_Recording.Start( Frames( { "vi:0", "vi:1" }, 30 ), m_Error ) );
  EXPECT_NE( std::string::npos, m_Error.find( "vi:1" ) );
  EXPECT_EQ( 1, pFirst->m_CancelCalls );
}

TEST_F( RecordingTest, ASilentSourceIsEndedSoThatItsFileIsClosed )
{
  const auto pSource = Add( "vi:0", Period25, OneHour, 100 );
  ASSERT_TRUE( m_Recording.Start( Frames( { "vi:0" }, 1000 ), m_Error ) );
  m_Recording.Poll();
  m_Time.m_Now += 2.9;
  m_Recording.Poll();
  EXPECT_EQ( 0, pSource->m_EndCalls );
  pSource->SetNewest( 101 );   // not silent after all
  m_Time.m_Now += 2.0;
  m_Recording.Poll();
  m_Time.m_Now += 2.9;
  m_Recording.Poll();
  EXPECT_EQ( 0, pSource->m_EndCalls );
  m_Time.m_Now += 0.2;
  m_Recording.Poll();
  EXPECT_EQ( 1, pSource->m_EndCalls );
}

TEST_F( RecordingTest, LossesAreToldByTheirCause )
{
  const auto pSource = Add( "vi:0", Period25, OneHour, 100 );
  pSource->m_Dropped = 7;   // before the recording
  ASSERT_TRUE( m_Recording.Start( Frames( { "vi:0" }, 50, 2 ), m_Error ) );
  EXPECT_EQ( OneHour + VTick( 50 * Period25 ), pSource->m_CaptureStart ) << "two seconds before the request";
  pSource->m_Dropped = 10;
  pSource->SetNewest( 110 );
  pSource->m_Status.m_Start = pSource->m_CaptureStart + VTick( 4 * Period25 );   // four frames had been evicted
  pSource->m_Status.m_State = Capturing;
  m_Recording.Poll();
  EXPECT_FALSE( m_Recording.IsFinished() );
  pSource->SetNewest( 111 );
  m_Recording.Poll();
  pSource->m_Dropped = 30;   // an absence: no frame of the range comes after it
  m_Recording.Poll();
  pSource->SetNewest( 150 );   // the frame that is about to end the capture
  m_Recording.Poll();
  pSource->m_Status.m_State = Complete;
  pSource->m_Status.m_Failure = 2;
  pSource->m_Status.m_CapturedDuration = VTick( Period25 * 40 );
  m_Recording.Poll();
  ASSERT_TRUE( m_Recording.IsFinished() );
  const VDeviceOutcome Outcome = m_Recording.GetOutcomes().front();
  EXPECT_EQ( 3u, Outcome.m_Lost.m_Card );
  EXPECT_EQ( 4u, Outcome.m_Lost.m_Memory );
  EXPECT_EQ( 6u, Outcome.m_Lost.m_Signal );
  EXPECT_EQ( 40u, Outcome.m_Lost.m_Writer );   // no file was reported
  EXPECT_TRUE( Outcome.HasFailed() );
}

TEST_F( RecordingTest, WhatIsCapturedAtAStopIsWhatWasAskedFor )
{
  const auto pSource = Add( "vi:0", Period25, OneHour, 100 );
  ASSERT_TRUE( m_Recording.Start( Frames( { "vi:0" }, 1000 ), m_Error ) );
  m_Recording.Poll();
  m_Recording.Stop();
  EXPECT_EQ( 1, pSource->m_EndCalls );
  pSource->m_Status.m_State = Complete;
  pSource->m_Status.m_CapturedDuration = VTick( Period25 * 12 );
  m_Recording.Poll();
  ASSERT_TRUE( m_Recording.IsFinished() );
  EXPECT_EQ( 12u, m_Recording.GetOutcomes().front().m_FramesRequested );
  EXPECT_EQ( 0u, m_Recording.GetOutcomes().front().m_Lost.m_Signal );
}
