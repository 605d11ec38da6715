// A node of the host that takes the states of one device, checks them and measures.
#pragma once

#include "Flow2/Flow2Utils/FlowNode.h"
#include "StageCorePluginInterface/StageCoreHost.h"
#include "StageCoreRuntime/ThreadAnnotations.h"

#include <boost/thread/mutex.hpp>

#include <cstddef>
#include <cstdint>
#include <memory>
#include <string>
#include <vector>

namespace StageHost
{

struct VWatchFigures
{
  std::string m_DeviceURN;   // empty while no state has come
  std::string m_DeviceName;
  uint64_t m_States = 0;
  uint64_t m_DroppedFrames = 0;   // left out of the states because the graph was behind
  uint64_t m_DropRuns = 0;        // how often that happened
  uint64_t m_MissedFrames = 0;    // of one session, and in no state although nobody left them out
  uint64_t m_Sessions = 0;        // global sessions seen
  double m_StatesPerSecond = 0.0;
  double m_MedianLatency = 0.0;   // from delivery to the state in this node, seconds; of the last few thousand
  double m_Latency99 = 0.0;       // 99th percentile
  KVZ::VideoFrameInfo m_Video;    // of the newest state, like the following
  KVZ::AudioFrameInfo m_Audio;
  KVZ::ITimecode m_Timecode;
  KVZ::VTick m_Tick;
  KVZ::VTick m_Period;
  uint64_t m_Faults = 0;
  std::string m_FirstFault;   // what was wrong with a state, in words
};

class VFlowWatcher : public Flow2Utils::VFlowNode<VFlowWatcher>
{
public:
  explicit VFlowWatcher( std::shared_ptr<StageCorePluginInterface::ITimeService> i_pTime, bool i_bKeepNewest = false );

  static KVZ::VFlowNodeInfo MakeNodeInfo();

  // Any thread
  VWatchFigures GetFigures() const;
  // Forgets what has been seen so far.
  void BeginAnew();
  // The newest image, if it was to be kept; its frame stays in memory until the next one or until it is let go. Empty pointers otherwise.
  std::shared_ptr<const KVZ::VFlowVideoFrame> GetNewest() const;

protected:
  void Process() override;

private:
  void Take( const KVZ::IFlowState& i_rState, double i_Now ) REQUIRES( m_Mutex );
  void CheckPayload( const KVZ::VFlowVideoFrame& i_rVideo, const KVZ::VFlowAudioFrame* i_pAudio ) REQUIRES( m_Mutex );
  void Follow( const KVZ::VFlowCameraHardware& i_rCamera, uint64_t i_DroppedBefore ) REQUIRES( m_Mutex );
  void Measure( double i_DeliveryTime, double i_Now ) REQUIRES( m_Mutex );
  void Blame( const std::string& i_rFault ) REQUIRES( m_Mutex );

  // Fixed after construction
  const std::shared_ptr<StageCorePluginInterface::ITimeService> m_pTime;
  const bool m_bKeepNewest;

  mutable boost::mutex m_Mutex;
  VWatchFigures m_Figures GUARDED_BY( m_Mutex );
  KVZ::VGlobalSyncSessionId m_Session GUARDED_BY( m_Mutex );   // of the newest state
  std::vector<double> m_Latencies GUARDED_BY( m_Mutex );       // a ring once it is full
  std::vector<double> m_Times GUARDED_BY( m_Mutex );           // when states came, likewise
  std::shared_ptr<const KVZ::VFlowVideoFrame> m_pNewest GUARDED_BY( m_Mutex );
};

}
