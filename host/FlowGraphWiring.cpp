#include "host/FlowGraphWiring.h"

#include <algorithm>
#include <iterator>

namespace StageHost
{

VFlowGraphNode::VFlowGraphNode( VFlowNodeId i_Id, std::shared_ptr<KVZ::IFlowNode> i_pNode, const VFlowNodeOptions& i_rOptions )
  : m_Id( i_Id ),
    m_pNode( std::move( i_pNode ) ),
    m_Name( i_rOptions.m_Name ),
    m_QueueLength( std::max<size_t>( 1, i_rOptions.m_QueueLength ) ),
    m_Inputs( m_pNode->NodeInfo().m_Inputs.size() ),
    m_Outputs( m_pNode->NodeInfo().m_Outputs.size() )
{
}

VFlowGraphNode* VFlowWiring::Find( VFlowNodeId i_Node ) const
{
  const auto Found = m_Nodes.find( i_Node );
  return Found == m_Nodes.end() ? nullptr : Found->second.get();
}

VFlowInput* VFlowWiring::FindInput( VFlowPort i_Input ) const
{
  VFlowGraphNode* const pNode = Find( i_Input.m_Node );
  return pNode && i_Input.m_Index < pNode->m_Inputs.size() ? &pNode->m_Inputs[i_Input.m_Index] : nullptr;
}

bool VFlowWiring::IsRunning( VFlowNodeId i_Node ) const
{
  const VFlowGraphNode* const pNode = Find( i_Node );
  return pNode && pNode->m_Status.m_State == EFlowNodeState::Running;
}

bool VFlowWiring::IsAtEnd( const VFlowInput& i_rInput ) const
{
  const VFlowGraphNode* const pSource = Find( i_rInput.m_From.m_Node );
  return pSource && ( pSource->m_Status.m_State == EFlowNodeState::Ended || pSource->m_Status.m_State == EFlowNodeState::Failed );
}

bool VFlowWiring::IsConnected( const VFlowOutput& i_rOutput ) const
{
  for( const VFlowPort& rTo : i_rOutput.m_To )
  {
    if( IsRunning( rTo.m_Node ) )
    {
      return true;
    }
  }
  return false;
}

bool VFlowWiring::HasRoom( const VFlowOutput& i_rOutput ) const
{
  for( const VFlowPort& rTo : i_rOutput.m_To )
  {
    const VFlowGraphNode& rNode = *Find( rTo.m_Node );
    if( rNode.m_Status.m_State == EFlowNodeState::Running && rNode.m_Inputs[rTo.m_Index].m_Queue.size() >= rNode.m_QueueLength )
    {
      return false;
    }
  }
  return true;
}

void VFlowWiring::Send( const VFlowOutput& i_rOutput, const KVZ::VFlowStatePtr& i_pState, VNotified& o_rNotified )
{
  for( const VFlowPort& rTo : i_rOutput.m_To )
  {
    const auto& pNode = m_Nodes.find( rTo.m_Node )->second;
    if( pNode->m_Status.m_State == EFlowNodeState::Running )
    {
      pNode->m_Inputs[rTo.m_Index].m_Queue.push_back( i_pState );
      o_rNotified.Add( pNode );
    }
  }
}

KVZ::VFlowStatePtr VFlowWiring::Take( VFlowInput& io_rInput, VNotified& o_rNotified )
{
  KVZ::VFlowStatePtr pState = std::move( io_rInput.m_Queue.front() );
  io_rInput.m_Queue.pop_front();
  const auto Source = m_Nodes.find( io_rInput.m_From.m_Node );
  if( Source != m_Nodes.end() && Source->second->m_bWaitsForRoom )
  {
    o_rNotified.Add( Source->second );
  }
  return pState;
}

void VFlowWiring::Begin( VFlowGraphNode& io_rNode )
{
  io_rNode.m_Status = {};
  io_rNode.m_Status.m_State = EFlowNodeState::Running;
  io_rNode.m_bStopping = false;
  io_rNode.m_bWaitsForRoom = false;
  io_rNode.m_bGlobalChanged = !m_GlobalItems.empty();
  TellNeighbours( io_rNode );
}

void VFlowWiring::End( VFlowGraphNode& io_rNode, EFlowNodeState i_State, VLeftStates& o_rLeft )
{
  io_rNode.m_Status.m_State = i_State;
  for( VFlowInput& rInput : io_rNode.m_Inputs )
  {
    std::move( rInput.m_Queue.begin(), rInput.m_Queue.end(), std::back_inserter( o_rLeft ) );
    rInput.m_Queue.clear();
  }
  TellNeighbours( io_rNode );
}

void VFlowWiring::RequestStop( VFlowGraphNode& io_rNode )
{
  io_rNode.m_bStopping = true;
  io_rNode.m_Changed.Notify();
}

void VFlowWiring::Disconnect( VFlowPort i_Input, VLeftStates& o_rLeft )
{
  VFlowInput& rInput = *FindInput( i_Input );
  std::move( rInput.m_Queue.begin(), rInput.m_Queue.end(), std::back_inserter( o_rLeft ) );
  rInput.m_Queue.clear();
  VFlowGraphNode& rSource = *Find( rInput.m_From.m_Node );
  std::erase( rSource.m_Outputs[rInput.m_From.m_Index].m_To, i_Input );
  rInput.m_From = {};
  TellRewired( rSource );
  TellRewired( *Find( i_Input.m_Node ) );
  TellObservers();
}

void VFlowWiring::TellNeighbours( VFlowGraphNode& io_rNode )
{
  TellRewired( io_rNode );
  for( const VFlowInput& rInput : io_rNode.m_Inputs )
  {
    if( VFlowGraphNode* const pSource = Find( rInput.m_From.m_Node ) )
    {
      TellRewired( *pSource );
    }
  }
  for( const VFlowOutput& rOutput : io_rNode.m_Outputs )
  {
    for( const VFlowPort& rTo : rOutput.m_To )
    {
      TellRewired( *Find( rTo.m_Node ) );
    }
  }
  TellObservers();
}

void VFlowWiring::TellRewired( VFlowGraphNode& io_rNode )
{
  io_rNode.m_bRewired = true;
  io_rNode.m_Changed.Notify();
}

void VFlowWiring::TellObservers()
{
  if( m_Observers != 0 )
  {
    m_Observed.Notify();
  }
}

}
