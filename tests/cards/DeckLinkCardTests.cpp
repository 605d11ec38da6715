// What a virtual card answers and what it refuses.
#include "tests/cards/DeckLinkClient.h"

using namespace CardsTests;
using DeckLinkCard = VCardFixture;

TEST_F( DeckLinkCard, WhatARealCardRefuses )
{
  Plug( "decklink" );
  EXPECT_EQ( m_pInput->StartStreams(), E_UNEXPECTED );
  EXPECT_EQ( m_pInput->StopStreams(), S_FALSE );
  EXPECT_EQ( m_pInput->EnableVideoInput( DisplayModeUnknown, PixelFormat::YUV8Bit, 0 ), E_INVALIDARG );
  EXPECT_EQ( m_pInput->EnableVideoInput( Mode1080p25, PixelFormat::RGB10Bit, 0 ), E_INVALIDARG );
  EXPECT_EQ( m_pInput->EnableVideoInput( Mode1080p25, PixelFormat::YUV8Bit, InputFlag::DualStream3D ), E_INVALIDARG );
  EXPECT_EQ( m_pInput->EnableAudioInput( 44100, AudioSampleType::Int16, 2 ), E_INVALIDARG );
  EXPECT_EQ( m_pInput->EnableAudioInput( 48000, 24, 2 ), E_INVALIDARG );
  EXPECT_EQ( m_pInput->EnableAudioInput( 48000, AudioSampleType::Int16, 4 ), E_INVALIDARG );
  EXPECT_TRUE( Control().SetBusy( m_Card, true ) );
  EXPECT_EQ( m_pInput->EnableVideoInput( Mode1080p25, PixelFormat::YUV8Bit, 0 ), E_ACCESSDENIED );
  EXPECT_TRUE( Control().SetBusy( m_Card, false ) );
  Enable();
  Start();
  EXPECT_EQ( m_pInput->StartStreams(), E_ACCESSDENIED );
  EXPECT_EQ( m_pInput->DisableVideoInput(), E_ACCESSDENIED );
  EXPECT_EQ( m_pInput->EnableAudioInput( 48000, AudioSampleType::Int16, 2 ), E_ACCESSDENIED );
  EXPECT_EQ( m_pInput->StopStreams(), S_OK );
  EXPECT_EQ( m_pInput->DisableVideoInput(), S_OK );
  EXPECT_EQ( m_pInput->StartStreams(), E_UNEXPECTED );
}

TEST_F( DeckLinkCard, InterfacesAreOneObjectAndRefuseTheUnknown )
{
  Plug( "decklink" );
  const VComPointer<IUnknown> pFromCard = QueryInterface<IUnknown>( *m_pCard, IID_IUnknown );
  const VComPointer<IUnknown> pFromInput = QueryInterface<IUnknown>( *m_pInput, IID_IUnknown );
  EXPECT_EQ( pFromCard.get(), pFromInput.get() );
  const VComPointer<IDeckLinkAttributes> pAttributes = QueryInterface<IDeckLinkAttributes>( *m_pInput, IID_IDeckLinkAttributes );
  ASSERT_NE( pAttributes, nullptr );
  EXPECT_EQ( QueryInterface<IDeckLink>( *pAttributes, IID_IDeckLink ).get(), m_pCard.get() );
  bool bDetects = false;
  EXPECT_EQ( pAttributes->GetFlag( AttributeId::SupportsInputFormatDetection, &bDetects ), S_OK );
  EXPECT_TRUE( bDetects );
  void* pFound = this;
  EXPECT_EQ( m_pCard->QueryInterface( IID_IDeckLinkVideoFrame, &pFound ), E_NOINTERFACE );
  EXPECT_EQ( pFound, nullptr );
  EXPECT_EQ( m_pCard->QueryInterface( IID_IDeckLink, nullptr ), E_POINTER );
}

TEST_F( DeckLinkCard, AReleaseTooManyIsNoticed )
{
  Plug( "decklink" );
  const int64_t Before = Control().ReleaseErrors();
  m_Client.m_OnFrame = []( IDeckLinkVideoInputFrame* i_pFrame, IDeckLinkAudioInputPacket* ) { i_pFrame->Release(); };
  Enable();
  Start();
  Step( 2 );
  EXPECT_EQ( Control().ReleaseErrors(), Before + 2 );
}
