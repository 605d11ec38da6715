// Values and items on their way from one store to another.
#include "StageCoreDataStore/DataStoreIntrospectionUtils.h"
#include "host/DataStore.h"
#include "tests/StageCoreDataStore/FaultyWriter.h"
#include "tests/support/LogCapture.h"

#include <gtest/gtest.h>

#include <optional>

using KVZ::Variant;
namespace Options = DataStorePersistence::Options;

namespace
{

using VTexts = std::vector<std::string>;

// Of an item of items.
const KVZ::ISchema* PairSchema()
{
  const KVZ::ISchema* pNumber = KVZ::VSchemaOf<int32_t>::Get();
  const KVZ::ISchema* pInner = KVZ::IO::GetUniqueSchema( "Test.Inner", "", std::vector<KVZ::ISchema::VField>{ { "X", pNumber }, { "Y", pNumber } } );
  return KVZ::IO::GetUniqueSchema( "Test.Pair", "", std::vector<KVZ::ISchema::VField>{ { "Id", pNumber }, { "Inner", pInner } } );
}

class Persistence : public testing::Test
{
protected:
  void Put( IDataStore& io_rStore, const VDataPath& i_rPath, int32_t i_Value, uint32_t i_Flags = 0 )
  {
    VDataWriter Writer( io_rStore );
    Writer.SetValueFlags( i_rPath, i_Flags );
    Writer.SetValue( i_rPath, Variant::Make( i_Value ) );
  }

  // A proposal that its owner has not answered yet.
  void PutForms( IDataStore& io_rStore, const VDataPath& i_rPath, int32_t i_Verified, int32_t i_Proposed )
  {
    VDataVerifyWriter Writer( io_rStore );
    Writer.SetValueFlags( i_rPath, DataFlags::VerifyRequired );
    Writer.SetVerifiedValue( i_rPath, Variant::Make( i_Verified ) );
    Writer.SetProposedValue( i_rPath, Variant::Make( i_Proposed ) );
  }

  using VNumber = std::optional<int32_t>;
  static VNumber Stored( IDataStore& i_rStore, const VDataPath& i_rPath, EDataForm i_Form )
  {
    const VDataReader Lock( i_rStore );
    Variant Value;
    int32_t Number = 0;
    return i_rStore.GetValue( i_rPath, Value, i_Form ) && Value.Get( Number ) ? VNumber( Number ) : std::nullopt;
  }
  static VNumber Verified( IDataStore& i_rStore, const VDataPath& i_rPath ) { return Stored( i_rStore, i_rPath, EDataForm::Verified ); }
  static VNumber Proposed( IDataStore& i_rStore, const VDataPath& i_rPath ) { return Stored( i_rStore, i_rPath, EDataForm::Proposed ); }
  static uint32_t Flags( IDataStore& i_rStore, const VDataPath& i_rPath )
  {
    uint32_t Flags = 0;
    VDataReader( i_rStore ).GetValueFlags( i_rPath, Flags );
    return Flags;
  }

  bool Copy( const VDataPath& i_rPath, uint32_t i_Options ) { return CopyTo( i_rPath, i_rPath, i_Options ); }
  bool CopyTo( const VDataPath& i_rFrom, const VDataPath& i_rTo, uint32_t i_Options )
  {
    VFaultyWriter Writer( m_Target, m_Faults );
    return DataStorePersistence::CopyValues( { VFaultyWriter( m_Source, m_SourceFaults ), i_rFrom }, { Writer, i_rTo }, i_Options );
  }
  bool CopyItem( const KVZ::ISchema* i_pSchema, uint32_t i_Options )
  {
    VFaultyWriter Writer( m_Target, m_Faults );
    return DataStoreIntrospectionUtils::CopyItem( { VDataVerifyReader( m_Source ), m_Item }, { Writer, m_Item }, *i_pSchema, i_Options );
  }

  StageHost::VDataStore m_Source;
  StageHost::VDataStore m_Target;
  VFaults m_SourceFaults;   // of copied values
  VFaults m_Faults;         // of the store that is written
  const VDataPath m_Path{ "A", "B" };
  const VDataPath m_Item{ "Items", "One" };
  TestSupport::VLogCapture m_Log{ "DataStore" };
};

}

