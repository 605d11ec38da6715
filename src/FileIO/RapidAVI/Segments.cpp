#include "FileIO/RapidAVI/Segments.h"

#include "StageCoreRuntime/GlobalLog.h"

#include <algorithm>
#include <numeric>

namespace RapidAVI
{

namespace
{

using VSpan = KVZ::IOutputStream::VSpan;

constexpr uint64_t CountedWithEachChunk = 16;
constexpr uint8_t Padding = 0;

constexpr uint64_t GetPadded( uint64_t i_Size ) { return i_Size + i_Size % 2; }

uint64_t GetTotalSize( const VSpan* i_pSpans, size_t i_Count )
{
  return std::accumulate( i_pSpans, i_pSpans + i_Count, uint64_t{ 0 },
    []( uint64_t i_Sum, const VSpan& i_rSpan ) { return i_Sum + i_rSpan.second; } );
}

bool FitsChunk( uint64_t i_Size )
{
  if( i_Size > LargestChunk )
  {
    KVZ_LOG_ERROR( "RapidAVI", "A chunk of %1% bytes cannot be stored: %2% is the limit.", i_Size, LargestChunk );
  }
  return i_Size <= LargestChunk;
}

}

VSegments::VSegments( VChunkWriter& io_rOut, VIndex& io_rIndex, const VSegmentLimits& i_rLimits )
  : m_rOut( io_rOut ), m_rIndex( io_rIndex ), m_Limits( i_rLimits )
{
}

bool VSegments::WriteFrame( const VSpans& i_rVideo, const KVZ::VBufferList& i_rAudio )
{
  DropCollected();
  // The spans point to the headers, which must not move.
  m_Headers.reserve( 1 + i_rAudio.size() );
  if( !FitsChunks( i_rVideo, i_rAudio ) || !BeginMovi() || !Collect( VideoStream, i_rVideo.data(), i_rVideo.size() ) )
  {
    return false;
  }
  if( IsFull() && ( !Flush() || !FinishRiff() ) )
  {
    return false;
  }
  return i_rAudio.empty() ? Flush() : BeginMovi() && CollectAudio( i_rAudio ) && Flush();
}

bool VSegments::FitsChunks( const VSpans& i_rVideo, const KVZ::VBufferList& i_rAudio ) const
{
  return FitsChunk( GetTotalSize( i_rVideo.data(), i_rVideo.size() ) ) &&
    std::all_of( i_rAudio.begin(), i_rAudio.end(), []( const auto& i_rpBuffer ) { return FitsChunk( i_rpBuffer->Size() ); } );
}

// Only the first RIFF is open without one: it begins with the headers.
bool VSegments::BeginMovi()
{
  if( m_rOut.CountOpen() == 2 )
  {
    return true;
  }
  if( m_rOut.CountOpen() == 0 && ( !m_rOut.Tell( m_RiffPosition ) || !m_rOut.OpenRiff( FourCC( "AVIX" ) ) ) )
  {
    return false;
  }
  return m_rOut.OpenList( FourCC( "movi" ) ) && m_rOut.Tell( m_MoviBase ) && m_rOut.GetMark( m_Whole );
}

bool VSegments::Collect( EStream i_Stream, const VSpan* i_pSpans, size_t i_Count )
{
  const uint64_t Size = GetTotalSize( i_pSpans, i_Count );
  const uint64_t Position = m_Whole.m_Position + m_CollectedBytes + sizeof( VChunkHeader );
  const uint64_t RiffEnd = Position + GetPadded( Size ) + m_rIndex.GetStoredSize( m_Entries.size() + 1 );
  if( RiffEnd - m_RiffPosition - sizeof( VChunkHeader ) > LargestChunk )
  {
    KVZ_LOG_ERROR( "RapidAVI", "A chunk of %1% bytes cannot be stored: its RIFF would be longer than %2% bytes, which is the limit.", Size,
      LargestChunk );
    return false;
  }
  m_Headers.push_back( { m_rIndex.GetChunkId( i_Stream ), static_cast<uint32_t>( Size ) } );
  m_Entries.push_back( { Position, static_cast<uint32_t>( Size ), i_Stream } );
  m_Spans.emplace_back( &m_Headers.back(), sizeof( VChunkHeader ) );
  m_Spans.insert( m_Spans.end(), i_pSpans, i_pSpans + i_Count );
  if( Size % 2 != 0 )
  {
    m_Spans.emplace_back( &Padding, sizeof( Padding ) );
  }
  m_CollectedBytes += sizeof( VChunkHeader ) + GetPadded( Size );
  return true;
}

bool VSegments::CollectAudio( const KVZ::VBufferList& i_rAudio )
{
  const auto IsCollected = [this]( const auto& i_rpBuffer )
  {
    const VSpan Span( i_rpBuffer->Data(), i_rpBuffer->Size() );
    return Collect( AudioStream, &Span, i_rpBuffer->Size() != 0 ? 1 : 0 );
  };
  return std::all_of( i_rAudio.begin(), i_rAudio.end(), IsCollected );
}

// The entries come first, since memory may run out: bytes in the file that no index knows would be found by a reader that walks.
bool VSegments::Flush()
{
  m_rIndex.Add( m_Entries );
  if( !m_rOut.Write( m_Spans ) )
  {
    m_rIndex.RemoveLast( m_Entries.size() );
    return false;
  }
  for( const VIndexEntry& rEntry : m_Entries )
  {
    m_ByteCount += rEntry.m_Size + CountedWithEachChunk;
  }
  m_Whole.m_Position += m_CollectedBytes;
  DropCollected();
  return true;
}

void VSegments::DropCollected()
{
  m_Headers.clear();
  m_Spans.clear();
  m_Entries.clear();
  m_CollectedBytes = 0;
}

bool VSegments::IsFull() const
{
  const uint64_t Limit = m_FinishedRiffs == 0 ? m_Limits.m_First : m_Limits.m_Following;
  return m_ByteCount + m_Entries.back().m_Size + CountedWithEachChunk >= Limit;
}

bool VSegments::FinishRiff()
{
  const bool bMovi = m_rOut.CountOpen() == 2;
  const bool bOldIndex = bMovi && m_FinishedRiffs == 0;
  m_bFinishing = true;
  if( bMovi && ( !m_rIndex.WriteStandardIndexes( m_rOut, m_MoviBase ) || !m_rOut.CloseChunk() ) )
  {
    return false;
  }
  if( ( bOldIndex && !m_rIndex.WriteOldIndex( m_rOut, m_MoviBase ) ) || !m_rOut.CloseChunk() || !m_rOut.GetMark( m_Whole ) )
  {
    return false;
  }
  if( bMovi )
  {
    m_rIndex.FinishRiff();
  }
  ++m_FinishedRiffs;
  m_ByteCount = 0;
  m_bFinishing = false;
  return true;
}

bool VSegments::Finish()
{
  if( !IsWhole() && !m_rOut.GoBack( m_Whole ) )
  {
    return false;
  }
  return m_rOut.CountOpen() == 0 || FinishRiff();
}

}
