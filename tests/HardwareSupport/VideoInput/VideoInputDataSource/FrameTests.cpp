// From the device's frame to the stored one: clocks, settings, memory.
#include "tests/HardwareSupport/VideoInput/VideoInputDataSource/VideoRig.h"

#include "tests/support/LogCapture.h"

namespace
{

class VideoFrames : public ::testing::Test
{
protected:
  uint32_t SessionId() { return m_pSource->Buffer()->NewestSessionId(); }
  KVZ::ITickInClocks StartClocks()
  {
    KVZ::ISourceSyncSession Session;
    EXPECT_TRUE( m_pSource->Buffer()->GetSourceSyncSession( SessionId(), Session ) );
    return Session.m_StartTime;
  }
  const VVideoInputDataSourceFrame& Newest()
  {
    SyncSystem::VToken Token;
    EXPECT_TRUE( m_pSource->Buffer()->GetNewestToken( Token ) );
    EXPECT_TRUE( m_pSource->Buffer()->Read( Token, m_Pinned ) );
    return *VVideoInputDataSource::FrameOf( m_Pinned.Frame() );
  }

  VVideoRig m_Rig;
  std::shared_ptr<VTestVideoSource> m_pSource = m_Rig.Make();
  SyncSystem::VRefCountedToken m_Pinned;
};

TEST_F( VideoFrames, CarryTheirNumberAndASharedTimecode )
{
  EXPECT_EQ( m_pSource->GetSourceName(), "vi:0" );
  EXPECT_EQ( m_Rig.m_pService->m_Releases, 2 );
  m_Rig.m_NextIndex = 17;
  m_Rig.m_Timecode = KVZ::ITimecode{ KVZ::ITimecodeStandard::ETimecode25, 1, 0, 0, 5 };
  m_Rig.DeliverMany( 10 );
  EXPECT_EQ( SessionId(), 1u );
  const KVZ::ITickInClocks Clocks = StartClocks();
  EXPECT_EQ( Clocks.m_TickByClock.size(), 3u );
  EXPECT_EQ( Clocks.Find( IClock( IClock::FrameNumber, 0, m_pSource->SourceId() ) ), Period * 17 );
  EXPECT_EQ( Clocks.Find( IClock( IClock::Timecode, 3, 0 ) ), Period * ( 3600 * 25 + 5 ) );
  EXPECT_EQ( Newest().Image()[0], 26 );
}

TEST_F( VideoFrames, AnImpossibleTimecodeIsNoClock )
{
  m_Rig.m_Timecode = KVZ::ITimecode{ KVZ::ITimecodeStandard::ETimecode25, 23, 59, 59, 24 };
  m_Rig.DeliverMany( 1 );
  m_Rig.m_Timecode = KVZ::ITimecode{ KVZ::ITimecodeStandard::ETimecode25, 24, 0, 0, 0 };
  const TestSupport::VLogCapture Log( "CaptureBuffer" );
  ASSERT_TRUE( m_Rig.Deliver() );
  EXPECT_TRUE( Log.Has( "Buffer vi:0: New Sync Session. Clock Changes: Timecode Removed, (1 continuous)" ) );
}

TEST_F( VideoFrames, TimecodeSettingsBeginAnew )
{
  m_Rig.m_Timecode = KVZ::ITimecode{ KVZ::ITimecodeStandard::ETimecode25, 1, 0, 0, 0 };
  m_Rig.DeliverMany( 2 );
  const TestSupport::VLogCapture Log( "Hal.vi:0" );
  m_pSource->SetTimecodeAdjustment( -Period * 2 );
  EXPECT_TRUE( Log.Has( "Setting timecode adjustment to -10800000 ticks." ) );
  m_pSource->SetTimecodeAdjustment( -Period * 2 );
  EXPECT_EQ( Log.Lines().size(), 1u ) << "no change";
  EXPECT_EQ( m_Rig.Declare( *m_pSource, 1 ).m_Id, 0u ) << "nothing is offered before the next frame";
  m_Rig.DeliverMany( 2 );
  EXPECT_EQ( SessionId(), 2u );
  EXPECT_EQ( StartClocks().Find( IClock( IClock::Timecode, 3, 0 ) ), Period * 90000 );

  m_pSource->SetUseTimecodeForSync( true );
  m_Rig.DeliverMany( 1 );
  EXPECT_EQ( SessionId(), 2u ) << "no change";
  m_pSource->SetUseTimecodeForSync( false );
  m_Rig.DeliverMany( 2 );
  EXPECT_EQ( SessionId(), 3u );
  EXPECT_FALSE( StartClocks().Find( IClock( IClock::Timecode, 3, 0 ) ).IsValid() );
  EXPECT_TRUE( StartClocks().Find( IClock( IClock::Timecode, 3, m_pSource->SourceId() ) ).IsValid() );
}

TEST_F( VideoFrames, TakeThePixelAspectRatioFromTheNextOneOn )
{
  m_Rig.DeliverMany( 1 );
  EXPECT_EQ( Newest().m_VideoInfo.m_PixelAspectRatio, 0.0 );
  m_pSource->SetPixelAspectRatio( 1.0667 );
  EXPECT_EQ( Newest().m_VideoInfo.m_PixelAspectRatio, 0.0 );
  m_Rig.DeliverMany( 1 );
  EXPECT_EQ( Newest().m_VideoInfo.m_PixelAspectRatio, 1.0667 );
  EXPECT_EQ( Newest().m_FrameScale, 1.0 );
}

TEST_F( VideoFrames, WithoutAPeriodAreRefused )
{
  VVideoInputDataSourceFrame* pFrame = m_Rig.MakeFrame( 0 );
  const int64_t NoPeriod = 0;
  EXPECT_FALSE( m_pSource->OnVideoInputData( 0, pFrame, &pFrame->m_Timecode, &NoPeriod ) );
  m_Rig.m_pFrames->Free( pFrame );
  EXPECT_EQ( SessionId(), 0u );
}

TEST_F( VideoFrames, LostByTheCardAreCountedButNotItsFirstCount )
{
  const auto Dropped = [this]
  {
    uint64_t Count = 0;
    m_Rig.OnStrand( *m_pSource, [&] { Count = m_pSource->GetSourceSyncStatus().m_DroppedFrames; } );
    return Count;
  };
  m_Rig.m_pDevice->StartCapture( {}, {}, {}, 2 );
  m_Rig.m_pDevice->LoseFrames( 5000000 );   // the card's running time
  m_Rig.DeliverMany( 2 );
  EXPECT_EQ( Dropped(), 0u );
  m_Rig.m_pDevice->LoseFrames( 3 );
  m_Rig.DeliverMany( 1 );
  m_Rig.m_pDevice->LoseFrames( 2 );
  EXPECT_EQ( Dropped(), 5u );
  m_Rig.m_pDevice->StopCapture();
  m_Rig.m_pDevice->StartCapture( {}, {}, {}, 2 );
  m_Rig.DeliverMany( 1 );   // no count: no time has been lost
  m_Rig.m_pDevice->LoseFrames( 1 );
  EXPECT_EQ( Dropped(), 6u );
}

}