TEST_F( Persistence, OptionsLeaveValuesOut )
{
  Put( m_Source, m_Path, 1, DataFlags::ReadOnly | DataFlags::NotSerialized );
  EXPECT_TRUE( Copy( m_Path, Options::SkipReadOnly | Options::SkipNotSerialized ) );
  EXPECT_TRUE( Copy( m_Path, Options::SkipNotSerialized ) );
  EXPECT_FALSE( VDataReader( m_Target ).Exists( m_Path ) );
  EXPECT_EQ( m_Log.Texts(), ( VTexts{ "Skipping read only value 'A.B'.", "Skipping not serialized value 'A.B'." } ) );

  EXPECT_TRUE( Copy( m_Path, 0 ) );
  EXPECT_EQ( Verified( m_Target, m_Path ), 1 );
  EXPECT_EQ( Flags( m_Target, m_Path ), 0u );

  m_Log.Clear();
  Put( m_Source, m_Path, 2, DataFlags::ReadOnly );
  EXPECT_TRUE( Copy( m_Path, Options::SkipExisting | Options::SkipReadOnly ) );
  EXPECT_EQ( Verified( m_Target, m_Path ), 1 );
  EXPECT_EQ( m_Log.Texts(), ( VTexts{ "Skipping value 'A.B' that already exists in i_rDataWriter." } ) );
}

TEST_F( Persistence, FormsAndFlagsAreKeptAsTheyAre )
{
  PutForms( m_Source, m_Path, 1, 2 );
  Put( m_Source, { "A", "C" }, 3, DataFlags::ReadOnly );
  EXPECT_TRUE( CopyTo( { "A" }, { "Saved", "X" }, Options::CopyForms ) );
  const VDataPath Kept{ "Saved", "X", "B" };
  EXPECT_EQ( Verified( m_Target, Kept ), 1 );
  EXPECT_EQ( Proposed( m_Target, Kept ), 2 );
  EXPECT_EQ( Flags( m_Target, Kept ), DataFlags::VerifyRequired );
  EXPECT_EQ( Flags( m_Target, { "Saved", "X", "C" } ), DataFlags::ReadOnly );
  EXPECT_TRUE( m_Log.Texts().empty() );
}

// What was asked for is asked of the target's owner, who answers it before it counts.
TEST_F( Persistence, AWishBecomesAProposalThatWaits )
{
  PutForms( m_Source, m_Path, 1, 2 );
  Put( m_Target, m_Path, 7 );
  EXPECT_TRUE( Copy( m_Path, 0 ) );
  EXPECT_EQ( m_Log.Texts(), ( VTexts{ "VerifyRequired flag missing in 'A.B' target value, setting flag." } ) );
  EXPECT_EQ( Flags( m_Target, m_Path ), DataFlags::VerifyRequired );
  EXPECT_EQ( Verified( m_Target, m_Path ), 7 );
  EXPECT_EQ( Proposed( m_Target, m_Path ), 2 );
  EXPECT_FALSE( VDataReader( m_Target ).IsSettled( m_Path ) );

  // A target that has the flag is not told of it again.
  m_Log.Clear();
  EXPECT_TRUE( Copy( m_Path, 0 ) );
  EXPECT_TRUE( m_Log.Texts().empty() );
}

TEST_F( Persistence, AFailureEndsTheCopyAndKeepsWhatIsThere )
{
  struct VFaultCase
  {
    bool m_bSource;
    const char* m_pFault;
    bool m_bVerify;
    uint32_t m_Options;
    const char* m_pText;
  };
  const VFaultCase Cases[] = {
    { true, "GetFlags A.B", true, Options::CopyForms, "Could not read 'A.B' flags." },
    { true, "GetVerified A.B", true, Options::CopyForms, "Could not read 'A.B' verified value." },
    { true, "GetProposed A.B", true, Options::CopyForms, "Could not read 'A.B' proposed value." },
    { false, "SetFlags A.B", true, Options::CopyForms, "Error writing 'A.B' value flags" },
    { false, "SetVerified A.B", true, Options::CopyForms, "Error writing 'A.B' verified value" },
    { false, "SetProposed A.B", true, Options::CopyForms, "Error writing 'A.B' proposed value" },
    { true, "GetVerified A.B", false, 0, "Could not read 'A.B' verified value" },
    { true, "GetProposed A.B", true, 0, "Could not read 'A.B' proposed value" },
    { false, "SetProposed A.B", false, 0, "Error writing 'A.B' proposed value" },
    { false, "SetFlags A.B", true, 0, "Setting VerifyRequired flag 'A.B' failed." },
  };
  for( const VFaultCase& rCase : Cases )
  {
    SCOPED_TRACE( rCase.m_pText );
    VDataWriter( m_Target ).RemoveBranch( VDataPath() );
    Put( m_Source, { "A", "A" }, 1 );
    Put( m_Source, m_Path, 2, rCase.m_bVerify ? DataFlags::VerifyRequired : 0 );
    Put( m_Source, { "A", "C" }, 3 );
    ( rCase.m_bSource ? m_SourceFaults : m_Faults ) = { rCase.m_pFault };
    m_Log.Clear();
    EXPECT_FALSE( Copy( { "A" }, rCase.m_Options ) );
    m_SourceFaults.clear();
    m_Faults.clear();
    EXPECT_EQ( m_Log.Texts().empty() ? "" : m_Log.Texts().back(), rCase.m_pText );
    EXPECT_EQ( Verified( m_Target, { "A", "A" } ), 1 );
    EXPECT_FALSE( VDataReader( m_Target ).Exists( VDataPath{ "A", "C" } ) );
  }
}

