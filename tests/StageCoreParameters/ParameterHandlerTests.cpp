#include "Core/VideoInterface/Schemas.h"
#include "StageCoreDataStore/DataWriter.h"
#include "StageCoreDataStoreTypes/DeviceSchemas.h"
#include "StageCoreParameters/CaptureDeviceParameterHandler.h"
#include "host/DataStore.h"
#include "tests/support/AssertionCapture.h"
#include "tests/support/FakeSettingsHost.h"
#include "tests/support/LogCapture.h"
#include "tests/support/ManualPostalService.h"

#include <gtest/gtest.h>

namespace
{

using KVZ::IAudioPayload;
using KVZ::IVideoContainer;
using KVZ::IVideoPayload;
using KVZ::Variant;
using Labels = std::vector<std::string>;

class VTestHandler : public VCaptureDeviceParameterHandler
{
public:
  using VCaptureDeviceParameterHandler::VCaptureDeviceParameterHandler;

  void OnEnabledChanged() override
  {
    ++m_EnabledCalls;
    Variant Wish;
    GetParameter( "Enabled" )->GetProposedValue( Wish );
    GetParameter( "Enabled" )->SetVerifiedValue( Wish );
  }
  void OnConnectedChanged() override { ++m_ConnectedCalls; }
  using VDeviceParameterHandler::CreateThreshold;

  int m_EnabledCalls = 0;
  int m_ConnectedCalls = 0;
};

// Whose list changes while it is being read.
class VRestlessFolders : public TestSupport::VFakeCaptureTargets
{
public:
  void GetFolderAliases( std::vector<std::string>& o_rAliases ) override
  {
    VFakeCaptureTargets::GetFolderAliases( o_rAliases );
    if( !std::exchange( m_bChanged, true ) )
    {
      SetAliases( { "Other" } );
    }
  }

private:
  bool m_bChanged = false;
};

class ParameterHandler : public testing::Test
{
protected:
  void Create( VCaptureDeviceParameterHandler::VContainers i_Containers = VCaptureDeviceParameterHandler::AllContainers() )
  {
    m_pHandler = KVZ::MakeShared<VTestHandler>( m_pService, m_pStore, m_pRegistry, m_pFolders, m_Device, "vi:0", "Model", std::move( i_Containers ) );
  }

  template<class T>
  T Value( const std::string& i_rKey )
  {
    Variant Value;
    T Result{};
    m_pHandler->GetParameter( i_rKey )->GetValue( Value );
    EXPECT_TRUE( Value.Get( Result ) ) << i_rKey;
    return Result;
  }

  template<class T>
  bool Set( const std::string& i_rKey, const T& i_rValue )
  {
    const bool bSet = m_pHandler->GetParameter( i_rKey )->SetValue( Variant::Make( i_rValue ) );
    m_pService->RunAll();
    return bSet;
  }

  Labels LabelsOf( const std::string& i_rKey )
  {
    Labels Found;
    m_pHandler->GetParameter( i_rKey )->GetEnum( Found );
    return Found;
  }

  const std::shared_ptr<TestSupport::VManualPostalService> m_pService = std::make_shared<TestSupport::VManualPostalService>();
  const std::shared_ptr<StageHost::VDataStore> m_pStore = std::make_shared<StageHost::VDataStore>();
  const std::shared_ptr<TestSupport::VFakeParameterRegistry> m_pRegistry = std::make_shared<TestSupport::VFakeParameterRegistry>();
  std::shared_ptr<TestSupport::VFakeCaptureTargets> m_pFolders = std::make_shared<TestSupport::VFakeCaptureTargets>();
  const VDataPath m_Device = DeviceSchemas::VideoInput::Path( "vi:0" );
  std::shared_ptr<VTestHandler> m_pHandler;
};

}

