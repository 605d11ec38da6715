// What stands behind a device under test: an allocator that counts, and a receiver that remembers what it was given.
#pragma once

#include "HardwareSupport/VideoInput/VideoInputHAL/VideoInputDevice.h"
#include "HardwareSupport/VideoInput/VideoInputHAL/VideoInputFrame.h"
#include "StageCoreRuntime/ThreadAnnotations.h"

#include <boost/thread/lock_guard.hpp>
#include <boost/thread/mutex.hpp>

#include <atomic>
#include <cstdlib>
#include <functional>
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
  size_t Count() const
  {
    boost::lock_guard<boost::mutex> Lock( m_Mutex );
    return m_Frames.size();
  }

private:
  mutable boost::mutex m_Mutex;
  std::vector<VReceivedFrame> m_Frames GUARDED_BY( m_Mutex );
};

}
