// Nodes for graphs under test. Their states carry a number.
#pragma once

#include "Flow2/Flow2Utils/FlowException.h"
#include "StageCoreRuntime/ThreadAnnotations.h"
#include "host/FlowGraph.h"
#include "tests/support/FunctionNode.h"

#include <boost/thread/condition_variable.hpp>
#include <boost/thread/lock_guard.hpp>
#include <boost/thread/mutex.hpp>

#include <functional>
#include <memory>
#include <vector>

using KVZ::EFlowResult;
using KVZ::VFlowLimit;
using StageHost::EFlowNodeState;
using StageHost::VFlowNodeId;
using StageHost::VFlowNodeStatus;
using TestSupport::VFunctionNode;

template<class TNode>
KVZ::VFlowStatePtr MakeNumber( TNode& io_rNode, double i_Number )
{
  const auto pItem = io_rNode.template CreateItemOf<KVZ::VFlowGenericData>( "number" );
  pItem->m_Values["Number"] = { i_Number };
  KVZ::VFlowStatePtr pState = io_rNode.CreateState();
  pState->AddItem( pItem );
  return pState;
}

// Writes numbers from the first on to its output, as many as it has been allowed to, and sleeps in between.
class VCountingNode : public Flow2Utils::VFlowNode<VCountingNode>
{
public:
  static KVZ::VFlowNodeInfo MakeNodeInfo() { return { "Counting", "Writes numbers", {}, { "Output" } }; }

  explicit VCountingNode( int i_First = 0 ) : m_Next( i_First ) {}

  // Any thread.
  void Allow( int i_Count )
  {
    std::function<void()> Wake = [] {};
    {
      boost::lock_guard<boost::mutex> Lock( m_Mutex );
      m_Allowed += i_Count;
      Wake.swap( m_Wake );
    }
    Wake();
  }
  // The last state; it is held by nobody else once it has been read and let go.
  std::weak_ptr<KVZ::IFlowState> Last() const
  {
    boost::lock_guard<boost::mutex> Lock( m_Mutex );
    return m_pLast;
  }

protected:
  void Process() override
  {
    WaitOutputConnected( 0, VFlowLimit::None() );
    if( !DoBlockingCall( [this]( uint64_t i_Token ) { return TakeTurn( i_Token ); }, VFlowLimit::None(), KVZ::EFlowFlags::Rewirable ) )
    {
      return;
    }
    const KVZ::VFlowStatePtr pState = MakeNumber( *this, m_Next++ );
    {
      boost::lock_guard<boost::mutex> Lock( m_Mutex );
      m_pLast = pState;
    }
    Write( 0, pState, VFlowLimit::None(), KVZ::EFlowFlags::Rewirable );
  }

private:
  uint32_t TakeTurn( uint64_t i_Token )
  {
    boost::lock_guard<boost::mutex> Lock( m_Mutex );
    if( m_Allowed > 0 )
    {
      --m_Allowed;
      return EFlowResult::Ok;
    }
    m_Wake = [pServices = std::weak_ptr( Services() ), i_Token]
    {
      if( const auto pRunning = pServices.lock() )
      {
        pRunning->Wake( i_Token );
      }
    };
    return EFlowResult::Asleep;
  }

  int m_Next;   // the node's thread
  mutable boost::mutex m_Mutex;
  std::function<void()> m_Wake GUARDED_BY( m_Mutex ) = [] {};
  int m_Allowed GUARDED_BY( m_Mutex ) = 0;
  std::weak_ptr<KVZ::IFlowState> m_pLast GUARDED_BY( m_Mutex );
};

// Collects the numbers of its input's states. While it is held back it finishes what it has read and reads no more.
class VCollectingNode : public Flow2Utils::VFlowNode<VCollectingNode>
{
public:
  static KVZ::VFlowNodeInfo MakeNodeInfo() { return { "Collecting", "Reads numbers", { "Input" }, {} }; }

  // Any thread.
  void Hold( bool i_bHold )
  {
    boost::lock_guard<boost::mutex> Lock( m_Mutex );
    m_bHold = i_bHold;
    m_Changed.notify_all();
  }
  std::vector<double> Numbers() const
  {
    boost::lock_guard<boost::mutex> Lock( m_Mutex );
    return m_Numbers;
  }
  // Waits until so many have come, in all.
  std::vector<double> WaitFor( size_t i_Count ) const
  {
    boost::lock_guard<boost::mutex> Lock( m_Mutex );
    while( m_Numbers.size() < i_Count )
    {
      m_Changed.wait( m_Mutex );
    }
    return m_Numbers;
  }

protected:
  void Process() override
  {
    KVZ::VFlowStatePtr pState;
    Read( 0, VFlowLimit::None(), pState );
    double Number = -1.0;
    ItemOf<KVZ::VFlowGenericData>( *pState )->GetNumber( "Number", Number );
    pState.reset();
    boost::lock_guard<boost::mutex> Lock( m_Mutex );
    m_Numbers.push_back( Number );
    m_Changed.notify_all();
    while( m_bHold )
    {
      m_Changed.wait( m_Mutex );
    }
  }

private:
  mutable boost::mutex m_Mutex;
  mutable boost::condition_variable_any m_Changed;
  std::vector<double> m_Numbers GUARDED_BY( m_Mutex );
  bool m_bHold GUARDED_BY( m_Mutex ) = false;
};
