// A data source that is fed by hand, as a device's delivery thread feeds it: frames in memory of the source's own allocator, timed and
// labelled without a break, 25 a second.
#pragma once

#include "HardwareSupport/VideoInput/VideoInputDataSource/VideoInputDataSource.h"

#include <cstddef>
#include <cstdint>
#include <memory>

namespace StageCorePluginInterface
{
class ICaptureTargets;
}

namespace NotificationSystem
{
class VAsioPostalService;
}

struct VFeedSettings
{
  size_t m_FrameBytes = 0;       // of a frame's block, its header included
  size_t m_FramesPerBlock = 1;   // of the allocator
  size_t m_Frames = 0;           // that the memory holds at least
  std::shared_ptr<StageCorePluginInterface::ICaptureTargets> m_pCaptureTargets{};
};

class VFrameFeed
{
public:
  static constexpr KVZ::VTick Period{ KVZ::VTick::TicksPerSecond / 25 };

  explicit VFrameFeed( const VFeedSettings& i_rSettings );
  ~VFrameFeed();
  VFrameFeed( const VFrameFeed& ) = delete;
  VFrameFeed& operator=( const VFrameFeed& ) = delete;

  // A frame with its header filled. Throws std::runtime_error where there is no memory for it.
  VideoInputHAL::VVideoInputDataSourceFrame* MakeFrame();
  // Hands the frame over and returns how long that took, in nanoseconds. Throws std::runtime_error if it was refused.
  int64_t Deliver( VideoInputHAL::VVideoInputDataSourceFrame* i_pFrame );

  // Joins the source to a global session in which global tick 0 is its first frame. After the first frame.
  void JoinSession();

  VideoInputHAL::VVideoInputDataSource& Source() { return *m_pSource; }
  int64_t HeldFrames() const;

private:
  class VTime;

  const VFeedSettings m_Settings;
  const std::shared_ptr<VTime> m_pTime;
  const std::shared_ptr<NotificationSystem::VAsioPostalService> m_pPostalService;
  const std::shared_ptr<VideoInputHAL::VVideoInputDataSourceAllocator> m_pAllocator;
  const std::shared_ptr<VideoInputHAL::VVideoInputDataSource> m_pSource;
  KVZ::ITimecode m_Timecode;
  uint32_t m_FrameIndex = 0;
};
