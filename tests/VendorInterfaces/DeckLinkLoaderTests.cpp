#include "VendorInterfaces/DeckLinkLoader.h"

#include <gtest/gtest.h>

namespace DeckLinkAPI
{

TEST( DeckLinkLoader, AMissingLibraryGivesNoDiscovery )
{
  const VRuntimeLibrary Library( "libNoSuchVendorRuntime.so" );
  EXPECT_FALSE( Library.IsLoaded() );
  EXPECT_EQ( Library.CreateDiscovery(), nullptr );
}

TEST( DeckLinkLoader, ALibraryWithoutTheFactoriesGivesNoDiscovery )
{
  const VRuntimeLibrary Library( "libm.so.6" );
  EXPECT_TRUE( Library.IsLoaded() );
  EXPECT_EQ( Library.CreateDiscovery(), nullptr );
}

TEST( DeckLinkLoader, TheOldestGenerationThatIsThereWins )
{
  const VRuntimeLibrary Library( OLD_FACTORIES_LIBRARY );
  EXPECT_EQ( reinterpret_cast<uintptr_t>( Library.CreateDiscovery() ), 2u );
}

}
