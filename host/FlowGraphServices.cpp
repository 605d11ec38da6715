#include "host/FlowGraphServices.h"

#include "host/FlowGraphState.h"

#include <boost/thread/lock_guard.hpp>

#include <algorithm>
#include <new>

namespace StageHost
{

using KVZ::EFlowResult;
using KVZ::VFlowLimit;
using KVZ::VFlowStatePtr;
using VLock = boost::lock_guard<boost::mutex>;

// When a wait has to end.
class VFlowGraphServices::VDeadline
{
public:
  explicit VDeadline( VFlowLimit i_Limit )
    : m_Limit( i_Limit ), m_Time( i_Limit.IsNone() || i_Limit.m_Milliseconds == 0 ? timespec() : MonotonicTimeAfter( i_Limit.m_Milliseconds ) )
  {
  }

  // False where there is no time left to sleep.
  bool Sleep( VFlowCondition& io_rCondition, boost::mutex& io_rMutex ) const REQUIRES( io_rMutex )
  {
    if( m_Limit.m_Milliseconds == 0 )
    {
      return false;
    }
    if( m_Limit.IsNone() )
    {
      io_rCondition.Wait( io_rMutex );
      return true;
    }
    return io_rCondition.WaitUntil( io_rMutex, m_Time );
  }

private:
  const VFlowLimit m_Limit;
  const timespec m_Time;
};

VFlowGraphServices::VFlowGraphServices( std::shared_ptr<VFlowWiring> i_pWiring, std::shared_ptr<VFlowGraphNode> i_pNode )
  : m_pWiring( std::move( i_pWiring ) ), m_pNode( std::move( i_pNode ) ), m_rWiring( *m_pWiring ), m_rNode( *m_pNode )
{
}

// With the wiring's mutex held, which the sleep gives up. The analysis knows neither that of the wiring under another name nor lambdas.
template<class TPredicate>
uint32_t VFlowGraphServices::Wait( const VDeadline& i_rDeadline, TPredicate i_Predicate )
{
  bool bTime = true;
  for( ;; )
  {
    if( m_rNode.m_bStopping )
    {
      return EFlowResult::Stopping;
    }
    if( i_Predicate() )
    {
      return EFlowResult::Ok;
    }
    if( !bTime )
    {
      return EFlowResult::WouldBlock;
    }
    m_rNode.m_Status.m_bAsleep = true;
    m_rWiring.TellObservers();
    bTime = i_rDeadline.Sleep( m_rNode.m_Changed, m_rWiring.m_Mutex );
    m_rNode.m_Status.m_bAsleep = false;
    m_rNode.m_Status.m_WakeUps += bTime ? 1 : 0;
  }
}

bool VFlowGraphServices::AreBelow( const std::vector<uint32_t>& i_rIndices, size_t i_Count )
{
  return std::all_of( i_rIndices.begin(), i_rIndices.end(), [i_Count]( uint32_t i_Index ) { return i_Index < i_Count; } );
}

uint32_t VFlowGraphServices::Read( uint32_t i_Input, VFlowLimit i_Limit, VFlowStatePtr& o_rpState )
{
  uint32_t Input = 0;
  return ReadOneOf( { i_Input }, i_Limit, Input, o_rpState );
}

uint32_t VFlowGraphServices::ReadOneOf( const std::vector<uint32_t>& i_rInputs, VFlowLimit i_Limit, uint32_t& o_rInput, VFlowStatePtr& o_rpState )
{
  const VDeadline Deadline( i_Limit );
  o_rpState.reset();
  VNotified Notified;   // without the lock
  VLock Lock( m_rWiring.m_Mutex );
  if( i_rInputs.empty() || !AreInputs( i_rInputs ) )
  {
    return EFlowResult::UnknownPort;
  }
  const auto HasState = [this]( uint32_t i_Input ) { return !m_rNode.m_Inputs[i_Input].m_Queue.empty(); };
  const auto IsAtEnd = [this]( uint32_t i_Input ) NO_LOCK_ANALYSIS { return m_rWiring.IsAtEnd( m_rNode.m_Inputs[i_Input] ); };
  auto Found = i_rInputs.end();
  const uint32_t Result = Wait( Deadline,
    [&]
    {
      Found = std::find_if( i_rInputs.begin(), i_rInputs.end(), HasState );
      return Found != i_rInputs.end() || std::all_of( i_rInputs.begin(), i_rInputs.end(), IsAtEnd );
    } );
  if( Result != EFlowResult::Ok )
  {
    return Result;
  }
  if( Found == i_rInputs.end() )
  {
    return EFlowResult::EndOfData;
  }
  o_rInput = *Found;
  o_rpState = m_rWiring.Take( m_rNode.m_Inputs[o_rInput], Notified );
  ++m_rNode.m_Status.m_StatesRead;
  m_rWiring.TellObservers();
  return EFlowResult::Ok;
}

uint32_t VFlowGraphServices::Write( uint32_t i_Output, const VFlowStatePtr& i_pState, VFlowLimit i_Limit, uint32_t i_Flags )
{
  const VDeadline Deadline( i_Limit );
  VNotified Notified;   // without the lock
  VLock Lock( m_rWiring.m_Mutex );
  if( i_Output >= m_rNode.m_Outputs.size() )
  {
    return EFlowResult::UnknownPort;
  }
  if( !i_pState )
  {
    return EFlowResult::Failed;
  }
  const VFlowOutput& rOutput = m_rNode.m_Outputs[i_Output];
  m_rNode.m_bWaitsForRoom = true;
  const uint32_t Result = Wait( Deadline, [&]() NO_LOCK_ANALYSIS { return m_rWiring.HasRoom( rOutput ); } );
  m_rNode.m_bWaitsForRoom = false;
  if( Result != EFlowResult::Ok )
  {
    return Result;
  }
  if( !m_rWiring.IsConnected( rOutput ) )
  {
    return ( i_Flags & KVZ::EFlowFlags::Rewirable ) != 0 ? EFlowResult::Ok : EFlowResult::NotConnected;
  }
  m_rWiring.Send( rOutput, i_pState, Notified );
  ++m_rNode.m_Status.m_StatesWritten;
  m_rWiring.TellObservers();
  return EFlowResult::Ok;
}

uint32_t VFlowGraphServices::Select( const std::vector<uint32_t>& i_rInputs, const std::vector<uint32_t>& i_rOutputs, VFlowLimit i_Limit,
  KVZ::VFlowSelection& o_rSelection )
{
  const VDeadline Deadline( i_Limit );
  VLock Lock( m_rWiring.m_Mutex );
  if( !AreInputs( i_rInputs ) || !AreBelow( i_rOutputs, m_rNode.m_Outputs.size() ) )
  {
    return EFlowResult::UnknownPort;
  }
  if( i_rInputs.empty() && i_rOutputs.empty() )
  {
    return EFlowResult::Failed;
  }
  const auto CanRead = [this]( uint32_t i_Input ) NO_LOCK_ANALYSIS
  { return !m_rNode.m_Inputs[i_Input].m_Queue.empty() || m_rWiring.IsAtEnd( m_rNode.m_Inputs[i_Input] ); };
  const auto CanWrite = [this]( uint32_t i_Output ) NO_LOCK_ANALYSIS
  { return m_rWiring.IsConnected( m_rNode.m_Outputs[i_Output] ) && m_rWiring.HasRoom( m_rNode.m_Outputs[i_Output] ); };
  const auto IsLinked = [this]( uint32_t i_Input ) { return m_rNode.m_Inputs[i_Input].m_From.m_Node != 0; };
  const auto LeadsOn = [this]( uint32_t i_Output ) { return !m_rNode.m_Outputs[i_Output].m_To.empty(); };
  if( std::none_of( i_rInputs.begin(), i_rInputs.end(), IsLinked ) && std::none_of( i_rOutputs.begin(), i_rOutputs.end(), LeadsOn ) )
  {
    return EFlowResult::NotConnected;
  }
  m_rNode.m_bWaitsForRoom = true;
  const uint32_t Result = Wait( Deadline,
    [&]
    {
      const auto Input = std::find_if( i_rInputs.begin(), i_rInputs.end(), CanRead );
      const auto Output = std::find_if( i_rOutputs.begin(), i_rOutputs.end(), CanWrite );
      o_rSelection.m_bInput = Input != i_rInputs.end();
      o_rSelection.m_Index = o_rSelection.m_bInput ? *Input : Output != i_rOutputs.end() ? *Output : 0;
      return o_rSelection.m_bInput || Output != i_rOutputs.end();
    } );
  m_rNode.m_bWaitsForRoom = false;
  return Result;
}

uint32_t VFlowGraphServices::Sleep( VFlowLimit i_Limit )
{
  const VDeadline Deadline( i_Limit );
  VLock Lock( m_rWiring.m_Mutex );
  const uint32_t Result = Wait( Deadline, [] { return false; } );
  return Result == EFlowResult::WouldBlock ? static_cast<uint32_t>( EFlowResult::Ok ) : Result;
}

uint32_t VFlowGraphServices::DoBlockingCall( const KVZ::VFlowBlockingCall& i_rCall, VFlowLimit i_Limit, uint32_t i_Flags )
{
  const VDeadline Deadline( i_Limit );
  for( ;; )
  {
    const uint64_t Token = BeginCall();
    const uint32_t Answer = Token == 0 ? static_cast<uint32_t>( EFlowResult::Stopping ) : i_rCall( Token );
    if( Answer != EFlowResult::Asleep )
    {
      return Answer;
    }
    const uint32_t Result = SleepInCall( Deadline, ( i_Flags & KVZ::EFlowFlags::Rewirable ) != 0 );
    if( Result != EFlowResult::Ok )
    {
      return Result;
    }
  }
}

// A token that may be woken from now on; 0 for a node that is to stop.
uint64_t VFlowGraphServices::BeginCall()
{
  VLock Lock( m_rWiring.m_Mutex );
  m_rNode.m_WakeToken = m_rNode.m_bStopping ? 0 : ++m_rWiring.m_LastToken;
  m_rNode.m_bWoken = false;
  return m_rNode.m_WakeToken;
}

// Each change of the connections or the global items ends one call at most, however little the node cares for it.
uint32_t VFlowGraphServices::SleepInCall( const VDeadline& i_rDeadline, bool i_bRewirable )
{
  VLock Lock( m_rWiring.m_Mutex );
  const uint32_t Result = Wait( i_rDeadline, [&] { return m_rNode.m_bWoken || ( i_bRewirable && m_rNode.m_bRewired ); } );
  m_rNode.m_WakeToken = 0;
  if( Result != EFlowResult::Ok || m_rNode.m_bWoken )
  {
    return Result;
  }
  m_rNode.m_bRewired = false;
  return EFlowResult::WouldBlock;
}

void VFlowGraphServices::Wake( uint64_t i_WakeToken )
{
  {
    VLock Lock( m_rWiring.m_Mutex );
    if( i_WakeToken == 0 || i_WakeToken != m_rNode.m_WakeToken )
    {
      return;
    }
    m_rNode.m_bWoken = true;
  }
  m_rNode.m_Changed.Notify();   // a node that does not have to wait for the lock wakes up once
}

uint32_t VFlowGraphServices::GlobalItems( VFlowLimit i_Limit, KVZ::VFlowItemList& o_rItems )
{
  const VDeadline Deadline( i_Limit );
  VLock Lock( m_rWiring.m_Mutex );
  const uint32_t Result = Wait( Deadline, [this] { return m_rNode.m_bGlobalChanged; } );
  if( Result == EFlowResult::Ok )
  {
    o_rItems = m_rWiring.m_GlobalItems;
    m_rNode.m_bGlobalChanged = false;
  }
  return Result;
}

template<class TPort>
uint32_t VFlowGraphServices::WaitConnected( const std::vector<TPort>& i_rPorts, uint32_t i_Index, VFlowLimit i_Limit )
{
  const VDeadline Deadline( i_Limit );
  VLock Lock( m_rWiring.m_Mutex );
  if( i_Index >= i_rPorts.size() )
  {
    return EFlowResult::UnknownPort;
  }
  const uint32_t Result = Wait( Deadline, [&]() NO_LOCK_ANALYSIS { return m_rWiring.IsConnected( i_rPorts[i_Index] ); } );
  m_rNode.m_bRewired = false;
  return Result;
}

uint32_t VFlowGraphServices::WaitInputConnected( uint32_t i_Input, VFlowLimit i_Limit )
{
  return WaitConnected( m_rNode.m_Inputs, i_Input, i_Limit );
}

uint32_t VFlowGraphServices::WaitOutputConnected( uint32_t i_Output, VFlowLimit i_Limit )
{
  return WaitConnected( m_rNode.m_Outputs, i_Output, i_Limit );
}

namespace
{

uint32_t FindName( const std::vector<std::string>& i_rNames, const std::string& i_rName, uint32_t& o_rIndex )
{
  const auto Found = std::find( i_rNames.begin(), i_rNames.end(), i_rName );
  o_rIndex = static_cast<uint32_t>( Found - i_rNames.begin() );
  return Found == i_rNames.end() ? EFlowResult::UnknownName : EFlowResult::Ok;
}

}

uint32_t VFlowGraphServices::InputIndex( const std::string& i_rName, uint32_t& o_rIndex )
{
  return FindName( m_rNode.m_pNode->NodeInfo().m_Inputs, i_rName, o_rIndex );
}

uint32_t VFlowGraphServices::OutputIndex( const std::string& i_rName, uint32_t& o_rIndex )
{
  return FindName( m_rNode.m_pNode->NodeInfo().m_Outputs, i_rName, o_rIndex );
}

uint32_t VFlowGraphServices::CreateItem( const std::string& i_rType, const std::string& i_rLabel, KVZ::VFlowItemPtr& o_rpItem )
{
  try
  {
    o_rpItem = KVZ::MakeFlowItem( i_rType, i_rLabel );
    return o_rpItem ? EFlowResult::Ok : EFlowResult::UnknownName;
  }
  catch( const std::bad_alloc& )
  {
    return EFlowResult::NoMemory;
  }
}

uint32_t VFlowGraphServices::CreateState( VFlowStatePtr& o_rpState )
{
  try
  {
    o_rpState = std::make_shared<VFlowState>();
    return EFlowResult::Ok;
  }
  catch( const std::bad_alloc& )
  {
    return EFlowResult::NoMemory;
  }
}

uint32_t VFlowGraphServices::CreateSharedUserBuffer( size_t i_Bytes, std::shared_ptr<KVZ::IBuffer>& o_rpBuffer )
{
  try
  {
    o_rpBuffer = std::make_shared<KVZ::IStandardBuffer>( i_Bytes );
    return EFlowResult::Ok;
  }
  catch( const std::exception& )   // also for a size beyond all measure
  {
    return EFlowResult::NoMemory;
  }
}

}
