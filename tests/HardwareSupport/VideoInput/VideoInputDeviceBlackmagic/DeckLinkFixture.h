// A DeckLink device on a card of the fake runtime, with a receiver and an allocator that remember what they were given.
#pragma once

#include "HardwareSupport/VideoInput/VideoInputDeviceBlackmagic/BlackmagicDeckLinkDevice.h"
#include "tests/support/DeviceFrames.h"
#include "tests/support/FakeDeckLink.h"
#include "tests/support/LogCapture.h"
#include "tests/support/ManualPostalService.h"

#include <gtest/gtest.h>

#include <atomic>
#include <functional>
#include <map>
#include <memory>
#include <vector>

namespace Fake = TestSupport::FakeDeckLink;

using TestSupport::VFrameReceiver;
using TestSupport::VHeapAllocator;
using TestSupport::VReceivedFrame;

class DeckLinkDevice : public ::testing::Test
{
protected:
  using VDevice = VideoInputHAL::VBlackmagicDeckLinkDevice;

  static constexpr auto UYVY = KVZ::IPixelFormat::EU8Y8V8Y8;
  static constexpr auto AnyTimecode = KVZ::ITimecodeSource::EAny;
  static constexpr auto Int16 = KVZ::IAudioSampleFormat::EInt16;

  const int m_LiveBefore = Fake::Live();
  std::shared_ptr<TestSupport::VManualPostalService> m_pService = std::make_shared<TestSupport::VManualPostalService>();
  std::shared_ptr<VHeapAllocator> m_pAllocator = std::make_shared<VHeapAllocator>();
  std::shared_ptr<VFrameReceiver> m_pReceiver = std::make_shared<VFrameReceiver>();
  Fake::VCard* m_pCard = new Fake::VCard;
  std::shared_ptr<VDevice> m_pDevice = KVZ::MakeShared<VDevice>( m_pCard, 1, m_pService );
  std::map<std::string, int> m_Fired;   // by name of the callback
  std::vector<unsigned int> m_Dropped;
  TestSupport::VLogCapture m_Log{ "VideoInputDeviceBlackmagic", 2 };

  // Nothing of the runtime's is left when device and card have gone, and every block came back.
  void TearDown() override
  {
    m_pDevice.reset();
    m_pCard->Release();
    EXPECT_EQ( Fake::Live(), m_LiveBefore );
    EXPECT_EQ( m_pAllocator->m_Outstanding, 0 );
  }

  Fake::VInput& Input() { return m_pCard->Input(); }

  void Listen()
  {
    m_pDevice->GetStatusChangedCallback().Add( [this] { ++m_Fired["status"]; } );
    m_pDevice->GetPixelFormatsChangedCallback().Add( [this] { ++m_Fired["formats"]; } );
    m_pDevice->GetVideoStandardChangedCallback().Add( [this] { ++m_Fired["standard"]; } );
    m_pDevice->GetTimecodeChangedCallback().Add( [this] { ++m_Fired["timecode"]; } );
    m_pDevice->GetDroppedFramesCallback().Add( [this]( unsigned int i_Count ) { m_Dropped.push_back( i_Count ); } );
  }
  // What was fired since the last call.
  std::map<std::string, int> Fired()
  {
    m_pService->RunAll();
    return std::exchange( m_Fired, {} );
  }

  // A device that streams, in the order in which the engine wires it.
  void Initialise()
  {
    ASSERT_TRUE( m_pDevice->Initialise().Succeeded() );
    m_pDevice->SetDeviceIndex( 7 );
    Listen();
    m_pDevice->SetDataCallback( m_pReceiver );
    m_pDevice->SetAllocator( m_pAllocator );
  }
  void InitialiseAndCapture( uint32_t i_Channels = 0, KVZ::IAudioSampleFormat::Enum i_AudioFormat = Int16 )
  {
    Initialise();
    ASSERT_EQ( m_pDevice->StartCapture( UYVY, AnyTimecode, i_AudioFormat, i_Channels ).m_Code, 0 );
    Input().ForgetCalls();
    Fired();
  }

  // The frame that a test looks at, after it was delivered.
  VReceivedFrame Delivered( const Fake::VFrameContent& i_rFrame, const std::optional<Fake::VAudioContent>& i_rAudio = std::nullopt )
  {
    const size_t Before = m_pReceiver->Count();
    Input().DeliverFrame( i_rFrame, i_rAudio );
    const auto Frames = m_pReceiver->Frames();
    EXPECT_EQ( Frames.size(), Before + 1 );
    return Frames.empty() ? VReceivedFrame() : Frames.back();
  }
};

using VCalls = std::vector<std::string>;
using VFired = std::map<std::string, int>;
