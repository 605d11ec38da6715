#include "Utils/UtilsIO/LargeFile.h"

namespace UtilsIO
{

bool VLargeFile::Open( const std::string& i_rPath, EOpenMode i_Mode )
{
  if( !m_Descriptor.Open( i_rPath, i_Mode ) )
  {
    return false;
  }
  m_Size = 0;
  if( SeekToEnd() && m_Descriptor.Tell( m_Size ) )
  {
    Seek( 0 );
  }
  return true;
}

bool VLargeFile::Close() { return m_Descriptor.Close(); }

bool VLargeFile::Read( void* o_pData, size_t i_Size )
{
  size_t Count = 0;
  if( !ReadBlock( o_pData, i_Size, Count ) )
  {
    return false;
  }
  m_bGood = Count == i_Size;
  return m_bGood;
}

bool VLargeFile::ReadBlock( void* o_pData, size_t i_Size, size_t& o_rRead )
{
  o_rRead = 0;
  if( !m_bGood || i_Size == 0 )
  {
    return m_bGood;
  }
  m_bGood = m_Descriptor.Read( o_pData, i_Size, o_rRead );
  m_bEnd = m_bGood && o_rRead < i_Size;
  return m_bGood;
}

bool VLargeFile::Write( const void* i_pData, size_t i_Size )
{
  m_bGood = m_bGood && m_Descriptor.Write( i_pData, i_Size );
  return m_bGood;
}

bool VLargeFile::Write( const std::vector<VSpan>& i_rSpans )
{
  m_bGood = m_bGood && m_Descriptor.Write( i_rSpans );
  return m_bGood;
}

bool VLargeFile::Tell( uint64_t& o_rPosition ) { return m_Descriptor.Tell( o_rPosition ); }

bool VLargeFile::Seek( uint64_t i_Position )
{
  m_bGood = m_Descriptor.Seek( i_Position );
  m_bEnd = false;
  return m_bGood;
}

bool VLargeFile::SeekToEnd()
{
  m_bGood = m_Descriptor.SeekToEnd();
  m_bEnd = false;
  return m_bGood;
}

}
