#include "host/FlowGraph.h"

#include "StageCoreRuntime/DebugServices.h"
#include "StageCoreRuntime/GlobalLog.h"
#include "host/FlowGraphServices.h"
#include "host/FlowGraphWiring.h"

#include <boost/thread/lock_guard.hpp>

#include <exception>

namespace StageHost
{

using KVZ::EFlowResult;
using VLock = boost::lock_guard<boost::mutex>;
using VNodePtr = std::shared_ptr<VFlowGraphNode>;
using VWiringPtr = std::shared_ptr<VFlowWiring>;

namespace
{

// How a run of a node has ended.
struct VOutcome
{
  bool m_bFailed = false;
  bool m_bException = false;   // ends the run of the whole graph
  std::string m_Text{};
};

bool MustStop( VFlowWiring& i_rWiring, const VFlowGraphNode& i_rNode )
{
  VLock Lock( i_rWiring.m_Mutex );
  return i_rNode.m_bStopping;
}

// One of the node's three operations. False when the run is over.
template<class TOperation>
bool Call( TOperation i_Operation, VOutcome& io_rOutcome )
{
  try
  {
    const uint32_t Result = i_Operation();
    if( KVZ::IsFlowFailure( Result ) && Result != EFlowResult::Stopping )
    {
      io_rOutcome.m_bFailed = true;
      io_rOutcome.m_Text = "The node could not be started.";
    }
    return !KVZ::IsFlowFailure( Result );
  }
  catch( const std::exception& rError )
  {
    io_rOutcome = { true, true, rError.what() };
  }
  catch( ... )
  {
    io_rOutcome = { true, true, "An exception of an unknown kind left the node." };
  }
  return false;
}

VOutcome RunToEnd( const VWiringPtr& i_pWiring, const VNodePtr& i_pNode )
{
  VOutcome Outcome;
  KVZ::IFlowNode& rNode = *i_pNode->m_pNode;
  const auto pServices = std::make_shared<VFlowGraphServices>( i_pWiring, i_pNode );
  bool bGoOn = Call( [&] { return rNode.PreProcessChecked( pServices ); }, Outcome );
  while( bGoOn && !MustStop( *i_pWiring, *i_pNode ) )
  {
    bGoOn = Call( [&] { return rNode.ProcessChecked(); }, Outcome );
  }
  VOutcome After;
  Call( [&] { return rNode.PostProcessChecked(); }, After );
  return Outcome.m_bFailed ? Outcome : After;
}

void RunNode( const VWiringPtr& i_pWiring, const VNodePtr& i_pNode )
{
  const DebugServices::VCrashHandlerForThread CrashHandler;
  DebugServices::SetThreadName( i_pNode->m_Name );
  KVZ_LOG( "FlowGraph", 6, "Node %1% runs.", i_pNode->m_Name );
  const VOutcome Outcome = RunToEnd( i_pWiring, i_pNode );
  if( Outcome.m_bFailed )
  {
    KVZ_LOG( "FlowGraph", Outcome.m_bException ? 2 : 3, "Node %1%: %2%", i_pNode->m_Name, Outcome.m_Text );
  }
  VLeftStates Left;   // end without the lock
  VLock Lock( i_pWiring->m_Mutex );
  i_pNode->m_Status.m_Failure = Outcome.m_Text;
  if( Outcome.m_bException )
  {
    i_pWiring->m_Failure = i_pWiring->m_Failure.empty() ? Outcome.m_Text : i_pWiring->m_Failure;
    for( const auto& rEntry : i_pWiring->m_Nodes )
    {
      i_pWiring->RequestStop( *rEntry.second );
    }
  }
  const EFlowNodeState State = Outcome.m_bFailed ? EFlowNodeState::Failed : i_pNode->m_bStopping ? EFlowNodeState::Idle : EFlowNodeState::Ended;
  i_pWiring->End( *i_pNode, State, Left );
}

// Of a node that does not run.
void Launch( const VWiringPtr& i_pWiring, const VNodePtr& i_pNode )
{
  i_pNode->m_Thread = boost::thread( [i_pWiring, i_pNode] { RunNode( i_pWiring, i_pNode ); } );
}

void Join( VFlowGraphNode& io_rNode )
{
  if( io_rNode.m_Thread.joinable() )
  {
    io_rNode.m_Thread.join();
  }
}

}

VFlowGraph::VFlowGraph() : m_pWiring( std::make_shared<VFlowWiring>() ) {}

VFlowGraph::~VFlowGraph() { Clear(); }

void VFlowGraph::Clear()
{
  std::vector<VFlowNodeId> Nodes;
  Stop();
  {
    VLock Lock( m_pWiring->m_Mutex );
    for( const auto& rEntry : m_pWiring->m_Nodes )
    {
      Nodes.push_back( rEntry.first );
    }
  }
  for( const VFlowNodeId Node : Nodes )
  {
    RemoveNode( Node );
  }
}

VFlowNodeId VFlowGraph::AddNode( std::shared_ptr<KVZ::IFlowNode> i_pNode, const VFlowNodeOptions& i_rOptions )
{
  VLock Lock( m_pWiring->m_Mutex );
  const VFlowNodeId Id = ++m_pWiring->m_LastId;
  i_pNode->ParameterTexts() = i_rOptions.m_Parameters;
  i_pNode->Targets() = { { Id, i_rOptions.m_Name } };
  m_pWiring->m_Nodes.emplace( Id, std::make_shared<VFlowGraphNode>( Id, std::move( i_pNode ), i_rOptions ) );
  return Id;
}

bool VFlowGraph::RemoveNode( VFlowNodeId i_Node )
{
  StopNode( i_Node );
  VNodePtr pNode;   // both end without the locks
  VLeftStates Left;
  VLock Control( m_ControlMutex );
  VLock Lock( m_pWiring->m_Mutex );
  const auto Found = m_pWiring->m_Nodes.find( i_Node );
  if( Found == m_pWiring->m_Nodes.end() || Found->second->m_Status.m_State == EFlowNodeState::Running )
  {
    return false;
  }
  pNode = Found->second;
  for( uint32_t Index = 0; Index < pNode->m_Inputs.size(); ++Index )
  {
    if( pNode->m_Inputs[Index].m_From.m_Node != 0 )
    {
      m_pWiring->Disconnect( { i_Node, Index }, Left );
    }
  }
  for( const VFlowOutput& rOutput : pNode->m_Outputs )
  {
    while( !rOutput.m_To.empty() )
    {
      m_pWiring->Disconnect( rOutput.m_To.front(), Left );
    }
  }
  m_pWiring->m_Nodes.erase( Found );
  return true;
}

bool VFlowGraph::Connect( VFlowPort i_Output, VFlowPort i_Input )
{
  VLock Lock( m_pWiring->m_Mutex );
  VFlowGraphNode* const pSource = m_pWiring->Find( i_Output.m_Node );
  VFlowInput* const pInput = m_pWiring->FindInput( i_Input );
  if( !pSource || i_Output.m_Index >= pSource->m_Outputs.size() || !pInput || pInput->m_From.m_Node != 0 )
  {
    return false;
  }
  pInput->m_From = i_Output;
  pSource->m_Outputs[i_Output.m_Index].m_To.push_back( i_Input );
  VFlowWiring::TellRewired( *pSource );
  VFlowWiring::TellRewired( *m_pWiring->Find( i_Input.m_Node ) );
  return true;
}

bool VFlowGraph::Disconnect( VFlowPort i_Input )
{
  VLeftStates Left;   // end without the lock
  VLock Lock( m_pWiring->m_Mutex );
  const VFlowInput* const pInput = m_pWiring->FindInput( i_Input );
  if( !pInput || pInput->m_From.m_Node == 0 )
  {
    return false;
  }
  m_pWiring->Disconnect( i_Input, Left );
  return true;
}

void VFlowGraph::SetGlobalItems( KVZ::VFlowItemList i_Items )
{
  VLock Lock( m_pWiring->m_Mutex );
  m_pWiring->m_GlobalItems.swap( i_Items );   // the former ones end without the lock
  for( const auto& rEntry : m_pWiring->m_Nodes )
  {
    rEntry.second->m_bGlobalChanged = true;
    VFlowWiring::TellRewired( *rEntry.second );
  }
}

// All are marked as running before the first one runs: none of them takes another for one that has ended.
void VFlowGraph::Start()
{
  VLock Control( m_ControlMutex );
  std::vector<VNodePtr> Nodes;
  {
    VLock Lock( m_pWiring->m_Mutex );
    for( const auto& rEntry : m_pWiring->m_Nodes )
    {
      if( rEntry.second->m_Status.m_State != EFlowNodeState::Running )
      {
        Nodes.push_back( rEntry.second );
      }
    }
  }
  for( const VNodePtr& pNode : Nodes )
  {
    Join( *pNode );   // a former run that is at its end
  }
  {
    VLock Lock( m_pWiring->m_Mutex );
    m_pWiring->m_Failure.clear();
    for( const VNodePtr& pNode : Nodes )
    {
      m_pWiring->Begin( *pNode );
    }
  }
  for( const VNodePtr& pNode : Nodes )
  {
    Launch( m_pWiring, pNode );
  }
}

void VFlowGraph::Stop()
{
  VLock Control( m_ControlMutex );
  std::vector<VNodePtr> Nodes;
  {
    VLock Lock( m_pWiring->m_Mutex );
    for( const auto& rEntry : m_pWiring->m_Nodes )
    {
      m_pWiring->RequestStop( *rEntry.second );
      Nodes.push_back( rEntry.second );
    }
  }
  for( const VNodePtr& pNode : Nodes )
  {
    Join( *pNode );
  }
}

bool VFlowGraph::StartNode( VFlowNodeId i_Node )
{
  VLock Control( m_ControlMutex );
  VNodePtr pNode;
  {
    VLock Lock( m_pWiring->m_Mutex );
    const auto Found = m_pWiring->m_Nodes.find( i_Node );
    if( Found == m_pWiring->m_Nodes.end() || Found->second->m_Status.m_State == EFlowNodeState::Running )
    {
      return false;
    }
    pNode = Found->second;
  }
  Join( *pNode );
  {
    VLock Lock( m_pWiring->m_Mutex );
    m_pWiring->Begin( *pNode );
  }
  Launch( m_pWiring, pNode );
  return true;
}

bool VFlowGraph::StopNode( VFlowNodeId i_Node )
{
  VLock Control( m_ControlMutex );
  VNodePtr pNode;
  {
    VLock Lock( m_pWiring->m_Mutex );
    const auto Found = m_pWiring->m_Nodes.find( i_Node );
    if( Found == m_pWiring->m_Nodes.end() || Found->second->m_Status.m_State != EFlowNodeState::Running )
    {
      return false;
    }
    pNode = Found->second;
    m_pWiring->RequestStop( *pNode );
  }
  Join( *pNode );
  return true;
}

VFlowNodeStatus VFlowGraph::GetStatus( VFlowNodeId i_Node ) const
{
  VLock Lock( m_pWiring->m_Mutex );
  const VFlowGraphNode* const pNode = m_pWiring->Find( i_Node );
  return pNode ? pNode->m_Status : VFlowNodeStatus();
}

bool VFlowGraph::WaitUntil( VFlowNodeId i_Node, const std::function<bool( const VFlowNodeStatus& )>& i_rPredicate ) const
{
  VLock Lock( m_pWiring->m_Mutex );
  const VFlowGraphNode* pNode = nullptr;
  m_pWiring->Observe(
    [&]() NO_LOCK_ANALYSIS
    {
      pNode = m_pWiring->Find( i_Node );
      return !pNode || i_rPredicate( pNode->m_Status );
    } );
  return pNode != nullptr;
}

std::string VFlowGraph::GetFailure() const
{
  VLock Lock( m_pWiring->m_Mutex );
  return m_pWiring->m_Failure;
}

}
