// What a running node of the graph asks of it. One object for each run of a node.
#pragma once

#include "host/FlowGraphWiring.h"

namespace StageHost
{

class VFlowGraphServices : public KVZ::IFlowNodeServices
{
public:
  VFlowGraphServices( std::shared_ptr<VFlowWiring> i_pWiring, std::shared_ptr<VFlowGraphNode> i_pNode );

  uint32_t Read( uint32_t i_Input, KVZ::VFlowLimit i_Limit, KVZ::VFlowStatePtr& o_rpState ) override;
  uint32_t ReadOneOf( const std::vector<uint32_t>& i_rInputs, KVZ::VFlowLimit i_Limit, uint32_t& o_rInput, KVZ::VFlowStatePtr& o_rpState ) override;
  uint32_t Write( uint32_t i_Output, const KVZ::VFlowStatePtr& i_pState, KVZ::VFlowLimit i_Limit, uint32_t i_Flags ) override;
  uint32_t Select( const std::vector<uint32_t>& i_rInputs, const std::vector<uint32_t>& i_rOutputs, KVZ::VFlowLimit i_Limit,
    KVZ::VFlowSelection& o_rSelection ) override;
  uint32_t Sleep( KVZ::VFlowLimit i_Limit ) override;
  bool SupportsBlockingCalls() const override { return true; }
  uint32_t DoBlockingCall( const KVZ::VFlowBlockingCall& i_rCall, KVZ::VFlowLimit i_Limit, uint32_t i_Flags ) override;
  void Wake( uint64_t i_WakeToken ) override;
  uint32_t GlobalItems( KVZ::VFlowLimit i_Limit, KVZ::VFlowItemList& o_rItems ) override;
  uint32_t WaitInputConnected( uint32_t i_Input, KVZ::VFlowLimit i_Limit ) override;
  uint32_t WaitOutputConnected( uint32_t i_Output, KVZ::VFlowLimit i_Limit ) override;
  uint32_t InputIndex( const std::string& i_rName, uint32_t& o_rIndex ) override;
  uint32_t OutputIndex( const std::string& i_rName, uint32_t& o_rIndex ) override;
  uint32_t CreateItem( const std::string& i_rType, const std::string& i_rLabel, KVZ::VFlowItemPtr& o_rpItem ) override;
  uint32_t CreateState( KVZ::VFlowStatePtr& o_rpState ) override;
  uint32_t CreateSharedUserBuffer( size_t i_Bytes, std::shared_ptr<KVZ::IBuffer>& o_rpBuffer ) override;

private:
  class VDeadline;

  // Sleeps until the predicate holds. Ok, Stopping, which comes first, or WouldBlock.
  template<class TPredicate>
  uint32_t Wait( const VDeadline& i_rDeadline, TPredicate i_Predicate ) NO_LOCK_ANALYSIS;
  template<class TPort>
  uint32_t WaitConnected( const std::vector<TPort>& i_rPorts, uint32_t i_Index, KVZ::VFlowLimit i_Limit );
  uint64_t BeginCall();
  uint32_t SleepInCall( const VDeadline& i_rDeadline, bool i_bRewirable );
  bool AreInputs( const std::vector<uint32_t>& i_rInputs ) const { return AreBelow( i_rInputs, m_rNode.m_Inputs.size() ); }
  static bool AreBelow( const std::vector<uint32_t>& i_rIndices, size_t i_Count );

  const std::shared_ptr<VFlowWiring> m_pWiring;
  const std::shared_ptr<VFlowGraphNode> m_pNode;
  VFlowWiring& m_rWiring;
  VFlowGraphNode& m_rNode;
};

}