TEST_F( ParameterHandler, RegistersItsGroupWhileItLives )
{
  Create();
  ASSERT_EQ( m_pRegistry->m_Groups.size(), 1u );
  const auto pGroup = m_pRegistry->m_Groups[0];
  EXPECT_EQ( pGroup->GetPath(), m_Device );
  EXPECT_EQ( pGroup->GetParameters().size(), 10u );
  m_pHandler.reset();
  EXPECT_TRUE( m_pRegistry->m_Groups.empty() );
  m_pService->RunAll();
}

TEST_F( ParameterHandler, AnUnknownKeyIsAnAssertion )
{
  Create();
  TestSupport::VAssertionCapture Assertions;
  EXPECT_FALSE( m_pHandler->GetParameter( "Nothing" ) );
  EXPECT_EQ( Assertions.Expressions(), std::vector<std::string>{ "pParameter" } );
}

TEST_F( ParameterHandler, EachUserWriteAndTheDefaultOfEnabledReachTheOwner )
{
  Create();
  EXPECT_EQ( m_pHandler->m_EnabledCalls, 0 );
  m_pService->RunAll();
  EXPECT_EQ( m_pHandler->m_EnabledCalls, 1 );
  EXPECT_TRUE( VDataReader( *m_pStore ).IsSettled( DeviceSchemas::Enabled( m_Device ) ) );
  Set( "Enabled", true );
  Set( "Enabled", false );
  EXPECT_EQ( m_pHandler->m_EnabledCalls, 3 );
}

TEST_F( ParameterHandler, ASavedEnabledReachesTheOwnerOnce )
{
  VDataWriter( *m_pStore ).SetValue( DeviceSchemas::Enabled( m_Device ), Variant::Make( false ) );
  Create();
  m_pService->RunAll();
  EXPECT_EQ( m_pHandler->m_EnabledCalls, 1 );
  EXPECT_FALSE( Value<bool>( "Enabled" ) );
}

TEST_F( ParameterHandler, ConnectionCountGrowsOnlyOnAChangeToConnected )
{
  Create();
  for( const bool bConnected : { false, true, true, false, true } )
  {
    m_pHandler->SetConnected( bConnected );
  }
  EXPECT_EQ( Value<uint32_t>( "ConnectionCount" ), 2u );
  EXPECT_EQ( m_pHandler->m_ConnectedCalls, 5 );
}

TEST_F( ParameterHandler, WarningsStandUnderTheDeviceUntilTheyAreCleared )
{
  Create();
  const VDataPath Path{ "VideoInput", "vi:0", "Warnings", "Heat" };
  m_pHandler->SetWarning( "Heat", "Too hot." );
  EXPECT_EQ( VDataReader( *m_pStore ).GetValue( Path ), Variant::Make( "Too hot." ) );
  m_pHandler->ClearWarning( "Heat" );
  m_pHandler->ClearWarning( "Heat" );
  EXPECT_FALSE( VDataReader( *m_pStore ).Exists( Path ) );
}

TEST_F( ParameterHandler, TheThresholdsDefaultFollowsWhatTheDeviceSees )
{
  for( const auto& [bGreyscale, bVideo, Default] :
    { std::tuple( true, true, 0.6 ), { false, true, 0.6 }, { true, false, 0.3 }, { false, false, 0.2 } } )
  {
    Create();
    VDataWriter( *m_pStore ).RemoveValue( DeviceSchemas::Threshold( m_Device ) );
    Variant Value;
    m_pHandler->CreateThreshold( bGreyscale, bVideo ).GetValue( Value );
    EXPECT_EQ( Value, Variant::Make( Default ) );
  }
}

