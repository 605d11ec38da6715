#include "StageCorePluginVideoInput/VideoInputSystemParameterHandler.h"

namespace
{

const VDataPath& SystemPath()
{
  static const VDataPath s_Path{ "System", "VideoInput" };
  return s_Path;
}

const VDataPath& SystemAttributePath()
{
  static const VDataPath s_Path = VDataPath{ "Attributes" } + SystemPath();
  return s_Path;
}

}

VVideoInputSystemParameterHandler::VVideoInputSystemParameterHandler( std::shared_ptr<KVZ::IPostalService> i_pPostalService,
  std::shared_ptr<IDataStore> i_pDataStore, std::shared_ptr<StageCorePluginInterface::IParameterRegistry> i_pParameterRegistry )
  : VStageCoreParameterHandler( std::move( i_pPostalService ), std::move( i_pDataStore ), std::move( i_pParameterRegistry ), SystemPath(),
      SystemAttributePath() )
{
}
