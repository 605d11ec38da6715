// The handler of a fake device, and what it tells the device's source.
#pragma once

#include "StageCorePluginVideoInput/VideoInputDeviceParameterHandler.h"
#include "tests/support/FakeVideoInputDevice.h"
#include "tests/support/ParameterHandlerFixture.h"

#include <optional>
#include <utility>

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

class VHandlerFixture : public TestSupport::VParameterHandlerFixture<VVideoInputDeviceParameterHandler>
{
protected:
  // Makes the handler and lets its first reactions run.
  void Create()
  {
    m_pHandler = KVZ::MakeShared<VVideoInputDeviceParameterHandler>( m_pService, m_pStore, m_pRegistry, m_pTargets, m_pSources, m_pDevice,
      m_pSource );
    m_pService->RunAll();
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
  void SetMasterPeriod( int64_t i_Period )
  {
    m_pSources->SetMasterPeriod( KVZ::VTick( i_Period ) );
    m_pService->RunAll();
  }

  // Empty without a warning.
  std::string Warning()
  {
    std::string Text;
    GetTyped( VDataReader( *m_pStore ), DeviceSchemas::VideoInput::IncompatibleVideoStandard( m_Device ), Text );
    return Text;
  }

  const std::shared_ptr<TestSupport::VFakeCaptureTargets> m_pTargets = std::make_shared<TestSupport::VFakeCaptureTargets>();
  const std::shared_ptr<TestSupport::VFakeSourceRegistry> m_pSources = std::make_shared<TestSupport::VFakeSourceRegistry>();
  const std::shared_ptr<TestSupport::VFakeVideoInputDevice> m_pDevice = std::make_shared<TestSupport::VFakeVideoInputDevice>();
  const std::shared_ptr<VFakeSourceControl> m_pSource = std::make_shared<VFakeSourceControl>();
};
