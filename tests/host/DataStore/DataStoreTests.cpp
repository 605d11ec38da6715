#include "host/DataStore.h"

#include "StageCoreDataStore/DataVerifyWriter.h"
#include "tests/support/AssertionCapture.h"
#include "tests/support/LogCapture.h"
#include "tests/support/ManualPostalService.h"

#include <gtest/gtest.h>

#include <stdexcept>

namespace
{

using KVZ::Variant;
using StageHost::VDataStore;

using VNames = std::vector<std::string>;

VNames ToTexts( const std::vector<VDataPath>& i_rPaths )
{
  VNames Texts;
  for( const VDataPath& rPath : i_rPaths )
  {
    Texts.push_back( rPath.ToString() );
  }
  return Texts;
}

class DataStore : public testing::Test
{
protected:
  // Writes down each of a node's events by its letter: proposed, changed, added, removed, flags, branch.
  void Listen( const VDataPath& i_rPath, std::string& o_rHeard, const std::shared_ptr<KVZ::IPostalService>& i_pService = nullptr )
  {
    IDataNode& rNode = *VDataWriter( m_Store ).GetNode( i_rPath );
    rNode.OnProposedValue().Add( [&o_rHeard] { o_rHeard += 'p'; }, i_pService );
    rNode.OnValueChanged().Add( [&o_rHeard] { o_rHeard += 'c'; }, i_pService );
    rNode.OnValueAdded().Add( [&o_rHeard] { o_rHeard += 'a'; }, i_pService );
    rNode.OnValueRemoved().Add( [&o_rHeard] { o_rHeard += 'r'; }, i_pService );
    rNode.OnFlagsChanged().Add( [&o_rHeard] { o_rHeard += 'f'; }, i_pService );
    rNode.OnBranchChanged().Add( [&o_rHeard] { o_rHeard += 'b'; }, i_pService );
  }

  // Whether exactly these events have been heard since the last call, in any order.
  static testing::AssertionResult IsHeard( std::string& io_rHeard, std::string i_Expected )
  {
    std::string Heard = std::exchange( io_rHeard, "" );
    std::sort( Heard.begin(), Heard.end() );
    std::sort( i_Expected.begin(), i_Expected.end() );
    return Heard == i_Expected ? testing::AssertionSuccess()
                               : testing::AssertionFailure() << "heard \"" << Heard << "\", not \"" << i_Expected << '"';
  }

  bool Set( const VDataPath& i_rPath, int i_Value ) { return VDataWriter( m_Store ).SetValue( i_rPath, Variant::Make( i_Value ) ); }
  bool Propose( const VDataPath& i_rPath, int i_Value ) { return VDataVerifyWriter( m_Store ).SetProposedValue( i_rPath, Variant::Make( i_Value ) ); }
  bool Verify( const VDataPath& i_rPath, int i_Value ) { return VDataVerifyWriter( m_Store ).SetVerifiedValue( i_rPath, Variant::Make( i_Value ) ); }
  void RequireVerification() { VDataWriter( m_Store ).SetValueFlags( m_Path, DataFlags::VerifyRequired ); }

  // Proposed, verified and counting value, 0 where there is none.
  std::array<int, 3> Forms()
  {
    const VDataVerifyReader Reader( m_Store );
    Variant Proposed;
    Variant Verified;
    std::array<int, 3> Forms{};
    Reader.GetProposedValue( m_Path, Proposed );
    Reader.GetVerifiedValue( m_Path, Verified );
    Proposed.Get( Forms[0] );
    Verified.Get( Forms[1] );
    GetTyped( Reader, m_Path, Forms[2] );
    return Forms;
  }

  VDataStore m_Store;
  const VDataPath m_Path{ "VideoInput", "vi:0", "Settings", "Enabled" };
};

using VForms = std::array<int, 3>;

}

TEST_F( DataStore, HoldsValuesAtConcretePathsOnly )
{
  EXPECT_FALSE( VDataReader( m_Store ).Exists( m_Path ) );
  EXPECT_TRUE( Set( m_Path, 1 ) );
  EXPECT_TRUE( VDataReader( m_Store ).Exists( m_Path ) );
  EXPECT_FALSE( VDataReader( m_Store ).Exists( m_Path.Parent() ) );
  EXPECT_FALSE( Set( {}, 1 ) );
  EXPECT_FALSE( Set( { "VideoInput", "*" }, 1 ) );
  EXPECT_FALSE( VDataReader( m_Store ).Exists( VDataPath{ "VideoInput", "*", "Settings", "Enabled" } ) );

  VDataWriter Writer( m_Store );
  EXPECT_FALSE( Writer.SetValue( m_Path, {} ) );
  EXPECT_TRUE( Writer.RemoveValue( m_Path ) );
  EXPECT_FALSE( Writer.RemoveValue( m_Path ) );
  EXPECT_FALSE( Writer.Exists( m_Path ) );
}

