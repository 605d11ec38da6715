// Settings by their paths: back to their defaults, and watched.
#include "StageCoreParameters/Parameter.h"
#include "StageCoreParameters/ParameterGroup.h"
#include "StageCoreRuntime/Shared.h"
#include "host/DataStore.h"
#include "host/DeviceSettings.h"
#include "host/SettingsWatcher.h"

#include <gtest/gtest.h>

using KVZ::Variant;
using VTexts = std::vector<std::string>;

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
    Device.m_pName = Make( Path, "Name" );
    Device.m_pPayload = Make( Path, "Payload" );
    Device.m_pStatus = Make( Path, "Status" );
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
  static VTexts Texts( const std::vector<VDataPath>& i_rPaths )
  {
    VTexts Result;
    for( const VDataPath& rPath : i_rPaths )
    {
      Result.push_back( rPath.ToString() );
    }
    return Result;
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

  const std::shared_ptr<StageHost::VDataStore> m_pStore = std::make_shared<StageHost::VDataStore>();
  StageHost::VParameterRegistry m_Registry;
  StageHost::VDeviceSettings m_Settings{ m_pStore, m_Registry };
  std::string m_Error;

private:
  std::shared_ptr<VParameter> Make( const VDataPath& i_rDevice, const std::string& i_rKey ) const
  {
    return KVZ::MakeShared<VParameter>( m_pStore, GetParameterChecker<std::string>(), i_rDevice + "Settings", i_rKey );
  }
};

}

TEST_F( Settings, ResetGoesBackToTheDefaultThatIsAllowed )
{
  const VDevice First = AddDevice( "vi:0" );
  const VDevice Second = AddDevice( "vi:1" );
  First.m_pName->SetValueDefault( Variant::Make( "default" ) );
  First.m_pPayload->SetValueDefault( Variant::Make( "gone" ) );
  First.m_pPayload->SetEnum( { { "A", Variant::Make( "a" ) }, { "Set", Variant::Make( "set" ) } } );

  EXPECT_EQ( Texts( m_Settings.Reset( "VideoInput.vi:0", m_Error ) ),
    ( VTexts{ "VideoInput.vi:0.Settings.Name", "VideoInput.vi:0.Settings.Payload" } ) );
  EXPECT_EQ( Text( First.m_pName ), "default" );
  EXPECT_EQ( Text( First.m_pPayload ), "a" );
  EXPECT_EQ( Text( First.m_pStatus ), "set" );
  EXPECT_EQ( Text( Second.m_pName ), "set" );

  EXPECT_EQ( Texts( m_Settings.Reset( "VideoInput.vi:1.Settings.Name", m_Error ) ), ( VTexts{ "VideoInput.vi:1.Settings.Name" } ) );
  EXPECT_EQ( Text( Second.m_pName ), "none" ) << "there is no default";
  EXPECT_EQ( Text( Second.m_pPayload ), "set" );
}

TEST_F( Settings, ResetTellsWhyNothingIsReset )
{
  AddDevice( "vi:0" );
  EXPECT_TRUE( m_Settings.Reset( "VideoInput.vi:0.Settings.Status", m_Error ).empty() );
  EXPECT_NE( m_Error.find( "read-only" ), std::string::npos ) << m_Error;
  for( const char* pPath : { "", "VideoInput.vi:", "VideoInput.*" } )
  {
    EXPECT_TRUE( m_Settings.Reset( pPath, m_Error ).empty() );
    EXPECT_NE( m_Error.find( "There is no setting" ), std::string::npos ) << m_Error;
  }
}

// A device that answers what it is asked must not be asked for nothing in between.
TEST_F( Settings, AnOwnerHearsOfAResetOnce )
{
  const VDevice Device = AddDevice( "vi:0" );
  Device.m_pName->SetValueDefault( Variant::Make( "default" ) );
  VTexts Heard;
  Device.m_pName->GetValueChangedCallback().AddImmediate( [&] { Heard.push_back( Text( Device.m_pName ) ); } );
  m_Settings.Reset( "VideoInput", m_Error );
  EXPECT_EQ( Heard, VTexts{ "default" } );
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
