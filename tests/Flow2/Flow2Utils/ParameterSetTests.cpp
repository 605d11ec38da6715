#include "Flow2/Flow2Utils/ParameterUtilsChecked.h"

#include "Flow2/Flow2Utils/FlowException.h"
#include "tests/support/LogCapture.h"

#include <gtest/gtest.h>

#include <limits>

namespace
{

using Flow2Utils::EParameterResult;
using Flow2Utils::UpdateChecked;
using Flow2Utils::VFlowException;
using VTexts = KVZ::VFlowParameterTexts;

constexpr uint32_t WholeUpdate = 7;
constexpr uint32_t BeginEnd = 6;

struct VTestSet : public Flow2Utils::VParameterSet
{
  VTestSet()
  {
    AddParameter<std::string>( "Colour", &m_Colour, { .m_Description = "Of the light", .m_Permitted = { { "Red", "#f00" }, { "Blue", "#00f" } } } );
    AddParameter<int32_t>( "Count", &m_Count, { .m_Default = 5, .m_Minimum = -2, .m_Maximum = 10 } );
    AddParameter<double>( "Gain", &m_Gain );
    AddParameter<std::string>( "Name", &m_Name, { .m_bRequired = true } );
    AddParameter<bool>( "On", &m_bOn, { .m_Default = true } );
  }

