// The bytes of a file, on disk or in memory, for the readers of containers. One thread at a time; copies read through one stream.
#pragma once

#include <cstdint>
#include <istream>
#include <memory>
#include <string>
#include <vector>

namespace TestSupport
{

// How the readers of files refuse: throws std::runtime_error with the place in the file where something does not hold.
void Require( bool i_bHolds, const std::string& i_rWhat, uint64_t i_Position );

class VFileBytes
{
public:
  static VFileBytes OfFile( const std::string& i_rPath );
  static VFileBytes OfBytes( const std::vector<uint8_t>& i_rBytes );

  uint64_t Size() const { return m_Size; }

  // All throw, as Require does, where the file is shorter.
  std::string Text( uint64_t i_Position, uint64_t i_Size ) const;
  std::vector<uint8_t> Read( uint64_t i_Position, uint64_t i_Size ) const;
  uint64_t Big( uint64_t i_Position, uint64_t i_Size ) const;
  uint64_t Little( uint64_t i_Position, uint64_t i_Size ) const;

private:
  explicit VFileBytes( std::shared_ptr<std::istream> i_pStream );

  std::shared_ptr<std::istream> m_pStream;
  uint64_t m_Size = 0;
};

}
