#include "FileIO/MkvIO/MkvIOCallback.h"

#include <stdexcept>

namespace MkvIO
{

namespace
{

void Require( bool i_bDone, const char* i_pWhat )
{
  if( !i_bDone )
  {
    throw std::runtime_error( i_pWhat );
  }
}

}

uint32_t VMkvIOCallback::read( void*, size_t ) { throw std::logic_error( "the file is open for writing alone" ); }

void VMkvIOCallback::setFilePointer( int64_t i_Offset, libebml::seek_mode i_Mode )
{
  const uint64_t Origin = i_Mode == libebml::seek_beginning ? 0 : i_Mode == libebml::seek_end ? m_Stream.GetEnd() : getFilePointer();
  const auto Target = static_cast<int64_t>( Origin ) + i_Offset;
  Require( Target >= 0 && m_Stream.Seek( static_cast<uint64_t>( Target ) ), "the file could not be positioned" );
}

size_t VMkvIOCallback::write( const void* i_pData, size_t i_Size )
{
  Require( m_Stream.Write( i_pData, i_Size ), "the file could not be written" );
  return i_Size;
}

uint64_t VMkvIOCallback::getFilePointer()
{
  uint64_t Position = 0;
  Require( m_Stream.Tell( Position ), "the position in the file is unknown" );
  return Position;
}

void VMkvIOCallback::close() { Require( m_Stream.Close(), "the file could not be stored" ); }

}
