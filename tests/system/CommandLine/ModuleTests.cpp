// What the built files show to the loader.
#include "tests/support/ProgramRun.h"

#include <gtest/gtest.h>

#include <algorithm>
#include <cstdlib>
#include <set>
#include <sstream>

namespace
{

using VNames = std::set<std::string>;

std::string BinFile( const std::string& i_rName ) { return std::string( std::getenv( "STAGECORE_BIN" ) ) + "/" + i_rName; }

// The last word of each line, without a version behind "@".
VNames LastWords( const std::string& i_rText )
{
  VNames Names;
  std::istringstream Lines( i_rText );
  for( std::string Line; std::getline( Lines, Line ); )
  {
    const std::string Name = Line.substr( Line.find_last_of( ' ' ) + 1 );
    Names.insert( Name.substr( 0, Name.find( '@' ) ) );
  }
  return Names;
}

VNames SymbolsOf( const std::string& i_rFile, const char* i_pWhich )
{
  const TestSupport::VRunResult Run = TestSupport::RunProgram( { "nm", "-D", i_pWhich, BinFile( i_rFile ) } );
  EXPECT_EQ( 0, Run.m_ExitCode ) << Run.m_Error;
  return LastWords( Run.m_Output );
}

VNames Exports( const std::string& i_rFile )
{
  // What the sanitizers add to every shared object is not ours
  VNames Names = SymbolsOf( i_rFile, "--defined-only" );
  std::erase_if( Names, []( const std::string& i_rName ) { return i_rName.starts_with( "__asan" ) || i_rName.starts_with( "__odr_asan" ); } );
  return Names;
}

std::string Dynamic( const std::string& i_rFile )
{
  const TestSupport::VRunResult Run = TestSupport::RunProgram( { "readelf", "-d", BinFile( i_rFile ) } );
  EXPECT_EQ( 0, Run.m_ExitCode ) << Run.m_Error;
  return Run.m_Output;
}

bool Holds( const std::string& i_rText, const std::string& i_rPart ) { return i_rText.find( i_rPart ) != std::string::npos; }

}

TEST( Module, ExportsItsThreeNamesAndNothingElse )
{
  const VNames Expected = { "CreatePlugin", "DestroyPlugin", "PluginBuildRevision" };
  EXPECT_EQ( Expected, Exports( "StageCorePluginVideoInput.tpm" ) );
}

// A second copy of the run-time library would have its own log, assertions and schemas. Cards are opened by name when the program runs: without a
// vendor's driver the module must load all the same.
TEST( Module, SharesTheRuntimeLibraryWithTheHostAndIsLinkedToNoVendor )
{
  for( const char* pFile : { "StageCorePluginVideoInput.tpm", "stagehost" } )
  {
    const std::string Needed = Dynamic( pFile );
    EXPECT_TRUE( Holds( Needed, "[libStageCoreRuntime.so]" ) ) << pFile;
    EXPECT_FALSE( Holds( Needed, "[libDeckLinkAPI" ) || Holds( Needed, "[libBlueVelvet" ) ) << pFile;
  }
}

TEST( Host, ReachesTheModuleByItsExportsAlone )
{
  EXPECT_FALSE( Holds( Dynamic( "stagehost" ), "StageCorePluginVideoInput" ) );
  const VNames Wanted = SymbolsOf( "stagehost", "--undefined-only" );
  const VNames Offered = Exports( "StageCorePluginVideoInput.tpm" );
  VNames Both;
  std::set_intersection( Wanted.begin(), Wanted.end(), Offered.begin(), Offered.end(), std::inserter( Both, Both.end() ) );
  EXPECT_EQ( VNames(), Both );
}

TEST( VirtualDeckLink, StandsInForTheVendorsLibrary )
{
  EXPECT_TRUE( Holds( Dynamic( "cards/libDeckLinkAPI.so" ), "Library soname: [libDeckLinkAPI.so]" ) );
  const VNames Names = Exports( "cards/libDeckLinkAPI.so" );
  EXPECT_EQ( 1u, Names.count( "GetVirtualCardControl" ) );
  EXPECT_TRUE( std::any_of( Names.begin(), Names.end(),
    []( const std::string& i_rName ) { return i_rName.starts_with( "CreateDeckLinkDiscoveryInstance_" ); } ) );
  for( const std::string& rName : Names )
  {
    EXPECT_TRUE( rName == "GetVirtualCardControl" || rName.starts_with( "CreateDeckLink" ) ) << rName;
  }
}
