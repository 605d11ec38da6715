// How the readers of files refuse.
#pragma once

#include <cstdint>
#include <stdexcept>
#include <string>

namespace TestSupport
{

// Throws with the place in the file where something does not hold.
inline void Require( bool i_bHolds, const std::string& i_rWhat, uint64_t i_Position )
{
  if( !i_bHolds )
  {
    throw std::runtime_error( i_rWhat + " at " + std::to_string( i_Position ) );
  }
}

}
