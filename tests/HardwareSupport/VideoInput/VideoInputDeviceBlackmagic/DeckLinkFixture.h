// A DeckLink device on a card of the fake runtime.
#pragma once

#include "HardwareSupport/VideoInput/VideoInputDeviceBlackmagic/BlackmagicDeckLinkDevice.h"
#include "HardwareSupport/VideoInput/VideoInputDeviceBlackmagic/ComPointer.h"
#include "tests/support/CaptureDeviceFixture.h"
#include "tests/support/FakeDeckLink.h"

#include <optional>

namespace Fake = TestSupport::FakeDeckLink;

class DeckLinkDevice : public VCaptureDeviceFixture
{
protected:
  using VDevice = VideoInputHAL::VBlackmagicDeckLinkDevice;

  DeckLinkDevice() : VCaptureDeviceFixture( "VideoInputDeviceBlackmagic" ) {}

  // Nothing of the runtime's is left when device and card have gone, and every block came back.
  void TearDown() override
  {
    m_pDevice.reset();
    m_pCard->Release();
    EXPECT_EQ( Fake::Live(), m_LiveBefore );
    EXPECT_EQ( m_pAllocator->m_Outstanding, 0 );
  }

  Fake::VInput& Input() { return m_pCard->Input(); }

  std::shared_ptr<VDevice> MakeDevice( int32_t i_CardNumber ) const { return KVZ::MakeShared<VDevice>( m_pCard, i_CardNumber, m_pService ); }

  // A device that streams
  void Initialise()
  {
    ASSERT_TRUE( m_pDevice->Initialise().Succeeded() );
    Wire( *m_pDevice );
  }
  void InitialiseAndCapture( uint32_t i_Channels = 0, KVZ::IAudioSampleFormat::Enum i_AudioFormat = Int16 )
  {
    Initialise();
    Capture( i_Channels, i_AudioFormat );
    Input().ForgetCalls();
    Fired();
  }
  void Capture( uint32_t i_Channels = 0, KVZ::IAudioSampleFormat::Enum i_AudioFormat = Int16 )
  {
    ASSERT_EQ( m_pDevice->StartCapture( UYVY, AnyTimecode, i_AudioFormat, i_Channels ).m_Code, 0 );
  }

  void DeliverFormat( uint32_t i_Mode ) { Input().DeliverFormat( i_Mode, DeckLinkAPI::DetectedSignal::YCbCr422 ); }

  // The frame that a test looks at, after it was delivered.
  VReceivedFrame Delivered( const Fake::VFrameContent& i_rFrame, const std::optional<Fake::VAudioContent>& i_rAudio = std::nullopt )
  {
    return FrameOf( [&] { Input().DeliverFrame( i_rFrame, i_rAudio ); } );
  }

  const int m_LiveBefore = Fake::Live();
  Fake::VCard* const m_pCard = new Fake::VCard;
  std::shared_ptr<VDevice> m_pDevice = MakeDevice( 1 );
};
