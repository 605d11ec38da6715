// The parameters that every device that records has: where captures go, and in what form.
#pragma once

#include "Core/VideoInterface/VideoContainer.h"
#include "StageCoreParameters/CaptureFolders.h"
#include "StageCoreParameters/DeviceParameterHandler.h"

#include <vector>

class VCaptureDeviceParameterHandler : public VDeviceParameterHandler
{
public:
  using VContainers = std::vector<KVZ::IVideoContainer::Enum>;

  // All that the system knows.
  static VContainers AllContainers();

  // The containers are those that the build can write, in the order in which they are offered.
  VCaptureDeviceParameterHandler( std::shared_ptr<KVZ::IPostalService> i_pPostalService, std::shared_ptr<IDataStore> i_pDataStore,
    std::shared_ptr<StageCorePluginInterface::IParameterRegistry> i_pParameterRegistry,
    std::shared_ptr<StageCorePluginInterface::ICaptureFolders> i_pCaptureFolders, const VDataPath& i_rDevicePath, const std::string& i_rDeviceURN,
    const std::string& i_rDisplayType, VContainers i_Containers );

  void CreateParameters() override;

private:
  void CreateCaptureDirectory();
  void CreateFormats();
  // Offers the payloads that the container can hold.
  void OnContainerChanged();
  void UpdateCaptureFolders();
  // A folder that is not offered gives way to the default one.
  void CheckCaptureFolder();

  const std::shared_ptr<StageCorePluginInterface::ICaptureFolders> m_pCaptureFolders;
  const VContainers m_Containers;
};
