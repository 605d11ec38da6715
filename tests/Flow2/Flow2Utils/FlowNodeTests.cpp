// The wrappers' words for every result, and the three checked calls around them.
#include "Flow2/Flow2Utils/FlowException.h"
#include "tests/support/FakeFlowServices.h"
#include "tests/support/FunctionNode.h"
#include "tests/support/LogCapture.h"

#include <gtest/gtest.h>

#include <functional>

namespace
{

using Flow2Utils::VFlowException;
using Flow2Utils::VFlowFinishedException;
using KVZ::EFlowResult;
using KVZ::VFlowLimit;
using TestSupport::VFakeFlowServices;
using TestSupport::VFunctionNode;

bool Read( VFunctionNode& i_rNode ) { return i_rNode.Read( 7, VFlowLimit::Zero(), i_rNode.m_pState ); }
bool ReadOneOf( VFunctionNode& i_rNode ) { return i_rNode.ReadOneOf( { 0 }, VFlowLimit::Zero(), i_rNode.m_Index, i_rNode.m_pState ); }
bool Write( VFunctionNode& i_rNode ) { return i_rNode.Write( 0, nullptr, VFlowLimit::Zero() ); }
bool Select( VFunctionNode& i_rNode ) { return i_rNode.Select( { 0 }, { 0 }, VFlowLimit::Zero(), i_rNode.m_Selection ); }
bool Sleep( VFunctionNode& i_rNode )
{
  i_rNode.Sleep( VFlowLimit::Zero() );
  return false;
}
bool DoBlockingCall( VFunctionNode& i_rNode )
{
  return i_rNode.DoBlockingCall( []( uint64_t ) { return 0u; }, VFlowLimit::Zero() );
}
bool GlobalItems( VFunctionNode& i_rNode ) { return i_rNode.GlobalItems( VFlowLimit::Zero(), i_rNode.m_Items ); }
bool WaitInputConnected( VFunctionNode& i_rNode ) { return i_rNode.WaitInputConnected( 3, VFlowLimit::Zero() ); }
bool WaitOutputConnected( VFunctionNode& i_rNode ) { return i_rNode.WaitOutputConnected( 4, VFlowLimit::Zero() ); }

// All say "Detected that node is stopping", and "Unexpected Error" of what they have no words for.
constexpr struct VWrapper
{
  const char* m_pName;
  bool ( *m_pCall )( VFunctionNode& );
  const char* m_pEndOfData;
  const char* m_pUnknown;
} Wrappers[] = {
  { "Read", &Read, "End of data on input index 7", "Unknown input - index = 7" },
  { "ReadOneOf", &ReadOneOf, "End of data on input", "Unknown input" },
  { "Write", &Write, "End of data on output", "Unknown input" },
  { "Select", &Select, nullptr, "Unknown input or output" },
  { "Sleep", &Sleep, nullptr, nullptr },
  { "DoBlockingCall", &DoBlockingCall, "End of data", nullptr },
  { "GlobalItems", &GlobalItems, nullptr, nullptr },
  { "WaitInputConnected", &WaitInputConnected, nullptr, "Unknown input - index = 3" },
  { "WaitOutputConnected", &WaitOutputConnected, nullptr, "Unknown output - index = 4" },
};

struct VThrown
{
  std::string m_Text;
  bool m_bFinished = false;
};

VThrown Catch( const std::function<void()>& i_rCall )
{
  try
  {
    i_rCall();
  }
  catch( const VFlowFinishedException& rReason )
  {
    return { rReason.what(), true };
  }
  catch( const VFlowException& rReason )
  {
    EXPECT_EQ( rReason.LogLevel(), 2 );
    EXPECT_EQ( rReason.Code(), 1 );
    return { rReason.what(), false };
  }
  return {};
}

class FlowNode : public ::testing::Test
{
protected:
  // Runs the call inside Process, where the services are installed, and gives what it threw.
  VThrown ThrownBy( const VFunctionNode::VFunction& i_rCall )
  {
    VThrown Thrown;
    m_Node.m_Process = [&]( VFunctionNode& i_rNode ) { Thrown = Catch( [&] { i_rCall( i_rNode ); } ); };
    EXPECT_EQ( m_Node.PreProcessChecked( m_pServices ), EFlowResult::Ok );
    EXPECT_EQ( m_Node.ProcessChecked(), EFlowResult::Ok );
    EXPECT_EQ( m_Node.PostProcessChecked(), EFlowResult::Ok );
    return Thrown;
  }
  std::string TextOf( uint32_t i_Answer, const VFunctionNode::VFunction& i_rCall )
  {
    m_pServices->m_Answer = i_Answer;
    return ThrownBy( i_rCall ).m_Text;
  }
  void Expect( const VWrapper& i_rCase, uint32_t i_Answer, const char* i_pText, bool i_bFinished )
  {
    m_pServices->m_Answer = i_Answer;
    const VThrown Thrown = ThrownBy( i_rCase.m_pCall );
    EXPECT_EQ( Thrown.m_Text, std::string( i_rCase.m_pName ) + ": " + ( i_pText ? i_pText : "Unexpected Error" ) );
    EXPECT_EQ( Thrown.m_bFinished, i_bFinished && i_pText );
  }