TEST_F( ParameterHandler, PayloadsFollowTheContainer )
{
  Create();
  EXPECT_EQ( Value<IVideoContainer::Enum>( "VideoContainer" ), IVideoContainer::ETVID );
  EXPECT_EQ( LabelsOf( "VideoContainer" ), ( Labels{ "MOV", "MP4", "AVI", "TVID", "MKV", "IMAGES" } ) );
  EXPECT_EQ( LabelsOf( "VideoPayload" ), Labels{ "Uncompressed" } );
  EXPECT_EQ( LabelsOf( "AudioPayload" ), ( Labels{ "None", "Uncompressed" } ) );
  EXPECT_FALSE( Set( "VideoPayload", IVideoPayload::EImageJPEG ) );

  Set( "VideoContainer", IVideoContainer::EIMAGES );
  EXPECT_EQ( LabelsOf( "VideoPayload" ), ( Labels{ "ImageJPEG", "ImagePNG", "ImageTIFF" } ) );
  EXPECT_EQ( Value<IVideoPayload::Enum>( "VideoPayload" ), IVideoPayload::EImageJPEG );
  EXPECT_EQ( Value<IAudioPayload::Enum>( "AudioPayload" ), IAudioPayload::ENone );

  Set( "VideoContainer", IVideoContainer::EMOV );
  EXPECT_EQ( Value<IVideoPayload::Enum>( "VideoPayload" ), IVideoPayload::EImageJPEG ) << "still allowed, so it stays";
}

TEST_F( ParameterHandler, OnlyContainersThatCanBeWrittenAreOffered )
{
  VDataWriter( *m_pStore ).SetValue( DeviceSchemas::VideoContainer( m_Device ), Variant::Make( IVideoContainer::EMKV ) );
  Create( { IVideoContainer::EMOV, IVideoContainer::EAVI } );
  EXPECT_EQ( LabelsOf( "VideoContainer" ), ( Labels{ "MOV", "AVI" } ) );
  EXPECT_EQ( Value<IVideoContainer::Enum>( "VideoContainer" ), IVideoContainer::EMOV );
  EXPECT_FALSE( Set( "VideoContainer", IVideoContainer::ETVID ) );
}

TEST_F( ParameterHandler, AFolderThatHasGoneGivesWayToTheDefaultOne )
{
  const std::string Message = "Device vi:0 is using an invalid capture folder [ Fast Disk ], reverting to default capture folder.";
  TestSupport::VLogCapture Log( "Capture" );
  VDataWriter( *m_pStore ).SetValue( DeviceSchemas::CaptureDirectory( m_Device ), Variant::Make( "Fast Disk" ) );
  Create();
  m_pService->RunAll();
  EXPECT_EQ( Value<std::string>( "CaptureDirectory" ), "Fast Disk" );
  EXPECT_EQ( LabelsOf( "CaptureDirectory" ), ( Labels{ "None", "Default", "Fast Disk" } ) );
  EXPECT_TRUE( Set( "CaptureDirectory", std::string( "None" ) ) );
  EXPECT_TRUE( Set( "CaptureDirectory", std::string( "Fast Disk" ) ) );
  EXPECT_FALSE( Set( "CaptureDirectory", std::string( "Slow Disk" ) ) );

  m_pFolders->SetAliases( { "Default", "None", "Other", "Other" } );
  m_pService->RunAll();
  EXPECT_EQ( Value<std::string>( "CaptureDirectory" ), "Default" );
  EXPECT_EQ( LabelsOf( "CaptureDirectory" ), ( Labels{ "None", "Default", "Other" } ) );
  EXPECT_EQ( Log.Texts(), std::vector<std::string>{ Message } );
}

TEST_F( ParameterHandler, AFolderThatComesWhileTheyAreReadIsOffered )
{
  m_pFolders = std::make_shared<VRestlessFolders>();
  Create();
  m_pService->RunAll();
  EXPECT_EQ( LabelsOf( "CaptureDirectory" ), ( Labels{ "None", "Other" } ) );
}

TEST_F( ParameterHandler, ASavedFolderThatNoLongerExistsGivesWayAtOnce )
{
  TestSupport::VLogCapture Log( "Capture" );
  VDataWriter( *m_pStore ).SetValue( DeviceSchemas::CaptureDirectory( m_Device ), Variant::Make( "Gone" ) );
  m_pFolders->SetAliases( {} );
  Create();
  m_pService->RunAll();
  EXPECT_EQ( Value<std::string>( "CaptureDirectory" ), "Default" );
  EXPECT_EQ( Log.Lines().size(), 1u );
  EXPECT_EQ( Log.Lines()[0].m_Level, 3 );
}
