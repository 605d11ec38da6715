// What every fuzzer here needs: silence, and a way to stop at what must not be. For the one file of a fuzzer.
#pragma once

#include "StageCoreRuntime/GlobalLog.h"

#include <cstdio>
#include <cstdlib>

// Refusals are what most inputs end in; writing each to the console would take nearly all the time.
extern "C" int LLVMFuzzerInitialize( int*, char*** )
{
  KVZ::ConfigureLog( { .m_ConsoleLevel = KVZ::LogLevel::None } );
  return 0;
}

namespace Fuzzing
{

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
