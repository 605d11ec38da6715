// A virtual card's capture side, frame by frame under a clock moved by hand.
#include "tests/cards/DeckLinkClient.h"

using namespace CardsTests;
using DeckLinkStream = VCardFixture;

TEST_F( DeckLinkStream, FramesFollowEachOtherInEveryFormat )
{
  Plug( "decklink:pattern=counter,audio=ramp,channels=4" );
  m_Client.Record( 8 * 4 );
  uint32_t Next = 0;
  for( const uint32_t Format : { PixelFormat::YUV8Bit, PixelFormat::YUV10Bit, PixelFormat::BGRA8Bit } )
  {
    m_Client.m_Sound.clear();
    Enable( Mode1080p25, Format );
    ASSERT_EQ( m_pInput->EnableAudioInput( 48000, AudioSampleType::Int32, 8 ), S_OK );
    Start();
    for( const uint32_t InStream : { 0u, 1u, 2u } )
    {
      SCOPED_TRACE( Next );
      Step();
      ASSERT_EQ( m_Client.m_Seen.size(), Next + 1 );
      const VSeen& rSeen = m_Client.m_Seen.back();
      EXPECT_TRUE( rSeen.m_bSignal );
      EXPECT_EQ( rSeen.m_Width, 1920 );
      EXPECT_EQ( rSeen.m_Height, 1080 );
      EXPECT_EQ( rSeen.m_PixelFormat, Format );
      EXPECT_EQ( rSeen.m_Counter, Next );
      EXPECT_EQ( rSeen.m_StreamTime, InStream * 5400000 ) << "the stream's time begins anew";
      EXPECT_EQ( rSeen.m_HardwareTime - m_Client.m_Seen[0].m_HardwareTime, Next * 5400000 );
      EXPECT_EQ( rSeen.m_Duration, 5400000 );
      EXPECT_EQ( rSeen.m_Timecode, "01:00:00:0" + std::to_string( Next ) );
      ++Next;
    }
    EXPECT_EQ( TestSupport::ReadRamp( { m_Client.m_Sound.data(), 3 * 1920, 8, 4 }, 4 ), ( Next - 3 ) * 1920 );
    EXPECT_EQ( m_pInput->StopStreams(), S_OK );
  }
  Step( 2 );
  EXPECT_EQ( m_Client.m_Seen.size(), Next ) << "nothing comes from stopped streams";
}

// In another mode it is none, unless detection was asked for, which leads to the signal's format within one frame.
TEST_F( DeckLinkStream, ASignalInAnotherModeIsLookedForWhereDetectionIsAskedFor )
{
  Plug( "decklink:standard=HD_1280_720P_5994,pattern=counter" );
  RestartOnFormat();
  m_Client.Record();
  Enable( ModeNTSC );
  Start();
  Step( 2 );
  EXPECT_EQ( m_Client.m_FormatCalls, 0 );
  ASSERT_EQ( m_Client.m_Seen.size(), 2u );
  EXPECT_EQ( m_Client.m_Seen[1].m_Flags, FrameFlag::NoInputSource );
  EXPECT_EQ( m_Client.m_Seen[1].m_Height, 486 );
  EXPECT_EQ( m_Client.m_Seen[1].m_Counter, std::nullopt );
  EXPECT_EQ( m_Client.m_Seen[1].m_Timecode, "" );

  m_pInput->StopStreams();
  StartDetecting();
  Step( 4 );
  EXPECT_EQ( m_Client.m_FormatCalls, 1 );
  EXPECT_EQ( m_Client.m_LastEvents, FormatChange::DisplayMode | FormatChange::FieldDominance | FormatChange::ColourSpace );
  EXPECT_EQ( m_Client.m_LastDetected, DetectedSignal::YCbCr422 );
  ASSERT_EQ( m_Client.m_Seen.size(), 6u );
  EXPECT_TRUE( m_Client.m_Seen[2].m_bSignal );
  EXPECT_EQ( m_Client.m_Seen[2].m_Height, 720 );
  EXPECT_EQ( m_Client.m_Seen[2].m_StreamTime, 0 );
  EXPECT_EQ( m_Client.m_Seen[3].m_Timecode, "01:00:00:01" );
  EXPECT_EQ( m_Client.m_Seen[3].m_TimecodeFlags, TimecodeFlag::FieldMark );
  EXPECT_EQ( m_Client.m_Seen[4].m_Timecode, "01:00:00:02" );
  EXPECT_EQ( m_Client.m_Seen[5].m_Counter, 5u );
}

