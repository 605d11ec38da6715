// The host's services as calls that throw on failure, so that a node's body is straight-line code and a stopping graph unwinds it.
//
// Each wrapper forwards to the service of its name. A stop and the end of data leave as VFlowFinishedException, all other failures as
// VFlowException. A wait that has run out of time is neither: the wrapper answers false. On the node's thread, and only inside a checked call.
#pragma once

#include "StageCorePluginInterface/FlowNode.h"

#include <cstdint>
#include <memory>
#include <string>
#include <vector>

namespace Flow2Utils
{

class VFlowNodeUtils
{
public:
  using VNames = std::vector<std::string>;
  using VTargets = std::vector<KVZ::VFlowTarget>;

  virtual ~VFlowNodeUtils();

  // The node's own tables.
  virtual VNames& InputNames() { return m_InputNames; }
  virtual KVZ::VFlowParameterTexts& ParameterTexts() { return m_ParameterTexts; }
  virtual VTargets& Targets() { return m_Targets; }
  virtual VNames& OutputNames() { return m_OutputNames; }

  // The item of a type; an empty pointer where the state has none. Throws where it has more than one.
  virtual KVZ::VFlowItemPtr ItemOne( KVZ::IFlowState& io_rState, const KVZ::VFlowItemType& i_rType );
  virtual std::shared_ptr<const KVZ::IFlowItem> ItemOneConst( const KVZ::IFlowState& i_rState, const KVZ::VFlowItemType& i_rType );

  bool Read( uint32_t i_Input, KVZ::VFlowLimit i_Limit, KVZ::VFlowStatePtr& o_rpState );
  bool ReadOneOf( const std::vector<uint32_t>& i_rInputs, KVZ::VFlowLimit i_Limit, uint32_t& o_rInput, KVZ::VFlowStatePtr& o_rpState );
  bool Write( uint32_t i_Output, const KVZ::VFlowStatePtr& i_pState, KVZ::VFlowLimit i_Limit, uint32_t i_Flags = 0 );
  bool Select( const std::vector<uint32_t>& i_rInputs, const std::vector<uint32_t>& i_rOutputs, KVZ::VFlowLimit i_Limit,
    KVZ::VFlowSelection& o_rSelection );
  void Sleep( KVZ::VFlowLimit i_Limit );
  bool DoBlockingCall( const KVZ::VFlowBlockingCall& i_rCall, KVZ::VFlowLimit i_Limit, uint32_t i_Flags = 0 );
  bool GlobalItems( KVZ::VFlowLimit i_Limit, KVZ::VFlowItemList& o_rItems );
  bool WaitInputConnected( uint32_t i_Input, KVZ::VFlowLimit i_Limit );
  bool WaitOutputConnected( uint32_t i_Output, KVZ::VFlowLimit i_Limit );
  uint32_t InputIndex( const std::string& i_rName );
  uint32_t OutputIndex( const std::string& i_rName );
  KVZ::VFlowItemPtr CreateItem( const std::string& i_rType, const std::string& i_rLabel );
  KVZ::VFlowStatePtr CreateState();
  std::shared_ptr<KVZ::IBuffer> CreateSharedUserBuffer( size_t i_Bytes );

  // For callbacks that wake the node from other threads. Throws like the wrappers.
  const std::shared_ptr<KVZ::IFlowNodeServices>& Services() const;

  template<class TItem>
  std::shared_ptr<TItem> CreateItemOf( const std::string& i_rLabel )
  {
    return std::static_pointer_cast<TItem>( CreateItem( TItem::ItemType.m_pName, i_rLabel ) );
  }
  template<class TItem>
  std::shared_ptr<const TItem> ItemOf( const KVZ::IFlowState& i_rState )
  {
    return std::static_pointer_cast<const TItem>( ItemOneConst( i_rState, TItem::ItemType ) );
  }

protected:
  void InstallServices( std::shared_ptr<KVZ::IFlowNodeServices> i_pServices ) { m_pServices = std::move( i_pServices ); }
  void UninstallServices() { m_pServices.reset(); }

private:
  std::shared_ptr<KVZ::IFlowNodeServices> m_pServices;   // while the host runs the node
  VNames m_InputNames;
  VNames m_OutputNames;
  KVZ::VFlowParameterTexts m_ParameterTexts;
  VTargets m_Targets;
};

}
