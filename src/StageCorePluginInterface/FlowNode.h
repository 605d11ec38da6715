// The host's flow graph as a node sees it, and a node as the host sees it.
//
// The host runs each node on a thread of its own: PreProcessChecked once, ProcessChecked over and over, PostProcessChecked once whatever
// became of the others. Between these calls the node's thread is asleep only inside a service, and there it uses no processor time.
#pragma once

#include "Core/VideoInterface/BufferAllocator.h"
#include "Core/VideoInterface/FlowState.h"
#include "StageCorePluginInterface/FlowItems.h"

#include <cstddef>
#include <cstdint>
#include <functional>
#include <memory>
#include <string>
#include <vector>

namespace KVZ
{

// What services and nodes answer; the high bit marks failure.
struct EFlowResult
{
  enum Enum : uint32_t
  {
    Ok = 0,
    Failed = 0x80000000u,
    Stopping = 0x80000003u,
    NoMemory = 0x8000000Eu,
    UnknownPort = 0x80000010u,   // an input or output
    UnknownName = 0x80000011u,
    NotConnected = 0x80000012u,
    WouldBlock = 0x80000022u,   // or timed out
    Asleep = 0x80000023u,       // of a blocking call's function: call again after Wake
    EndOfData = 0x80000024u
  };
};

constexpr bool IsFlowFailure( uint32_t i_Result ) { return ( i_Result & 0x80000000u ) != 0; }

// How long a service may wait.
struct VFlowLimit
{
  uint32_t m_Milliseconds = 0;

  static constexpr VFlowLimit None() { return { 0xFFFFFFFFu }; }   // without end
  static constexpr VFlowLimit Zero() { return { 0 }; }
  constexpr bool IsNone() const { return m_Milliseconds == 0xFFFFFFFFu; }
};

struct EFlowFlags
{
  enum Enum : uint32_t
  {
    // The graph may be rewired meanwhile: a state that nobody is connected for is let go, and a blocking call ends with WouldBlock when the
    // node's connections or the global items change.
    Rewirable = 2
  };
};

// Gets a token, never 0, that wakes the call. Runs on the node's thread, again after each Wake for as long as it answers Asleep.
using VFlowBlockingCall = std::function<uint32_t( uint64_t i_WakeToken )>;

struct VFlowSelection
{
  bool m_bInput = false;   // otherwise an output
  uint32_t m_Index = 0;
};

// What a running node asks of its host. All on the node's thread but Wake. Results are EFlowResult.
class IFlowNodeServices
{
public:
  virtual uint32_t Read( uint32_t i_Input, VFlowLimit i_Limit, VFlowStatePtr& o_rpState ) = 0;
  // The first input of the list that has something.
  virtual uint32_t ReadOneOf( const std::vector<uint32_t>& i_rInputs, VFlowLimit i_Limit, uint32_t& o_rInput, VFlowStatePtr& o_rpState ) = 0;
  virtual uint32_t Write( uint32_t i_Output, const VFlowStatePtr& i_pState, VFlowLimit i_Limit, uint32_t i_Flags ) = 0;
  // Waits until one of them can be read or written at once.
  virtual uint32_t Select( const std::vector<uint32_t>& i_rInputs, const std::vector<uint32_t>& i_rOutputs, VFlowLimit i_Limit,
    VFlowSelection& o_rSelection ) = 0;
  virtual uint32_t Sleep( VFlowLimit i_Limit ) = 0;
  virtual bool SupportsBlockingCalls() const = 0;
  virtual uint32_t DoBlockingCall( const VFlowBlockingCall& i_rCall, VFlowLimit i_Limit, uint32_t i_Flags ) = 0;
  // Any thread, also when the node has ended. A token of another call, or of one that is over, does nothing.
  virtual void Wake( uint64_t i_WakeToken ) = 0;
  // All items that the host gives to every node, when they have changed since the node last had them.
  virtual uint32_t GlobalItems( VFlowLimit i_Limit, VFlowItemList& o_rItems ) = 0;
  virtual uint32_t WaitInputConnected( uint32_t i_Input, VFlowLimit i_Limit ) = 0;
  virtual uint32_t WaitOutputConnected( uint32_t i_Output, VFlowLimit i_Limit ) = 0;
  virtual uint32_t InputIndex( const std::string& i_rName, uint32_t& o_rIndex ) = 0;
  virtual uint32_t OutputIndex( const std::string& i_rName, uint32_t& o_rIndex ) = 0;
  virtual uint32_t CreateItem( const std::string& i_rType, const std::string& i_rLabel, VFlowItemPtr& o_rpItem ) = 0;
  virtual uint32_t CreateState( VFlowStatePtr& o_rpState ) = 0;
  // Bytes that may be handed on with a state.
  virtual uint32_t CreateSharedUserBuffer( size_t i_Bytes, std::shared_ptr<IBuffer>& o_rpBuffer ) = 0;
  virtual ~IFlowNodeServices() = default;
};

struct VFlowNodeInfo
{
  std::string m_Name;
  std::string m_Description;
  std::vector<std::string> m_Inputs;
  std::vector<std::string> m_Outputs;
};

class IFlowNode
{
public:
  virtual const VFlowNodeInfo& NodeInfo() const = 0;
  // Texts for the node's parameters. The host fills them before the node runs.
  virtual VFlowParameterTexts& ParameterTexts() = 0;
  // Under which addresses parameters find this node; the host's likewise.
  virtual std::vector<VFlowTarget>& Targets() = 0;
  // Ok, Stopping where the node has ended by itself, or a failure. Exceptions are the host's to handle: they end the graph's run.
  virtual uint32_t PreProcessChecked( std::shared_ptr<IFlowNodeServices> i_pServices ) = 0;
  virtual uint32_t ProcessChecked() = 0;
  virtual uint32_t PostProcessChecked() = 0;
  virtual ~IFlowNode() = default;
};

// Any thread.
class IFlowNodeFactory
{
public:
  virtual const VFlowNodeInfo& NodeInfo() const = 0;
  virtual std::shared_ptr<IFlowNode> CreateNode() = 0;
  // The parameters that its nodes know, with their attributes, by name.
  virtual std::map<std::string, std::map<std::string, std::string>> DescribeParameters() const = 0;
  // Whether its nodes need services that can do blocking calls.
  virtual bool NeedsBlockingCalls() const = 0;
  virtual ~IFlowNodeFactory() = default;
};

}
