// Makes flow states of stored frames. A state holds the frame's own memory: the frame stays pinned exactly as long as somebody has the state,
// or one of the two buffers in it.
#pragma once

#include "Flow2/Flow2Utils/FlowNodeUtils.h"
#include "SyncSystem/DataSourceFrames.h"
#include "SyncSystem/DriftMonitorAnalysis.h"

#include <boost/optional.hpp>

#include <cstdint>
#include <memory>

namespace VideoInputHAL
{

class VVideoInputDeviceManager;

// What a state tells about its frame beside the frame itself.
struct VFrameAnalysis
{
  uint64_t m_DroppedBefore = 0;   // frames left out between the last state and this one because the graph is behind
  boost::optional<SyncSystem::VDeliveryOffsets> m_Offsets;
};

// The node's thread, inside a checked call. The services outlive the object.
class VVideoInputDataBufferToFlowState
{
public:
  VVideoInputDataBufferToFlowState( std::shared_ptr<VVideoInputDeviceManager> i_pDeviceManager, Flow2Utils::VFlowNodeUtils& i_rServices );

  // VFlowException where the frame's device is not known any more, and where the services refuse.
  KVZ::VFlowStatePtr MakeState( const SyncSystem::VFrameRecord& i_rRecord, const VFrameAnalysis& i_rAnalysis ) const;

private:
  KVZ::VFlowItemPtr MakeVideo( const SyncSystem::VFrameRecord& i_rRecord ) const;
  KVZ::VFlowItemPtr MakeAudio( const SyncSystem::VFrameRecord& i_rRecord ) const;
  KVZ::VFlowItemPtr MakeCamera( const SyncSystem::VFrameRecord& i_rRecord ) const;
  KVZ::VFlowItemPtr MakeAnalysis( const SyncSystem::VFrameRecord& i_rRecord, const VFrameAnalysis& i_rAnalysis ) const;

  const std::shared_ptr<VVideoInputDeviceManager> m_pDeviceManager;
  Flow2Utils::VFlowNodeUtils& m_rServices;
};

}
