// The bridge between one capture device and the data store: publishes the device's state as parameters, feeds changed parameters back to
// the device and its data source, and warns when the frame rate cannot be locked to the system's. A device streams exactly when it is enabled.
//
// Made through MakeShared on the engine's thread. All reactions run there, one at a time; what the handler remembers lives in the data store.
#pragma once

#include "HardwareSupport/VideoInput/VideoInputDataSource/VideoInputSourceControl.h"
#include "HardwareSupport/VideoInput/VideoInputHAL/VideoInputDevice.h"
#include "StageCoreParameters/CaptureDeviceParameterHandler.h"
#include "StageCorePluginInterface/StageCoreHost.h"

#include <memory>

class VVideoInputDeviceParameterHandler : public VCaptureDeviceParameterHandler
{
public:
  // The containers are those that the build can write.
  VVideoInputDeviceParameterHandler( std::shared_ptr<KVZ::IPostalService> i_pPostalService, std::shared_ptr<IDataStore> i_pDataStore,
    std::shared_ptr<StageCorePluginInterface::IParameterRegistry> i_pParameterRegistry,
    std::shared_ptr<StageCorePluginInterface::ICaptureTargets> i_pCaptureTargets,
    std::shared_ptr<StageCorePluginInterface::ISourceRegistry> i_pSourceRegistry, std::shared_ptr<VideoInputHAL::IVideoInputDevice> i_pDevice,
    std::shared_ptr<VideoInputHAL::IVideoInputSourceControl> i_pDataSource, VContainers i_Containers = AllContainers() );

  void CreateParameters() override;
  void OnEnabledChanged() override;

  // With the settings as they stand. False without a pixel format, and where the device refuses.
  bool StartCapture();
  bool StopCapture();

private:
  using VReaction = void ( VVideoInputDeviceParameterHandler::* )();
  struct VControlRow;
  static const VControlRow ControlRows[];

  // Creation, in order
  void CreateIdentity();
  void CreateSignal();
  void CreateVideoSetup();
  void CreateAudioSetup();
  void CreateTimecodeSetup();
  void CreatePixelAspectRatio();
  void CreateOpticalSettings();
  void CreateDeviceControls();
  void AssignUserId();
  void SubscribeToStartSettings();
  void SubscribeToDevice();
  void SubscribeToSystem();

  // Subscribes to a parameter. A value that was saved before counts as changed.
  void React( VParameter& io_rParameter, VReaction i_Reaction, bool i_bSaved );
  // Makes a parameter with a default value, and subscribes to it.
  template<class T>
  VParameter& AddSetting( const VDataPath& i_rPath, const VParameterText& i_rText, uint32_t i_Traits, const T& i_rDefault, VReaction i_Reaction );

  // Reactions, and refreshes of what the device reports
  void UpdateStatus();
  void OnVideoStandardChanged();
  void UpdateMaskGrid();
  void OnTimecodeChanged();
  void UpdatePixelFormats();
  void UpdateTimecodeSources();
  void UpdateAudioSampleFormats();
  void UpdateAudioSampleRates();
  void RestartIfStreaming();
  void UpdateSourceEnabled();
  void ApplyTimeOffset();
  void ApplyUseTimecodeForSync();
  void ApplyPixelAspectRatio();
  void ApplyControl( const VControlRow& i_rRow );
  void ApplyAutoWhiteBalance();
  void CheckFrameRates();

  const VDataPath m_DevicePath;
  const std::shared_ptr<VideoInputHAL::IVideoInputDevice> m_pDevice;
  const std::shared_ptr<VideoInputHAL::IVideoInputSourceControl> m_pDataSource;
  const std::shared_ptr<StageCorePluginInterface::ISourceRegistry> m_pSourceRegistry;
};