  std::string m_Colour;
  int32_t m_Count = 0;
  double m_Gain = 0.0;
  std::string m_Name;
  bool m_bOn = false;
};

std::string ErrorOf( const std::function<void()>& i_rCall )
{
  try
  {
    i_rCall();
  }
  catch( const VFlowException& rError )
  {
    return rError.what();
  }
  return {};
}

KVZ::VFlowItemPtr Addressed( const KVZ::VFlowTarget& i_rTarget, const VTexts& i_rTexts )
{
  auto pItem = std::make_shared<KVZ::VFlowParameters>( "test" );
  pItem->m_Target = i_rTarget;
  pItem->m_Texts = i_rTexts;
  return pItem;
}

struct FlowParameterSet : public ::testing::Test
{
  VTestSet m_Set;
};

TEST_F( FlowParameterSet, TurnsTextIntoMembersAndTellsChanges )
{
  EXPECT_EQ( m_Set.m_Count, 5 ) << "a default is there from the beginning";
  const VTexts Texts = { { "Count", "7" }, { "Gain", "-2.5e1" }, { "Name", "left" }, { "On", "0" } };
  EXPECT_TRUE( UpdateChecked( m_Set, Texts, WholeUpdate ) );
  EXPECT_EQ( m_Set.m_Count, 7 );
  EXPECT_EQ( m_Set.m_Gain, -25.0 );
  EXPECT_EQ( m_Set.m_Name, "left" );
  EXPECT_FALSE( m_Set.m_bOn );
  EXPECT_FALSE( UpdateChecked( m_Set, Texts, WholeUpdate ) ) << "the same again";
  const uint64_t Stamp = m_Set.Find( "Name" )->Stamp();
  EXPECT_TRUE( UpdateChecked( m_Set, VTexts{ { "Count", "8" }, { "Gain", "-25" }, { "Name", "left" }, { "On", "false" } }, WholeUpdate ) );
  EXPECT_TRUE( m_Set.Find( "Count" )->IsChanged() );
  EXPECT_FALSE( m_Set.Find( "Name" )->IsChanged() );
  EXPECT_EQ( m_Set.Find( "Name" )->Stamp(), Stamp );
  EXPECT_GT( m_Set.Find( "Count" )->Stamp(), Stamp );
}

TEST_F( FlowParameterSet, GoesBackToDefaultsWhenNoSourceNamesAParameterAnyMore )
{
  UpdateChecked( m_Set, VTexts{ { "Count", "7" }, { "Name", "left" }, { "On", "1" } }, WholeUpdate );
  EXPECT_TRUE( UpdateChecked( m_Set, VTexts(), BeginEnd ) );
  EXPECT_EQ( m_Set.m_Count, 5 );
  EXPECT_TRUE( m_Set.Find( "Count" )->IsChanged() );
  EXPECT_FALSE( m_Set.Find( "On" )->IsChanged() ) << "had the default's value";
  KVZ::Variant Value;
  EXPECT_EQ( m_Set.Find( "Name" )->GetValue( Value ), EParameterResult::NoValue );
  EXPECT_EQ( m_Set.Find( "Count" )->GetValue( Value ), 0u );
  EXPECT_EQ( Value, KVZ::Variant::Make( int32_t( 5 ) ) );
  EXPECT_FALSE( UpdateChecked( m_Set, VTexts(), BeginEnd ) );

  // Without a new beginning, what an earlier part of the update named stays.
  UpdateChecked( m_Set, VTexts{ { "Count", "7" } }, 3 );
  EXPECT_TRUE( UpdateChecked( m_Set, VTexts(), 4 ) );
  EXPECT_EQ( m_Set.m_Count, 7 );
}

TEST_F( FlowParameterSet, OneBadEntryDoesNotStopTheOthers )
{
  const TestSupport::VLogCapture Log( "Internal" );
  const VTexts Texts = { { "Count", "seven" }, { "Flavour", "x" }, { "Gain", "nan" }, { "Name", "left" }, { "Smell", "y" } };
  const std::string BadTexts = "Could not parse parameter Count\nCould not parse parameter Gain\n";
  EXPECT_EQ( ErrorOf( [&] { UpdateChecked( m_Set, Texts, WholeUpdate ); } ),
    "Could not parse parameter Count\nUnknown parameter Flavour\nCould not parse parameter Gain\nUnknown parameter Smell\n" );
  EXPECT_EQ( m_Set.m_Name, "left" );
  EXPECT_EQ( ErrorOf( [&] { UpdateChecked( m_Set, Texts, BeginEnd ); } ), BadTexts );
  ASSERT_EQ( Log.Lines().size(), 2u );
  EXPECT_EQ( Log.Lines()[1].m_Text, BadTexts );
  EXPECT_EQ( Log.Lines()[1].m_Level, 2 );
  EXPECT_EQ( Log.Lines()[1].m_File, "Flow2Utils/ParameterUtilsChecked" );
}

TEST_F( FlowParameterSet, TakesNoMoreThanANumber )
{
  const std::pair<const char*, const char*> Bad[] = { { "Count", "" }, { "Count", " 1" }, { "Count", "1 " }, { "Count", "+1" }, { "Count", "0x10" },
    { "Count", "1.0" }, { "Count", "2147483648" }, { "Gain", "" }, { "Gain", "inf" }, { "Gain", "1,5" }, { "Gain", "1e999" }, { "On", "yes" } };
  for( const auto& [pName, pText] : Bad )
  {
    EXPECT_EQ( m_Set.SetParameter( pName, pText ), EParameterResult::BadText ) << pName << " of " << pText;
  }
  EXPECT_EQ( m_Set.SetParameter( "Count", "-2147483648" ), EParameterResult::Changed );
  EXPECT_EQ( m_Set.m_Count, std::numeric_limits<int32_t>::min() );
  EXPECT_EQ( m_Set.SetParameter( "Flavour", "x" ), EParameterResult::UnknownName );
}

TEST_F( FlowParameterSet, ValidatesEachParameterInOrder )
{
  std::string Text;
  EXPECT_FALSE( m_Set.Validate( Text ) );
  EXPECT_EQ( Text, "Parameter Name: Value is not set\n" );
  UpdateChecked( m_Set, VTexts{ { "Colour", "Red" }, { "Name", "x" } }, WholeUpdate );
  EXPECT_EQ( m_Set.m_Colour, "#f00" ) << "a label stands for its value";
  EXPECT_TRUE( m_Set.Validate( Text ) );
  EXPECT_NO_THROW( Flow2Utils::ValidateChecked( m_Set ) );
  UpdateChecked( m_Set, VTexts{ { "Colour", "Green" }, { "Count", "-3" } }, WholeUpdate );
  EXPECT_EQ( m_Set.m_Colour, "Green" ) << "stored as it stands";
  const std::string All = "Parameter Colour: Value is not one of the permitted values\nParameter Count: Value is less than permitted minimum\n"
                          "Parameter Name: Value is not set\n";
  EXPECT_EQ( ErrorOf( [&] { Flow2Utils::ValidateChecked( m_Set ); } ), All );
  UpdateChecked( m_Set, VTexts{ { "Colour", "#00f" }, { "Count", "11" }, { "Name", "x" } }, WholeUpdate );
  EXPECT_FALSE( m_Set.Validate( Text ) );
  EXPECT_EQ( Text, "Parameter Count: Value is greater than permitted maximum\n" );
}

TEST_F( FlowParameterSet, TakesItemsThatAreAddressedToIt )
{
  m_Set.SetTarget( { 3, "left" } );
  const KVZ::VFlowItemList Items = { std::make_shared<KVZ::VFlowGenericData>( "other" ), Addressed( { 3, "right" }, { { "Flavour", "x" } } ),
    Addressed( { 3, "left" }, { { "Count", "6" } } ), Addressed( {}, { { "Gain", "1.5" } } ) };
  EXPECT_TRUE( UpdateChecked( m_Set, Items, WholeUpdate ) );
  EXPECT_EQ( m_Set.m_Count, 6 );
  EXPECT_EQ( m_Set.m_Gain, 1.5 );

  EXPECT_TRUE( UpdateChecked( m_Set, VTexts{ { "Count", "7" }, { "Name", "x" } }, Items, WholeUpdate ) );
  EXPECT_EQ( m_Set.m_Count, 6 ) << "the second input is laid over the first";
  EXPECT_EQ( m_Set.m_Name, "x" ) << "and does not end what the first has named";
  EXPECT_EQ( ErrorOf(
               [&] {
                 UpdateChecked( m_Set, VTexts{ { "A", "" } }, KVZ::VFlowItemList{ Addressed( {}, { { "B", "" } } ) }, 5 );
               } ),
    "Unknown parameter A\nUnknown parameter B\n" );
}

TEST_F( FlowParameterSet, AMovedTargetIsAChange )
{
  for( const bool bFirst : { true, false } )
  {
    m_Set.BeginUpdate();
    m_Set.SetTarget( { 1, "a" } );
    EXPECT_EQ( m_Set.HasChanged(), bFirst );
    EXPECT_FALSE( m_Set.Find( "Name" )->IsChanged() ) << "its value is the same";
  }
}

TEST_F( FlowParameterSet, DescribesItsParameters )
{
  const auto Described = m_Set.Describe();
  EXPECT_EQ( Described.at( "Count" ),
    ( Flow2Utils::VParameterAttributes{ { "<RangeMin>", "-2" }, { "<RangeMax>", "10" }, { "<DefaultValue>", "5" }, { "<Advanced>", "false" },
      { "<Hidden>", "false" }, { "<Serialized>", "true" } } ) );
  EXPECT_EQ( Described.at( "Colour" ).at( "<Description>" ), "Of the light" );
  std::string* pNothing = nullptr;
  EXPECT_EQ( ErrorOf( [&] { m_Set.AddParameter( "Nothing", pNothing ); } ), "Null pointer in ptr_map_adapter::insert()" );
}

TEST_F( FlowParameterSet, ACloneGoesItsOwnWay )
{
  m_Set.SetParameter( "Count", "7" );
  const auto pClone = m_Set.Find( "Count" )->Clone();
  KVZ::Variant Value;
  EXPECT_EQ( pClone->GetValue( Value ), 0u );
  EXPECT_EQ( Value, KVZ::Variant::Make( int32_t( 7 ) ) );
  EXPECT_EQ( pClone->SetValue( "11" ), EParameterResult::Changed );
  EXPECT_EQ( m_Set.m_Count, 7 );
}

}
