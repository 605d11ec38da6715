// The wrappers' words for every result, and the three checked calls around them.
#include "Flow2/Flow2Utils/FlowNode.h"

#include "Flow2/Flow2Utils/FlowException.h"
#include "tests/support/FakeFlowServices.h"
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

// Runs what the test puts in.
class VScriptedNode : public Flow2Utils::VFlowNode<VScriptedNode>
{
public:
  static KVZ::VFlowNodeInfo MakeNodeInfo() { return { "Scripted", "Runs a function", { "In" }, { "Out" } }; }

  std::function<void( VScriptedNode& )> m_PreProcess;
  std::function<void( VScriptedNode& )> m_Process;
  std::function<void( VScriptedNode& )> m_PostProcess;

protected:
  uint32_t PreProcess() override
  {
    Run( m_PreProcess );
    return EFlowResult::Ok;
  }
  void Process() override { Run( m_Process ); }
  void PostProcess() override { Run( m_PostProcess ); }

private:
  void Run( const std::function<void( VScriptedNode& )>& i_rFunction )
  {
    if( i_rFunction )
    {
      i_rFunction( *this );
    }
  }
};

using VWrapper = std::function<bool( VScriptedNode& )>;

const struct VWrapperCase
{
  const char* m_pName;
  VWrapper m_Call;
  const char* m_pStopping;
  const char* m_pEndOfData;   // a null pointer: an unexpected error
  const char* m_pUnknown;
  const char* m_pOther;
} Wrappers[] = {
  { "Read",
    []( VScriptedNode& i_rNode )
    {
      KVZ::VFlowStatePtr pState;
      return i_rNode.Read( 7, VFlowLimit::Zero(), pState );
    },
    "Read: Detected that node is stopping", "Read: End of data on input index 7", "Read: Unknown input - index = 7", "Read: Unexpected Error" },
  { "ReadOneOf",
    []( VScriptedNode& i_rNode )
    {
      KVZ::VFlowStatePtr pState;
      uint32_t Index = 0;
      return i_rNode.ReadOneOf( { 0 }, VFlowLimit::Zero(), Index, pState );
    },
    "ReadOneOf: Detected that node is stopping", "ReadOneOf: End of data on input", "ReadOneOf: Unknown input", "ReadOneOf: Unexpected Error" },
  { "Write", []( VScriptedNode& i_rNode ) { return i_rNode.Write( 0, nullptr, VFlowLimit::Zero() ); }, "Write: Detected that node is stopping",
    "Write: End of data on output", "Write: Unknown input", "Write: Unexpected Error" },
  { "Select",
    []( VScriptedNode& i_rNode )
    {
      KVZ::VFlowSelection Selection;
      return i_rNode.Select( { 0 }, { 0 }, VFlowLimit::Zero(), Selection );
    },
    "Select: Detected that node is stopping", nullptr, "Select: Unknown input or output", "Select: Unexpected Error" },
  { "Sleep",
    []( VScriptedNode& i_rNode )
    {
      i_rNode.Sleep( VFlowLimit::Zero() );
      return false;
    },
    "Sleep: Detected that node is stopping", nullptr, nullptr, "Sleep: Unexpected Error" },
  { "DoBlockingCall", []( VScriptedNode& i_rNode ) { return i_rNode.DoBlockingCall( []( uint64_t ) { return 0u; }, VFlowLimit::Zero() ); },
    "DoBlockingCall: Detected that node is stopping", "DoBlockingCall: End of data", nullptr, "DoBlockingCall: Unexpected Error" },
  { "GlobalItems",
    []( VScriptedNode& i_rNode )
    {
      KVZ::VFlowItemList Items;
      return i_rNode.GlobalItems( VFlowLimit::Zero(), Items );
    },
    "GlobalItems: Detected that node is stopping", nullptr, nullptr, "GlobalItems: Unexpected Error" },
  { "WaitInputConnected", []( VScriptedNode& i_rNode ) { return i_rNode.WaitInputConnected( 3, VFlowLimit::Zero() ); },
    "WaitInputConnected: Detected that node is stopping", nullptr, "WaitInputConnected: Unknown input - index = 3",
    "WaitInputConnected: Unexpected Error" },
  { "WaitOutputConnected", []( VScriptedNode& i_rNode ) { return i_rNode.WaitOutputConnected( 4, VFlowLimit::Zero() ); },
    "WaitOutputConnected: Detected that node is stopping", nullptr, "WaitOutputConnected: Unknown output - index = 4",
    "WaitOutputConnected: Unexpected Error" },
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
  VThrown ThrownBy( const std::function<void( VScriptedNode& )>& i_rCall )
  {
    VThrown Thrown;
    m_Node.m_Process = [&]( VScriptedNode& i_rNode ) { Thrown = Catch( [&] { i_rCall( i_rNode ); } ); };
    EXPECT_EQ( m_Node.PreProcessChecked( m_pServices ), EFlowResult::Ok );
    EXPECT_EQ( m_Node.ProcessChecked(), EFlowResult::Ok );
    EXPECT_EQ( m_Node.PostProcessChecked(), EFlowResult::Ok );
    return Thrown;
  }
  void Expect( const VWrapperCase& i_rCase, uint32_t i_Answer, const char* i_pText, bool i_bFinished )
  {
    m_pServices->m_Answer = i_Answer;
    const VThrown Thrown = ThrownBy( i_rCase.m_Call );
    EXPECT_EQ( Thrown.m_Text, i_pText ? i_pText : i_rCase.m_pOther );
    EXPECT_EQ( Thrown.m_bFinished, i_bFinished && i_pText );
  }

  VScriptedNode m_Node;
  const std::shared_ptr<VFakeFlowServices> m_pServices = std::make_shared<VFakeFlowServices>();
};

