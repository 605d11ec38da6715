#include "VendorInterfaces/DeckLinkLoader.h"

#include <dlfcn.h>

namespace DeckLinkAPI
{

namespace
{

// One name for each generation of the vendor's kit. All give the same interface; the oldest is the one this interface was made for.
constexpr std::array DiscoveryFactories = { "CreateDeckLinkDiscoveryInstance_0001", "CreateDeckLinkDiscoveryInstance_0002",
  "CreateDeckLinkDiscoveryInstance_0003" };

}

VRuntimeLibrary::VRuntimeLibrary( const char* i_pName ) : m_pHandle( dlopen( i_pName, RTLD_NOW | RTLD_GLOBAL ) ) {}

IDeckLinkDiscovery* VRuntimeLibrary::CreateDiscovery() const
{
  if( !m_pHandle )
  {
    return nullptr;
  }
  for( const char* pName : DiscoveryFactories )
  {
    if( void* pSymbol = dlsym( m_pHandle, pName ) )
    {
      return reinterpret_cast<IDeckLinkDiscovery* (*)()>( pSymbol )();
    }
  }
  return nullptr;
}

IDeckLinkDiscovery* CreateDiscovery()
{
  static const VRuntimeLibrary s_Library( "libDeckLinkAPI.so" );
  return s_Library.CreateDiscovery();
}

}
