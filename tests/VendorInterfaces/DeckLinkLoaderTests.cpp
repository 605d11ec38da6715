#include "VendorInterfaces/DeckLinkLoader.h"

#include <gtest/gtest.h>

namespace DeckLinkAPI
{

TEST( DeckLinkLoader, ALibraryThatIsMissingOrHasNoFactoryGivesNoDiscovery )
{
  EXPECT_EQ( VRuntimeLibrary( "libNoSuchVendorRuntime.so" ).CreateDiscovery(), nullptr );
  EXPECT_EQ( VRuntimeLibrary( "libm.so.6" ).CreateDiscovery(), nullptr );
}

TEST( DeckLinkLoader, TheOldestGenerationThatIsThereWins )
{
  const VRuntimeLibrary Library( OLD_FACTORIES_LIBRARY );
  EXPECT_EQ( reinterpret_cast<uintptr_t>( Library.CreateDiscovery() ), 2u );
}

}
