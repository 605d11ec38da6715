#include "FileIO/MovIO/MovPrimitiveWriter.h"

#include <algorithm>
#include <bit>
#include <cstring>

namespace MovIO
{

namespace
{

constexpr size_t LongestText = 254;

}

VMovPrimitiveWriter::VMovPrimitiveWriter( std::shared_ptr<WriterSupport::VWatchedStream> i_pStream )
  : m_pStream( std::move( i_pStream ) ), m_bOk( m_pStream != nullptr ), m_Buffer( Capacity )
{
}

VMovPrimitiveWriter& VMovPrimitiveWriter::Put( const void* i_pData, size_t i_Size )
{
  if( !m_bOk || i_Size == 0 || ( m_Cursor + i_Size > Capacity && !Flush() ) )
  {
    return *this;
  }
  std::memcpy( m_Buffer.data() + m_Cursor, i_pData, i_Size );
  m_Cursor += i_Size;
  m_Used = std::max( m_Used, m_Cursor );
  return *this;
}

VMovPrimitiveWriter& VMovPrimitiveWriter::Refuse()
{
  m_bOk = false;
  return *this;
}

VMovPrimitiveWriter& VMovPrimitiveWriter::FourCC( std::string_view i_Code )
{
  return i_Code.size() == 4 ? Put( i_Code.data(), i_Code.size() ) : Refuse();
}

VMovPrimitiveWriter& VMovPrimitiveWriter::PascalString( std::string_view i_Text ) { return PaddedPascalString( i_Text, i_Text.size() + 1 ); }

VMovPrimitiveWriter& VMovPrimitiveWriter::PaddedPascalString( std::string_view i_Text, size_t i_Width )
{
  if( i_Text.size() > LongestText || i_Text.size() + 1 > i_Width )
  {
    return Refuse();
  }
  return U8( static_cast<uint8_t>( i_Text.size() ) ).Put( i_Text.data(), i_Text.size() ).Zeros( i_Width - 1 - i_Text.size() );
}

VMovPrimitiveWriter& VMovPrimitiveWriter::Double( double i_Value ) { return U64( std::bit_cast<uint64_t>( i_Value ) ); }

VMovPrimitiveWriter& VMovPrimitiveWriter::Zeros( size_t i_Bytes )
{
  for( size_t Byte = 0; Byte < i_Bytes; ++Byte )
  {
    U8( 0 );
  }
  return *this;
}

bool VMovPrimitiveWriter::Write( const void* i_pData, size_t i_Size )
{
  return i_Size <= Capacity ? Put( i_pData, i_Size ).IsOk() : Write( std::vector<VSpan>{ { i_pData, i_Size } } );
}

bool VMovPrimitiveWriter::Write( const std::vector<VSpan>& i_rSpans )
{
  if( !Flush() )
  {
    return false;
  }
  m_bOk = false;   // also where the stream throws
  m_bOk = m_pStream->Seek( m_BufferPosition ) && m_pStream->Write( i_rSpans );
  for( const VSpan& rSpan : i_rSpans )
  {
    m_BufferPosition += rSpan.second;
  }
  return m_bOk;
}

bool VMovPrimitiveWriter::Seek( uint64_t i_Position )
{
  if( i_Position >= m_BufferPosition && i_Position - m_BufferPosition <= m_Used )
  {
    m_Cursor = static_cast<size_t>( i_Position - m_BufferPosition );
    return m_bOk;
  }
  if( Flush() )
  {
    m_BufferPosition = i_Position;
  }
  return m_bOk;
}

bool VMovPrimitiveWriter::Flush()
{
  if( m_bOk && m_Used != 0 )
  {
    m_bOk = false;
    m_bOk = m_pStream->Seek( m_BufferPosition ) && m_pStream->Write( m_Buffer.data(), m_Used );
    m_BufferPosition += m_Cursor;
    m_Used = 0;
    m_Cursor = 0;
  }
  return m_bOk;
}

bool VMovPrimitiveWriter::Close()
{
  const bool bFlushed = Flush();
  return m_pStream && m_pStream->Close() && bFlushed;
}

}
