#include "StageCoreParameters/Parameter.h"

#include "StageCoreDataStore/DataVerifyWriter.h"
#include "StageCoreParameters/ParameterGroup.h"
#include "StageCoreRuntime/Shared.h"
#include "host/DataStore.h"
#include "tests/support/AssertionCapture.h"
#include "tests/support/LogCapture.h"

#include <gtest/gtest.h>

#include <cmath>

namespace
{

using KVZ::Variant;

class Parameters : public testing::Test
{
protected:
  template<class T>
  std::shared_ptr<VParameter> Make( const std::string& i_rName )
  {
    return KVZ::MakeShared<VParameter>( m_pStore, GetParameterChecker<T>(), m_Parent, i_rName );
  }

  static Variant ValueOf( const IParameter& i_rParameter )
  {
    Variant Value;
    i_rParameter.GetValue( Value );
    return Value;
  }

  const std::shared_ptr<StageHost::VDataStore> m_pStore = std::make_shared<StageHost::VDataStore>();
  const VDataPath m_Parent{ "VideoInput", "vi:0", "Settings" };
};

// Two choices of a number
VParameterChoices TwoChoices() { return { { "One", Variant::Make( 1.0 ) }, { "Two", Variant::Make( 2.0 ) } }; }

}

TEST_F( Parameters, AttributesStandBesideTheValuesUnderTheSamePathAndAClearedMarkLeavesNothing )
{
  const auto pParameter = Make<double>( "Gain" );
  int HiddenChanged = 0;
  int AttributesChanged = 0;
  pParameter->GetHiddenChangedCallback().AddImmediate( [&] { ++HiddenChanged; } );
  pParameter->GetAttributesChangedCallback().AddImmediate( [&] { ++AttributesChanged; } );
  for( const bool bSet : { true, false, false } )
  {
    EXPECT_TRUE( pParameter->SetHidden( bSet ) && pParameter->SetAdvanced( bSet ) && pParameter->SetDynamic( bSet ) );
    EXPECT_EQ( pParameter->IsHidden(), bSet );
    EXPECT_EQ( pParameter->IsAdvanced(), bSet );
    EXPECT_EQ( pParameter->IsDynamic(), bSet );
  }
  EXPECT_EQ( HiddenChanged, 2 );
  EXPECT_EQ( AttributesChanged, 6 );
  pParameter->SetDisplay( "Gain (dB)" );
  EXPECT_EQ( pParameter->GetDisplay(), "Gain (dB)" );
  std::vector<VDataPath> Paths;
  VDataReader( *m_pStore ).GetValuePaths( VDataPath{ "Attributes" }, Paths );
  EXPECT_EQ( Paths, ( std::vector<VDataPath>{ { "Attributes", "VideoInput", "vi:0", "Settings", "Gain", "Display" } } ) );
}

TEST_F( Parameters, AUserWritesWithinTypeAndRangeOnly )
{
  const auto pParameter = Make<double>( "Gain" );
  EXPECT_FALSE( pParameter->SetRange( Variant::Make( 2.0 ), Variant::Make( 1.0 ) ) );
  EXPECT_FALSE( pParameter->HasMin() || pParameter->HasRange() );
  EXPECT_TRUE( pParameter->SetRange( Variant::Make( 1.0 ), Variant::Make( 2.0 ) ) );
  EXPECT_TRUE( pParameter->SetValue( Variant::Make( 2.0 ) ) );
  for( const Variant& rRefused :
    { Variant(), Variant::Make( 1 ), Variant::Make( "1.5" ), Variant::Make( 0.99 ), Variant::Make( 2.01 ), Variant::Make( std::nan( "" ) ) } )
  {
    EXPECT_FALSE( pParameter->SetValue( rRefused ) ) << rRefused.ToText();
  }
  EXPECT_EQ( ValueOf( *pParameter ), Variant::Make( 2.0 ) );
  EXPECT_TRUE( pParameter->SetValueInternal( Variant::Make( 5.0 ) ) );
  EXPECT_FALSE( pParameter->SetValueInternal( Variant::Make( 5 ) ) );
  EXPECT_FALSE( pParameter->SetVerifiedValue( Variant::Make( 5 ) ) );
  Variant Min;
  Variant Max;
  EXPECT_TRUE( pParameter->GetRange( Min, Max ) );
  EXPECT_EQ( Max, Variant::Make( 2.0 ) );
}

