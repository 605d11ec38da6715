#include "Utils/UtilsMemory/BalancingAllocator.h"

#include <gtest/gtest.h>

#include <cstring>
#include <memory>
#include <random>
#include <vector>

namespace
{

using UtilsMemory::VBalancedClientAllocator;
using UtilsMemory::VBalancingAllocator;

constexpr size_t BlockSize = 4096;

// The level below: hands out what it may, and counts.
class VLimitedAllocator : public UtilsMemory::VAllocator
{
public:
  explicit VLimitedAllocator( size_t i_Limit ) : m_Limit( i_Limit ) {}
  ~VLimitedAllocator() override { EXPECT_EQ( m_Outstanding, 0u ); }
  size_t MaxAllocation() const override { return ~size_t{ 0 }; }
  void* Allocate( size_t i_Size ) override
  {
    EXPECT_EQ( i_Size, BlockSize + 64 );
    if( m_Outstanding == m_Limit ) return nullptr;
    ++m_Outstanding;
    return ::operator new( i_Size );
  }
  void Free( void* i_pMemory ) override
  {
    --m_Outstanding;
    ::operator delete( i_pMemory );
  }

  size_t m_Limit;
  size_t m_Outstanding = 0;
};

// A client and the blocks that it has taken. Its end frees them.
struct VTaker
{
  explicit VTaker( VBalancingAllocator& i_rPool ) : m_pClient( i_rPool.MakeClient() ) {}
  VTaker( VTaker&& ) = default;
  ~VTaker() { FreeAll(); }

  size_t Take( size_t i_Most )
  {
    size_t Taken = 0;
    for( ; Taken < i_Most; ++Taken )
    {
      void* pBlock = m_pClient->Allocate( BlockSize );
      if( !pBlock ) break;
      std::memset( pBlock, static_cast<int>( Taken ), BlockSize );
      m_Blocks.push_back( pBlock );
    }
    return Taken;
  }
  bool FreeAt( size_t i_Index )
  {
    if( i_Index >= m_Blocks.size() ) return false;
    m_pClient->Free( m_Blocks[i_Index] );
    m_Blocks.erase( m_Blocks.begin() + static_cast<std::ptrdiff_t>( i_Index ) );
    return true;
  }
  void FreeAll()
  {
    while( !m_Blocks.empty() ) FreeAt( 0 );
  }

