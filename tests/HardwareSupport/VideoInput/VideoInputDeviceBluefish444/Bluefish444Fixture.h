// A Bluefish444 device on a card of the fake library, with a receiver and an allocator that remember what they were given.
#pragma once

#include "HardwareSupport/VideoInput/VideoInputDeviceBluefish444/Bluefish444Device.h"
#include "tests/support/DeviceFrames.h"
#include "tests/support/FakeBlueVelvet.h"
#include "tests/support/LogCapture.h"
#include "tests/support/ManualPostalService.h"

#include <gtest/gtest.h>

#include <map>
#include <memory>
#include <string>
#include <vector>

namespace Fake = TestSupport::FakeBlueVelvet;

using TestSupport::VReceivedFrame;
using VCalls = std::vector<std::string>;
using VFired = std::map<std::string, int>;

class Bluefish444Device : public ::testing::Test
{
protected:
  using VDevice = VideoInputHAL::VBluefish444Device;

  static constexpr uint32_t Mode576i = 0;
  static constexpr uint32_t Mode720p5994 = 2;
  static constexpr uint32_t Mode1556PsF15 = 15;
  static constexpr uint32_t NoSignal = 46;
  static constexpr auto UYVY = KVZ::IPixelFormat::EU8Y8V8Y8;
  static constexpr auto AnyTimecode = KVZ::ITimecodeSource::EAny;
  static constexpr auto Int16 = KVZ::IAudioSampleFormat::EInt16;

  Bluefish444Device() { Fake::Cards() = { &m_Card }; }

  // Nothing of the library's is left when the device has gone, and every block came back.
  void TearDown() override
  {
    m_Card.Freely();
    m_pDevice.reset();
    Fake::Cards().clear();
    EXPECT_EQ( Fake::Objects(), 0 );
    EXPECT_EQ( m_pAllocator->m_Outstanding, 0 );
  }

  // A device whose thread rests at its first sync.
  void Make( uint32_t i_Channel = 2 )
  {
    const auto pCard = std::make_shared<VideoInputHAL::VBluefish444SDKWrapper>( Fake::Functions() );
    ASSERT_TRUE( pCard->AttachInput( 1, i_Channel - 2 ) );
    m_pDevice = KVZ::MakeShared<VDevice>( VideoInputHAL::VBluefish444Input{ pCard, m_Card.m_Type, 1, i_Channel, 0 }, m_pService,
      [this]( std::chrono::milliseconds i_Time ) { m_Card.Rest( std::to_string( i_Time.count() ) ); } );
    m_pDevice->SetDeviceIndex( 7 );
    m_pDevice->GetStatusChangedCallback().Add( [this] { ++m_Fired["status"]; } );
    m_pDevice->GetPixelFormatsChangedCallback().Add( [this] { ++m_Fired["formats"]; } );
    m_pDevice->GetVideoStandardChangedCallback().Add( [this] { ++m_Fired["standard"]; } );
    m_pDevice->GetTimecodeChangedCallback().Add( [this] { ++m_Fired["timecode"]; } );
    m_pDevice->GetDroppedFramesCallback().Add( [this]( unsigned int i_Count ) { m_Dropped.push_back( i_Count ); } );
    m_pDevice->SetDataCallback( m_pReceiver );
    m_pDevice->SetAllocator( m_pAllocator );
    m_Card.WaitForRest();
  }

  void Order( uint32_t i_Channels = 0, KVZ::IAudioSampleFormat::Enum i_AudioFormat = Int16, KVZ::IPixelFormat::Enum i_PixelFormat = UYVY,
    KVZ::ITimecodeSource::Enum i_Source = AnyTimecode )
  {
    EXPECT_EQ( m_pDevice->StartCapture( i_PixelFormat, i_Source, i_AudioFormat, i_Channels ).m_Code, 0 );
  }

  void Resume( int i_Times )
  {
    for( int Time = 0; Time < i_Times; ++Time )
    {
      m_Card.Resume();
    }
  }

  // A device that delivers a frame with every Resume.
  void MakeCapturing( uint32_t i_Mode = Mode576i, uint32_t i_Channels = 0, KVZ::IAudioSampleFormat::Enum i_AudioFormat = Int16 )
  {
    m_Card.m_Mode = i_Mode;
    Make();
    Order( i_Channels, i_AudioFormat );
    for( int Syncs = 0; m_pReceiver->Count() == 0 && Syncs < 20; ++Syncs )
    {
      m_Card.Resume();
    }
    m_Card.TakeCalls();
    Fired();
  }

  // What was fired since the last call.
  VFired Fired()
  {
    m_pService->RunAll();
    return std::exchange( m_Fired, {} );
  }

  VReceivedFrame Next()
  {
    const size_t Before = m_pReceiver->Count();
    m_Card.Resume();
    const auto Frames = m_pReceiver->Frames();
    EXPECT_EQ( Frames.size(), Before + 1 );
    return Frames.empty() ? VReceivedFrame() : Frames.back();
  }

  Fake::VCard m_Card;
  std::shared_ptr<TestSupport::VManualPostalService> m_pService = std::make_shared<TestSupport::VManualPostalService>();
  std::shared_ptr<TestSupport::VHeapAllocator> m_pAllocator = std::make_shared<TestSupport::VHeapAllocator>();
  std::shared_ptr<TestSupport::VFrameReceiver> m_pReceiver = std::make_shared<TestSupport::VFrameReceiver>();
  std::shared_ptr<VDevice> m_pDevice;
  VFired m_Fired;   // by name of the callback
  std::vector<unsigned int> m_Dropped;
  TestSupport::VLogCapture m_Log{ "VideoInputDeviceBluefish444", 2 };
};
