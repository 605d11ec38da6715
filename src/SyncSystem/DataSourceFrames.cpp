#include "SyncSystem/DataSourceFrames.h"

#include <algorithm>
#include <limits>
#include <tuple>

namespace SyncSystem
{

namespace
{

int64_t Ruler( uint64_t i_Number )
{
  return i_Number == 0 ? std::numeric_limits<int64_t>::max() - 1 : static_cast<int64_t>( i_Number & ( ~i_Number + 1 ) );
}

uint64_t Unsigned( KVZ::VTick i_Tick ) { return static_cast<uint64_t>( i_Tick.Count() ); }

bool IsOnBeat( uint64_t i_Tick, uint64_t i_Period, const VBeat& i_rBeat )
{
  return i_Period != 0 && i_rBeat.m_Period.Count() != 0 && i_Tick % i_Period == Unsigned( i_rBeat.m_Offset ) % Unsigned( i_rBeat.m_Period );
}

}

void RankFrame( VFrameRecord& io_rFrame, const VBeat& i_rBeat )
{
  const uint64_t Tick = Unsigned( io_rFrame.m_Tick );
  const uint64_t Period = Unsigned( io_rFrame.m_Period );
  io_rFrame.m_FrameRank = Ruler( Period == 0 ? Tick : Tick / Period );
  io_rFrame.m_BeatRank = IsOnBeat( Tick, Period, i_rBeat ) ? Ruler( Tick / Unsigned( i_rBeat.m_Period ) ) : 0;
}

size_t DropEvenly( std::vector<VFrameRecord>& io_rFrames, uint64_t i_Limit )
{
  const uint64_t Limit = std::max<uint64_t>( 1, i_Limit );
  if( io_rFrames.size() <= Limit )
  {
    return 0;
  }
  std::vector<VFrameRecord*> ByRank;
  ByRank.reserve( io_rFrames.size() );
  for( VFrameRecord& rFrame : io_rFrames )
  {
    rFrame.m_DropRun = 0;
    ByRank.push_back( &rFrame );
  }
  std::stable_sort( ByRank.begin(), ByRank.end(),
    []( const VFrameRecord* i_pA, const VFrameRecord* i_pB )
    { return std::tie( i_pA->m_BeatRank, i_pA->m_FrameRank ) < std::tie( i_pB->m_BeatRank, i_pB->m_FrameRank ); } );
  const size_t Dropped = io_rFrames.size() - static_cast<size_t>( Limit );
  std::for_each( ByRank.begin(), ByRank.begin() + static_cast<ptrdiff_t>( Dropped ), []( VFrameRecord* i_pFrame ) { i_pFrame->m_DropRun = -1; } );

  int64_t Run = 1;
  for( auto Frame = io_rFrames.rbegin(); Frame != io_rFrames.rend(); ++Frame )
  {
    if( Frame->m_DropRun == 0 )
    {
      Run = 1;
    }
    else
    {
      Frame->m_DropRun = Run++;
    }
  }
  return Dropped;
}

}
