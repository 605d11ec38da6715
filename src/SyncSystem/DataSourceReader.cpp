#include "SyncSystem/DataSourceReader.h"

#include <boost/thread/lock_guard.hpp>

#include <algorithm>

namespace SyncSystem
{

VDataSourceReader::VDataSourceReader( std::shared_ptr<VTimeBasedCaptureBuffer> i_pBuffer, const KVZ::VLogCategory& i_rLog )
  : m_pBuffer( std::move( i_pBuffer ) ), m_rLog( i_rLog )
{
}

EReadResult::Enum VDataSourceReader::Read( const std::shared_ptr<const VGlobalSyncSessionInfo>& i_pNewest, uint64_t i_MaxFrames,
  VReadFrames& o_rRead )
{
  o_rRead.m_Frames.clear();
  o_rRead.m_Beat = {};
  if( !i_pNewest || !i_pNewest->HasPositions() )
  {
    return EReadResult::None;
  }
  boost::lock_guard<boost::mutex> Lock( m_Mutex );
  if( i_pNewest->m_Id != m_ReadGlobal )
  {
    BeginSession( *i_pNewest );
  }
  const int64_t Count = CountFrames( *i_pNewest );
  if( Count < 1 )
  {
    return EReadResult::None;
  }
  if( i_pNewest->m_Session.m_BeatPeriod.Count() != 0 )
  {
    o_rRead.m_Beat = { i_pNewest->m_Session.m_BeatPeriod, i_pNewest->m_Session.m_BeatOffset, i_pNewest->m_Id };
  }
  ReadUpTo( Count, *i_pNewest, o_rRead );
  if( o_rRead.m_Frames.empty() )
  {
    return EReadResult::None;
  }
  if( o_rRead.m_Frames.size() > 1 )
  {
    KVZ_LOG( m_rLog, 6, "Backlog is %1% frames long", o_rRead.m_Frames.size() );
  }
  if( const size_t Dropped = DropEvenly( o_rRead.m_Frames, i_MaxFrames ) )
  {
    KVZ_LOG( m_rLog, 6, "Evenly dropped %1% frames", Dropped );
  }
  o_rRead.m_pInfo = i_pNewest;
  return EReadResult::Frames;
}

void VDataSourceReader::BeginSession( const VGlobalSyncSessionInfo& i_rInfo )
{
  m_ReadGlobal = i_rInfo.m_Id;
  m_ReadPosition = i_rInfo.PositionAtOrAfter( i_rInfo.LiveStart() );
  i_rInfo.TickAt( m_ReadPosition, m_ReadTick );
}

int64_t VDataSourceReader::CountFrames( const VGlobalSyncSessionInfo& i_rInfo ) const
{
  VToken Newest;
  KVZ::ITickInClocks Clocks;
  int64_t Frames = 0;
  if( !m_pBuffer->LastPosition( i_rInfo.m_Session.m_Id, Newest, Clocks ) || !VCaptureBuffer::Distance( m_ReadPosition, Newest, Frames ) )
  {
    return 0;
  }
  return Frames + 1;
}

void VDataSourceReader::ReadUpTo( int64_t i_Frames, const VGlobalSyncSessionInfo& i_rInfo, VReadFrames& o_rRead )
{
  const KVZ::VTick Period = i_rInfo.m_Session.m_Period;
  const int64_t Frames = SkipEvicted( i_Frames, Period );
  o_rRead.m_FirstTimecode = i_rInfo.TimecodeAt( m_ReadTick );
  o_rRead.m_Frames.reserve( static_cast<size_t>( Frames ) );
  for( int64_t Index = 0; Index < Frames; ++Index )
  {
    VFrameRecord Record;
    if( m_pBuffer->Read( m_ReadPosition, Record.m_Frame ) )
    {
      Record.m_Tick = m_ReadTick;
      Record.m_Period = Period;
      Record.m_GlobalSession = i_rInfo.m_Id;
      RankFrame( Record, o_rRead.m_Beat );
      o_rRead.m_Frames.push_back( std::move( Record ) );
    }
    Advance( 1, Period );
  }
}

// A reader that was away for long finds its place far behind the oldest frame.
int64_t VDataSourceReader::SkipEvicted( int64_t i_Frames, KVZ::VTick i_Period )
{
  VToken Oldest;
  int64_t Gone = 0;
  if( !m_pBuffer->GetFirstToken( m_ReadPosition.m_BufferSession, Oldest ) || !VCaptureBuffer::Distance( m_ReadPosition, Oldest, Gone ) || Gone <= 0 )
  {
    return i_Frames;
  }
  Gone = std::min( Gone, i_Frames );
  Advance( Gone, i_Period );
  return i_Frames - Gone;
}

void VDataSourceReader::Advance( int64_t i_Frames, KVZ::VTick i_Period )
{
  m_pBuffer->Advance( m_ReadPosition, i_Frames );
  m_ReadTick += i_Period * i_Frames;
}

}
