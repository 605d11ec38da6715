#include "tests/support/FileBytes.h"

#include <fstream>
#include <sstream>
#include <stdexcept>

namespace TestSupport
{

void Require( bool i_bHolds, const std::string& i_rWhat, uint64_t i_Position )
{
  if( !i_bHolds )
  {
    throw std::runtime_error( i_rWhat + " at " + std::to_string( i_Position ) );
  }
}

VFileBytes VFileBytes::OfFile( const std::string& i_rPath )
{
  auto pFile = std::make_shared<std::ifstream>( i_rPath, std::ios::binary );
  Require( pFile->is_open(), "cannot open " + i_rPath, 0 );
  return VFileBytes( std::move( pFile ) );
}

VFileBytes VFileBytes::OfBytes( const std::vector<uint8_t>& i_rBytes )
{
  return VFileBytes( std::make_shared<std::istringstream>( std::string( i_rBytes.begin(), i_rBytes.end() ) ) );
}

VFileBytes::VFileBytes( std::shared_ptr<std::istream> i_pStream ) : m_pStream( std::move( i_pStream ) )
{
  m_pStream->seekg( 0, std::ios::end );
  m_Size = static_cast<uint64_t>( m_pStream->tellg() );
}

std::string VFileBytes::Text( uint64_t i_Position, uint64_t i_Size ) const
{
  Require( i_Position <= m_Size && i_Size <= m_Size - i_Position, "cut short", i_Position );
  std::string Bytes( i_Size, '\0' );
  m_pStream->seekg( static_cast<std::streamoff>( i_Position ) );
  m_pStream->read( Bytes.data(), static_cast<std::streamsize>( i_Size ) );
  Require( m_pStream->good(), "cannot be read", i_Position );
  return Bytes;
}

std::vector<uint8_t> VFileBytes::Read( uint64_t i_Position, uint64_t i_Size ) const
{
  const std::string Bytes = Text( i_Position, i_Size );
  return { Bytes.begin(), Bytes.end() };
}

uint64_t VFileBytes::Big( uint64_t i_Position, uint64_t i_Size ) const
{
  uint64_t Value = 0;
  for( const uint8_t Byte : Read( i_Position, i_Size ) )
  {
    Value = Value << 8 | Byte;
  }
  return Value;
}

uint64_t VFileBytes::Little( uint64_t i_Position, uint64_t i_Size ) const
{
  uint64_t Value = 0;
  const std::vector<uint8_t> Bytes = Read( i_Position, i_Size );
  for( size_t Byte = Bytes.size(); Byte-- > 0; )
  {
    Value = Value << 8 | Bytes[Byte];
  }
  return Value;
}

}
