// Settings by their paths: back to their defaults, and watched.
#include "Core/VideoInterface/Schemas.h"
#include "StageCoreDataStore/DataVerifyWriter.h"
#include "StageCoreParameters/Parameter.h"
#include "StageCoreParameters/ParameterGroup.h"
#include "StageCoreRuntime/Shared.h"
#include "host/DataStore.h"
#include "host/DeviceSettings.h"
#include "host/RestoredSettings.h"
#include "host/SettingsWatcher.h"
#include "tests/support/LogCapture.h"

#include <gtest/gtest.h>

#include <cmath>

using KVZ::Variant;
using VTexts = std::vector<std::string>;
using VPaths = std::vector<VDataPath>;

namespace
{

class Settings : public testing::Test
{
protected:
  struct VDevice
  {
    std::shared_ptr<VParameterGroup> m_pGroup;
    std::shared_ptr<VParameter> m_pName;
    std::shared_ptr<VParameter> m_pPayload;
    std::shared_ptr<VParameter> m_pStatus;
  };

  VDevice AddDevice( const std::string& i_rURN )
  {
    VDevice Device;
    const VDataPath Path{ "VideoInput", i_rURN };
    Device.m_pGroup = std::make_shared<VParameterGroup>( m_pStore, Path, VDataPath{ "Attributes" } + Path );
    const auto Make = [&]( const char* i_pKey )
    { return KVZ::MakeShared<VParameter>( m_pStore, GetParameterChecker<std::string>(), Path + "Settings", i_pKey ); };
    Device.m_pName = Make( "Name" );
    Device.m_pPayload = Make( "Payload" );
    Device.m_pStatus = Make( "Status" );
    Device.m_pStatus->SetReadOnly( true );
    for( const auto& pParameter : { Device.m_pName, Device.m_pPayload, Device.m_pStatus } )
    {
      pParameter->SetValueInternal( Variant::Make( "set" ) );
      Device.m_pGroup->AddParameter( pParameter );
    }
    m_Registry.AddParameterGroup( Device.m_pGroup );
    return Device;
  }

  static std::string Text( const std::shared_ptr<VParameter>& i_pParameter )
  {
    Variant Value;
    return i_pParameter->GetValue( Value ) ? Value.ToText() : "none";
  }
  static VTexts Texts( const std::vector<StageHost::VSettingChange>& i_rChanges )
  {
    VTexts Result;
    for( const StageHost::VSettingChange& rChange : i_rChanges )
    {
      Result.push_back( rChange.m_Path + "=" + rChange.m_Value );
    }
    return Result;
  }

  const VDataPath m_Path{ "VideoInput", "vi:0", "Settings" };
  const std::shared_ptr<StageHost::VDataStore> m_pStore = std::make_shared<StageHost::VDataStore>();
  StageHost::VParameterRegistry m_Registry;
  StageHost::VDeviceSettings m_Settings{ m_pStore, m_Registry };
  std::string m_Error;
};

}

// A device that answers what it is asked must not be asked for nothing in between.
TEST_F( Settings, ResetGoesBackAtOnceToTheDefaultThatIsAllowed )
{
  const VDevice First = AddDevice( "vi:0" );
  const VDevice Second = AddDevice( "vi:1" );
  First.m_pName->SetValueDefault( Variant::Make( "default" ) );
  First.m_pPayload->SetValueDefault( Variant::Make( "gone" ) );
  First.m_pPayload->SetEnum( { { "A", Variant::Make( "a" ) }, { "Set", Variant::Make( "set" ) } } );
  VTexts Heard;
  First.m_pName->GetValueChangedCallback().AddImmediate( [&] { Heard.push_back( Text( First.m_pName ) ); } );

  EXPECT_EQ( m_Settings.Reset( "VideoInput.vi:0", m_Error ), ( VPaths{ m_Path + "Name", m_Path + "Payload" } ) );
  EXPECT_EQ( Heard, VTexts{ "default" } );
  EXPECT_EQ( Text( First.m_pPayload ), "a" );
  EXPECT_EQ( Text( First.m_pStatus ), "set" );
  EXPECT_EQ( Text( Second.m_pName ), "set" );

  EXPECT_EQ( m_Settings.Reset( "VideoInput.vi:1.Settings.Name", m_Error ), ( VPaths{ { "VideoInput", "vi:1", "Settings", "Name" } } ) );
  EXPECT_EQ( Text( Second.m_pName ), "none" ) << "there is no default";
  EXPECT_EQ( Text( Second.m_pPayload ), "set" );

  // Or tells why nothing is reset.
  EXPECT_TRUE( m_Settings.Reset( "VideoInput.vi:0.Settings.Status", m_Error ).empty() );
  EXPECT_NE( m_Error.find( "read-only" ), std::string::npos ) << m_Error;
  for( const char* pPath : { "", "VideoInput.vi:", "VideoInput.*" } )
  {
    EXPECT_TRUE( m_Settings.Reset( pPath, m_Error ).empty() );
    EXPECT_NE( m_Error.find( "There is no setting" ), std::string::npos ) << m_Error;
  }
}

