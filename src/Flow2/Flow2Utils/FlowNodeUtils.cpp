#include "Flow2/Flow2Utils/FlowNodeUtils.h"

#include "Flow2/Flow2Utils/FlowException.h"
#include "StageCoreRuntime/GlobalLog.h"

namespace Flow2Utils
{

using KVZ::EFlowResult;
using KVZ::VFlowLimit;
using KVZ::VFlowStatePtr;

namespace
{

constexpr const char* NotInstalled =
  "VFlowNodeUtils: Services not installed - possible illegal call outside of PreProcessChecked(), ProcessChecked() or PostProcessChecked()";

// What a wrapper says to a result. A null pointer: the result is unexpected there.
struct VResultText
{
  uint32_t m_Result;
  const char* m_pText;   // may hold %1%, for an index or a name
};

bool IsFinish( uint32_t i_Result ) { return i_Result == EFlowResult::Stopping || i_Result == EFlowResult::EndOfData; }

std::string Fill( const char* i_pText, const KVZ::VLogArgument& i_rArgument )
{
  return std::string_view( i_pText ).find( "%1%" ) == std::string_view::npos ? std::string( i_pText )
                                                                             : KVZ::FormatLogMessage( i_pText, &i_rArgument, 1 );
}

// Throws what the table says of a failure, and the last text for one that it does not know. False for a wait that ran out of time.
template<size_t Count>
bool Check( uint32_t i_Result, const VResultText ( &i_rTexts )[Count], const char* i_pOther, const KVZ::VLogArgument& i_rArgument = 0 )
{
  if( i_Result == EFlowResult::WouldBlock || !KVZ::IsFlowFailure( i_Result ) )
  {
    return i_Result != EFlowResult::WouldBlock;
  }
  for( const VResultText& rText : i_rTexts )
  {
    if( rText.m_Result == i_Result && IsFinish( i_Result ) )
    {
      throw VFlowFinishedException( Fill( rText.m_pText, i_rArgument ) );
    }
    if( rText.m_Result == i_Result )
    {
      throw VFlowException( Fill( rText.m_pText, i_rArgument ) );
    }
  }
  throw VFlowException( i_pOther );
}

constexpr VResultText ReadTexts[] = {
  { EFlowResult::Stopping, "Read: Detected that node is stopping" },
  { EFlowResult::EndOfData, "Read: End of data on input index %1%" },
  { EFlowResult::UnknownPort, "Read: Unknown input - index = %1%" },
};
constexpr VResultText ReadOneOfTexts[] = {
  { EFlowResult::Stopping, "ReadOneOf: Detected that node is stopping" },
  { EFlowResult::EndOfData, "ReadOneOf: End of data on input" },
  { EFlowResult::UnknownPort, "ReadOneOf: Unknown input" },
};
constexpr VResultText WriteTexts[] = {
  { EFlowResult::Stopping, "Write: Detected that node is stopping" },
  { EFlowResult::EndOfData, "Write: End of data on output" },
  { EFlowResult::UnknownPort, "Write: Unknown input" },
  { EFlowResult::NotConnected, "Write: NotConnected" },
  { EFlowResult::Failed, "Write: Failed" },
};
constexpr VResultText SelectTexts[] = {
  { EFlowResult::Stopping, "Select: Detected that node is stopping" },
  { EFlowResult::UnknownPort, "Select: Unknown input or output" },
  { EFlowResult::NotConnected, "Select: NotConnected" },
  { EFlowResult::Failed, "Select: Failed" },
};
constexpr VResultText SleepTexts[] = { { EFlowResult::Stopping, "Sleep: Detected that node is stopping" } };
constexpr VResultText BlockingCallTexts[] = {
  { EFlowResult::Stopping, "DoBlockingCall: Detected that node is stopping" },
  { EFlowResult::EndOfData, "DoBlockingCall: End of data" },
};
constexpr VResultText GlobalItemsTexts[] = { { EFlowResult::Stopping, "GlobalItems: Detected that node is stopping" } };
constexpr VResultText WaitInputTexts[] = {
  { EFlowResult::Stopping, "WaitInputConnected: Detected that node is stopping" },
  { EFlowResult::UnknownPort, "WaitInputConnected: Unknown input - index = %1%" },
};
constexpr VResultText WaitOutputTexts[] = {
  { EFlowResult::Stopping, "WaitOutputConnected: Detected that node is stopping" },
  { EFlowResult::UnknownPort, "WaitOutputConnected: Unknown output - index = %1%" },
};
constexpr VResultText InputIndexTexts[] = { { EFlowResult::UnknownName, "InputIndex: Unknown input name %1%" } };
constexpr VResultText OutputIndexTexts[] = { { EFlowResult::UnknownName, "OutputIndex: Unknown output name %1%" } };
constexpr VResultText CreateItemTexts[] = {
  { EFlowResult::UnknownName, "CreateItem: Unknown item type %1%" },
  { EFlowResult::NoMemory, "CreateItem: Could not allocate item %1%" },
};

}

VFlowNodeUtils::~VFlowNodeUtils() = default;

const std::shared_ptr<KVZ::IFlowNodeServices>& VFlowNodeUtils::Services() const
{
  if( !m_pServices )
  {
    throw VFlowException( NotInstalled );
  }
  return m_pServices;
}

bool VFlowNodeUtils::Read( uint32_t i_Input, VFlowLimit i_Limit, VFlowStatePtr& o_rpState )
{
  return Check( Services()->Read( i_Input, i_Limit, o_rpState ), ReadTexts, "Read: Unexpected Error", i_Input );
}

bool VFlowNodeUtils::ReadOneOf( const std::vector<uint32_t>& i_rInputs, VFlowLimit i_Limit, uint32_t& o_rInput, VFlowStatePtr& o_rpState )
{
  return Check( Services()->ReadOneOf( i_rInputs, i_Limit, o_rInput, o_rpState ), ReadOneOfTexts, "ReadOneOf: Unexpected Error" );
}

bool VFlowNodeUtils::Write( uint32_t i_Output, const VFlowStatePtr& i_pState, VFlowLimit i_Limit, uint32_t i_Flags )
{
  return Check( Services()->Write( i_Output, i_pState, i_Limit, i_Flags ), WriteTexts, "Write: Unexpected Error" );
}

bool VFlowNodeUtils::Select( const std::vector<uint32_t>& i_rInputs, const std::vector<uint32_t>& i_rOutputs, VFlowLimit i_Limit,
  KVZ::VFlowSelection& o_rSelection )
{
  return Check( Services()->Select( i_rInputs, i_rOutputs, i_Limit, o_rSelection ), SelectTexts, "Select: Unexpected Error" );
}

void VFlowNodeUtils::Sleep( VFlowLimit i_Limit ) { Check( Services()->Sleep( i_Limit ), SleepTexts, "Sleep: Unexpected Error" ); }

bool VFlowNodeUtils::DoBlockingCall( const KVZ::VFlowBlockingCall& i_rCall, VFlowLimit i_Limit, uint32_t i_Flags )
{
  if( !Services()->SupportsBlockingCalls() )
  {
    throw VFlowException( "VFlowNodeUtils: Non blocking node services are not supported" );
  }
  return Check( Services()->DoBlockingCall( i_rCall, i_Limit, i_Flags ), BlockingCallTexts, "DoBlockingCall: Unexpected Error" );
}

bool VFlowNodeUtils::GlobalItems( VFlowLimit i_Limit, KVZ::VFlowItemList& o_rItems )
{
  return Check( Services()->GlobalItems( i_Limit, o_rItems ), GlobalItemsTexts, "GlobalItems: Unexpected Error" );
}

bool VFlowNodeUtils::WaitInputConnected( uint32_t i_Input, VFlowLimit i_Limit )
{
  return Check( Services()->WaitInputConnected( i_Input, i_Limit ), WaitInputTexts, "WaitInputConnected: Unexpected Error", i_Input );
}

bool VFlowNodeUtils::WaitOutputConnected( uint32_t i_Output, VFlowLimit i_Limit )
{
  return Check( Services()->WaitOutputConnected( i_Output, i_Limit ), WaitOutputTexts, "WaitOutputConnected: Unexpected Error", i_Output );
}

uint32_t VFlowNodeUtils::InputIndex( const std::string& i_rName )
{
  uint32_t Index = 0;
  if( !Check( Services()->InputIndex( i_rName, Index ), InputIndexTexts, "InputIndex: Unknown error", i_rName ) )
  {
    throw VFlowException( "InputIndex: Unknown error" );
  }
  return Index;
}

uint32_t VFlowNodeUtils::OutputIndex( const std::string& i_rName )
{
  uint32_t Index = 0;
  if( !Check( Services()->OutputIndex( i_rName, Index ), OutputIndexTexts, "OutputIndex: Unknown error", i_rName ) )
  {
    throw VFlowException( "OutputIndex: Unknown error" );
  }
  return Index;
}

KVZ::VFlowItemPtr VFlowNodeUtils::CreateItem( const std::string& i_rType, const std::string& i_rLabel )
{
  KVZ::VFlowItemPtr pItem;
  const uint32_t Result = Services()->CreateItem( i_rType, i_rLabel, pItem );
  if( !Check( Result, CreateItemTexts, "CreateItem: Unknown error", i_rType ) || !pItem )
  {
    throw VFlowException( "CreateItem: Unknown error" );
  }
  return pItem;
}

VFlowStatePtr VFlowNodeUtils::CreateState()
{
  VFlowStatePtr pState;
  if( KVZ::IsFlowFailure( Services()->CreateState( pState ) ) || !pState )
  {
    throw VFlowException( "CreateState: failed to create state" );
  }
  return pState;
}

std::shared_ptr<KVZ::IBuffer> VFlowNodeUtils::CreateSharedUserBuffer( size_t i_Bytes )
{
  std::shared_ptr<KVZ::IBuffer> pBuffer;
  if( KVZ::IsFlowFailure( Services()->CreateSharedUserBuffer( i_Bytes, pBuffer ) ) || !pBuffer )
  {
    throw VFlowException( "CreateSharedUserBuffer: failed to create buffer" );
  }
  return pBuffer;
}

KVZ::VFlowItemPtr VFlowNodeUtils::ItemOne( KVZ::IFlowState& io_rState, const KVZ::VFlowItemType& i_rType )
{
  KVZ::VFlowItemPtr pFound;
  for( const KVZ::VFlowItemPtr& pItem : io_rState.Items() )
  {
    if( &pItem->Type() != &i_rType )
    {
      continue;
    }
    if( pFound )
    {
      throw VFlowException( Fill( "Did not expect multiple items of type %1%", i_rType.m_pName ) );
    }
    pFound = pItem;
  }
  return pFound;
}

// Reads the list of items alone.
std::shared_ptr<const KVZ::IFlowItem> VFlowNodeUtils::ItemOneConst( const KVZ::IFlowState& i_rState, const KVZ::VFlowItemType& i_rType )
{
  return ItemOne( const_cast<KVZ::IFlowState&>( i_rState ), i_rType );
}

}
