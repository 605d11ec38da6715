#include "Utils/UtilsIO/StreamAdapters.h"

#include <algorithm>
#include <cstring>
#include <new>

namespace KVZ
{

namespace
{

size_t CopyFrom( const std::vector<uint8_t>& i_rBytes, uint64_t& io_rPosition, void* o_pData, size_t i_Size )
{
  if( i_Size == 0 || io_rPosition >= i_rBytes.size() )
  {
    return 0;
  }
  const size_t Count = std::min<size_t>( i_Size, i_rBytes.size() - io_rPosition );
  std::memcpy( o_pData, i_rBytes.data() + io_rPosition, Count );
  io_rPosition += Count;
  return Count;
}

}

bool ISimpleStreamAdapter::Read( void* o_pData, size_t i_Size )
{
  m_bGood = m_bGood && CopyFrom( m_rBytes, m_Position, o_pData, i_Size ) == i_Size;
  return m_bGood;
}

bool ISimpleStreamAdapter::ReadBlock( void* o_pData, size_t i_Size, size_t& o_rRead )
{
  o_rRead = m_bGood ? CopyFrom( m_rBytes, m_Position, o_pData, i_Size ) : 0;
  return m_bGood;
}

// A memory that is full is a failure like that of a full disk.
bool ISimpleStreamAdapter::Write( const void* i_pData, size_t i_Size )
try
{
  if( !m_bGood || i_Size == 0 )
  {
    return m_bGood;
  }
  if( i_Size > m_rBytes.max_size() - m_Position )
  {
    m_bGood = false;
    return false;
  }
  const uint64_t End = m_Position + i_Size;
  if( End > m_rBytes.size() )
  {
    m_rBytes.resize( End );
  }
  std::memcpy( m_rBytes.data() + m_Position, i_pData, i_Size );
  m_Position = End;
  return true;
}
catch( const std::bad_alloc& )
{
  m_bGood = false;
  return false;
}

bool ISimpleStreamAdapter::Tell( uint64_t& o_rPosition )
{
  o_rPosition = m_Position;
  return true;
}

bool ISimpleStreamAdapter::Seek( uint64_t i_Position )
{
  m_bGood = i_Position <= m_rBytes.max_size();
  m_Position = m_bGood ? i_Position : m_Position;
  return m_bGood;
}

bool ISimpleInputStreamAdapter::Read( void* o_pData, size_t i_Size )
{
  m_bGood = m_bGood && CopyFrom( m_rBytes, m_Position, o_pData, i_Size ) == i_Size;
  return m_bGood;
}

bool ISimpleInputStreamAdapter::ReadBlock( void* o_pData, size_t i_Size, size_t& o_rRead )
{
  o_rRead = m_bGood ? CopyFrom( m_rBytes, m_Position, o_pData, i_Size ) : 0;
  return m_bGood;
}

bool ISimpleInputStreamAdapter::Tell( uint64_t& o_rPosition )
{
  o_rPosition = m_Position;
  return true;
}

bool ISimpleInputStreamAdapter::Seek( uint64_t i_Position )
{
  m_bGood = i_Position <= m_rBytes.size();
  m_Position = m_bGood ? i_Position : m_Position;
  return m_bGood;
}

}
