// What every fuzzer here needs: silence, and a way to stop at what must not be.
#pragma once

#include "StageCoreRuntime/GlobalLog.h"

#include <cstdio>
#include <cstdlib>

namespace Fuzzing
{

// Refusals are what most inputs end in; writing each to the console would take nearly all the time.
inline void SilenceLog()
{
  KVZ::VLogOptions Options;
  Options.m_ConsoleLevel = KVZ::LogLevel::None;
  KVZ::ConfigureLog( Options );
}

// Ends the program, with the input kept, where a property does not hold.
inline void Require( bool i_bHolds, const char* i_pProperty )
{
  if( !i_bHolds )
  {
    std::fprintf( stderr, "does not hold: %s\n", i_pProperty );
    std::abort();
  }
}

}
