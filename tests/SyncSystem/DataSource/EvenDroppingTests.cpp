#include "SyncSystem/DataSourceFrames.h"
#include "tests/SyncSystem/DataSource/TestSource.h"

#include <algorithm>
#include <limits>
#include <vector>

namespace
{

using SyncSystem::VBeat;
using SyncSystem::VFrameRecord;

constexpr int64_t Ticks50 = 2700000;   // of a frame

std::vector<VFrameRecord> MakeFrames( int64_t i_FirstTick, size_t i_Count, const VBeat& i_rBeat )
{
  std::vector<VFrameRecord> Frames( i_Count );
  for( size_t Index = 0; Index < i_Count; ++Index )
  {
    Frames[Index].m_Tick = VTick( i_FirstTick + static_cast<int64_t>( Index ) * Ticks50 );
    Frames[Index].m_Period = VTick( Ticks50 );
    SyncSystem::RankFrame( Frames[Index], i_rBeat );
  }
  return Frames;
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
std::vector<int64_t> SurvivorsOneByOne( std::vector<int64_t> i_Ticks, size_t i_Limit, int64_t i_BeatPeriod )
{
  const auto Merit = [i_BeatPeriod]( int64_t i_Tick )
  {
    const bool bOnBeat = i_BeatPeriod != 0 && i_Tick % Ticks50 == 0;
    return std::pair( bOnBeat ? Halvings( i_Tick / i_BeatPeriod ) : -1, Halvings( i_Tick / Ticks50 ) );
  };
  while( i_Ticks.size() > std::max<size_t>( i_Limit, 1 ) )
  {
    i_Ticks.erase( std::min_element( i_Ticks.begin(), i_Ticks.end(), [&]( int64_t i_A, int64_t i_B ) { return Merit( i_A ) < Merit( i_B ); } ) );
  }
  return i_Ticks;
}

TEST( EvenDropping, KeepsWhatIsLeftWhenTheLeastDeservingGoOneByOne )
{
  for( const int64_t BeatPeriod : { int64_t( 0 ), Ticks50, 4 * Ticks50 } )
  {
    for( const int64_t First : { int64_t( 0 ), 7 * Ticks50, 1000 * Ticks50 + 13 } )
    {
      for( size_t Count = 1; Count <= 64; ++Count )
      {
        for( size_t Limit = 0; Limit <= Count + 1; ++Limit )
        {
          const VBeat Beat{ VTick( BeatPeriod ), VTick(), KVZ::VGlobalSyncSessionId( 1 ) };
          std::vector<VFrameRecord> Frames = MakeFrames( First, Count, Beat );
          std::vector<int64_t> Ticks;
          for( const VFrameRecord& rFrame : Frames )
          {
            Ticks.push_back( rFrame.m_Tick.Count() );
          }
          const size_t Dropped = SyncSystem::DropEvenly( Frames, Limit );
          std::vector<int64_t> Kept;
          for( const VFrameRecord& rFrame : Frames )
          {
            if( rFrame.m_DropRun == 0 )
            {
              Kept.push_back( rFrame.m_Tick.Count() );
            }
          }
          ASSERT_EQ( Kept, SurvivorsOneByOne( Ticks, Limit, BeatPeriod ) ) << BeatPeriod << " " << First << " " << Count << " " << Limit;
          ASSERT_EQ( Dropped, Count - Kept.size() );
        }
      }
    }
  }
}

TEST( EvenDropping, ADroppedFrameTellsHowManyGoBeforeTheNextKeptOne )
{
  for( size_t Limit = 1; Limit <= 40; ++Limit )
  {
    std::vector<VFrameRecord> Frames = MakeFrames( 3 * Ticks50, 40, {} );
    SyncSystem::DropEvenly( Frames, Limit );
    for( size_t Index = 0; Index < Frames.size(); ++Index )
    {
      size_t Run = 0;
      while( Index + Run < Frames.size() && Frames[Index + Run].m_DropRun != 0 )
      {
        ++Run;
      }
      ASSERT_EQ( Frames[Index].m_DropRun, static_cast<int64_t>( Run ) ) << Limit << " " << Index;
    }
  }
}

TEST( EvenDropping, HalvesASequenceIntoRegularSpacing )
{
  std::vector<VFrameRecord> Frames = MakeFrames( 0, 8, {} );
  EXPECT_EQ( SyncSystem::DropEvenly( Frames, 4 ), 4u );
  for( size_t Index = 0; Index < 8; ++Index )
  {
    EXPECT_EQ( Frames[Index].m_DropRun, Index % 2 == 1 ? 1 : 0 ) << Index;
  }
}

TEST( EvenDropping, FramesOnTheBeatOutliveAllOthers )
{
  const VBeat Beat{ VTick( 5 * Ticks50 ), VTick( 5 * Ticks50 + 40 ), KVZ::VGlobalSyncSessionId( 1 ) };
  std::vector<VFrameRecord> Frames = MakeFrames( 1000, 20, Beat );
  Frames[3].m_Tick = VTick( 3 * Ticks50 + 40 );
  Frames[15].m_Tick = VTick( 15 * Ticks50 + 40 );
  SyncSystem::RankFrame( Frames[3], Beat );
  SyncSystem::RankFrame( Frames[15], Beat );
  SyncSystem::DropEvenly( Frames, 2 );
  for( size_t Index = 0; Index < Frames.size(); ++Index )
  {
    EXPECT_EQ( Frames[Index].m_DropRun == 0, Index == 3 || Index == 15 ) << Index;
  }
}

TEST( EvenDropping, WithoutAPeriodTheTickItselfRanks )
{
  VFrameRecord Frame;
  Frame.m_Tick = VTick( 40 );
  SyncSystem::RankFrame( Frame, { VTick( 10 ), VTick(), KVZ::VGlobalSyncSessionId( 1 ) } );
  EXPECT_EQ( Frame.m_FrameRank, 8 );
  EXPECT_EQ( Frame.m_BeatRank, 0 );
  Frame.m_Tick = VTick( 0 );
  SyncSystem::RankFrame( Frame, {} );
  EXPECT_EQ( Frame.m_FrameRank, std::numeric_limits<int64_t>::max() - 1 );
}

}
