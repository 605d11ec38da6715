#include "FileIO/RapidAVI/Index.h"

#include <algorithm>

namespace RapidAVI
{

namespace
{

// Hands records on in large pieces.
template<class TRecord>
class VRecordWriter
{
public:
  explicit VRecordWriter( VChunkWriter& io_rOut ) : m_rOut( io_rOut ) { m_Records.reserve( AtOnce ); }

  bool Add( const TRecord& i_rRecord )
  {
    m_Records.push_back( i_rRecord );
    return m_Records.size() < AtOnce || Flush();
  }

  bool Flush()
  {
    const bool bWritten = m_rOut.Write( m_Records.data(), m_Records.size() * sizeof( TRecord ) );
    m_Records.clear();
    return bWritten;
  }

private:
  static constexpr size_t AtOnce = 4096;

  VChunkWriter& m_rOut;
  std::vector<TRecord> m_Records;
};

VFourCC StandardIndexId( EStream i_Stream ) { return i_Stream == VideoStream ? FourCC( "ix00" ) : FourCC( "ix01" ); }

}

VIndex::VIndex( std::vector<VFourCC> i_ChunkIds )
{
  for( const VFourCC Id : i_ChunkIds )
  {
    m_Streams.push_back( { Id } );
  }
}

void VIndex::Add( const std::vector<VIndexEntry>& i_rEntries )
{
  m_Entries.insert( m_Entries.end(), i_rEntries.begin(), i_rEntries.end() );
  for( const VIndexEntry& rEntry : i_rEntries )
  {
    ++m_Streams[rEntry.m_Stream].m_Entries;
    m_Frames += rEntry.m_Stream == VideoStream ? 1 : 0;
  }
}

void VIndex::RemoveLast( size_t i_Entries )
{
  for( ; i_Entries != 0; --i_Entries )
  {
    --m_Streams[m_Entries.back().m_Stream].m_Entries;
    m_Frames -= m_Entries.back().m_Stream == VideoStream ? 1 : 0;
    m_Entries.pop_back();
  }
}

uint64_t VIndex::GetStoredSize( size_t i_MoreEntries ) const
{
  const uint64_t Headers = ( m_Streams.size() + 1 ) * sizeof( VChunkHeader ) + m_Streams.size() * sizeof( VStandardIndexHeader );
  return Headers + ( m_Entries.size() + i_MoreEntries ) * ( sizeof( VStandardIndexEntry ) + sizeof( VOldIndexEntry ) );
}

bool VIndex::WriteStandardIndexes( VChunkWriter& io_rOut, uint64_t i_Base )
{
  return WriteStandardIndex( io_rOut, i_Base, VideoStream ) && ( CountStreams() == 1 || WriteStandardIndex( io_rOut, i_Base, AudioStream ) );
}

bool VIndex::WriteStandardIndex( VChunkWriter& io_rOut, uint64_t i_Base, EStream i_Stream )
{
  VStream& rStream = m_Streams[i_Stream];
  VStandardIndexHeader Header;
  Header.m_EntriesInUse = rStream.m_Entries;
  Header.m_ChunkId = rStream.m_ChunkId;
  Header.m_BasePosition = i_Base;
  const auto Size = static_cast<uint32_t>( sizeof( Header ) + rStream.m_Entries * sizeof( VStandardIndexEntry ) );

  rStream.m_SuperIndex.reserve( rStream.m_SuperIndex.size() + 1 );
  rStream.m_Newest.m_Size = static_cast<uint32_t>( sizeof( VChunkHeader ) + Size );
  rStream.m_Newest.m_Duration = rStream.m_Entries;
  if( !io_rOut.Tell( rStream.m_Newest.m_Position ) || !io_rOut.OpenChunk( StandardIndexId( i_Stream ), Size ) ||
    !io_rOut.Write( &Header, sizeof( Header ) ) )
  {
    return false;
  }
  VRecordWriter<VStandardIndexEntry> Records( io_rOut );
  const auto IsWritten = [&]( const VIndexEntry& i_rEntry ) {
    return i_rEntry.m_Stream != i_Stream || Records.Add( { static_cast<uint32_t>( i_rEntry.m_Position - i_Base ), i_rEntry.m_Size } );
  };
  return std::all_of( m_Entries.begin(), m_Entries.end(), IsWritten ) && Records.Flush() && io_rOut.CloseChunk();
}

bool VIndex::WriteOldIndex( VChunkWriter& io_rOut, uint64_t i_Base ) const
{
  constexpr uint64_t FormSize = sizeof( VFourCC );
  if( !io_rOut.OpenChunk( FourCC( "idx1" ), static_cast<uint32_t>( m_Entries.size() * sizeof( VOldIndexEntry ) ) ) )
  {
    return false;
  }
  VRecordWriter<VOldIndexEntry> Records( io_rOut );
  const auto IsWritten = [&]( const VIndexEntry& i_rEntry )
  {
    VOldIndexEntry Record;
    Record.m_ChunkId = GetChunkId( i_rEntry.m_Stream );
    Record.m_Offset = static_cast<uint32_t>( i_rEntry.m_Position - i_Base - FormSize );
    Record.m_Size = i_rEntry.m_Size;
    return Records.Add( Record );
  };
  return std::all_of( m_Entries.begin(), m_Entries.end(), IsWritten ) && Records.Flush() && io_rOut.CloseChunk();
}

void VIndex::FinishRiff()
{
  for( VStream& rStream : m_Streams )
  {
    rStream.m_SuperIndex.push_back( rStream.m_Newest );
    rStream.m_Entries = 0;
  }
  m_Entries.clear();
}

bool VIndex::WriteSuperIndex( VChunkWriter& io_rOut, uint64_t i_Position, EStream i_Stream ) const
{
  const std::vector<VSuperIndexEntry>& rRecords = m_Streams[i_Stream].m_SuperIndex;
  VSuperIndexHeader Header;
  Header.m_ChunkId = GetChunkId( i_Stream );
  Header.m_EntriesInUse = static_cast<uint32_t>( std::min( rRecords.size(), SuperIndexEntries ) );
  return io_rOut.Seek( i_Position ) && io_rOut.Write( &Header, sizeof( Header ) ) &&
    io_rOut.Write( rRecords.data(), Header.m_EntriesInUse * sizeof( VSuperIndexEntry ) );
}

}