TEST_F( DataStore, FindsAHandlesPlaceInEveryStore )
{
  VDataStore Other;
  const VDataPathHandle Handle( m_Path );
  EXPECT_FALSE( VDataReader( m_Store ).Exists( Handle ) );
  Set( m_Path, 1 );
  VDataWriter( Other ).SetValue( m_Path, Variant::Make( 2 ) );
  for( int Round = 0; Round < 2; ++Round )
  {
    EXPECT_EQ( VDataReader( m_Store ).GetValue( Handle ), Variant::Make( 1 ) );
    EXPECT_EQ( VDataReader( Other ).GetValue( Handle ), Variant::Make( 2 ) );
  }
}

TEST_F( DataStore, ListsWhatItHolds )
{
  Set( { "VideoInput", "vi:1", "Settings", "UserId" }, 2 );
  Set( { "VideoInput", "vi:0", "Settings", "UserId" }, 1 );
  Set( { "VideoInput", "vi:0", "Hardware", "Status" }, 0 );
  Set( { "Camera", "c", "Settings", "UserId" }, 9 );
  std::string Ignored;
  Listen( { "VideoInput", "*", "Settings" }, Ignored );

  VNames Names;
  std::vector<VDataPath> Paths;
  VDataWriter Writer( m_Store );
  EXPECT_TRUE( Writer.GetChildNames( VDataPath(), Names ) );
  EXPECT_EQ( Names, ( VNames{ "Camera", "VideoInput" } ) );
  EXPECT_TRUE( Writer.GetChildNames( VDataPath{ "VideoInput" }, Names ) );
  EXPECT_EQ( Names, ( VNames{ "vi:0", "vi:1" } ) );
  EXPECT_TRUE( Writer.GetValuePaths( VDataPath{ "VideoInput", "vi:0" }, Paths ) );
  EXPECT_EQ( ToTexts( Paths ), ( VNames{ "VideoInput.vi:0.Hardware.Status", "VideoInput.vi:0.Settings.UserId" } ) );
  EXPECT_TRUE( Writer.GetMatches( VDataPath{ "VideoInput", "*", "Settings", "UserId" }, Paths ) );
  EXPECT_EQ( ToTexts( Paths ), ( VNames{ "VideoInput.vi:0.Settings.UserId", "VideoInput.vi:1.Settings.UserId" } ) );
  EXPECT_EQ( Writer.CountValues( VDataPath{ "VideoInput" } ), 3u );

  EXPECT_TRUE( Writer.RemoveBranch( VDataPath{ "VideoInput", "vi:0" } ) );
  EXPECT_FALSE( Writer.RemoveBranch( VDataPath{ "VideoInput", "vi:0" } ) );
  EXPECT_TRUE( Writer.GetChildNames( VDataPath{ "VideoInput" }, Names ) );
  EXPECT_EQ( Names, VNames{ "vi:1" } );
  EXPECT_FALSE( Writer.GetChildNames( VDataPath{ "VideoInput", "vi:0" }, Names ) );
}

TEST_F( DataStore, ChangeStampsTellWhetherAnythingBelowHasChanged )
{
  Set( m_Path, 1 );
  const auto Stamp = [this]( const VDataPath& i_rPath ) { return VDataReader( m_Store ).GetChangeStamp( i_rPath ); };
  const uint64_t Device = Stamp( { "VideoInput", "vi:0" } );
  EXPECT_GT( Device, 0u );
  Set( { "VideoInput", "vi:1", "Settings", "Enabled" }, 1 );
  EXPECT_EQ( Stamp( { "VideoInput", "vi:0" } ), Device );
  EXPECT_GT( Stamp( { "VideoInput" } ), Device );
  VDataWriter( m_Store ).SetValueFlags( m_Path, DataFlags::ReadOnly );
  EXPECT_GT( Stamp( { "VideoInput", "vi:0" } ), Device );
}

TEST_F( DataStore, APlainValueSettlesAsItIsWritten )
{
  std::string Heard;
  Listen( m_Path, Heard );
  Set( m_Path, 1 );
  EXPECT_EQ( Forms(), ( VForms{ 1, 1, 1 } ) );
  EXPECT_TRUE( IsHeard( Heard, "pcab" ) );
  Set( m_Path, 1 );
  EXPECT_TRUE( IsHeard( Heard, "pb" ) );
  Propose( m_Path, 2 );
  EXPECT_EQ( Forms(), ( VForms{ 2, 2, 2 } ) );
  EXPECT_TRUE( IsHeard( Heard, "pcb" ) );
  Verify( m_Path, 3 );
  EXPECT_EQ( Forms(), ( VForms{ 2, 3, 3 } ) );
  EXPECT_TRUE( IsHeard( Heard, "cb" ) );
  EXPECT_TRUE( VDataReader( m_Store ).IsSettled( m_Path ) );
}

