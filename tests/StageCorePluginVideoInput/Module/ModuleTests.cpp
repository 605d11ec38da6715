// The module file as a host finds it: what its three exports promise.
#include "host/ModuleLoader.h"

#include <gtest/gtest.h>

#include <dlfcn.h>
#include <string>

namespace
{

TEST( Module, ALoadedModuleThatIsNeverInitialisedEndsQuietly )
{
  std::string Error;
  const auto pModule = StageHost::VLoadedModule::Load( VIDEO_INPUT_MODULE, Error );
  ASSERT_TRUE( pModule ) << Error;
  EXPECT_EQ( pModule->BuildRevision(), 120364u );
  EXPECT_EQ( pModule->Plugin().GetDisplayName(), "" );
  EXPECT_EQ( pModule->Plugin().GetVersionText(), "" );
  EXPECT_TRUE( pModule->Plugin().RegisterTypes() );
  EXPECT_TRUE( pModule->Plugin().RegisterCommands() );
  EXPECT_TRUE( pModule->Plugin().RegisterViews() );
  EXPECT_TRUE( pModule->Plugin().PostInitialise() );
  pModule->Plugin().OnHostReady();
  pModule->Plugin().OnHostClosing();
}

TEST( Module, DestroysNothingWhereThereIsNothing )
{
  void* const pModule = dlopen( VIDEO_INPUT_MODULE, RTLD_NOW | RTLD_LOCAL );
  ASSERT_TRUE( pModule );
  const auto pDestroy = reinterpret_cast<VDestroyPlugin>( dlsym( pModule, "DestroyPlugin" ) );
  ASSERT_TRUE( pDestroy );
  pDestroy( nullptr );
}

TEST( Module, AFileThatIsNoModuleIsRefusedWithTheReason )
{
  std::string Error;
  EXPECT_FALSE( StageHost::VLoadedModule::Load( "/nowhere/Some.tpm", Error ) );
  EXPECT_NE( Error.find( "/nowhere/Some.tpm" ), std::string::npos );
  EXPECT_FALSE( StageHost::VLoadedModule::Load( "libm.so.6", Error ) );
  EXPECT_EQ( Error, "\"libm.so.6\" is no module: it must export CreatePlugin, DestroyPlugin and PluginBuildRevision." );
}

}
