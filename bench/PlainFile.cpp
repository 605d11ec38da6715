#include "bench/PlainFile.h"

#include <fcntl.h>
#include <unistd.h>

#include <stdexcept>

VPlainFile::VPlainFile( std::string i_Path )
  : m_Path( std::move( i_Path ) ), m_Handle( open( m_Path.c_str(), O_WRONLY | O_CREAT | O_TRUNC | O_CLOEXEC, 0666 ) )
{
  if( m_Handle < 0 )
  {
    throw std::runtime_error( "The file \"" + m_Path + "\" cannot be made." );
  }
}

VPlainFile::~VPlainFile()
{
  Close();
  unlink( m_Path.c_str() );
}

void VPlainFile::Write( const void* i_pData, size_t i_Size )
{
  const auto* pData = static_cast<const char*>( i_pData );
  while( i_Size != 0 )
  {
    const ssize_t Written = write( m_Handle, pData, i_Size );
    if( Written <= 0 )
    {
      throw std::runtime_error( "The file \"" + m_Path + "\" cannot be written." );
    }
    pData += Written;
    i_Size -= static_cast<size_t>( Written );
  }
}

void VPlainFile::Close()
{
  if( m_Handle >= 0 )
  {
    close( m_Handle );
    m_Handle = -1;
  }
}
