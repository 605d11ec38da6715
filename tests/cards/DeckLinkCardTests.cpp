// What a virtual card answers and what it refuses.
#include "tests/cards/DeckLinkClient.h"

using namespace CardsTests;

namespace
{

class DeckLinkCard : public VCardFixture
{
};

}

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

TEST_F( DeckLinkCard, ModesAndTheirSupport )
{
  Plug( "decklink" );
  IDeckLinkDisplayModeIterator* pIterator = nullptr;
  ASSERT_EQ( m_pInput->GetDisplayModeIterator( &pIterator ), S_OK );
  std::set<uint32_t> Codes;
  for( IDeckLinkDisplayMode* pMode = nullptr; pIterator->Next( &pMode ) == S_OK; pMode->Release() )
  {
    EXPECT_TRUE( Codes.insert( pMode->GetDisplayMode() ).second );
    int64_t Duration = 0;
    int64_t TimeScale = 0;
    EXPECT_EQ( pMode->GetFrameRate( &Duration, &TimeScale ), S_OK );
    EXPECT_GT( TimeScale / Duration, 22 );
    if( pMode->GetDisplayMode() == FourCharacterCode( "Hi59" ) )
    {
      const char* pName = nullptr;
      EXPECT_EQ( pMode->GetName( &pName ), S_OK );
      EXPECT_EQ( TakeText( pName ), "1080i59.94" );
      EXPECT_EQ( pMode->GetHeight(), 1080 );
      EXPECT_EQ( Duration * 30000, TimeScale * 1001 );
      EXPECT_EQ( pMode->GetFieldDominance(), FieldDominance::UpperFieldFirst );
      EXPECT_EQ( pMode->GetFlags(), DisplayModeFlag::Rec709 );
    }
  }
  EXPECT_EQ( pIterator->Release(), 0u );
  EXPECT_EQ( Codes.size(), 36u );

  uint32_t Support = 9;
  EXPECT_EQ( m_pInput->DoesSupportVideoMode( Mode1080p25, PixelFormat::YUV10Bit, InputFlag::FormatDetection, &Support, nullptr ), S_OK );
  EXPECT_EQ( Support, ModeSupport::Yes );
  EXPECT_EQ( m_pInput->DoesSupportVideoMode( Mode1080p25, PixelFormat::RGB12Bit, 0, &Support, nullptr ), S_OK );
  EXPECT_EQ( Support, ModeSupport::No );
}

TEST_F( DeckLinkCard, InterfacesAreOneObjectAndRefuseTheUnknown )
{
  Plug( "decklink" );
  const VPointer<IUnknown> pFromCard = Query<IUnknown>( *m_pCard, IID_IUnknown );
  const VPointer<IUnknown> pFromInput = Query<IUnknown>( *m_pInput, IID_IUnknown );
  EXPECT_EQ( pFromCard.get(), pFromInput.get() );
  const VPointer<IDeckLinkAttributes> pAttributes = Query<IDeckLinkAttributes>( *m_pInput, IID_IDeckLinkAttributes );
  ASSERT_NE( pAttributes, nullptr );
  EXPECT_EQ( Query<IDeckLink>( *pAttributes, IID_IDeckLink ).get(), m_pCard.get() );
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
