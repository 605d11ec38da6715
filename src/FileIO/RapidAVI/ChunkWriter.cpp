#include "FileIO/RapidAVI/ChunkWriter.h"

#include "StageCoreRuntime/DebugServices.h"
#include "StageCoreRuntime/GlobalLog.h"

#include <vector>

namespace RapidAVI
{

bool VChunkWriter::OpenChunk( VFourCC i_Id, uint32_t i_Size ) { return Push( i_Id, i_Size ); }

bool VChunkWriter::OpenChunk( VFourCC i_Id ) { return Push( i_Id, boost::none ); }

bool VChunkWriter::OpenForm( VFourCC i_Id, VFourCC i_Form ) { return Push( i_Id, boost::none ) && Write( i_Form.data(), i_Form.size() ); }

bool VChunkWriter::Push( VFourCC i_Id, boost::optional<uint32_t> i_KnownSize )
{
  const VChunkHeader Header{ i_Id, i_KnownSize.value_or( 0 ) };
  VOpenChunk Chunk{ 0, i_KnownSize };
  if( !KVZ_ASSERT( m_Stack.size() < m_Stack.capacity() ) || !Tell( Chunk.m_Position ) || !Write( &Header, sizeof( Header ) ) )
  {
    return false;
  }
  m_Stack.push_back( Chunk );
  return true;
}

bool VChunkWriter::CloseChunk()
{
  uint64_t End = 0;
  if( !KVZ_ASSERT( !m_Stack.empty() ) || !Tell( End ) )
  {
    return false;
  }
  const VOpenChunk Chunk = m_Stack.back();
  const uint64_t Size = End - Chunk.m_Position - sizeof( VChunkHeader );
  constexpr uint8_t Zero = 0;
  if( Size % 2 != 0 && !Write( &Zero, sizeof( Zero ) ) )
  {
    return false;
  }
  if( Chunk.m_KnownSize ? !IsStatedSize( Chunk, Size ) : !PatchSize( Chunk, End + Size % 2, Size ) )
  {
    return false;
  }
  m_Stack.pop_back();
  return true;
}

// Where nothing has failed, another size is an error of the program.
bool VChunkWriter::IsStatedSize( const VOpenChunk& i_rChunk, uint64_t i_Size ) const
{
  const bool bStated = i_Size == *i_rChunk.m_KnownSize;
  KVZ_ASSERT( bStated || HasFailed() );
  return bStated;
}

bool VChunkWriter::PatchSize( const VOpenChunk& i_rChunk, uint64_t i_End, uint64_t i_Size )
{
  if( i_Size > LargestChunk )
  {
    KVZ_LOG_ERROR( "RapidAVI", "A chunk of %1% bytes cannot be stored: %2% is the limit.", i_Size, LargestChunk );
    return false;
  }
  const auto Size = static_cast<uint32_t>( i_Size );
  return Seek( i_rChunk.m_Position + offsetof( VChunkHeader, m_Size ) ) && Write( &Size, sizeof( Size ) ) && Seek( i_End );
}

bool VChunkWriter::Reserve( size_t i_Bytes )
{
  const std::vector<uint8_t> Zeros( i_Bytes );
  return Write( Zeros.data(), Zeros.size() );
}

bool VChunkWriter::GetMark( VMark& o_rMark )
{
  o_rMark.m_Stack = m_Stack;
  return Tell( o_rMark.m_Position );
}

bool VChunkWriter::GoBack( const VMark& i_rMark )
{
  m_Stack = i_rMark.m_Stack;
  return Seek( i_rMark.m_Position );
}

}
