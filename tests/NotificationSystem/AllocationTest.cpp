#include "StageCoreRuntime/SanitizerBuild.h"

// A sanitizer brings its own operator new.
#if !defined( STAGECORE_SANITIZER_BUILD )

#include "NotificationSystem/MultiCallback.h"

#include <gtest/gtest.h>

#include <cstdlib>
#include <new>

namespace
{
thread_local size_t t_Allocations = 0;

void* CountedAllocation( size_t i_Size )
{
  ++t_Allocations;
  if( void* pMemory = std::malloc( i_Size ) )
  {
    return pMemory;
  }
  throw std::bad_alloc();
}
}

void* operator new( size_t i_Size ) { return CountedAllocation( i_Size ); }

void operator delete( void* i_pMemory ) noexcept { std::free( i_pMemory ); }

void operator delete( void* i_pMemory, size_t ) noexcept { std::free( i_pMemory ); }

namespace
{
using NotificationSystem::VCallbackPostal;
using NotificationSystem::VMultiCallback;
using NotificationSystem::VMultiCallbackPostal;

// Drops what is posted, so that all that is counted belongs to the post itself.
class VDroppingPostalService : public KVZ::IPostalService
{
public:
  void Post( std::function<void()>, unsigned int ) override { ++m_Posts; }
  size_t m_Posts = 0;
};

template<class TSlot>
size_t AllocationsOfACall( TSlot& i_rSlot )
{
  const size_t Before = t_Allocations;
  i_rSlot( 1 );
  return t_Allocations - Before;
}

TEST( Allocation, ACallAllocatesNothingButItsPosts )
{
  const auto pService = std::make_shared<VDroppingPostalService>();
  VMultiCallback<void( uint64_t )> Plain;
  VMultiCallbackPostal<void( uint64_t )> Multi( pService );
  VCallbackPostal<void( uint64_t )> Single( pService );
  EXPECT_EQ( AllocationsOfACall( Plain ) + AllocationsOfACall( Multi ) + AllocationsOfACall( Single ), 0u );
  uint64_t Sum = 0;
  const auto Add = [&Sum]( uint64_t i_Number ) { Sum += i_Number; };
  for( int Subscriber = 0; Subscriber < 3; ++Subscriber )
  {
    Plain.Add( Add );
    Multi.AddImmediate( Add );
  }
  Single.SetImmediate( Add );
  EXPECT_EQ( AllocationsOfACall( Plain ) + AllocationsOfACall( Multi ) + AllocationsOfACall( Single ), 0u );
  EXPECT_EQ( Sum, 7u );
  for( int Subscriber = 0; Subscriber < 3; ++Subscriber )
  {
    Multi.Add( Add );
  }
  Single.Set( Add );
  EXPECT_EQ( AllocationsOfACall( Multi ), 1u );
  EXPECT_EQ( AllocationsOfACall( Single ), 1u );
  EXPECT_EQ( pService->m_Posts, 2u );
}
}

#endif
