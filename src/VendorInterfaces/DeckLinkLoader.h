// Reaches the DeckLink runtime library, which may or may not be installed.
#pragma once

#include "VendorInterfaces/DeckLinkAPI.h"

namespace DeckLinkAPI
{

// The runtime library, opened with global symbols and never closed: its threads may outlive every user. Any thread may call.
class VRuntimeLibrary
{
public:
  // A bare name is looked for on the loader's normal path. One that is already loaded under this name is used as it is.
  explicit VRuntimeLibrary( const char* i_pName );

  // Carries one reference for the caller. Null without the library, or when it knows none of the factories' generations.
  IDeckLinkDiscovery* CreateDiscovery() const;

private:
  void* const m_pHandle;
};

// From the process's one "libDeckLinkAPI.so". The library is looked for once, at the first call and not before, so that a host can
// load another library of that name ahead of it. Null where there is none.
IDeckLinkDiscovery* CreateDiscovery();

}
