// A device's handler between a real data store, the host's registries and a fake device; reactions run when a test says so.
#pragma once

#include "StageCoreDataStore/DataVerifyWriter.h"
#include "StageCoreDataStoreTypes/DeviceSchemas.h"
#include "StageCoreParameters/Parameter.h"
#include "StageCorePluginVideoInput/VideoInputDeviceParameterHandler.h"
#include "host/DataStore.h"
#include "host/Registries.h"
#include "host/SyncEngine.h"
#include "tests/support/FakeSource.h"
#include "tests/support/FakeVideoInputDevice.h"
#include "tests/support/ManualPostalService.h"

#include <gtest/gtest.h>

#include <memory>
#include <optional>
#include <string>
#include <utility>
#include <vector>

// Remembers what it was last told.
class VFakeSourceControl : public VideoInputHAL::IVideoInputSourceControl
{
public:
  bool SetSourceEnabled( bool i_bEnabled ) override { return std::exchange( m_Enabled, i_bEnabled ) != i_bEnabled; }
  void SetUseTimecodeForSync( bool i_bUse ) override { m_UseTimecode = i_bUse; }
  void SetPixelAspectRatio( double i_Ratio ) override { m_Ratio = i_Ratio; }
  void SetTimecodeAdjustment( KVZ::VTick i_Adjustment ) override { m_Adjustment = i_Adjustment.Count(); }

  std::optional<bool> m_Enabled;
  std::optional<bool> m_UseTimecode;
  std::optional<double> m_Ratio;
  std::optional<int64_t> m_Adjustment;
};

// Folders that come and go by hand.
class VFakeCaptureTargets : public StageCorePluginInterface::ICaptureTargets
{
public:
  void GetFolderAliases( std::vector<std::string>& o_rAliases ) override { o_rAliases = m_Aliases; }
  KVZ::IMultiCallbackPostal<void()>& GetFolderAliasesChangedCallback() override { return m_Changed; }
  std::vector<int32_t> GetContainers( const std::string& ) override { return {}; }
  bool GetTarget( const KVZ::ICaptureHeader&, const std::string&, int32_t, StageCorePluginInterface::VCaptureTarget& ) override { return false; }

  void SetAliases( std::vector<std::string> i_Aliases )
  {
    m_Aliases = std::move( i_Aliases );
    m_Changed();
  }

private:
  std::vector<std::string> m_Aliases = { "Default", "Fast Disk" };
  NotificationSystem::VMultiCallbackPostal<void()> m_Changed;
};

class VHandlerFixture : public testing::Test
{
protected:
  using VHandler = VVideoInputDeviceParameterHandler;

  // Makes the handler and lets its first reactions run.
  void Create( VHandler::VContainers i_Containers = VHandler::AllContainers() )
  {
    m_pHandler = KVZ::MakeShared<VHandler>( m_pService, m_pStore, m_pRegistry, m_pTargets, m_pSources, m_pDevice, m_pSource,
      std::move( i_Containers ) );
    m_pService->RunAll();
  }

  // As another part of the program does.
  template<class T>
  void Save( const VDataPath& i_rPath, const T& i_rValue )
  {
    VDataWriter( *m_pStore ).SetValue( i_rPath, KVZ::Variant::Make( i_rValue ) );
    m_pService->RunAll();
  }

  // The user's write.
  template<class T>
  bool Set( const std::string& i_rKey, const T& i_rValue )
  {
    const bool bSet = m_pHandler->GetParameter( i_rKey )->SetValue( KVZ::Variant::Make( i_rValue ) );
    m_pService->RunAll();
    return bSet;
  }

  template<class T>
  T Value( const std::string& i_rKey )
  {
    KVZ::Variant Value;
    T Result{};
    m_pHandler->GetParameter( i_rKey )->GetValue( Value );
    EXPECT_TRUE( Value.Get( Result ) ) << i_rKey << " is " << Value.ToText();
    return Result;
  }

  std::vector<std::string> LabelsOf( const std::string& i_rKey )
  {
    std::vector<std::string> Labels;
    m_pHandler->GetParameter( i_rKey )->GetEnum( Labels );
    return Labels;
  }

  void SetSignal( KVZ::IVideoStandard::Enum i_Standard )
  {
    m_pDevice->SetSignal( i_Standard );
    m_pService->RunAll();
  }
  void SetPixelFormats( std::set<KVZ::IPixelFormat::Enum> i_Formats )
  {
    m_pDevice->SetPixelFormats( std::move( i_Formats ) );
    m_pService->RunAll();
  }
  // By a session of a source with frames of this length.
  void SetMasterPeriod( int64_t i_Period )
  {
    const auto pMaster = std::make_shared<TestSupport::VFakeSource>( "vi:9", i_Period );
    m_pSources->AddSource( pMaster );
    pMaster->BeginSession( 1.0, KVZ::VTick( 0 ) );
    m_pService->RunAll();
    m_pSources->RemoveSource( pMaster );
  }

  // Empty without a warning.
  std::string Warning()
  {
    std::string Text;
    GetTyped( VDataReader( *m_pStore ), DeviceSchemas::VideoInput::IncompatibleVideoStandard( m_Device ), Text );
    return Text;
  }

  const std::shared_ptr<TestSupport::VManualPostalService> m_pService = std::make_shared<TestSupport::VManualPostalService>();
  const std::shared_ptr<StageHost::VDataStore> m_pStore = std::make_shared<StageHost::VDataStore>();
  const std::shared_ptr<StageHost::VParameterRegistry> m_pRegistry = std::make_shared<StageHost::VParameterRegistry>();
  const std::shared_ptr<StageHost::VSyncEngine> m_pSources = std::make_shared<StageHost::VSyncEngine>( m_pService, nullptr );
  const std::shared_ptr<TestSupport::VFakeVideoInputDevice> m_pDevice = std::make_shared<TestSupport::VFakeVideoInputDevice>();
  const std::shared_ptr<VFakeSourceControl> m_pSource = std::make_shared<VFakeSourceControl>();
  std::shared_ptr<VFakeCaptureTargets> m_pTargets = std::make_shared<VFakeCaptureTargets>();
  const VDataPath m_Device = DeviceSchemas::VideoInput::Path( "vi:0" );
  std::shared_ptr<VHandler> m_pHandler;
};