TEST_F( Parameters, ARangeAndAListOfChoicesTakeEachOtherAway )
{
  const auto pParameter = Make<double>( "Ratio" );
  pParameter->SetRange( Variant::Make( 0.0 ), Variant::Make( 9.0 ) );
  EXPECT_TRUE( pParameter->SetEnum( TwoChoices(), Variant::Make( 2.0 ) ) );
  EXPECT_EQ( ValueOf( *pParameter ), Variant::Make( 2.0 ) );
  EXPECT_FALSE( pParameter->HasMin() || pParameter->HasMax() );
  EXPECT_TRUE( pParameter->SetValue( Variant::Make( 1.0 ) ) );
  EXPECT_FALSE( pParameter->SetValue( Variant::Make( 3.0 ) ) );

  // A faulty list leaves the old one.
  EXPECT_FALSE( pParameter->SetEnum( { { "One", Variant::Make( 1.0 ) }, { "One", Variant::Make( 3.0 ) } } ) );
  EXPECT_FALSE( pParameter->SetEnum( { { "One", Variant::Make( 1 ) } } ) );
  EXPECT_FALSE( pParameter->SetEnum( { { "One", Variant::Make( 1.0 ) } }, Variant::Make( 3.0 ) ) );
  VParameterChoices Choices;
  EXPECT_TRUE( pParameter->GetEnum( Choices ) );
  EXPECT_EQ( Choices, TwoChoices() );

  EXPECT_TRUE( pParameter->SetMax( Variant::Make( 9.0 ) ) );
  EXPECT_FALSE( pParameter->HasEnum() );
  EXPECT_TRUE( pParameter->SetValue( Variant::Make( 3.0 ) ) );
}

TEST_F( Parameters, AReadOnlyValueIsTheOwnersAlone )
{
  const auto pParameter = Make<std::string>( "DriverName" );
  pParameter->SetReadOnly( true );
  pParameter->SetNotSerialized( true );
  EXPECT_TRUE( pParameter->IsReadOnly() && pParameter->IsNotSerialized() );
  EXPECT_FALSE( pParameter->SetValue( Variant::Make( "user" ) ) );
  EXPECT_FALSE( pParameter->HasValue() );
  EXPECT_TRUE( pParameter->SetValueInternal( Variant::Make( "owner" ) ) );
  pParameter->SetReadOnly( false );
  EXPECT_TRUE( pParameter->SetValue( Variant::Make( "user" ) ) );
  EXPECT_TRUE( pParameter->IsNotSerialized() );
}

TEST_F( Parameters, ADefaultBecomesTheValueOnlyWhereThereIsNone )
{
  const auto pFresh = Make<int64_t>( "Fresh" );
  EXPECT_FALSE( pFresh->SetValueDefault( Variant::Make( 1.0 ) ) );
  EXPECT_TRUE( pFresh->SetValueDefault( Variant::Make<int64_t>( 1 ) ) );
  EXPECT_EQ( ValueOf( *pFresh ), Variant::Make<int64_t>( 1 ) );

  VDataWriter( *m_pStore ).SetValue( m_Parent + "Saved", Variant::Make<int64_t>( 7 ) );
  const auto pSaved = Make<int64_t>( "Saved" );
  EXPECT_TRUE( pSaved->SetValueDefault( Variant::Make<int64_t>( 1 ) ) );
  Variant Default;
  EXPECT_TRUE( pSaved->GetValueDefault( Default ) );
  EXPECT_EQ( Default, Variant::Make<int64_t>( 1 ) );
  EXPECT_EQ( ValueOf( *pSaved ), Variant::Make<int64_t>( 7 ) );

  VDataWriter( *m_pStore ).SetValue( m_Parent + "Foreign", Variant::Make( "7" ) );
  const auto pForeign = Make<int64_t>( "Foreign" );
  EXPECT_TRUE( pForeign->SetValueDefault( Variant::Make<int64_t>( 1 ) ) );
  EXPECT_EQ( ValueOf( *pForeign ), Variant::Make<int64_t>( 1 ) ) << "a value of another type is none";
}