TEST_F( DataStore, AProposalWaitsForItsOwner )
{
  RequireVerification();
  std::string Heard;
  Listen( m_Path, Heard );
  Propose( m_Path, 1 );
  EXPECT_EQ( Forms(), ( VForms{ 1, 0, 1 } ) );
  EXPECT_TRUE( IsHeard( Heard, "pab" ) );
  EXPECT_FALSE( VDataReader( m_Store ).IsSettled( m_Path ) );
  Verify( m_Path, 1 );
  EXPECT_TRUE( IsHeard( Heard, "cb" ) );
  EXPECT_TRUE( VDataReader( m_Store ).IsSettled( m_Path ) );

  Propose( m_Path, 2 );
  EXPECT_EQ( Forms(), ( VForms{ 2, 1, 1 } ) );
  Verify( m_Path, 3 );
  EXPECT_EQ( Forms(), ( VForms{ 2, 3, 3 } ) );
  EXPECT_TRUE( IsHeard( Heard, "pbcb" ) );
  Verify( m_Path, 3 );
  EXPECT_TRUE( IsHeard( Heard, "" ) );
}

TEST_F( DataStore, AWriteOfBothFormsIsAProposalToo )
{
  RequireVerification();
  std::string Heard;
  Listen( m_Path, Heard );
  for( const int Value : { 1, 1, 2 } )
  {
    SCOPED_TRACE( Value );
    Set( m_Path, Value );
    EXPECT_EQ( Forms(), ( VForms{ Value, Value, Value } ) );
    EXPECT_FALSE( VDataReader( m_Store ).IsSettled( m_Path ) );
    EXPECT_EQ( Heard.find( 'c' ), std::string::npos );
    Verify( m_Path, Value );
    EXPECT_EQ( std::count( Heard.begin(), Heard.end(), 'p' ), 1 );
    EXPECT_EQ( std::count( Heard.begin(), Heard.end(), 'c' ), 1 );
    Heard.clear();
  }
}

TEST_F( DataStore, AWriteOfBothFormsSettlesAtOnceWhereNobodyWouldAnswer )
{
  RequireVerification();
  int Changed = 0;
  VDataWriter( m_Store ).GetNode( m_Path )->OnValueChanged().AddImmediate( [&Changed] { ++Changed; } );
  Set( m_Path, 1 );
  EXPECT_EQ( Changed, 1 );
  EXPECT_TRUE( VDataReader( m_Store ).IsSettled( m_Path ) );
  Propose( m_Path, 2 );
  EXPECT_FALSE( VDataReader( m_Store ).IsSettled( m_Path ) );
}

TEST_F( DataStore, AProposalCanBeGivenUp )
{
  RequireVerification();
  EXPECT_FALSE( VDataWriter( m_Store ).DiscardProposal( m_Path ) );
  Verify( m_Path, 1 );
  Propose( m_Path, 2 );
  std::string Heard;
  Listen( m_Path, Heard );
  EXPECT_TRUE( VDataWriter( m_Store ).DiscardProposal( m_Path ) );
  EXPECT_EQ( Forms(), ( VForms{ 1, 1, 1 } ) );
  EXPECT_TRUE( IsHeard( Heard, "cb" ) );
  Propose( m_Path, 3 );
  VDataWriter( m_Store ).SetValueFlags( m_Path, 0 );
  EXPECT_EQ( Forms(), ( VForms{ 3, 3, 3 } ) ) << "without an owner a proposal settles itself";
}

TEST_F( DataStore, FlagsStandByThemselves )
{
  std::string Heard;
  Listen( m_Path, Heard );
  uint32_t Flags = 77;
  EXPECT_FALSE( VDataReader( m_Store ).GetValueFlags( m_Path, Flags ) );
  RequireVerification();
  EXPECT_TRUE( IsHeard( Heard, "fb" ) );
  RequireVerification();
  EXPECT_TRUE( IsHeard( Heard, "" ) );
  Set( m_Path, 1 );
  Heard.clear();
  VDataWriter( m_Store ).RemoveValue( m_Path );
  EXPECT_TRUE( IsHeard( Heard, "rcb" ) );
  EXPECT_TRUE( VDataReader( m_Store ).GetValueFlags( m_Path, Flags ) );
  EXPECT_EQ( Flags, DataFlags::VerifyRequired );
  VDataWriter Writer( m_Store );
  EXPECT_TRUE( m_Store.RemoveValue( m_Path, 1 ) );
  EXPECT_FALSE( Writer.GetValueFlags( m_Path, Flags ) );
}