TEST_F( Persistence, RemovalLeavesWhatIsReadOnlyOrNotSaved )
{
  Put( m_Source, { "A", "A" }, 1 );
  Put( m_Source, { "A", "B" }, 2, DataFlags::ReadOnly );
  Put( m_Source, { "A", "C" }, 3, DataFlags::NotSerialized );
  Put( m_Source, { "A", "D" }, 4 );
  Put( m_Source, { "A", "E" }, 5, DataFlags::VerifyRequired );
  Put( m_Source, { "B" }, 6 );
  m_Faults = { "Remove A.D" };
  {
    VFaultyWriter Writer( m_Source, m_Faults );
    EXPECT_FALSE( DataStorePersistence::RemoveParameterValues( Writer, VDataPath{ "A" } ) );
    std::vector<VDataPath> Left;
    Writer.GetValuePaths( VDataPath(), Left );
    EXPECT_EQ( Left, ( std::vector<VDataPath>{ { "A", "B" }, { "A", "C" }, { "A", "D" }, { "B" } } ) );
  }
  EXPECT_EQ( m_Log.Texts(),
    ( VTexts{ "skipping read only parameter 'A.B'", "skipping not serialized value 'A.C'.", "Error removing 'A.D' parameter value" } ) );
}

TEST_F( Persistence, AnItemIsCopiedWholeOrNotAtAll )
{
  Put( m_Source, m_Item + VDataPath{ "Id" }, 1 );
  Put( m_Source, m_Item + VDataPath{ "Inner", "X" }, 2 );
  Put( m_Source, m_Item + VDataPath{ "Foreign" }, 9 );
  EXPECT_TRUE( CopyItem( PairSchema(), Options::CopyForms ) );
  EXPECT_EQ( m_Log.Texts(), ( VTexts{ "Not persisting incomplete item 'Items.One'." } ) );
  EXPECT_EQ( VDataReader( m_Target ).CountValues( m_Item ), 0u );

  // A field of another type is no field of the item.
  VDataWriter( m_Source ).SetValue( m_Item + VDataPath{ "Inner", "Y" }, Variant::Make( "three" ) );
  EXPECT_TRUE( CopyItem( PairSchema(), Options::CopyForms | Options::CopyIncomplete ) );
  EXPECT_EQ( VDataReader( m_Target ).CountValues( m_Item ), 2u );
  VDataWriter( m_Target ).RemoveBranch( m_Item );

  Put( m_Source, m_Item + VDataPath{ "Inner", "Y" }, 3 );
  EXPECT_TRUE( CopyItem( PairSchema(), Options::CopyForms ) );
  EXPECT_EQ( Verified( m_Target, m_Item + VDataPath{ "Inner", "Y" } ), 3 );
  EXPECT_EQ( VDataReader( m_Target ).CountValues( m_Item ), 3u ) << "what is no field of the item stays behind";
}

// Half of one item and half of another would be neither.
TEST_F( Persistence, AnItemThatIsThereIsLeftAlone )
{
  Put( m_Source, m_Item + VDataPath{ "Id" }, 1 );
  Put( m_Source, m_Item + VDataPath{ "Inner", "X" }, 2 );
  Put( m_Source, m_Item + VDataPath{ "Inner", "Y" }, 3 );
  Put( m_Target, m_Item + VDataPath{ "Inner", "Y" }, 30 );
  EXPECT_TRUE( CopyItem( PairSchema(), Options::SkipExisting ) );
  EXPECT_EQ( m_Log.Texts(), ( VTexts{ "Skipping copy of already present item 'Items.One'." } ) );
  EXPECT_EQ( VDataReader( m_Target ).CountValues( m_Item ), 1u );

  m_Faults = { "SetProposed Items.One.Inner.X" };
  EXPECT_FALSE( CopyItem( PairSchema(), 0 ) );
  EXPECT_EQ( Verified( m_Target, m_Item + VDataPath{ "Id" } ), 1 );
  EXPECT_EQ( Verified( m_Target, m_Item + VDataPath{ "Inner", "Y" } ), 30 ) << "the copy ends at the first failure";
}
