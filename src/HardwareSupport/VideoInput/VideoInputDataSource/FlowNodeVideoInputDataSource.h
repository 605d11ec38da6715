// The flow node by which frames reach the host's graph: no input, one output, one state for each frame of its device.
//
// A graph that falls behind gets the backlog thinned evenly, ten states at most in a round. Between frames the node sleeps.
#pragma once

#include "Flow2/Flow2Utils/FlowNode.h"
#include "Flow2/Flow2Utils/ParameterSet.h"
#include "HardwareSupport/VideoInput/VideoInputDataSource/VideoInputDataBufferToFlowState.h"
#include "HardwareSupport/VideoInput/VideoInputDataSource/VideoInputDataSourceMap.h"

#include <memory>
#include <optional>
#include <string>
#include <vector>

namespace VideoInputHAL
{

// A data source has one live reader: two nodes on one device would take each other's frames.
class VFlowNodeVideoInputDataSource : public Flow2Utils::VFlowNode<VFlowNodeVideoInputDataSource>
{
public:
  struct VParameters : public Flow2Utils::VParameterSet
  {
    VParameters();
    std::string m_DeviceURN;
  };

  explicit VFlowNodeVideoInputDataSource( std::shared_ptr<VVideoInputDataSourceMap> i_pDataSources );

  static KVZ::VFlowNodeInfo MakeNodeInfo();

protected:
  // A failure, with a line in the log, where there is no such device.
  uint32_t PreProcess() override;
  void Process() override;
  void PostProcess() override;

private:
  // False, with a line in the log and nothing changed, for an unknown device.
  bool UseDataSource();
  void LeaveDataSource();
  void TakeGlobalParameters();
  uint32_t GetFrames( uint64_t i_WakeToken );
  void MakeStates();
  VFrameAnalysis Analyse( const SyncSystem::VFrameRecord& i_rRecord ) const;

  const std::shared_ptr<VVideoInputDataSourceMap> m_pDataSources;

  // The node's thread
  std::shared_ptr<VVideoInputDataSource> m_pDataSource;
  std::shared_ptr<VParameters> m_pParameters;
  std::optional<VVideoInputDataBufferToFlowState> m_ToFlowState;   // of m_pDataSource
  std::vector<KVZ::VFlowStatePtr> m_States;                        // of the present round
  KVZ::VFlowItemList m_GlobalItems;
  SyncSystem::VReadFrames m_Read;
  uint64_t m_Dropped = 0;   // since the last state
};

}