  VFunctionNode m_Node;
  const std::shared_ptr<VFakeFlowServices> m_pServices = std::make_shared<VFakeFlowServices>();
};

TEST_F( FlowNode, EveryWrapperHasItsWordsForEveryResult )
{
  for( const VWrapper& rCase : Wrappers )
  {
    SCOPED_TRACE( rCase.m_pName );
    Expect( rCase, EFlowResult::Stopping, "Detected that node is stopping", true );
    Expect( rCase, EFlowResult::EndOfData, rCase.m_pEndOfData, true );
    Expect( rCase, EFlowResult::UnknownPort, rCase.m_pUnknown, false );
    Expect( rCase, 0x80004005u, nullptr, false );
    bool bAnswer = true;
    EXPECT_EQ( TextOf( EFlowResult::WouldBlock, [&]( VFunctionNode& i_rNode ) { bAnswer = rCase.m_pCall( i_rNode ); } ), "" )
      << "a timeout is no exception";
    EXPECT_FALSE( bAnswer );
  }
}

TEST_F( FlowNode, WrappersWithResultsOfTheirOwn )
{
  EXPECT_EQ( TextOf( EFlowResult::NotConnected, &Write ), "Write: NotConnected" );
  EXPECT_EQ( TextOf( EFlowResult::Failed, &Write ), "Write: Failed" );
  EXPECT_EQ( TextOf( EFlowResult::NotConnected, &Select ), "Select: NotConnected" );
  EXPECT_EQ( TextOf( EFlowResult::Failed, &Select ), "Select: Failed" );
  const auto Input = []( VFunctionNode& i_rNode ) { i_rNode.InputIndex( "Left" ); };
  const auto Output = []( VFunctionNode& i_rNode ) { i_rNode.OutputIndex( "Right" ); };
  EXPECT_EQ( TextOf( EFlowResult::UnknownName, Input ), "InputIndex: Unknown input name Left" );
  EXPECT_EQ( TextOf( EFlowResult::UnknownName, Output ), "OutputIndex: Unknown output name Right" );
  for( const uint32_t Answer : { EFlowResult::Failed, EFlowResult::WouldBlock } )   // no index came, so there is none to go on with
  {
    EXPECT_EQ( TextOf( Answer, Input ), "InputIndex: Unknown error" );
    EXPECT_EQ( TextOf( Answer, Output ), "OutputIndex: Unknown error" );
  }
  const auto Item = []( VFunctionNode& i_rNode ) { i_rNode.CreateItem( "FlowAudioFrame", "Label" ); };
  EXPECT_EQ( TextOf( EFlowResult::Ok, []( VFunctionNode& i_rNode ) { i_rNode.CreateItem( "FlowSmell", "Label" ); } ),
    "CreateItem: Unknown item type FlowSmell" );
  EXPECT_EQ( TextOf( EFlowResult::Failed, Item ), "CreateItem: Unknown error" );
  m_pServices->m_bNoMemory = true;
  EXPECT_EQ( TextOf( EFlowResult::Ok, Item ), "CreateItem: Could not allocate item FlowAudioFrame" );
  EXPECT_EQ( TextOf( EFlowResult::Ok, []( VFunctionNode& i_rNode ) { i_rNode.CreateState(); } ), "CreateState: failed to create state" );
  EXPECT_EQ( TextOf( EFlowResult::Ok, []( VFunctionNode& i_rNode ) { i_rNode.CreateSharedUserBuffer( 10 ); } ),
    "CreateSharedUserBuffer: failed to create buffer" );
  m_pServices->m_bBlockingCalls = false;
  EXPECT_EQ( TextOf( EFlowResult::Ok, &DoBlockingCall ), "VFlowNodeUtils: Non blocking node services are not supported" );
}

TEST_F( FlowNode, HasServicesOnlyWhileItRuns )
{
  const std::string NotInstalled = "VFlowNodeUtils: Services not installed - possible illegal call outside of PreProcessChecked(), "
                                   "ProcessChecked() or PostProcessChecked()";
  for( const VWrapper& rCase : Wrappers )
  {
    EXPECT_EQ( Catch( [&] { rCase.m_pCall( m_Node ); } ).m_Text, NotInstalled ) << rCase.m_pName;
  }
  EXPECT_EQ( Catch( [&] { m_Node.CreateState(); } ).m_Text, NotInstalled );
  int Calls = 0;
  m_Node.m_PreProcess = m_Node.m_PostProcess = [&]( VFunctionNode& i_rNode )
  {
    ++Calls;
    EXPECT_NE( i_rNode.CreateState(), nullptr );
  };
  EXPECT_EQ( ThrownBy( []( VFunctionNode& i_rNode ) { i_rNode.CreateState(); } ).m_Text, "" );
  EXPECT_EQ( Calls, 2 );
  EXPECT_EQ( Catch( [&] { m_Node.CreateState(); } ).m_Text, NotInstalled );
  EXPECT_EQ( m_pServices.use_count(), 1 ) << "a node that has ended keeps its services";
}

TEST_F( FlowNode, EndsCleanlyOnAStopAndTheEndOfData )
{
  const TestSupport::VLogCapture Log( "Flow2Utils" );
  m_Node.m_PreProcess = m_Node.m_Process = m_Node.m_PostProcess = &Read;
  m_pServices->m_Answer = EFlowResult::Stopping;
  EXPECT_EQ( m_Node.PreProcessChecked( m_pServices ), EFlowResult::Stopping );
  m_pServices->m_Answer = EFlowResult::EndOfData;
  EXPECT_EQ( m_Node.ProcessChecked(), EFlowResult::Stopping );
  EXPECT_EQ( m_Node.PostProcessChecked(), EFlowResult::Stopping );
  EXPECT_EQ( Log.Texts(),
    ( std::vector<std::string>{ "Node exited in PreProcess - Read: Detected that node is stopping",
      "Node exited in Process - Read: End of data on input index 7", "Node exited in PostProcess - Read: End of data on input index 7" } ) );
}

TEST_F( FlowNode, OtherExceptionsPassOutAndLeaveNoServices )
{
  m_Node.m_Process = &Read;
  m_Node.m_PostProcess = []( VFunctionNode& ) { throw std::runtime_error( "broken" ); };
  EXPECT_EQ( m_Node.PreProcessChecked( m_pServices ), EFlowResult::Ok );
  m_pServices->m_Answer = EFlowResult::UnknownPort;
  EXPECT_THROW( m_Node.ProcessChecked(), VFlowException );
  EXPECT_THROW( m_Node.PostProcessChecked(), std::runtime_error );
  EXPECT_EQ( m_pServices.use_count(), 1 );
}

TEST_F( FlowNode, FetchesTheOneItemOfAType )
{
  const VThrown Thrown = ThrownBy(
    []( VFunctionNode& i_rNode )
    {
      const KVZ::VFlowStatePtr pState = i_rNode.CreateState();
      EXPECT_EQ( i_rNode.ItemOf<KVZ::VFlowGenericData>( *pState ), nullptr );
      const auto pData = i_rNode.CreateItemOf<KVZ::VFlowGenericData>( "first" );
      pState->AddItem( i_rNode.CreateItemOf<KVZ::VFlowAudioFrame>( "sound" ) );
      pState->AddItem( pData );
      EXPECT_EQ( i_rNode.ItemOf<KVZ::VFlowGenericData>( *pState ), pData );
      EXPECT_EQ( i_rNode.ItemOne( *pState, KVZ::VFlowAudioFrame::ItemType )->Label(), "sound" );
      const KVZ::VFlowStatePtr pCopy = pState->Clone();
      pState->AddItem( i_rNode.CreateItemOf<KVZ::VFlowGenericData>( "second" ) );
      EXPECT_EQ( i_rNode.ItemOf<KVZ::VFlowGenericData>( *pCopy ), pData );
      i_rNode.ItemOf<KVZ::VFlowGenericData>( *pState );
    } );
  EXPECT_EQ( Thrown.m_Text, "Did not expect multiple items of type FlowGenericData" );
}

}