TEST_F( FlowNode, EveryWrapperHasItsWordsForEveryResult )
{
  for( const VWrapperCase& rCase : Wrappers )
  {
    SCOPED_TRACE( rCase.m_pName );
    Expect( rCase, EFlowResult::Stopping, rCase.m_pStopping, true );
    Expect( rCase, EFlowResult::EndOfData, rCase.m_pEndOfData, true );
    Expect( rCase, EFlowResult::UnknownPort, rCase.m_pUnknown, false );
    Expect( rCase, 0x80004005u, nullptr, false );
    m_pServices->m_Answer = EFlowResult::WouldBlock;
    bool bAnswer = true;
    EXPECT_EQ( ThrownBy( [&]( VScriptedNode& i_rNode ) { bAnswer = rCase.m_Call( i_rNode ); } ).m_Text, "" ) << "a timeout is no exception";
    EXPECT_FALSE( bAnswer );
  }
}

TEST_F( FlowNode, WrappersWithResultsOfTheirOwn )
{
  const auto Text = [&]( uint32_t i_Answer, const std::function<void( VScriptedNode& )>& i_rCall )
  {
    m_pServices->m_Answer = i_Answer;
    return ThrownBy( i_rCall ).m_Text;
  };
  EXPECT_EQ( Text( EFlowResult::NotConnected, Wrappers[2].m_Call ), "Write: NotConnected" );
  EXPECT_EQ( Text( EFlowResult::Failed, Wrappers[2].m_Call ), "Write: Failed" );
  EXPECT_EQ( Text( EFlowResult::NotConnected, Wrappers[3].m_Call ), "Select: NotConnected" );
  EXPECT_EQ( Text( EFlowResult::Failed, Wrappers[3].m_Call ), "Select: Failed" );
  const auto Input = []( VScriptedNode& i_rNode ) { i_rNode.InputIndex( "Left" ); };
  const auto Output = []( VScriptedNode& i_rNode ) { i_rNode.OutputIndex( "Right" ); };
  EXPECT_EQ( Text( EFlowResult::UnknownName, Input ), "InputIndex: Unknown input name Left" );
  EXPECT_EQ( Text( EFlowResult::Failed, Input ), "InputIndex: Unknown error" );
  EXPECT_EQ( Text( EFlowResult::WouldBlock, Input ), "InputIndex: Unknown error" ) << "no index came, so there is none to go on with";
  EXPECT_EQ( Text( EFlowResult::UnknownName, Output ), "OutputIndex: Unknown output name Right" );
  EXPECT_EQ( Text( EFlowResult::Failed, Output ), "OutputIndex: Unknown error" );
  EXPECT_EQ( Text( EFlowResult::WouldBlock, Output ), "OutputIndex: Unknown error" );
  const auto Item = []( VScriptedNode& i_rNode ) { i_rNode.CreateItem( "FlowAudioFrame", "Label" ); };
  EXPECT_EQ( Text( EFlowResult::Ok, []( VScriptedNode& i_rNode ) { i_rNode.CreateItem( "FlowSmell", "Label" ); } ),
    "CreateItem: Unknown item type FlowSmell" );
  EXPECT_EQ( Text( EFlowResult::Failed, Item ), "CreateItem: Unknown error" );
  m_pServices->m_bNoMemory = true;
  EXPECT_EQ( Text( EFlowResult::Ok, Item ), "CreateItem: Could not allocate item FlowAudioFrame" );
  EXPECT_EQ( Text( EFlowResult::Ok, []( VScriptedNode& i_rNode ) { i_rNode.CreateState(); } ), "CreateState: failed to create state" );
  EXPECT_EQ( Text( EFlowResult::Ok, []( VScriptedNode& i_rNode ) { i_rNode.CreateSharedUserBuffer( 10 ); } ),
    "CreateSharedUserBuffer: failed to create buffer" );
  m_pServices->m_bBlockingCalls = false;
  EXPECT_EQ( Text( EFlowResult::Ok, Wrappers[5].m_Call ), "VFlowNodeUtils: Non blocking node services are not supported" );
}

