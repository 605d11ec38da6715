// Reads a file at once.
#pragma once

#include <fstream>
#include <iterator>
#include <string>

namespace TestSupport
{

// All its bytes; none where it cannot be read.
inline std::string ReadFile( const std::string& i_rPath )
{
  std::ifstream File( i_rPath, std::ios::binary );
  return { std::istreambuf_iterator<char>( File ), std::istreambuf_iterator<char>() };
}

}
