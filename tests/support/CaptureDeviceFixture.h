// What stands around a capture device of any kind of card: a receiver and an allocator that remember what they were given, and listeners that count.
#pragma once

#include "HardwareSupport/VideoInput/VideoInputHAL/VideoInputDevice.h"
#include "HardwareSupport/VideoInput/VideoInputHAL/VideoInputFrame.h"
#include "StageCoreRuntime/ThreadAnnotations.h"
#include "tests/support/LogCapture.h"
#include "tests/support/ManualPostalService.h"

#include <boost/thread/lock_guard.hpp>
#include <boost/thread/mutex.hpp>
#include <gtest/gtest.h>

#include <atomic>
#include <cstdlib>
#include <functional>
#include <map>
#include <memory>
#include <string>
#include <utility>
#include <vector>

namespace TestSupport
{

class VHeapAllocator : public VideoInputHAL::IVideoInputAllocator
{
public:
  std::atomic<bool> m_bExhausted{ false };
  std::atomic<int> m_Outstanding{ 0 };
  std::atomic<uint64_t> m_LastBytes{ 0 };

  void* Allocate( uint64_t i_Bytes ) override
  {
    m_LastBytes = i_Bytes;
    if( m_bExhausted )
    {
      return nullptr;
    }
    ++m_Outstanding;
    return std::malloc( i_Bytes );   // exactly as much as was asked for, so that a sanitizer sees what goes beyond
  }
  void Free( void* i_pBlock ) override
  {
    --m_Outstanding;
    std::free( i_pBlock );
  }
};

struct VReceivedFrame
{
  uint32_t m_Index = 0;
  VideoInputHAL::VVideoInputDataSourceFrame m_Header;
  KVZ::ITimecode m_Timecode;
  int64_t m_Period = 0;
  std::vector<uint8_t> m_Image;
  std::vector<uint8_t> m_Audio;
};

class VFrameReceiver : public VideoInputHAL::IVideoInputDataCallback
{
public:
  std::atomic<bool> m_bAccept{ true };
  std::function<void()> m_OnFrame;   // inside the call; set before frames come

  bool OnVideoInputData( uint32_t i_FrameIndex, VideoInputHAL::VVideoInputDataSourceFrame* i_pFrame, const KVZ::ITimecode* i_pTimecode,
    const int64_t* i_pPeriod ) override
  {
    {
      boost::lock_guard<boost::mutex> Lock( m_Mutex );
      m_Frames.push_back( { i_FrameIndex, *i_pFrame, *i_pTimecode, *i_pPeriod, { i_pFrame->Image(), i_pFrame->Image() + i_pFrame->m_ImageBytes },
        { i_pFrame->Audio(), i_pFrame->Audio() + i_pFrame->m_AudioBytes } } );
    }
    if( m_OnFrame )
    {
      m_OnFrame();
    }
    if( m_bAccept )
    {
      i_pFrame->m_pAllocator->Free( i_pFrame );
    }
    return m_bAccept;
  }

  std::vector<VReceivedFrame> Frames() const
  {
    boost::lock_guard<boost::mutex> Lock( m_Mutex );
    return m_Frames;
  }
  size_t Count() const { return Frames().size(); }

private:
  mutable boost::mutex m_Mutex;
  std::vector<VReceivedFrame> m_Frames GUARDED_BY( m_Mutex );
};

}

using TestSupport::VFrameReceiver;
using TestSupport::VReceivedFrame;
using VCalls = std::vector<std::string>;
using VFired = std::map<std::string, int>;

class VCaptureDeviceFixture : public ::testing::Test
{
protected:
  static constexpr auto UYVY = KVZ::IPixelFormat::EU8Y8V8Y8;
  static constexpr auto AnyTimecode = KVZ::ITimecodeSource::EAny;
  static constexpr auto Int16 = KVZ::IAudioSampleFormat::EInt16;

  explicit VCaptureDeviceFixture( const char* i_pLogCategory ) : m_Log( i_pLogCategory, 2 ) {}

  // In the order in which the engine does it.
  void Wire( VideoInputHAL::IVideoInputDevice& i_rDevice )
  {
    i_rDevice.SetDeviceIndex( 7 );
    i_rDevice.GetStatusChangedCallback().Add( [this] { ++m_Fired["status"]; } );
    i_rDevice.GetPixelFormatsChangedCallback().Add( [this] { ++m_Fired["formats"]; } );
    i_rDevice.GetVideoStandardChangedCallback().Add( [this] { ++m_Fired["standard"]; } );
    i_rDevice.GetTimecodeChangedCallback().Add( [this] { ++m_Fired["timecode"]; } );
    i_rDevice.GetDroppedFramesCallback().Add( [this]( unsigned int i_Count ) { m_Dropped.push_back( i_Count ); } );
    i_rDevice.SetDataCallback( m_pReceiver );
    i_rDevice.SetAllocator( m_pAllocator );
  }

  // What was fired since the last call.
  VFired Fired()
  {
    m_pService->RunAll();
    return std::exchange( m_Fired, {} );
  }

  // The one frame that comes of this.
  VReceivedFrame FrameOf( const std::function<void()>& i_rDeliver )
  {
    const size_t Before = m_pReceiver->Count();
    i_rDeliver();
    const auto Frames = m_pReceiver->Frames();
    EXPECT_EQ( Frames.size(), Before + 1 );
    return Frames.empty() ? VReceivedFrame() : Frames.back();
  }

  // Of a wired device that captures two channels, whose image is less than a page.
  void ExpectHeader( const VReceivedFrame& i_rFrame, const KVZ::VideoFrameInfo& i_rVideo, uint32_t i_ImageBytes, uint32_t i_AudioBytes )
  {
    const auto& rHeader = i_rFrame.m_Header;
    EXPECT_EQ( rHeader.m_pAllocator, m_pAllocator.get() );
    EXPECT_EQ( rHeader.m_DeviceIndex, 7 );
    EXPECT_EQ( rHeader.m_VideoInfo, i_rVideo );
    EXPECT_EQ( rHeader.m_AudioInfo, ( KVZ::AudioFrameInfo{ Int16, 48000, 2 } ) );
    EXPECT_EQ( rHeader.m_ImageBytes, i_ImageBytes );
    EXPECT_EQ( rHeader.m_ImageCapacity, 4096u );
    EXPECT_EQ( rHeader.m_AudioBytes, i_AudioBytes );
    EXPECT_EQ( rHeader.m_AudioCapacity, i_AudioBytes );
    EXPECT_EQ( m_pAllocator->m_LastBytes, 4096u + 4096u + i_AudioBytes );
  }

  const std::shared_ptr<TestSupport::VManualPostalService> m_pService = std::make_shared<TestSupport::VManualPostalService>();
  std::shared_ptr<TestSupport::VHeapAllocator> m_pAllocator = std::make_shared<TestSupport::VHeapAllocator>();
  std::shared_ptr<VFrameReceiver> m_pReceiver = std::make_shared<VFrameReceiver>();
  VFired m_Fired;   // by name of the callback
  std::vector<unsigned int> m_Dropped;
  TestSupport::VLogCapture m_Log;
};

// May be its device's last owner, so that both end inside the callback.
class VOwningReceiver : public VFrameReceiver
{
public:
  std::shared_ptr<VideoInputHAL::IVideoInputDevice> m_pDevice;
};
