// The parameters that every device has: what it is called, whether it is there, whether it is wanted.
#pragma once

#include "StageCoreParameters/StageCoreParameterHandler.h"

class VDeviceParameterHandler : public VStageCoreParameterHandler
{
public:
  VDeviceParameterHandler( std::shared_ptr<KVZ::IPostalService> i_pPostalService, std::shared_ptr<IDataStore> i_pDataStore,
    std::shared_ptr<StageCorePluginInterface::IParameterRegistry> i_pParameterRegistry, const VDataPath& i_rDevicePath,
    const std::string& i_rDeviceURN, const std::string& i_rDisplayType );

  void CreateParameters() override;

  const std::string& GetDeviceURN() const { return m_DeviceURN; }

  // "ConnectionCount" counts the changes to true.
  void SetConnected( bool i_bConnected );
  // The text stands in the device's group "Warnings" until it is cleared.
  void SetWarning( const std::string& i_rKey, const std::string& i_rText );
  void ClearWarning( const std::string& i_rKey );

protected:
  // What sees markers has these too. They are made on request.
  VParameter& CreateGreyscaleMode();
  // The default is 0.6 for video, 0.3 for other greyscale, and 0.2 for a plain threshold.
  VParameter& CreateThreshold( bool i_bGreyscale, bool i_bVideo );
  VParameter& CreateCircularityThreshold();
  VParameter& CreateMaximumBlobHeight();

private:
  const std::string m_DeviceURN;
  const std::string m_DisplayType;
};
