#include "host/Timeline.h"

#include <algorithm>

namespace StageHost
{

namespace
{

KVZ::VTick Distance( KVZ::VTick i_A, KVZ::VTick i_B ) { return i_A < i_B ? i_B - i_A : i_A - i_B; }

}

const KVZ::IClock* FindSharedTimecode( const KVZ::ISourceSyncSession& i_rSession )
{
  for( const auto& rEntry : i_rSession.m_StartTime.m_TickByClock )
  {
    if( rEntry.first.Type() == KVZ::IClock::Timecode && rEntry.first.Source() == 0 )
    {
      return &rEntry.first;
    }
  }
  return nullptr;
}

boost::optional<VTimeline> LaySources( const std::vector<VTimelineSource>& i_rSources )
{
  const auto Reference = std::find_if( i_rSources.begin(), i_rSources.end(),
    []( const VTimelineSource& i_rSource ) { return FindSharedTimecode( i_rSource.m_Session ); } );

  VTimeline Timeline;
  Timeline.m_bByTimecode = Reference != i_rSources.end();
  if( Timeline.m_bByTimecode && i_rSources.size() == 1 )
  {
    Timeline.m_Sources = { { Reference->m_Session.m_StartTime.Find( *FindSharedTimecode( Reference->m_Session ) ), true } };
    return Timeline;
  }
  if( std::any_of( i_rSources.begin(), i_rSources.end(), []( const VTimelineSource& i_rSource ) { return !i_rSource.m_Timing; } ) )
  {
    return {};
  }

  KVZ::VTick HostToGlobal;
  if( Timeline.m_bByTimecode )
  {
    HostToGlobal = Reference->m_Session.m_StartTime.Find( *FindSharedTimecode( Reference->m_Session ) ) -
      KVZ::VTick::FromSeconds( Reference->m_Timing->m_StartTime );
  }
  for( const VTimelineSource& rSource : i_rSources )
  {
    VLaidSource Laid{ KVZ::VTick::FromSeconds( rSource.m_Timing->m_StartTime ) + HostToGlobal, false };
    if( const KVZ::IClock* pTimecode = FindSharedTimecode( rSource.m_Session ) )
    {
      const KVZ::VTick ByTimecode = rSource.m_Session.m_StartTime.Find( *pTimecode );
      if( Distance( ByTimecode, Laid.m_CounterStart ) <= TimecodeTolerance )
      {
        Laid = { ByTimecode, true };
      }
    }
    Timeline.m_Sources.push_back( Laid );
  }
  return Timeline;
}

}
