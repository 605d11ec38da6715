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
using VPaths = std::vector<VDataPath>;

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
  void RequireVerification() { VDataWriter( m_Store ).SetValueFlags( m_Path, DataFlags::VerifyRequired ); }

  // Proposed, verified and counting value, 0 where there is none.
  using VForms = std::array<int, 3>;
  VForms Forms()
  {
    const VDataReader Lock( m_Store );
    VForms Forms{};
    for( size_t Index = 0; Index < Forms.size(); ++Index )
    {
      Variant Value;
      m_Store.GetValue( m_Path, Value, std::array{ EDataForm::Proposed, EDataForm::Verified, EDataForm::Both }[Index] );
      Value.Get( Forms[Index] );
    }
    return Forms;
  }

  // A write, and all that is to be seen and heard of it
  struct VStep
  {
    EDataForm m_Form;
    int m_Value;
    VForms m_Forms;
    bool m_bSettled;
    const char* m_pHeard;
  };
  void Follow( const std::vector<VStep>& i_rSteps )
  {
    Listen( m_Path, m_Heard );
    for( const VStep& rStep : i_rSteps )
    {
      SCOPED_TRACE( &rStep - i_rSteps.data() );
      {
        const VDataWriter Lock( m_Store );
        EXPECT_TRUE( m_Store.SetValue( m_Path, Variant::Make( rStep.m_Value ), rStep.m_Form ) );
      }
      EXPECT_EQ( Forms(), rStep.m_Forms );
      EXPECT_EQ( VDataReader( m_Store ).IsSettled( m_Path ), rStep.m_bSettled );
      EXPECT_TRUE( IsHeard( m_Heard, rStep.m_pHeard ) );
    }
  }

  std::string m_Heard;
  VDataStore m_Store;
  const VDataPath m_Path{ "VideoInput", "vi:0", "Settings", "Enabled" };
};

constexpr bool Settled = true;
constexpr bool Waiting = false;

}

// Two equal stamps mean that nothing has changed between them, there or below.
TEST_F( DataStore, AStampTellsOfChangesBelow )
{
  const auto Stamps = [this]
  {
    const VDataReader Reader( m_Store );
    return std::array{ Reader.GetChangeStamp( VDataPath() ), Reader.GetChangeStamp( m_Path ), Reader.GetChangeStamp( VDataPath{ "Other" } ) };
  };
  const auto Before = Stamps();
  EXPECT_EQ( Stamps(), Before );
  EXPECT_TRUE( Set( m_Path, 7 ) );
  const auto After = Stamps();
  EXPECT_NE( After[0], Before[0] );
  EXPECT_NE( After[1], Before[1] );
  EXPECT_EQ( After[2], Before[2] );
  EXPECT_EQ( VDataReader( m_Store ).FindNode( m_Path ), nullptr ) << "nobody has asked for the place itself";
  IDataNode* const pNode = VDataWriter( m_Store ).GetNode( m_Path );
  EXPECT_EQ( VDataReader( m_Store ).FindNode( m_Path ), pNode );
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
  VPaths Paths;
  VDataWriter Writer( m_Store );
  EXPECT_TRUE( Writer.GetChildNames( VDataPath(), Names ) );
  EXPECT_EQ( Names, ( VNames{ "Camera", "VideoInput" } ) );
  EXPECT_TRUE( Writer.GetChildNames( VDataPath{ "VideoInput" }, Names ) );
  EXPECT_EQ( Names, ( VNames{ "vi:0", "vi:1" } ) );
  EXPECT_TRUE( Writer.GetValuePaths( VDataPath{ "VideoInput", "vi:0" }, Paths ) );
  EXPECT_EQ( Paths, ( VPaths{ { "VideoInput", "vi:0", "Hardware", "Status" }, { "VideoInput", "vi:0", "Settings", "UserId" } } ) );
  EXPECT_TRUE( Writer.GetMatches( VDataPath{ "VideoInput", "*", "Settings", "UserId" }, Paths ) );
  EXPECT_EQ( Paths, ( VPaths{ { "VideoInput", "vi:0", "Settings", "UserId" }, { "VideoInput", "vi:1", "Settings", "UserId" } } ) );
  EXPECT_EQ( Writer.CountValues( VDataPath{ "VideoInput" } ), 3u );

  EXPECT_TRUE( Writer.RemoveBranch( VDataPath{ "VideoInput", "vi:0" } ) );
  EXPECT_FALSE( Writer.RemoveBranch( VDataPath{ "VideoInput", "vi:0" } ) );
  EXPECT_TRUE( Writer.GetChildNames( VDataPath{ "VideoInput" }, Names ) );
  EXPECT_EQ( Names, VNames{ "vi:1" } );
  EXPECT_FALSE( Writer.GetChildNames( VDataPath{ "VideoInput", "vi:0" }, Names ) );
}