// As a device finds them in the store, and makes its parameters around them.
TEST_F( Settings, RestoredValuesThatAreNotTakenGiveWayToTheDefault )
{
  using KVZ::IPixelFormat;
  const auto Put = [this]( const char* i_pKey, const Variant& i_rValue, uint32_t i_Flags = 0 )
  {
    VDataVerifyWriter Writer( *m_pStore );
    Writer.SetValueFlags( m_Path + i_pKey, i_Flags );
    Writer.SetValue( m_Path + i_pKey, i_rValue );
  };
  Put( "Gain", Variant::Make( 5.5 ) );
  Put( "Odd", Variant::Make( std::nan( "" ) ) );
  Put( "Good", Variant::Make( 0.25 ) );
  Put( "Asked", Variant::Make( 0.5 ), DataFlags::VerifyRequired );
  VDataVerifyWriter( *m_pStore ).SetProposedValue( m_Path + "Asked", Variant::Make( 7.0 ) );
  Put( "Foreign", Variant::Make( "maybe" ) );
  Put( "Bare", Variant::Make( "maybe" ) );
  Put( "Ratio", Variant::Make( 3.0 ) );
  Put( "Format", Variant::Make( IPixelFormat::ELuminance8 ) );
  Put( "Status", Variant::Make( 9.0 ), DataFlags::ReadOnly );
  const auto pRestored = std::make_shared<StageHost::VRestoredSettings>( m_pStore );
  pRestored->TakeAll();
  StageHost::VParameterRegistry Registry( [&]( const IParameterGroup& i_rGroup ) { pRestored->Check( i_rGroup ); } );

  const auto pGroup = std::make_shared<VParameterGroup>( m_pStore, m_Path, VDataPath{ "Attributes" } + m_Path );
  const auto Add = [&]( const auto& i_rChecker, const char* i_pKey, const Variant& i_rDefault )
  {
    const auto pParameter = KVZ::MakeShared<VParameter>( m_pStore, i_rChecker, m_Path, i_pKey );
    pParameter->SetRange( Variant::Make( 0.0 ), Variant::Make( 1.0 ) );
    pParameter->SetValueDefault( i_rDefault );
    pGroup->AddParameter( pParameter );
    return pParameter;
  };
  for( const char* pKey : { "Gain", "Odd", "Good", "Asked", "Foreign", "Status", "Unsaved" } )
  {
    Add( GetParameterChecker<double>(), pKey, Variant::Make( 0.75 ) );
  }
  Add( GetParameterChecker<bool>(), "Bare", {} );
  Add( GetParameterChecker<double>(), "Ratio", {} )->SetEnum( { { "One", Variant::Make( 1.0 ) } } );
  Add( GetParameterChecker<IPixelFormat::Enum>(), "Format", {} )->SetEnum( { { "Other", Variant::Make( IPixelFormat::EU8Y8V8Y8 ) } } );

  TestSupport::VLogCapture Log( "DataStore" );
  Registry.AddParameterGroup( pGroup );
  Registry.AddParameterGroup( pGroup );
  VTexts Values;
  for( const auto& pParameter : pGroup->GetParameters() )
  {
    Variant Value;
    Values.push_back( pParameter->GetName() + "=" + ( pParameter->GetValue( Value ) ? Value.ToText() : "" ) );
  }
  EXPECT_EQ( Values,
    ( VTexts{ "Gain=0.75", "Odd=0.75", "Good=0.25", "Asked=0.75", "Foreign=0.75", "Status=9", "Unsaved=0.75",
      "Bare=", "Ratio=", "Format=Luminance8" } ) );
  const std::string Path = "The saved setting \"VideoInput.vi:0.Settings.";
  EXPECT_EQ( Log.Texts(),
    ( VTexts{ Path + "Gain\" cannot be used: it is \"5.5\", and it takes values from 0 to 1.",
      Path + "Odd\" cannot be used: it is \"nan\", and it takes values from 0 to 1.",
      Path + "Asked\" cannot be used: it is \"7\", and it takes values from 0 to 1.",
      Path + "Foreign\" cannot be used: it is of the type string, not double.", Path + "Bare\" cannot be used: it is of the type string, not bool.",
      Path + "Ratio\" cannot be used: it is \"3\", and it takes: One." } ) );
}

TEST_F( Settings, EveryChangeIsHeardInItsOrder )
{
  const VDevice First = AddDevice( "vi:0" );
  auto pWatcher = std::make_unique<StageHost::VSettingsWatcher>( m_Registry, "VideoInput.vi:0" );
  StageHost::VSettingsWatcher All( m_Registry, "" );
  EXPECT_EQ( pWatcher->Count(), 3u );
  EXPECT_TRUE( pWatcher->Take().empty() );

  First.m_pName->SetValue( Variant::Make( "A" ) );
  First.m_pStatus->SetValueInternal( Variant::Make( "B" ) );
  First.m_pName->SetValue( Variant::Make( "C" ) );
  First.m_pName->SetValue( Variant::Make( "C" ) );
  First.m_pName->RemoveValue();
  EXPECT_EQ( Texts( pWatcher->Take() ),
    ( VTexts{ "VideoInput.vi:0.Settings.Name=A", "VideoInput.vi:0.Settings.Status=B", "VideoInput.vi:0.Settings.Name=C",
      "VideoInput.vi:0.Settings.Name=" } ) );
  EXPECT_TRUE( pWatcher->Take().empty() );

  // A device that comes later is none that this one asks for.
  const VDevice Second = AddDevice( "vi:1" );
  All.Take();
  pWatcher->Take();
  Second.m_pName->SetValue( Variant::Make( "D" ) );
  EXPECT_EQ( Texts( All.Take() ), ( VTexts{ "VideoInput.vi:1.Settings.Name=D" } ) );
  EXPECT_TRUE( pWatcher->Take().empty() );

  pWatcher.reset();
  First.m_pName->SetValue( Variant::Make( "E" ) );
  EXPECT_EQ( Texts( All.Take() ), ( VTexts{ "VideoInput.vi:0.Settings.Name=E" } ) );
}
