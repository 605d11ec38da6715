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

std::vector<void*> TakeAll( VBalancedClientAllocator& i_rClient )
{
  std::vector<void*> Blocks;
  while( void* pBlock = i_rClient.Allocate( BlockSize ) )
  {
    std::memset( pBlock, static_cast<int>( Blocks.size() ), BlockSize );
    Blocks.push_back( pBlock );
  }
  return Blocks;
}

size_t TakeAtMost( VBalancedClientAllocator& i_rClient, size_t i_Count, std::vector<void*>& io_rBlocks )
{
  size_t Taken = 0;
  for( ; Taken < i_Count; ++Taken )
  {
    void* pBlock = i_rClient.Allocate( BlockSize );
    if( !pBlock ) break;
    io_rBlocks.push_back( pBlock );
  }
  return Taken;
}

void FreeAll( std::vector<void*>& io_rBlocks, UtilsMemory::VAllocator& i_rAllocator )
{
  for( void* pBlock : io_rBlocks ) i_rAllocator.Free( pBlock );
  io_rBlocks.clear();
}

TEST( BalancingAllocator, GuaranteesHoldAgainstAGreedyClient )
{
  for( const bool bRecovery : { false, true } )
  {
    const auto pPool = std::make_shared<VBalancingAllocator>( BlockSize );
    const auto pGreedy = pPool->MakeClient();
    const auto pModest = pPool->MakeClient();
    ASSERT_TRUE( pPool->Configure( 30, 0, 10 ) );
    if( bRecovery ) pGreedy->SetRecovery( [] { return false; } );
    auto Greedy = TakeAll( *pGreedy );
    EXPECT_EQ( Greedy.size(), 20u );
    auto Modest = TakeAll( *pModest );
    EXPECT_EQ( Modest.size(), 10u );
    FreeAll( Greedy, *pModest );   // any holder may free
    FreeAll( Modest, *pGreedy );
    EXPECT_EQ( pGreedy->GetHeldBlocks() + pModest->GetHeldBlocks(), 0u );
  }
}

// Who asks more recently gets what lies beyond the guarantees, and the other one must give up its own to go on.
TEST( BalancingAllocator, BlocksMoveToTheClientThatAsks )
{
  const auto pPool = std::make_shared<VBalancingAllocator>( BlockSize );
  const auto pFirst = pPool->MakeClient();
  const auto pSecond = pPool->MakeClient();
  ASSERT_TRUE( pPool->Configure( 20, 2, 2 ) );
  std::vector<void*> First, Second;
  const auto FreeOldest = []( std::vector<void*>& io_rBlocks, VBalancedClientAllocator& i_rClient )
  {
    return [&io_rBlocks, &i_rClient]
    {
      if( io_rBlocks.empty() ) return false;
      i_rClient.Free( io_rBlocks.front() );
      io_rBlocks.erase( io_rBlocks.begin() );
      return true;
    };
  };
  pFirst->SetRecovery( FreeOldest( First, *pFirst ) );
  pSecond->SetRecovery( FreeOldest( Second, *pSecond ) );
  TakeAtMost( *pFirst, 100, First );
  EXPECT_EQ( First.size(), 16u );   // all but the reserve and what the other is promised
  for( int Round = 0; Round < 100; ++Round )
  {
    TakeAtMost( *pSecond, 2, Second );
    TakeAtMost( *pFirst, 1, First );
    ASSERT_LE( First.size() + Second.size(), 20u );
    ASSERT_GE( Second.size(), std::min<size_t>( 2 * ( Round + 1 ), 2 ) );
  }
  EXPECT_NEAR( static_cast<double>( Second.size() ), 12.0, 2.0 );   // two thirds of the grants
  EXPECT_NEAR( static_cast<double>( First.size() ), 6.0, 2.0 );
  FreeAll( First, *pFirst );
  FreeAll( Second, *pSecond );
}

TEST( BalancingAllocator, ShareThatWasSetIsTakenWithoutRecoveryUpToTheOthersGuarantee )
{
  const auto pPool = std::make_shared<VBalancingAllocator>( BlockSize );
  const auto pClient = pPool->MakeClient();
  const auto pOther = pPool->MakeClient();
  ASSERT_TRUE( pPool->Configure( 8, 3, 2 ) );   // requests alone earn no more than three
  size_t Recoveries = 0;
  pClient->SetRecovery(
    [&Recoveries]
    {
      ++Recoveries;
      return false;
    } );
  std::vector<void*> Blocks;
  pClient->SetShare( 4 );
  EXPECT_EQ( TakeAtMost( *pClient, 4, Blocks ), 4u );
  EXPECT_EQ( Recoveries, 0u );
  EXPECT_EQ( TakeAtMost( *pClient, 8, Blocks ), 2u );   // beyond it, what recovery cannot give comes from the reserve
  EXPECT_EQ( Recoveries, 3u );
  FreeAll( Blocks, *pClient );
}

