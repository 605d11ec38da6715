// A Bluefish444 device on a card of the fake library.
#pragma once

#include "HardwareSupport/VideoInput/VideoInputDeviceBluefish444/Bluefish444Device.h"
#include "tests/support/CaptureDeviceFixture.h"
#include "tests/support/FakeBlueVelvet.h"

namespace Fake = TestSupport::FakeBlueVelvet;

class Bluefish444Device : public VCaptureDeviceFixture
{
protected:
  using VDevice = VideoInputHAL::VBluefish444Device;

  static constexpr uint32_t Mode576i = 0;
  static constexpr uint32_t Mode720p5994 = 2;
  static constexpr uint32_t Mode1556PsF15 = 15;
  static constexpr uint32_t NoSignal = 46;

  Bluefish444Device() : VCaptureDeviceFixture( "VideoInputDeviceBluefish444" ) { Fake::s_Cards = { &m_Card }; }

  // Nothing of the library's is left when the device has gone, and every block came back.
  void TearDown() override
  {
    m_Card.Freely();
    m_pDevice.reset();
    Fake::s_Cards.clear();
    EXPECT_EQ( Fake::s_Objects, 0 );
    EXPECT_EQ( m_pAllocator->m_Outstanding, 0 );
  }

  VideoInputHAL::VBluefish444Input Attach( uint32_t i_Channel = 2 ) const
  {
    const auto pCard = std::make_shared<VideoInputHAL::VBluefish444SDKWrapper>( Fake::Functions() );
    EXPECT_TRUE( pCard->AttachInput( 1, i_Channel - 2 ) );
    return { pCard, m_Card.m_Type, 1, i_Channel, 0 };
  }

  // A device whose thread rests at its first sync.
  void Make( uint32_t i_Mode = Mode576i, uint32_t i_Channel = 2 )
  {
    m_Card.m_Mode = i_Mode;
    m_pDevice = KVZ::MakeShared<VDevice>( Attach( i_Channel ), m_pService,
      [this]( std::chrono::milliseconds i_Time ) { m_Card.Rest( std::to_string( i_Time.count() ) ); } );
    Wire( *m_pDevice );
    m_Card.WaitForRest();
  }

  void Order( uint32_t i_Channels = 0, KVZ::IAudioSampleFormat::Enum i_AudioFormat = Int16, KVZ::IPixelFormat::Enum i_PixelFormat = UYVY )
  {
    EXPECT_EQ( m_pDevice->StartCapture( i_PixelFormat, AnyTimecode, i_AudioFormat, i_Channels ).m_Code, 0 );
  }

  void Resume( int i_Times = 1 )
  {
    for( int Time = 0; Time < i_Times; ++Time )
    {
      m_Card.Resume();
    }
  }

  // Until a frame has come.
  VReceivedFrame ResumeUntilFrame()
  {
    return FrameOf(
      [this, Before = m_pReceiver->Count()]
      {
        for( int Syncs = 0; m_pReceiver->Count() == Before && Syncs < 20; ++Syncs )
        {
          m_Card.Resume();
        }
      } );
  }

  // A device that delivers a frame with every Resume.
  void MakeCapturing( uint32_t i_Mode = Mode576i, uint32_t i_Channels = 0 )
  {
    Make( i_Mode );
    Order( i_Channels );
    ResumeUntilFrame();
    m_Card.TakeCalls();
    Fired();
  }

  VReceivedFrame Next()
  {
    return FrameOf( [this] { m_Card.Resume(); } );
  }

  Fake::VCard m_Card;
  std::shared_ptr<VDevice> m_pDevice;
};
