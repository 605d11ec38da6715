// A virtual card's capture side, frame by frame under a clock moved by hand.
#include "tests/cards/DeckLinkClient.h"

using namespace CardsTests;

namespace
{

class DeckLinkStream : public VCardFixture
{
};

}

TEST_F( DeckLinkStream, FramesFollowEachOtherInEveryFormat )
{
  Plug( "decklink:pattern=counter,audio=ramp,channels=4" );
  uint32_t Next = 0;
  for( const uint32_t Format : { PixelFormat::YUV8Bit, PixelFormat::YUV10Bit, PixelFormat::BGRA8Bit } )
  {
    m_Client.m_Seen.clear();
    Enable( Mode1080p25, Format );
    ASSERT_EQ( m_pInput->EnableAudioInput( 48000, AudioSampleType::Int32, 8 ), S_OK );
    m_Client.m_OnFrame = [&]( IDeckLinkVideoInputFrame* i_pFrame, IDeckLinkAudioInputPacket* i_pPacket )
    {
      m_Client.m_Seen.push_back( Look( *i_pFrame, i_pPacket ) );
      void* pSamples = nullptr;
      ASSERT_EQ( i_pPacket->GetBytes( &pSamples ), S_OK );
      const TestSupport::VSamples Samples{ static_cast<const uint8_t*>( pSamples ), static_cast<size_t>( i_pPacket->GetSampleFrameCount() ), 8, 4 };
      EXPECT_EQ( TestSupport::ReadRamp( Samples, 4 ), static_cast<uint16_t>( m_Client.m_Seen.back().m_Counter.value_or( 0 ) * 1920 ) );
    };
    Start();
    Step( 3 );
    ASSERT_EQ( m_Client.m_Seen.size(), 3u );
    for( size_t i = 0; i < 3; ++i )
    {
      const VSeen& rSeen = m_Client.m_Seen[i];
      EXPECT_TRUE( rSeen.m_bSignal );
      EXPECT_EQ( rSeen.m_Width, 1920 );
      EXPECT_EQ( rSeen.m_Height, 1080 );
      EXPECT_EQ( rSeen.m_PixelFormat, Format );
      EXPECT_EQ( rSeen.m_Counter, Next );
      EXPECT_EQ( rSeen.m_StreamTime, static_cast<int64_t>( i ) * 5400000 ) << "the stream's time begins anew";
      EXPECT_EQ( rSeen.m_HardwareTime - m_Client.m_Seen[0].m_HardwareTime, static_cast<int64_t>( i ) * 5400000 );
      EXPECT_EQ( rSeen.m_Duration, 5400000 );
      EXPECT_EQ( rSeen.m_Timecode, "01:00:00:0" + std::to_string( Next ) );
      ++Next;
    }
    EXPECT_EQ( m_pInput->StopStreams(), S_OK );
  }
  Step( 2 );
  EXPECT_EQ( m_Client.m_Seen.size(), 3u ) << "nothing comes from stopped streams";
}

TEST_F( DeckLinkStream, DetectionLeadsToTheSignalsFormatWithinOneFrame )
{
  Plug( "decklink:standard=HD_1280_720P_5994,pattern=counter" );
  boost::mutex ClientLock;   // held through both callbacks, as drivers do
  m_Client.m_OnFormat = [&]( uint32_t i_Mode )
  {
    const boost::lock_guard<boost::mutex> Lock( ClientLock );
    EXPECT_EQ( i_Mode, FourCharacterCode( "hp59" ) );
    m_pInput->PauseStreams();
    m_pInput->EnableVideoInput( i_Mode, PixelFormat::YUV8Bit, InputFlag::FormatDetection );
    m_pInput->FlushStreams();
    m_pInput->StartStreams();
  };
  m_Client.m_OnFrame = [&]( IDeckLinkVideoInputFrame* i_pFrame, IDeckLinkAudioInputPacket* i_pPacket )
  {
    const boost::lock_guard<boost::mutex> Lock( ClientLock );
    m_Client.m_Seen.push_back( Look( *i_pFrame, i_pPacket ) );
  };
  Enable( ModeNTSC, PixelFormat::YUV8Bit, InputFlag::FormatDetection );
  Start();
  Step( 4 );
  EXPECT_EQ( m_Client.m_FormatCalls, 1 );
  EXPECT_EQ( m_Client.m_LastEvents, FormatChange::DisplayMode | FormatChange::FieldDominance | FormatChange::ColourSpace );
  EXPECT_EQ( m_Client.m_LastDetected, DetectedSignal::YCbCr422 );
  ASSERT_EQ( m_Client.m_Seen.size(), 4u );
  EXPECT_TRUE( m_Client.m_Seen[0].m_bSignal );
  EXPECT_EQ( m_Client.m_Seen[0].m_StreamTime, 0 );
  EXPECT_EQ( m_Client.m_Seen[3].m_Counter, 3u );
  EXPECT_EQ( m_Client.m_Seen[1].m_Timecode, "01:00:00:00" );
  EXPECT_EQ( m_Client.m_Seen[1].m_TimecodeFlags, TimecodeFlag::FieldMark );
  EXPECT_EQ( m_Client.m_Seen[2].m_Timecode, "01:00:00:01" );
}

