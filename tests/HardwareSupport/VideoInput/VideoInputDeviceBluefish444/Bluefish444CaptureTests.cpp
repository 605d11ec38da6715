// What the capture thread does between two syncs: set-up, the rhythm of the buffers, the signal's coming and going, orders.
#include "tests/HardwareSupport/VideoInput/VideoInputDeviceBluefish444/Bluefish444Fixture.h"

namespace
{

const VCalls SetUpForRGB = { "Set 1 0", "Set 3 2", "Stop", "Set 47 30000F05", "Set 21 1", "Set 22 10" };

VCalls operator+( VCalls i_A, const VCalls& i_rB )
{
  i_A.insert( i_A.end(), i_rB.begin(), i_rB.end() );
  return i_A;
}

TEST_F( Bluefish444Device, SetsTheCardUpAndFollowsItsFirstSignal )
{
  Make();
  EXPECT_EQ( m_Card.TakeCalls(), ( VCalls{ "Set 2D 2", "Query 69" } + SetUpForRGB + VCalls{ "Wait" } ) );
  EXPECT_EQ( m_pDevice->GetVideoStandard(), KVZ::IVideoStandard::EUnspecified );
  // The mode is seen, so the card is set up for it; its frame store is switched on at a sync
  m_Card.Resume();
  EXPECT_EQ( m_Card.TakeCalls(), ( VCalls{ "Capture 0", "Capture 5000", "Query 18" } + SetUpForRGB + VCalls{ "Wait" } ) );
  EXPECT_EQ( m_pDevice->GetVideoStandard(), KVZ::IVideoStandard::ESD_720_576I_5000 );
  EXPECT_EQ( Fired(), ( VFired{ { "standard", 1 } } ) );
  m_Card.Resume();
  EXPECT_EQ( m_Card.TakeCalls(), ( VCalls{ "Set 39 0", "Wait" } ) );
}

TEST_F( Bluefish444Device, ARoundIsOneFrameAndReadsTheBufferNamedBefore )
{
  MakeCapturing();
  m_Dropped.clear();
  const VCalls Names[] = { { "Capture 0", "Capture 5000" }, { "Capture 1", "Capture 5001" }, { "Capture 2", "Capture 5002" } };
  const uint32_t First = m_pReceiver->Frames().back().m_Image.front();
  for( uint32_t Round = 1; Round < 7; ++Round )
  {
    SCOPED_TRACE( Round );
    const uint32_t Read = ( First + Round ) % 3;
    const uint32_t Named = ( Read + 1 ) % 3;
    EXPECT_EQ( Next().m_Image, std::vector<uint8_t>( Fake::ImageBytes, static_cast<uint8_t>( Read ) ) );
    const VCalls Frame = { "Query 18", "Capture 600" + std::to_string( Named ), "Read 600" + std::to_string( Read ) + " 1000",
      "Read 4600" + std::to_string( Read ) + " 40000", "Decode 1B" };
    EXPECT_EQ( m_Card.TakeCalls(), ( Frame + Names[( Named + 1 ) % 3] + VCalls{ "Query 18", "Wait" } ) );
  }
  EXPECT_EQ( m_Dropped, std::vector<unsigned int>() );
}

TEST_F( Bluefish444Device, NothingNamedBeforeASetUpIsDelivered )
{
  MakeCapturing();
  const size_t Before = m_pReceiver->Count();
  Order( 2 );
  // This round's frame is still the former order's; then two syncs of set-up, one for the first name, and with the next its frame is whole
  Resume( 1 );
  EXPECT_EQ( m_pReceiver->Count(), Before + 1 );
  m_Card.TakeCalls();
  Resume( 3 );
  EXPECT_EQ( m_pReceiver->Count(), Before + 1 );
  const VReceivedFrame Frame = Next();
  EXPECT_EQ( Frame.m_Index, Before + 1 ) << "the running index goes on";
  EXPECT_EQ( Frame.m_Header.m_AudioInfo.m_Channels, 2u );
}

TEST_F( Bluefish444Device, PausesASecondAtATimeWithoutASignal )
{
  Make( NoSignal );
  Order();
  EXPECT_EQ( m_Card.Resume(), "1000" );
  EXPECT_EQ( m_Card.Resume(), "sync" );
  EXPECT_EQ( m_Card.Resume(), "1000" );
  EXPECT_EQ( m_pReceiver->Count(), 0u );
  EXPECT_EQ( m_pDevice->GetVideoStandard(), KVZ::IVideoStandard::EUnspecified );
  m_Card.m_Mode = Mode576i;
  EXPECT_EQ( ResumeUntilFrame().m_Index, 0u );
}

// The driver's own number for no signal counts, and without an answer the one of old.
TEST_F( Bluefish444Device, TakesTheNoSignalModeFromTheCard )
{
  m_Card.m_Properties.erase( BlueVelvet::Property::InvalidVideoModeFlag );
  Make( 44 );
  EXPECT_EQ( m_Card.Resume(), "1000" );
  m_Card.m_Mode = 46;
  Resume( 2 );
  EXPECT_EQ( m_pDevice->GetVideoStandard(), KVZ::IVideoStandard::ESD_720_576I_5000 );
  EXPECT_TRUE( m_Log.Has( "Invalid video standard." ) );
}

TEST_F( Bluefish444Device, ASignalThatGoesTakesItsTimecodeAlong )
{
  m_Card.m_Timecodes[BlueVelvet::TimecodePlace::RP188LTC] = 0x01'00'00'00'00'00'00'00;
  MakeCapturing();
  EXPECT_TRUE( KVZ::IsValid( m_pDevice->GetTimecode() ) );
  bool bValidThen = true;
  // On the capture thread, which must hold no lock then
  m_pDevice->GetTimecodeChangedCallback().AddImmediate( [&] { bValidThen = KVZ::IsValid( m_pDevice->GetTimecode() ); } );
  const size_t Before = m_pReceiver->Count();
  m_Card.m_Mode = NoSignal;
  while( m_Card.Resume() == "sync" )
  {
  }
  EXPECT_EQ( m_pReceiver->Count(), Before ) << "nobody knows what the last frame holds";
  EXPECT_EQ( m_pDevice->GetVideoStandard(), KVZ::IVideoStandard::EUnspecified );
  EXPECT_FALSE( bValidThen );
  EXPECT_EQ( Fired(), ( VFired{ { "standard", 1 }, { "timecode", 1 } } ) );
}

// A card that is taken out fails every call; one that comes back is used again.
TEST_F( Bluefish444Device, ALostCardIsALostSignalUntilItComesBack )
{
  MakeCapturing();
  const size_t Before = m_pReceiver->Count();
  m_Card.m_bLost = true;
  EXPECT_EQ( m_Card.Resume(), "1000" );
  EXPECT_EQ( m_Card.Resume(), "1000" );
  EXPECT_EQ( m_pReceiver->Count(), Before );
  EXPECT_EQ( m_pDevice->GetVideoStandard(), KVZ::IVideoStandard::EUnspecified );
  EXPECT_EQ( m_pDevice->GetStatus(), VDevice::EStatus::ECapturing ) << "the order stands";
  m_Card.m_bLost = false;
  EXPECT_EQ( ResumeUntilFrame().m_Index, Before );
}

TEST_F( Bluefish444Device, CountsTheFramesBetweenTwoSyncs )
{
  MakeCapturing();
  EXPECT_EQ( m_Dropped, ( std::vector<unsigned int>{ Fake::FieldsBefore / 2 + 3 } ) )
    << "at first the card's whole running time, as it stands: with the syncs of the set-up, less the frame that came";
  m_Dropped.clear();
  for( const uint32_t Fields : { 2u, 4u, 3u, 12u, 1u, 2u } )
  {
    m_Card.m_FieldsAFrame = Fields;
    Resume();
  }
  m_pService->RunAll();
  EXPECT_EQ( m_Dropped, ( std::vector<unsigned int>{ 1, 0, 5 } ) );
}

TEST_F( Bluefish444Device, OrdersAreTakenOneARound )
{
  Make();
  Resume( 3 );
  Fired();
  Order();
  EXPECT_EQ( m_pDevice->GetStatus(), VDevice::EStatus::ECapturing );
  m_pDevice->StopCapture();
  EXPECT_EQ( m_pDevice->GetStatus(), VDevice::EStatus::EReady ) << "by the last order, whatever the thread has come to";
  Order( 2 );
  Order( 4 );
  EXPECT_FALSE( m_pDevice->IsCapturing() );
  std::vector<bool> Capturing;
  std::vector<int> Status;
  for( int Round = 0; Round < 4; ++Round )
  {
    // The end of a round, then its successor takes an order and sets up: that sync, and the one its first name waits for
    m_Card.Resume();
    Capturing.push_back( m_pDevice->IsCapturing() );
    Status.push_back( Fired()["status"] );
    Resume( 2 );
  }
  EXPECT_EQ( Capturing, ( std::vector<bool>{ true, false, true, true } ) );
  EXPECT_EQ( Status, ( std::vector<int>{ 1, 1, 1, 0 } ) );
  EXPECT_EQ( m_pReceiver->Count(), 0u );
  Resume( 1 );
  EXPECT_EQ( Next().m_Header.m_VideoInfo.m_ImageWidth, Fake::Width );
}

TEST_F( Bluefish444Device, StoppingEndsTheFramesAndKeepsWatchingTheSignal )
{
  MakeCapturing();
  m_pDevice->StopCapture();
  m_Card.Resume();   // the frame that was under way
  const size_t Before = m_pReceiver->Count();
  EXPECT_EQ( Fired(), ( VFired{ { "status", 1 } } ) );
  Resume( 8 );
  EXPECT_EQ( m_pReceiver->Count(), Before );
  m_Card.m_Mode = Mode720p5994;
  Resume( 2 );
  EXPECT_EQ( m_pDevice->GetVideoStandard(), KVZ::IVideoStandard::EHD_1280_720P_5994 );
}

TEST_F( Bluefish444Device, BadOrdersAreToldInTheLog )
{
  Make( Mode576i, 6 );
  EXPECT_EQ( m_pDevice->GetDeviceName(), "Epoch Horizon C1:Ch?" );
  EXPECT_TRUE( m_Log.Has( "Unknown channel." ) );
  Order( 0, Int16, KVZ::IPixelFormat::EBayerRG8 );
  Resume( 5 );
  EXPECT_TRUE( m_Log.Has( "Unsupported pixel format." ) );
}

}
