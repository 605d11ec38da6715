#include "host/ModuleLoader.h"

#include <boost/filesystem/operations.hpp>

#include <dlfcn.h>

namespace StageHost
{

VLoadedModule::VLoadedModule( StageCorePluginInterface::IPlugin* i_pPlugin, VDestroyPlugin i_pDestroy, unsigned int i_BuildRevision )
  : m_pPlugin( i_pPlugin ), m_pDestroy( i_pDestroy ), m_BuildRevision( i_BuildRevision )
{
}

VLoadedModule::~VLoadedModule() { m_pDestroy( m_pPlugin ); }

std::unique_ptr<VLoadedModule> VLoadedModule::Load( const std::string& i_rPath, std::string& o_rError )
{
  void* const pHandle = dlopen( i_rPath.c_str(), RTLD_NOW | RTLD_LOCAL );
  if( !pHandle )
  {
    o_rError = "The module cannot be loaded: " + std::string( dlerror() );
    return nullptr;
  }
  const auto pCreate = reinterpret_cast<VCreatePlugin>( dlsym( pHandle, "CreatePlugin" ) );
  const auto pDestroy = reinterpret_cast<VDestroyPlugin>( dlsym( pHandle, "DestroyPlugin" ) );
  const auto pRevision = reinterpret_cast<VPluginBuildRevision>( dlsym( pHandle, "PluginBuildRevision" ) );
  if( !pCreate || !pDestroy || !pRevision )
  {
    o_rError = "\"" + i_rPath + "\" is no module: it must export CreatePlugin, DestroyPlugin and PluginBuildRevision.";
    return nullptr;
  }
  return std::unique_ptr<VLoadedModule>( new VLoadedModule( pCreate(), pDestroy, pRevision() ) );
}

std::string ProgramFolder() { return boost::filesystem::read_symlink( "/proc/self/exe" ).parent_path().string(); }

}