  std::shared_ptr<VBalancedClientAllocator> m_pClient;
  std::vector<void*> m_Blocks;
};

TEST( BalancingAllocator, GuaranteesHoldAgainstAGreedyClient )
{
  for( const bool bRecovery : { false, true } )
  {
    const auto pPool = std::make_shared<VBalancingAllocator>( BlockSize );
    VTaker Greedy( *pPool );
    VTaker Modest( *pPool );
    ASSERT_TRUE( pPool->Configure( 30, 0, 10 ) );
    if( bRecovery ) Greedy.m_pClient->SetRecovery( [] { return false; } );
    EXPECT_EQ( Greedy.Take( 30 ), 20u );
    EXPECT_EQ( Modest.Take( 30 ), 10u );
    Greedy.m_Blocks.swap( Modest.m_Blocks );   // any holder may free
    Greedy.FreeAll();
    Modest.FreeAll();
    EXPECT_EQ( Greedy.m_pClient->GetHeldBlocks() + Modest.m_pClient->GetHeldBlocks(), 0u );
  }
}

// Who asks more recently gets what lies beyond the guarantees, and the other one must give up its own to go on.
TEST( BalancingAllocator, BlocksMoveToTheClientThatAsks )
{
  const auto pPool = std::make_shared<VBalancingAllocator>( BlockSize );
  VTaker First( *pPool );
  VTaker Second( *pPool );
  ASSERT_TRUE( pPool->Configure( 20, 2, 2 ) );
  First.m_pClient->SetRecovery( [&First] { return First.FreeAt( 0 ); } );
  Second.m_pClient->SetRecovery( [&Second] { return Second.FreeAt( 0 ); } );
  First.Take( 100 );
  EXPECT_EQ( First.m_Blocks.size(), 16u );   // all but the reserve and what the other is promised
  for( int Round = 0; Round < 100; ++Round )
  {
    Second.Take( 2 );
    First.Take( 1 );
    ASSERT_LE( First.m_Blocks.size() + Second.m_Blocks.size(), 20u );
    ASSERT_GE( Second.m_Blocks.size(), 2u );
  }
  EXPECT_NEAR( static_cast<double>( Second.m_Blocks.size() ), 12.0, 2.0 );   // two thirds of the grants
  EXPECT_NEAR( static_cast<double>( First.m_Blocks.size() ), 6.0, 2.0 );
}

TEST( BalancingAllocator, ShareThatWasSetIsTakenWithoutRecoveryUpToTheOthersGuarantee )
{
  const auto pPool = std::make_shared<VBalancingAllocator>( BlockSize );
  VTaker Client( *pPool );
  const VTaker Other( *pPool );
  ASSERT_TRUE( pPool->Configure( 8, 3, 2 ) );   // requests alone earn no more than three
  size_t Recoveries = 0;
  const auto Recover = [&Recoveries]
  {
    ++Recoveries;
    return false;
  };
  Client.m_pClient->SetRecovery( Recover );
  Client.m_pClient->SetShare( 4 );
  EXPECT_EQ( Client.Take( 4 ), 4u );
  EXPECT_EQ( Recoveries, 0u );
  EXPECT_EQ( Client.Take( 8 ), 2u );   // beyond it, what recovery cannot give comes from the reserve
  EXPECT_EQ( Recoveries, 3u );
}

TEST( BalancingAllocator, RefusesAndTellsThatRecoveryCouldNotHelp )
{
  const auto pPool = std::make_shared<VBalancingAllocator>( BlockSize );
  VTaker Client( *pPool );
  size_t Finished = 0;
  Client.m_pClient->SetRecoveryFinished( [&Finished] { ++Finished; } );
  EXPECT_EQ( Client.Take( 1 ), 0u );   // no budget yet
  ASSERT_TRUE( pPool->Configure( 1, 0, 0 ) );
  EXPECT_EQ( Client.m_pClient->MaxAllocation(), BlockSize );
  EXPECT_EQ( Client.m_pClient->Allocate( BlockSize + 1 ), nullptr );
  EXPECT_EQ( Finished, 1u );   // a request that can never succeed is no shortage
  EXPECT_EQ( Client.Take( 2 ), 1u );
  EXPECT_EQ( reinterpret_cast<uintptr_t>( Client.m_Blocks[0] ) % 16, 0u );
  EXPECT_EQ( Finished, 2u );
}

TEST( BalancingAllocator, BudgetFallsAsFarAsBlocksAreFree )
{
  const auto pBelow = std::make_shared<VLimitedAllocator>( 12 );
  const auto pPool = std::make_shared<VBalancingAllocator>( BlockSize, 64, pBelow );
  VTaker Client( *pPool );
  EXPECT_FALSE( pPool->Configure( 13, 0, 0 ) );
  EXPECT_EQ( pBelow->m_Outstanding, 12u );
  EXPECT_TRUE( pPool->Configure( 10, 0, 0 ) );
  EXPECT_EQ( pBelow->m_Outstanding, 10u );
  EXPECT_EQ( Client.Take( 6 ), 6u );
  EXPECT_FALSE( pPool->Configure( 4, 0, 0 ) );
  EXPECT_EQ( pBelow->m_Outstanding, 6u );
  EXPECT_EQ( Client.Take( 1 ), 0u );
  Client.FreeAll();   // what is over the budget goes below at once
  EXPECT_EQ( pBelow->m_Outstanding, 4u );
  EXPECT_TRUE( pPool->Configure( 4, 0, 0 ) );
}

TEST( BalancingAllocator, BlocksOutliveTheirClientAndCountAgainstTheBudget )
{
  const auto pBelow = std::make_shared<VLimitedAllocator>( 12 );
  auto pPool = std::make_shared<VBalancingAllocator>( BlockSize, 64, pBelow );
  VTaker Gone( *pPool );
  VTaker Client( *pPool );
  ASSERT_TRUE( pPool->Configure( 12, 0, 4 ) );
  EXPECT_EQ( Gone.Take( 6 ), 6u );
  Gone.m_pClient = Client.m_pClient;
  EXPECT_EQ( Client.Take( 12 ), 6u );
  double Total = 0, Used = 0;
  Client.m_pClient->GetMemoryStats( Total, Used );
  EXPECT_DOUBLE_EQ( Total, 6.0 * BlockSize / 1048576.0 );
  EXPECT_DOUBLE_EQ( Used, 6.0 * BlockSize / 1048576.0 );
  std::memset( Gone.m_Blocks.back(), 1, BlockSize );
  Gone.FreeAll();
  EXPECT_EQ( Client.Take( 12 ), 6u );
  pPool.reset();
  Client.m_pClient->Release();
  EXPECT_EQ( Client.Take( 1 ), 0u );
  Client.FreeAll();
  Gone.m_pClient.reset();
  Client.m_pClient.reset();
  EXPECT_EQ( pBelow->m_Outstanding, 0u );
}

// Whatever clients do, the guarantee of each can be had at once, blocks are distinct, and none is lost.
TEST( BalancingAllocator, RandomRun )
{
  for( unsigned Seed = 0; Seed < 50; ++Seed )
  {
    SCOPED_TRACE( Seed );
    std::mt19937 Random( Seed );
    const auto Pick = [&Random]( size_t i_Bound ) { return std::uniform_int_distribution<size_t>( 0, i_Bound - 1 )( Random ); };
    const size_t Guarantee = Pick( 4 );
    const size_t Total = 3 * Guarantee + 1 + Pick( 20 );
    const auto pPool = std::make_shared<VBalancingAllocator>( BlockSize );
    std::vector<VTaker> Takers;
    for( int Taker = 0; Taker < 3; ++Taker ) Takers.emplace_back( *pPool );
    ASSERT_TRUE( pPool->Configure( Total, Pick( 3 ), Guarantee ) );
    for( int Step = 0; Step < 500; ++Step )
    {
      VTaker& rTaker = Takers[Pick( 3 )];
      const size_t Held = rTaker.m_Blocks.size();
      if( Pick( 5 ) < 3 ) ASSERT_TRUE( rTaker.Take( 1 ) == 1 || Held >= Guarantee );
      else if( Held != 0 ) rTaker.FreeAt( Pick( Held ) );
    }
    std::set<void*> Held;
    size_t Count = 0;
    for( const VTaker& rTaker : Takers )
    {
      Held.insert( rTaker.m_Blocks.begin(), rTaker.m_Blocks.end() );
      Count += rTaker.m_Blocks.size();
    }
    ASSERT_EQ( Held.size(), Count );
    ASSERT_LE( Count, Total );
    for( VTaker& rTaker : Takers ) rTaker.FreeAll();
    EXPECT_EQ( Takers[0].Take( Total ), Total - 2 * Guarantee );
  }
}

}
