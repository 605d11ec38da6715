// Reaches the Bluefish444 runtime library, which may or may not be installed.
#pragma once

#include "VendorInterfaces/BlueVelvet.h"

namespace BlueVelvet
{

// The runtime library, opened with global symbols and never closed: its threads may outlive every user. Any thread may call.
class VRuntimeLibrary
{
public:
  // A bare name is looked for on the loader's normal path. One that is already loaded under this name is used as it is.
  explicit VRuntimeLibrary( const char* i_pName );

  // Null without the library, and where it lacks a function that is needed.
  const VFlatFunctions* Functions() const { return m_Functions.IsComplete() ? &m_Functions : nullptr; }

private:
  VFlatFunctions m_Functions;
};

// Those of the process's one "libBlueVelvetC64.so". The library is looked for once, at the first call and not before, so that a host can
// load another library of that name ahead of it. Null where there is none.
const VFlatFunctions* RuntimeFunctions();

}