TEST_F( FlowNode, HasServicesOnlyWhileItRuns )
{
  const std::string NotInstalled = "VFlowNodeUtils: Services not installed - possible illegal call outside of PreProcessChecked(), "
                                   "ProcessChecked() or PostProcessChecked()";
  for( const VWrapperCase& rCase : Wrappers )
  {
    EXPECT_EQ( Catch( [&] { rCase.m_Call( m_Node ); } ).m_Text, NotInstalled ) << rCase.m_pName;
  }
  EXPECT_EQ( Catch( [&] { m_Node.CreateState(); } ).m_Text, NotInstalled );
  int Calls = 0;
  m_Node.m_PreProcess = m_Node.m_PostProcess = [&]( VScriptedNode& i_rNode )
  {
    ++Calls;
    EXPECT_NE( i_rNode.CreateState(), nullptr );
  };
  EXPECT_EQ( ThrownBy( []( VScriptedNode& i_rNode ) { i_rNode.CreateState(); } ).m_Text, "" );
  EXPECT_EQ( Calls, 2 );
  EXPECT_EQ( Catch( [&] { m_Node.CreateState(); } ).m_Text, NotInstalled );
  EXPECT_EQ( m_pServices.use_count(), 1 ) << "a node that has ended keeps its services";
}

TEST_F( FlowNode, EndsCleanlyOnAStopAndTheEndOfData )
{
  const auto Read = []( VScriptedNode& i_rNode ) { Wrappers[0].m_Call( i_rNode ); };
  const TestSupport::VLogCapture Log( "Flow2Utils" );
  m_Node.m_PreProcess = m_Node.m_Process = m_Node.m_PostProcess = Read;
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
  m_Node.m_Process = []( VScriptedNode& i_rNode ) { Wrappers[0].m_Call( i_rNode ); };
  m_Node.m_PostProcess = []( VScriptedNode& ) { throw std::runtime_error( "broken" ); };
  EXPECT_EQ( m_Node.PreProcessChecked( m_pServices ), EFlowResult::Ok );
  m_pServices->m_Answer = EFlowResult::UnknownPort;
  EXPECT_THROW( m_Node.ProcessChecked(), VFlowException );
  EXPECT_THROW( m_Node.PostProcessChecked(), std::runtime_error );
  EXPECT_EQ( m_pServices.use_count(), 1 );
}

TEST_F( FlowNode, FetchesTheOneItemOfAType )
{
  const VThrown Thrown = ThrownBy(
    []( VScriptedNode& i_rNode )
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
