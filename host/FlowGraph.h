// The host's flow graph: nodes on threads of their own, which exchange states through bounded queues.
//
// A connection leads from an output to an input and counts while the nodes at both its ends run: a state goes to every running node that its
// output leads to, and waits until each of them has room. An output may lead to several inputs; an input has one source. Nodes are started,
// stopped, connected and disconnected at any time. A node that waits uses no processor time.
//
// Every operation may be called from any thread but those of the nodes. Starting and stopping wait for one another, and a stop until the
// threads have ended; that is bounded by what a node does without calling its services.
#pragma once

#include "StageCorePluginInterface/FlowNode.h"
#include "StageCoreRuntime/ThreadAnnotations.h"

#include <boost/thread/mutex.hpp>

#include <cstddef>
#include <cstdint>
#include <functional>
#include <memory>
#include <string>

namespace StageHost
{

class VFlowWiring;

// Never used twice in a graph; 0 for none.
using VFlowNodeId = uint32_t;

struct VFlowPort
{
  VFlowNodeId m_Node = 0;
  uint32_t m_Index = 0;

  bool operator==( const VFlowPort& ) const = default;
};

struct VFlowNodeOptions
{
  std::string m_Name;   // of its thread, and the address of its parameters
  KVZ::VFlowParameterTexts m_Parameters{};
  size_t m_QueueLength = 4;   // states that wait at each input
};

enum class EFlowNodeState
{
  Idle,      // not started, or stopped
  Running,   // may be waiting
  Ended,     // by itself: the end of data
  Failed
};

struct VFlowNodeStatus
{
  EFlowNodeState m_State = EFlowNodeState::Idle;
  std::string m_Failure;   // in words; empty unless failed
  bool m_bAsleep = false;
  // Since the node was started
  uint64_t m_WakeUps = 0;   // how often its thread went on after it had been asleep
  uint64_t m_StatesRead = 0;
  uint64_t m_StatesWritten = 0;
};

class VFlowGraph
{
public:
  VFlowGraph();
  ~VFlowGraph();
  VFlowGraph( const VFlowGraph& ) = delete;
  VFlowGraph& operator=( const VFlowGraph& ) = delete;

  // The graph runs the node from now on, and nobody else.
  VFlowNodeId AddNode( std::shared_ptr<KVZ::IFlowNode> i_pNode, const VFlowNodeOptions& i_rOptions );
  // Stops and disconnects the node, and lets go of it. False for an unknown node.
  bool RemoveNode( VFlowNodeId i_Node );

  // All nodes.
  void Clear();

  // False for an unknown node, input or output, and for an input that has a source already.
  bool Connect( VFlowPort i_Output, VFlowPort i_Input );
  // States that wait at the input are let go. False where there is no connection.
  bool Disconnect( VFlowPort i_Input );

  // What every node is given, also those that start later.
  void SetGlobalItems( KVZ::VFlowItemList i_Items );

  // All nodes that do not run.
  void Start();
  void Stop();
  // False for an unknown node and one that runs, or does not, already.
  bool StartNode( VFlowNodeId i_Node );
  bool StopNode( VFlowNodeId i_Node );

  // A status with all at its default for an unknown node.
  VFlowNodeStatus GetStatus( VFlowNodeId i_Node ) const;
  // Waits until the predicate holds for the node's status; false for an unknown node.
  bool WaitUntil( VFlowNodeId i_Node, const std::function<bool( const VFlowNodeStatus& )>& i_rPredicate ) const;
  // What ended the run of the whole graph: the text of the first exception that left a node. Empty while there was none since Start.
  std::string GetFailure() const;

private:
  const std::shared_ptr<VFlowWiring> m_pWiring;
  boost::mutex m_ControlMutex;   // held while nodes are started and stopped; taken before the wiring's
};

}