TEST_F( DeckLinkStream, TimecodeAnswersByTheSignalsPlaces )
{
  using namespace TimecodeFormat;
  const struct
  {
    std::string m_Standard;
    uint32_t m_Mode;
    std::vector<uint32_t> m_Answering;
  } Cases[] = {
    { "HD_1920_1080P_2500", Mode1080p25, { RP188Any, RP188LTC, RP188VITC1 } },
    { "HD_1920_1080I_5000", FourCharacterCode( "Hi50" ), { RP188Any, RP188LTC, RP188VITC1, RP188VITC2 } },
    { "SD_720_576I_5000", FourCharacterCode( "pal " ), { RP188Any, RP188LTC, RP188VITC1, RP188VITC2, VITCField1, VITCField2 } },
  };
  Plug( "decklink" );
  std::vector<uint32_t> Answering;
  m_Client.m_OnFrame = [&]( IDeckLinkVideoInputFrame* i_pFrame, IDeckLinkAudioInputPacket* )
  {
    Answering.clear();
    for( const uint32_t Format : { RP188Any, RP188LTC, RP188VITC1, RP188VITC2, VITCField1, VITCField2, Serial, FourCharacterCode( "rphr" ) } )
    {
      IDeckLinkTimecode* pTimecode = nullptr;
      const HRESULT Result = i_pFrame->GetTimecode( Format, &pTimecode );
      EXPECT_EQ( Result == S_OK, pTimecode != nullptr );
      if( pTimecode )
      {
        Answering.push_back( Format );
        EXPECT_EQ( pTimecode->GetBCD(), 0x10203024u );
        EXPECT_EQ( pTimecode->Release(), 0u );
      }
    }
  };
  for( const auto& rCase : Cases )
  {
    SCOPED_TRACE( rCase.m_Standard );
    Event( R"({ "do": "format", "standard": ")" + rCase.m_Standard + "\" }" );
    Event( R"({ "do": "timecode-jump", "to": "10:20:30:24" })" );
    Enable( rCase.m_Mode );
    Start();
    Step();
    EXPECT_EQ( Answering, rCase.m_Answering );
    m_pInput->StopStreams();
  }
}

TEST_F( DeckLinkStream, PacketsComeOnlyWithSoundThatIsEnabledAndThere )
{
  Play( "decklink:audio=none" );
  Step();
  m_pInput->StopStreams();
  ASSERT_EQ( m_pInput->EnableAudioInput( 48000, AudioSampleType::Int16, 2 ), S_OK );
  Start();
  Step();
  EXPECT_EQ( m_Client.m_FrameCalls, 2 );
  EXPECT_EQ( m_Client.m_Packets, 0 );
}

TEST_F( DeckLinkStream, FramesThatAreKeptStayAsTheyWere )
{
  Plug( "decklink:pattern=counter" );
  std::vector<VComPointer<IDeckLinkVideoInputFrame>> Kept;
  m_Client.m_OnFrame = [&]( IDeckLinkVideoInputFrame* i_pFrame, IDeckLinkAudioInputPacket* )
  {
    EXPECT_EQ( i_pFrame->AddRef(), 2u );
    Kept.emplace_back( i_pFrame, false );
  };
  Enable();
  Start();
  Step( 20 );
  ASSERT_EQ( Kept.size(), 16u ) << "the card's buffers are used up";
  EXPECT_EQ( Counters().m_FramesWithoutBuffer, 4u );
  for( uint32_t i = 0; i < Kept.size(); ++i )
  {
    EXPECT_EQ( ReadCounter( PixelsOf( *Kept[i] ) ), i );
  }
  const void* pFreed = PixelsOf( *Kept[3] ).m_pBytes;
  Kept.erase( Kept.begin() + 3 );
  Step();
  ASSERT_EQ( Kept.size(), 16u );
  EXPECT_EQ( PixelsOf( *Kept.back() ).m_pBytes, pFreed ) << "memory is used again";
  EXPECT_EQ( ReadCounter( PixelsOf( *Kept.back() ) ), 20u );

  // They outlive the card
  m_pInput->StopStreams();
  m_pInput->SetCallback( nullptr );
  m_pInput.reset();
  m_pCard.reset();
  EXPECT_TRUE( Control().RemoveCard( m_Card ) );
  EXPECT_EQ( Control().ReferencesHeld(), 16 );
  EXPECT_EQ( ReadCounter( PixelsOf( *Kept[5] ) ), 6u );
}