TEST_F( DeckLinkStream, AFormatChangeIsToldAndStopEnableStartInsideTheCallbackWorks )
{
  Plug( "decklink:pattern=counter" );
  m_Client.m_OnFormat = [&]( uint32_t i_Mode )
  {
    EXPECT_EQ( m_pInput->StopStreams(), S_OK );
    EXPECT_EQ( m_pInput->EnableVideoInput( i_Mode, PixelFormat::YUV10Bit, InputFlag::FormatDetection ), S_OK );
    EXPECT_EQ( m_pInput->StartStreams(), S_OK );
  };
  m_Client.Record();
  Enable( Mode1080p25, PixelFormat::YUV10Bit, InputFlag::FormatDetection );
  Start();
  Step( 2 );
  EXPECT_EQ( m_Client.m_FormatCalls, 1 ) << "the first signal is always announced";
  EXPECT_EQ( m_Client.m_LastEvents, FormatChange::ColourSpace );
  Event( R"({ "do": "format", "standard": "SD_720_576I_5000" })" );
  Step( 2 );
  EXPECT_EQ( m_Client.m_FormatCalls, 2 );
  EXPECT_EQ( m_Client.m_LastEvents, FormatChange::DisplayMode | FormatChange::FieldDominance );
  ASSERT_EQ( m_Client.m_Seen.size(), 4u );
  EXPECT_EQ( m_Client.m_Seen[3].m_Height, 576 );
  EXPECT_EQ( m_Client.m_Seen[3].m_Counter, 3u );
}

TEST_F( DeckLinkStream, ASignalInAnotherModeIsNoSignal )
{
  Plug( "decklink:pattern=counter" );
  m_Client.Record();
  Enable( ModeNTSC );
  Start();
  Step( 2 );
  EXPECT_EQ( m_Client.m_FormatCalls, 0 ) << "detection was not asked for";
  ASSERT_EQ( m_Client.m_Seen.size(), 2u );
  EXPECT_EQ( m_Client.m_Seen[1].m_Flags, FrameFlag::NoInputSource );
  EXPECT_EQ( m_Client.m_Seen[1].m_Height, 486 );
  EXPECT_EQ( m_Client.m_Seen[1].m_Counter, std::nullopt );
  EXPECT_EQ( m_Client.m_Seen[1].m_Timecode, "" );
}

TEST_F( DeckLinkStream, AClientThatInsistsOnTheWrongColourSpaceIsToldAgainAndAgain )
{
  Plug( "decklink:pattern=counter" );
  RestartOnFormat( PixelFormat::BGRA8Bit );
  m_Client.Record();
  Enable( Mode1080p25, PixelFormat::BGRA8Bit, InputFlag::FormatDetection );
  Start();
  Step( 3 );
  EXPECT_EQ( m_Client.m_FormatCalls, 3 );
  EXPECT_EQ( m_Client.m_LastEvents, FormatChange::ColourSpace );
  ASSERT_EQ( m_Client.m_Seen.size(), 3u ) << "and gets its pictures all the same";
  EXPECT_EQ( m_Client.m_Seen[2].m_Counter, 2u );

  m_Client.m_OnFormat = nullptr;
  Step( 3 );
  EXPECT_EQ( m_Client.m_FormatCalls, 4 ) << "one that does not answer is told once";
}

