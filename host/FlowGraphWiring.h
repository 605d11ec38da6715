// What the threads of a graph share: the nodes, their queues and connections. Inside of VFlowGraph and its services.
//
// One mutex guards all of it. Nothing foreign runs under it, and no state is let go under it: what a state holds may take locks of its own.
// Nodes sleep on a condition of their own, so that only those wake up for which something has changed.
#pragma once

#include "StageCoreRuntime/ThreadAnnotations.h"
#include "host/FlowGraph.h"
#include "host/FlowGraphCondition.h"

#include <boost/container/small_vector.hpp>
#include <boost/thread/mutex.hpp>
#include <boost/thread/thread.hpp>

#include <deque>
#include <map>
#include <memory>
#include <string>
#include <utility>
#include <vector>

namespace StageHost
{

// What was taken out under the lock and ends after it.
using VLeftStates = std::vector<KVZ::VFlowStatePtr>;

struct VFlowInput
{
  std::deque<KVZ::VFlowStatePtr> m_Queue;
  VFlowPort m_From;   // m_Node 0: not connected
};

struct VFlowOutput
{
  std::vector<VFlowPort> m_To;
};

struct VFlowGraphNode
{
  VFlowGraphNode( VFlowNodeId i_Id, std::shared_ptr<KVZ::IFlowNode> i_pNode, const VFlowNodeOptions& i_rOptions );

  // Fixed after construction
  const VFlowNodeId m_Id;
  const std::shared_ptr<KVZ::IFlowNode> m_pNode;
  const std::string m_Name;
  const size_t m_QueueLength;

  // Guarded by the graph's control mutex
  boost::thread m_Thread;

  // Guarded by the wiring's mutex
  VFlowNodeStatus m_Status;
  std::vector<VFlowInput> m_Inputs;
  std::vector<VFlowOutput> m_Outputs;
  bool m_bStopping = false;
  bool m_bWaitsForRoom = false;
  bool m_bRewired = false;         // connections or global items have changed since the node last looked at its connections
  bool m_bGlobalChanged = false;   // since the node last took the global items
  uint64_t m_WakeToken = 0;        // of the blocking call that runs; 0: none
  bool m_bWoken = false;
  VFlowCondition m_Changed;
};

// Notifies nodes when it ends.
class VNotified
{
public:
  VNotified() = default;
  VNotified( const VNotified& ) = delete;
  VNotified& operator=( const VNotified& ) = delete;
  ~VNotified()
  {
    for( const auto& pNode : m_Nodes )
    {
      pNode->m_Changed.Notify();
    }
  }
  void Add( std::shared_ptr<VFlowGraphNode> i_pNode ) { m_Nodes.push_back( std::move( i_pNode ) ); }

private:
  boost::container::small_vector<std::shared_ptr<VFlowGraphNode>, 4> m_Nodes;
};

class VFlowWiring
{
public:
  using VNodes = std::map<VFlowNodeId, std::shared_ptr<VFlowGraphNode>>;

  boost::mutex m_Mutex;
  VNodes m_Nodes GUARDED_BY( m_Mutex );
  VFlowNodeId m_LastId GUARDED_BY( m_Mutex ) = 0;
  uint64_t m_LastToken GUARDED_BY( m_Mutex ) = 0;
  KVZ::VFlowItemList m_GlobalItems GUARDED_BY( m_Mutex );
  std::string m_Failure GUARDED_BY( m_Mutex );

  // A null pointer for an unknown node.
  VFlowGraphNode* Find( VFlowNodeId i_Node ) const REQUIRES( m_Mutex );
  VFlowInput* FindInput( VFlowPort i_Input ) const REQUIRES( m_Mutex );
  bool IsRunning( VFlowNodeId i_Node ) const REQUIRES( m_Mutex );
  // The input's source has ended and will send nothing more.
  bool IsAtEnd( const VFlowInput& i_rInput ) const REQUIRES( m_Mutex );
  bool IsConnected( const VFlowInput& i_rInput ) const REQUIRES( m_Mutex ) { return IsRunning( i_rInput.m_From.m_Node ); }
  bool IsConnected( const VFlowOutput& i_rOutput ) const REQUIRES( m_Mutex );
  // All running nodes that the output leads to can take a state; also where there is none.
  bool HasRoom( const VFlowOutput& i_rOutput ) const REQUIRES( m_Mutex );

  // Both add the nodes that have to be notified, which is done without the lock: they would only wait for it.
  void Send( const VFlowOutput& i_rOutput, const KVZ::VFlowStatePtr& i_pState, VNotified& o_rNotified ) REQUIRES( m_Mutex );
  KVZ::VFlowStatePtr Take( VFlowInput& io_rInput, VNotified& o_rNotified ) REQUIRES( m_Mutex );

  // Marks the node running, before its thread exists.
  void Begin( VFlowGraphNode& io_rNode ) REQUIRES( m_Mutex );
  // The node's thread is at its end. Empties its queues into the list.
  void End( VFlowGraphNode& io_rNode, EFlowNodeState i_State, VLeftStates& o_rLeft ) REQUIRES( m_Mutex );
  void RequestStop( VFlowGraphNode& io_rNode ) REQUIRES( m_Mutex );
  void Disconnect( VFlowPort i_Input, VLeftStates& o_rLeft ) REQUIRES( m_Mutex );
  // The node and those that it is connected with look at their connections again.
  void TellNeighbours( VFlowGraphNode& io_rNode ) REQUIRES( m_Mutex );
  static void TellRewired( VFlowGraphNode& io_rNode );

  // Somebody outside looks at statuses.
  void TellObservers() REQUIRES( m_Mutex );
  template<class TPredicate>
  void Observe( TPredicate i_Predicate ) REQUIRES( m_Mutex )
  {
    ++m_Observers;
    while( !i_Predicate() )
    {
      m_Observed.Wait( m_Mutex );
    }
    --m_Observers;
  }

private:
  unsigned int m_Observers GUARDED_BY( m_Mutex ) = 0;
  VFlowCondition m_Observed;
};

}