TEST_F( Parameters, VerificationAskedForTooLateLeavesAWarning )
{
  TestSupport::VLogCapture Log( "VParameter" );
  const auto pParameter = Make<bool>( "Enabled" );
  pParameter->SetVerifyRequired( true );
  pParameter->SetValueDefault( Variant::Make( true ) );
  EXPECT_TRUE( Log.Lines().empty() );
  pParameter->SetVerifyRequired( false );
  EXPECT_FALSE( pParameter->IsVerifyRequired() );
  ASSERT_EQ( Log.Lines().size(), 1u );
  EXPECT_EQ( Log.Lines()[0].m_Level, 3 );
  EXPECT_EQ( Log.Lines()[0].m_Text,
    "VParameter::SetVerifyRequired called after VParameter::SetValueDefault for Parameter \"Enabled\", parameters previously imported from "
    "other Tarvo applications may be lost." );
}

TEST_F( Parameters, RemoveAllLeavesNothingInTheStore )
{
  const auto pParameter = Make<double>( "Gain" );
  int Removed = 0;
  pParameter->GetFourthNodeCallback().AddImmediate( [&] { ++Removed; } );
  pParameter->SetDisplay( "Gain" );
  pParameter->SetReadOnly( true );
  pParameter->SetRange( Variant::Make( 0.0 ), Variant::Make( 1.0 ) );
  pParameter->SetValueDefault( Variant::Make( 0.5 ) );
  EXPECT_TRUE( pParameter->RemoveAll() );
  std::vector<std::string> Names;
  EXPECT_FALSE( VDataReader( *m_pStore ).GetChildNames( VDataPath(), Names ) );
  EXPECT_EQ( Removed, 1 );
  EXPECT_FALSE( pParameter->RemoveAll() );
}

TEST_F( Parameters, SubscriptionsEndWithTheParameter )
{
  int Calls = 0;
  auto pParameter = Make<double>( "Gain" );
  pParameter->SubscribeProposedValue( [&] { ++Calls; }, nullptr );
  pParameter->SubscribeValueChanged( [&] { ++Calls; }, nullptr );
  pParameter->SetValue( Variant::Make( 1.0 ) );
  EXPECT_EQ( Calls, 2 );
  pParameter.reset();
  VDataWriter( *m_pStore ).SetValue( m_Parent + "Gain", Variant::Make( 2.0 ) );
  EXPECT_EQ( Calls, 2 );
}

TEST_F( Parameters, AskingForAnEventInsideAReaderIsAnAssertionAndNoCrash )
{
  TestSupport::VAssertionCapture Assertions;
  const auto pParameter = Make<double>( "Gain" );
  const VDataReader Reader( *m_pStore );
  pParameter->GetValueChangedCallback().AddImmediate( [] {} );
  EXPECT_EQ( Assertions.Expressions().size(), 1u );
}

TEST_F( Parameters, AGroupKnowsItsParametersByKeyAndByPlace )
{
  VParameterGroup Group( m_pStore, m_Parent.Parent(), VDataPath{ "Attributes" } + m_Parent.Parent() );
  EXPECT_TRUE( Group.AddParameter( Make<double>( "Angle" ) ) );
  EXPECT_TRUE( Group.AddParameter( Make<double>( "Mode" ) ) );
  EXPECT_FALSE( Group.AddParameter( Make<bool>( "Angle" ) ) );
  EXPECT_EQ( Group.GetParameter( "Angle" )->GetSchema(), KVZ::VSchemaOf<double>::Get() );
  EXPECT_TRUE( Group.GetParameter( VDataPathHandle( m_Parent + "Mode" ) ) );
  EXPECT_FALSE( Group.GetParameter( VDataPathHandle( VDataPath{ "Elsewhere", "Mode" } ) ) );
  EXPECT_TRUE( Group.RemoveParameter( VDataPathHandle( m_Parent + "Angle" ) ) );
  EXPECT_FALSE( Group.RemoveParameter( "Angle" ) );
  EXPECT_EQ( Group.GetParameters().size(), 1u );
}