TEST( BalancingAllocator, RefusesAndTellsThatRecoveryCouldNotHelp )
{
  const auto pPool = std::make_shared<VBalancingAllocator>( BlockSize );
  const auto pClient = pPool->MakeClient();
  size_t Finished = 0;
  pClient->SetRecoveryFinished( [&Finished] { ++Finished; } );
  EXPECT_EQ( pClient->Allocate( 1 ), nullptr );   // no budget yet
  ASSERT_TRUE( pPool->Configure( 1, 0, 0 ) );
  EXPECT_EQ( pClient->MaxAllocation(), BlockSize );
  EXPECT_EQ( pClient->Allocate( BlockSize + 1 ), nullptr );
  EXPECT_EQ( Finished, 1u );   // a request that can never succeed is no shortage
  void* pBlock = pClient->Allocate( BlockSize );
  ASSERT_NE( pBlock, nullptr );
  EXPECT_EQ( reinterpret_cast<uintptr_t>( pBlock ) % 16, 0u );
  EXPECT_EQ( pClient->Allocate( 1 ), nullptr );
  EXPECT_EQ( Finished, 2u );
  pClient->Free( pBlock );
}

TEST( BalancingAllocator, BudgetFallsAsFarAsBlocksAreFree )
{
  const auto pBelow = std::make_shared<VLimitedAllocator>( 12 );
  {
    const auto pPool = std::make_shared<VBalancingAllocator>( BlockSize, 64, pBelow );
    const auto pClient = pPool->MakeClient();
    EXPECT_FALSE( pPool->Configure( 13, 0, 0 ) );
    EXPECT_EQ( pBelow->m_Outstanding, 12u );
    EXPECT_TRUE( pPool->Configure( 10, 0, 0 ) );
    EXPECT_EQ( pBelow->m_Outstanding, 10u );
    std::vector<void*> Blocks;
    EXPECT_EQ( TakeAtMost( *pClient, 6, Blocks ), 6u );
    EXPECT_FALSE( pPool->Configure( 4, 0, 0 ) );
    EXPECT_EQ( pBelow->m_Outstanding, 6u );
    double Total = 0, Used = 0;
    pClient->GetMemoryStats( Total, Used );
    EXPECT_GE( Total, Used );
    EXPECT_EQ( pClient->Allocate( 1 ), nullptr );
    FreeAll( Blocks, *pClient );   // what is over the budget goes below at once
    EXPECT_EQ( pBelow->m_Outstanding, 4u );
    EXPECT_TRUE( pPool->Configure( 4, 0, 0 ) );
  }
  EXPECT_EQ( pBelow->m_Outstanding, 0u );
}

TEST( BalancingAllocator, BlocksOutliveTheirClientAndCountAgainstTheBudget )
{
  const auto pBelow = std::make_shared<VLimitedAllocator>( 12 );
  auto pPool = std::make_shared<VBalancingAllocator>( BlockSize, 64, pBelow );
  auto pGone = pPool->MakeClient();
  auto pClient = pPool->MakeClient();
  ASSERT_TRUE( pPool->Configure( 12, 0, 4 ) );
  std::vector<void*> Left, Blocks;
  EXPECT_EQ( TakeAtMost( *pGone, 6, Left ), 6u );
  pGone.reset();
  EXPECT_EQ( TakeAtMost( *pClient, 12, Blocks ), 6u );
  double Total = 0, Used = 0;
  pClient->GetMemoryStats( Total, Used );
  EXPECT_DOUBLE_EQ( Total, 6.0 * BlockSize / 1048576.0 );
  EXPECT_DOUBLE_EQ( Used, 6.0 * BlockSize / 1048576.0 );
  std::memset( Left.back(), 1, BlockSize );
  FreeAll( Left, *pClient );
  EXPECT_EQ( TakeAtMost( *pClient, 12, Blocks ), 6u );
  pPool.reset();
  pClient->Release();
  EXPECT_EQ( pClient->Allocate( 1 ), nullptr );
  FreeAll( Blocks, *pClient );
  pClient.reset();
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
    struct VOwner
    {
      std::shared_ptr<VBalancedClientAllocator> m_pClient;
      std::vector<void*> m_Blocks;
    };
    std::vector<VOwner> Owners( 3 );
    for( VOwner& rOwner : Owners ) rOwner.m_pClient = pPool->MakeClient();
    ASSERT_TRUE( pPool->Configure( Total, Pick( 3 ), Guarantee ) );
    for( int Step = 0; Step < 500; ++Step )
    {
      VOwner& rOwner = Owners[Pick( 3 )];
      if( Pick( 5 ) < 3 )
      {
        const size_t Held = rOwner.m_Blocks.size();
        void* pBlock = rOwner.m_pClient->Allocate( BlockSize );
        ASSERT_TRUE( pBlock || Held >= Guarantee );
        if( pBlock ) std::memset( pBlock, static_cast<int>( Pick( 256 ) ), BlockSize );
        if( pBlock ) rOwner.m_Blocks.push_back( pBlock );
      }
      else if( !rOwner.m_Blocks.empty() )
      {
        std::swap( rOwner.m_Blocks[Pick( rOwner.m_Blocks.size() )], rOwner.m_Blocks.back() );
        rOwner.m_pClient->Free( rOwner.m_Blocks.back() );
        rOwner.m_Blocks.pop_back();
      }
    }
    size_t Held = 0;
    for( VOwner& rOwner : Owners ) Held += rOwner.m_Blocks.size();
    ASSERT_LE( Held, Total );
    for( VOwner& rOwner : Owners ) FreeAll( rOwner.m_Blocks, *rOwner.m_pClient );
    std::vector<void*> Blocks;
    EXPECT_EQ( TakeAtMost( *Owners[0].m_pClient, Total, Blocks ), Total - 2 * Guarantee );
    FreeAll( Blocks, *Owners[0].m_pClient );
  }
}

}