TEST_F( DataStore, WildcardPlacesHearOfAllTheyStandFor )
{
  std::string Key;
  std::string Device;
  std::string Root;
  std::string OtherKey;
  Listen( { "VideoInput", "*", "Settings", "Enabled" }, Key );
  Listen( { "VideoInput", "*" }, Device );
  Listen( {}, Root );
  Listen( { "VideoInput", "*", "Settings", "Name" }, OtherKey );
  Set( m_Path, 1 );
  EXPECT_TRUE( IsHeard( Key, "pacb" ) );
  EXPECT_TRUE( IsHeard( Device, "b" ) );
  EXPECT_TRUE( IsHeard( Root, "b" ) );
  Set( { "VideoInput", "vi:7", "Settings", "Enabled" }, 1 );
  EXPECT_TRUE( IsHeard( Key, "pacb" ) );
  Set( { "VideoInput", "vi:7", "Settings", "Enabled", "Deeper" }, 1 );
  EXPECT_TRUE( IsHeard( Key, "b" ) );
  Set( { "Camera", "vi:7", "Settings", "Enabled" }, 1 );
  EXPECT_TRUE( IsHeard( Key, "" ) );
  EXPECT_TRUE( IsHeard( OtherKey, "" ) );
}

TEST_F( DataStore, EventsGoOutOnceWhenTheOutermostWriterEnds )
{
  std::string Heard;
  Listen( m_Path, Heard );
  {
    VDataWriter Outer( m_Store );
    for( const int Value : { 1, 2, 3 } )
    {
      Set( m_Path, Value );
    }
    EXPECT_TRUE( Heard.empty() );
  }
  EXPECT_TRUE( IsHeard( Heard, "pacb" ) );
}

TEST_F( DataStore, ASubscriberHearsOnlyOfWhatIsWrittenAfterwards )
{
  std::string Early;
  std::string Late;
  VDataWriter( m_Store ).GetNode( m_Path )->OnValueAdded().AddImmediate( [&Early] { Early += 'a'; } );
  {
    VDataWriter Outer( m_Store );
    Set( m_Path, 1 );
    VDataWriter( m_Store ).GetNode( m_Path )->OnValueChanged().AddImmediate( [&Late] { Late += 'c'; } );
  }
  EXPECT_EQ( Early, "a" );
  EXPECT_EQ( Late, "" );
}

TEST_F( DataStore, PostedSubscribersWaitForTheirServiceAndImmediateOnesMayReadAndWrite )
{
  const auto pService = std::make_shared<TestSupport::VManualPostalService>();
  std::string Posted;
  Listen( m_Path, Posted, pService );
  const VDataPath Copy{ "Copy" };
  VDataWriter( m_Store ).GetNode( m_Path )->OnValueChanged().AddImmediate(
    [&]
    {
      const Variant Value = VDataReader( m_Store ).GetValue( m_Path );
      VDataWriter( m_Store ).SetValue( Copy, Value );
    } );
  Set( m_Path, 4 );
  EXPECT_EQ( VDataReader( m_Store ).GetValue( Copy ), Variant::Make( 4 ) );
  EXPECT_TRUE( Posted.empty() );
  pService->RunAll();
  EXPECT_TRUE( IsHeard( Posted, "pacb" ) );
}

TEST_F( DataStore, ASubscriberThatThrowsLeavesALineAndHurtsNobody )
{
  TestSupport::VLogCapture Log( "DataStore" );
  int Later = 0;
  IDataNode& rNode = *VDataWriter( m_Store ).GetNode( m_Path );
  rNode.OnValueChanged().AddImmediate( [] { throw std::runtime_error( "no" ); } );
  rNode.OnBranchChanged().AddImmediate( [&Later] { ++Later; } );
  Set( m_Path, 1 );
  EXPECT_EQ( Later, 1 );
  EXPECT_TRUE( Log.Has( "A subscriber to \"VideoInput.vi:0.Settings.Enabled\" failed: no" ) );
}

TEST_F( DataStore, WritesWithoutTheLockAreRefused )
{
  TestSupport::VAssertionCapture Assertions;
  EXPECT_FALSE( m_Store.SetValue( m_Path, Variant::Make( 1 ), EDataForm::Both ) );
  EXPECT_EQ( m_Store.GetNode( m_Path ), nullptr );
  EXPECT_EQ( Assertions.Expressions().size(), 2u );
}

TEST_F( DataStore, FindNodeGivesOnlyWhatGetNodeHasMade )
{
  Set( m_Path, 1 );
  EXPECT_EQ( VDataReader( m_Store ).FindNode( m_Path ), nullptr );
  IDataNode* pNode = VDataWriter( m_Store ).GetNode( m_Path );
  EXPECT_EQ( VDataReader( m_Store ).FindNode( m_Path ), pNode );
  EXPECT_EQ( VDataReader( m_Store ).GetSchema( m_Path ), KVZ::VSchemaOf<int32_t>::Get() );
}
