// What a flow node is run with, without a graph and without threads: every service answers at once, as the test has set it up.
#pragma once

#include "StageCorePluginInterface/FlowNode.h"
#include "host/FlowGraphState.h"

#include <cstdint>
#include <memory>
#include <string>
#include <utility>
#include <vector>

namespace TestSupport
{

class VFakeFlowServices : public KVZ::IFlowNodeServices
{
public:
  // By hand. What every call answers from now on, in place of its own work; Ok lets it work.
  uint32_t m_Answer = KVZ::EFlowResult::Ok;
  bool m_bBlockingCalls = true;
  bool m_bNoMemory = false;
  KVZ::VFlowItemList m_Global;   // handed over once, when not empty
  KVZ::VFlowStatePtr m_pNext;    // likewise, by Read

  // What has happened
  std::vector<KVZ::VFlowStatePtr> m_Written;
  std::vector<uint32_t> m_WriteFlags;
  std::vector<KVZ::VFlowLimit> m_GlobalLimits;
  std::vector<uint64_t> m_Woken;
  uint64_t m_NextToken = 1;
  uint32_t m_LastCall = 0;   // the last answer of a blocking call's function

  uint32_t Read( uint32_t, KVZ::VFlowLimit, KVZ::VFlowStatePtr& o_rpState ) override
  {
    o_rpState = std::exchange( m_pNext, nullptr );
    return m_Answer;
  }
  uint32_t ReadOneOf( const std::vector<uint32_t>&, KVZ::VFlowLimit, uint32_t&, KVZ::VFlowStatePtr& ) override { return m_Answer; }
  uint32_t Write( uint32_t, const KVZ::VFlowStatePtr& i_pState, KVZ::VFlowLimit, uint32_t i_Flags ) override
  {
    if( m_Answer == KVZ::EFlowResult::Ok )
    {
      m_Written.push_back( i_pState );
      m_WriteFlags.push_back( i_Flags );
    }
    return m_Answer;
  }
  uint32_t Select( const std::vector<uint32_t>&, const std::vector<uint32_t>&, KVZ::VFlowLimit, KVZ::VFlowSelection& ) override { return m_Answer; }
  uint32_t Sleep( KVZ::VFlowLimit ) override { return m_Answer; }
  bool SupportsBlockingCalls() const override { return m_bBlockingCalls; }
  // Where the function wants to sleep, the call ends as if its time had run out.
  uint32_t DoBlockingCall( const KVZ::VFlowBlockingCall& i_rCall, KVZ::VFlowLimit, uint32_t ) override
  {
    if( m_Answer != KVZ::EFlowResult::Ok )
    {
      return m_Answer;
    }
    m_LastCall = i_rCall( m_NextToken++ );
    return m_LastCall == KVZ::EFlowResult::Asleep ? static_cast<uint32_t>( KVZ::EFlowResult::WouldBlock ) : m_LastCall;
  }
  void Wake( uint64_t i_WakeToken ) override { m_Woken.push_back( i_WakeToken ); }
  uint32_t GlobalItems( KVZ::VFlowLimit i_Limit, KVZ::VFlowItemList& o_rItems ) override
  {
    m_GlobalLimits.push_back( i_Limit );
    if( m_Answer != KVZ::EFlowResult::Ok )
    {
      return m_Answer;
    }
    if( m_Global.empty() )
    {
      return KVZ::EFlowResult::WouldBlock;
    }
    o_rItems = std::exchange( m_Global, {} );
    return KVZ::EFlowResult::Ok;
  }
  uint32_t WaitInputConnected( uint32_t, KVZ::VFlowLimit ) override { return m_Answer; }
  uint32_t WaitOutputConnected( uint32_t, KVZ::VFlowLimit ) override { return m_Answer; }
  uint32_t InputIndex( const std::string&, uint32_t& ) override { return m_Answer; }
  uint32_t OutputIndex( const std::string&, uint32_t& ) override { return m_Answer; }
  uint32_t CreateItem( const std::string& i_rType, const std::string& i_rLabel, KVZ::VFlowItemPtr& o_rpItem ) override
  {
    o_rpItem = KVZ::MakeFlowItem( i_rType, i_rLabel );
    return m_bNoMemory ? KVZ::EFlowResult::NoMemory : o_rpItem ? m_Answer : static_cast<uint32_t>( KVZ::EFlowResult::UnknownName );
  }
  uint32_t CreateState( KVZ::VFlowStatePtr& o_rpState ) override
  {
    o_rpState = m_bNoMemory ? nullptr : std::make_shared<StageHost::VFlowState>();
    return m_bNoMemory ? static_cast<uint32_t>( KVZ::EFlowResult::NoMemory ) : m_Answer;
  }
  uint32_t CreateSharedUserBuffer( size_t i_Bytes, std::shared_ptr<KVZ::IBuffer>& o_rpBuffer ) override
  {
    o_rpBuffer = m_bNoMemory ? nullptr : std::make_shared<KVZ::IStandardBuffer>( i_Bytes );
    return m_bNoMemory ? static_cast<uint32_t>( KVZ::EFlowResult::NoMemory ) : m_Answer;
  }
};

}
