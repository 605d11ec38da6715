// A handler with a fake device between a real data store and fakes of everything else; reactions run when a test says so.
#pragma once

#include "StageCoreDataStore/DataWriter.h"
#include "StageCoreDataStoreTypes/DeviceSchemas.h"
#include "StageCorePluginVideoInput/VideoInputDeviceParameterHandler.h"
#include "host/DataStore.h"
#include "tests/support/FakeSettingsHost.h"
#include "tests/support/FakeVideoInputDevice.h"
#include "tests/support/ManualPostalService.h"

#include <gtest/gtest.h>

#include <memory>
#include <optional>
#include <string>
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

class VHandlerFixture : public testing::Test
{
protected:
  // Makes the handler and lets its first reactions run.
  void Create()
  {
    m_pHandler = KVZ::MakeShared<VVideoInputDeviceParameterHandler>( m_pService, m_pStore, m_pRegistry, m_pTargets, m_pSources, m_pDevice,
      m_pSource );
    m_pService->RunAll();
  }

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

  // Empty without a warning.
  std::string Warning()
  {
    std::string Text;
    GetTyped( VDataReader( *m_pStore ), DeviceSchemas::VideoInput::IncompatibleVideoStandard( m_Device ), Text );
    return Text;
  }

  const std::shared_ptr<TestSupport::VManualPostalService> m_pService = std::make_shared<TestSupport::VManualPostalService>();
  const std::shared_ptr<StageHost::VDataStore> m_pStore = std::make_shared<StageHost::VDataStore>();
  const std::shared_ptr<TestSupport::VFakeParameterRegistry> m_pRegistry = std::make_shared<TestSupport::VFakeParameterRegistry>();
  const std::shared_ptr<TestSupport::VFakeCaptureTargets> m_pTargets = std::make_shared<TestSupport::VFakeCaptureTargets>();
  const std::shared_ptr<TestSupport::VFakeSourceRegistry> m_pSources = std::make_shared<TestSupport::VFakeSourceRegistry>();
  const std::shared_ptr<TestSupport::VFakeVideoInputDevice> m_pDevice = std::make_shared<TestSupport::VFakeVideoInputDevice>();
  const std::shared_ptr<VFakeSourceControl> m_pSource = std::make_shared<VFakeSourceControl>();
  const VDataPath m_Device = DeviceSchemas::VideoInput::Path( "vi:0" );
  std::shared_ptr<VVideoInputDeviceParameterHandler> m_pHandler;
};
