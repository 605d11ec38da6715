#include "SyncSystem/DataSourceFrames.h"
#include "tests/SyncSystem/DataSource/TestSource.h"

#include <algorithm>
#include <vector>

namespace
{

using SyncSystem::VBeat;
using SyncSystem::VFrameRecord;

constexpr int64_t Ticks50 = 2700000;   // of a frame

// Every third frame lies a little behind the grid of the others.
std::vector<int64_t> MakeTicks( int64_t i_First, int64_t i_Behind, size_t i_Count )
{
  std::vector<int64_t> Ticks;
  for( int64_t Index = 0; Ticks.size() < i_Count; ++Index )
  {
    Ticks.push_back( i_First + Index * Ticks50 + ( Index % 3 == 0 ? i_Behind : 0 ) );
  }
  return Ticks;
}

// How many times a number can be halved; zero more often than any other.
int Halvings( int64_t i_Number )
{
  if( i_Number == 0 )
  {
    return 64;
  }
  int Count = 0;
  for( ; i_Number % 2 == 0; i_Number /= 2 )
  {
    ++Count;
  }
  return Count;
}

// What is left when the least deserving frame goes, one at a time: off the beat before on it, then by halvings of the beat's number and of
// the frame's number, then the earlier one.
std::vector<int64_t> SurvivorsOneByOne( std::vector<int64_t> i_Ticks, size_t i_Limit, const VBeat& i_rBeat )
{
  const int64_t BeatPeriod = i_rBeat.m_Period.Count();
  const auto Merit = [&]( int64_t i_Tick )
  {
    const bool bOnBeat = BeatPeriod != 0 && i_Tick % Ticks50 == i_rBeat.m_Offset.Count() % BeatPeriod;
    return std::pair( bOnBeat ? Halvings( i_Tick / BeatPeriod ) : -1, Halvings( i_Tick / Ticks50 ) );
  };
  while( i_Ticks.size() > std::max<size_t>( i_Limit, 1 ) )
  {
    i_Ticks.erase( std::min_element( i_Ticks.begin(), i_Ticks.end(), [&]( int64_t i_A, int64_t i_B ) { return Merit( i_A ) < Merit( i_B ); } ) );
  }
  return i_Ticks;
}

// A dropped frame tells how many go before the next kept one.
void Check( const std::vector<int64_t>& i_rTicks, size_t i_Limit, const VBeat& i_rBeat )
{
  std::vector<VFrameRecord> Frames( i_rTicks.size() );
  for( size_t Index = 0; Index < Frames.size(); ++Index )
  {
    Frames[Index].m_Tick = VTick( i_rTicks[Index] );
    Frames[Index].m_Period = VTick( Ticks50 );
    SyncSystem::RankFrame( Frames[Index], i_rBeat );
  }
  const size_t Dropped = SyncSystem::DropEvenly( Frames, i_Limit );
  const std::vector<int64_t> Kept = SurvivorsOneByOne( i_rTicks, i_Limit, i_rBeat );
  ASSERT_EQ( Dropped, i_rTicks.size() - Kept.size() );
  int64_t Run = 0;
  for( size_t Index = Frames.size(); Index-- > 0; )
  {
    Run = std::binary_search( Kept.begin(), Kept.end(), i_rTicks[Index] ) ? 0 : Run + 1;
    ASSERT_EQ( Frames[Index].m_DropRun, Run ) << Index << " of " << i_rTicks.size() << ", limit " << i_Limit;
  }
}

TEST( EvenDropping, KeepsWhatIsLeftWhenTheLeastDeservingGoOneByOne )
{
  const VBeat Beats[] = { {}, { VTick( Ticks50 ), VTick(), {} }, { VTick( 4 * Ticks50 ), VTick(), {} },
    { VTick( 5 * Ticks50 ), VTick( 5 * Ticks50 + 40 ), {} } };
  for( const VBeat& rBeat : Beats )
  {
    for( const auto& [First, Behind] : { std::pair<int64_t, int64_t>{ 0, 0 }, { 0, 40 }, { 7 * Ticks50, 0 }, { 1000 * Ticks50 + 13, 27 } } )
    {
      SCOPED_TRACE( testing::Message() << "beat " << rBeat.m_Period.Count() << ", from " << First << ", third ones " << Behind << " behind" );
      for( size_t Count = 1; Count <= 64 && !HasFatalFailure(); ++Count )
      {
        for( size_t Limit = 0; Limit <= Count + 1; ++Limit )
        {
          Check( MakeTicks( First, Behind, Count ), Limit, rBeat );
        }
      }
    }
  }
}

}