TEST_F( DeckLinkStream, LossOfSignalMarksFramesAndTheClockGoesOn )
{
  Plug( "decklink:pattern=counter,audio=tone" );
  m_Client.Record();
  Enable();
  ASSERT_EQ( m_pInput->EnableAudioInput( 48000, AudioSampleType::Int16, 2 ), S_OK );
  Start();
  Step( 2 );
  Event( R"({ "do": "signal-loss", "frames": 3 })" );
  Step( 4 );
  ASSERT_EQ( m_Client.m_Seen.size(), 6u );
  for( size_t i = 0; i < 6; ++i )
  {
    const bool bSignal = i < 2 || i > 4;
    EXPECT_EQ( m_Client.m_Seen[i].m_bSignal, bSignal ) << i;
    EXPECT_EQ( m_Client.m_Seen[i].m_Timecode.empty(), !bSignal ) << i;
    EXPECT_EQ( m_Client.m_Seen[i].m_Samples, 1920 ) << i;
    EXPECT_EQ( m_Client.m_Seen[i].m_StreamTime, static_cast<int64_t>( i ) * 5400000 );
  }
  EXPECT_EQ( m_Client.m_Seen[5].m_Counter, 5u );
}

TEST_F( DeckLinkStream, PausedStreamsGoOnInTheirOwnTime )
{
  Play( "decklink:pattern=counter" );
  Step();
  EXPECT_EQ( m_pInput->PauseStreams(), S_OK );
  Step( 2 );
  EXPECT_EQ( m_pInput->PauseStreams(), S_OK );
  Step();
  ASSERT_EQ( m_Client.m_Seen.size(), 2u );
  EXPECT_EQ( m_Client.m_Seen[1].m_StreamTime, 3 * 5400000 );
  EXPECT_EQ( m_pInput->StopStreams(), S_OK );
  EXPECT_EQ( m_pInput->PauseStreams(), E_ACCESSDENIED );
}

TEST_F( DeckLinkStream, TimecodeAnswersByTheSignalsPlaces )
{
  struct VCase
  {
    const char* m_pStandard;
    uint32_t m_Mode;
    std::vector<uint32_t> m_Answering;
  };
  using namespace TimecodeFormat;
  const VCase Cases[] = {
    { "HD_1920_1080P_2500", Mode1080p25, { RP188Any, RP188LTC, RP188VITC1 } },
    { "HD_1920_1080I_5000", FourCharacterCode( "Hi50" ), { RP188Any, RP188LTC, RP188VITC1, RP188VITC2 } },
    { "SD_720_576I_5000", FourCharacterCode( "pal " ), { RP188Any, RP188LTC, RP188VITC1, RP188VITC2, VITCField1, VITCField2 } },
  };
  Plug( "decklink:timecode=10:20:30:24" );
  for( const VCase& rCase : Cases )
  {
    SCOPED_TRACE( rCase.m_pStandard );
    Event( ( std::string( R"({ "do": "format", "standard": ")" ) + rCase.m_pStandard + "\" }" ).c_str() );
    Event( R"({ "do": "timecode-jump", "to": "10:20:30:24" })" );
    std::vector<uint32_t> Answering;
    m_Client.m_OnFrame = [&]( IDeckLinkVideoInputFrame* i_pFrame, IDeckLinkAudioInputPacket* )
    {
      for( const uint32_t Format : { RP188Any, RP188LTC, RP188VITC1, RP188VITC2, VITCField1, VITCField2, Serial } )
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
      IDeckLinkTimecode* pTimecode = nullptr;
      EXPECT_LT( i_pFrame->GetTimecode( FourCharacterCode( "rphr" ), &pTimecode ), 0 );
    };
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
  EXPECT_FALSE( m_Client.m_Seen[0].m_bPacket );
  m_pInput->StopStreams();
  ASSERT_EQ( m_pInput->EnableAudioInput( 48000, AudioSampleType::Int16, 2 ), S_OK );
  Start();
  Step();
  EXPECT_FALSE( m_Client.m_Seen[1].m_bPacket );
}

TEST_F( DeckLinkStream, FramesThatAreKeptStayAsTheyWere )
{
  Plug( "decklink:pattern=counter" );
  std::vector<VPointer<IDeckLinkVideoInputFrame>> Kept;
  m_Client.m_OnFrame = [&]( IDeckLinkVideoInputFrame* i_pFrame, IDeckLinkAudioInputPacket* )
  {
    EXPECT_EQ( i_pFrame->AddRef(), 2u );
    Kept.emplace_back( i_pFrame );
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