TEST_F( DataStore, APlainValueSettlesAsItIsWritten )
{
  Follow( {
    { EDataForm::Both, 1, { 1, 1, 1 }, Settled, "pcab" },
    { EDataForm::Both, 1, { 1, 1, 1 }, Settled, "pb" },
    { EDataForm::Proposed, 2, { 2, 2, 2 }, Settled, "pcb" },
    { EDataForm::Verified, 3, { 2, 3, 3 }, Settled, "cb" },
  } );
}

// A write of both forms is a proposal too.
TEST_F( DataStore, AProposalWaitsForItsOwnerOrIsGivenUp )
{
  RequireVerification();
  EXPECT_FALSE( VDataWriter( m_Store ).DiscardProposal( m_Path ) );
  Follow( {
    { EDataForm::Proposed, 1, { 1, 0, 1 }, Waiting, "pab" },
    { EDataForm::Verified, 1, { 1, 1, 1 }, Settled, "cb" },
    { EDataForm::Proposed, 2, { 2, 1, 1 }, Waiting, "pb" },
    { EDataForm::Verified, 3, { 2, 3, 3 }, Settled, "cb" },
    { EDataForm::Verified, 3, { 2, 3, 3 }, Settled, "" },
    { EDataForm::Both, 4, { 4, 4, 4 }, Waiting, "pb" },
    { EDataForm::Verified, 4, { 4, 4, 4 }, Settled, "cb" },
    { EDataForm::Both, 4, { 4, 4, 4 }, Waiting, "pb" },
    { EDataForm::Verified, 4, { 4, 4, 4 }, Settled, "cb" },
    { EDataForm::Proposed, 5, { 5, 4, 4 }, Waiting, "pb" },
  } );
  EXPECT_TRUE( VDataWriter( m_Store ).DiscardProposal( m_Path ) );
  EXPECT_EQ( Forms(), ( VForms{ 4, 4, 4 } ) );
  EXPECT_TRUE( IsHeard( m_Heard, "cb" ) );
  VDataVerifyWriter( m_Store ).SetProposedValue( m_Path, Variant::Make( 6 ) );
  VDataWriter( m_Store ).SetValueFlags( m_Path, 0 );
  EXPECT_EQ( Forms(), ( VForms{ 6, 6, 6 } ) ) << "without an owner a proposal settles itself";
}

TEST_F( DataStore, AWriteOfBothFormsSettlesAtOnceWhereNobodyWouldAnswer )
{
  RequireVerification();
  int Changed = 0;
  VDataWriter( m_Store ).GetNode( m_Path )->OnValueChanged().AddImmediate( [&Changed] { ++Changed; } );
  Set( m_Path, 1 );
  EXPECT_EQ( Changed, 1 );
  EXPECT_TRUE( VDataReader( m_Store ).IsSettled( m_Path ) );
  VDataVerifyWriter( m_Store ).SetProposedValue( m_Path, Variant::Make( 2 ) );
  EXPECT_FALSE( VDataReader( m_Store ).IsSettled( m_Path ) );
}

TEST_F( DataStore, FlagsStandByThemselves )
{
  Listen( m_Path, m_Heard );
  uint32_t Flags = 77;
  EXPECT_FALSE( VDataReader( m_Store ).GetValueFlags( m_Path, Flags ) );
  RequireVerification();
  EXPECT_TRUE( IsHeard( m_Heard, "fb" ) );
  RequireVerification();
  EXPECT_TRUE( IsHeard( m_Heard, "" ) );
  Set( m_Path, 1 );
  m_Heard.clear();
  VDataWriter( m_Store ).RemoveValue( m_Path );
  EXPECT_TRUE( IsHeard( m_Heard, "rcb" ) );
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
  Listen( m_Path, m_Heard );
  {
    VDataWriter Outer( m_Store );
    for( const int Value : { 1, 2, 3 } )
    {
      Set( m_Path, Value );
    }
    EXPECT_TRUE( m_Heard.empty() );
  }
  EXPECT_TRUE( IsHeard( m_Heard, "pacb" ) );
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
