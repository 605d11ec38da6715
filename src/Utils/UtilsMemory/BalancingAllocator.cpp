#include "Utils/UtilsMemory/BalancingAllocator.h"

#include "StageCoreRuntime/DebugServices.h"

#include <algorithm>

namespace UtilsMemory
{

VBalancingAllocator::VBalancingAllocator( size_t i_BlockSize, size_t i_Overhead, std::shared_ptr<VAllocator> i_pAllocator )
  : m_pAllocator( i_pAllocator ? std::move( i_pAllocator ) : std::make_shared<VGlobalFreeAllocatorNewDelete>() ),
    m_BlockSize( i_BlockSize ),
    m_Overhead( std::max( i_Overhead, VGlobalFreeAllocator::HiddenBytes ) ),
    m_AllocationSize( m_BlockSize + m_Overhead )
{
}

VBalancingAllocator::~VBalancingAllocator()
{
  // Every client owns the pool, so nothing is in use.
  KVZ_ASSERT( m_Clients.empty() && m_FreeBlocks.size() == m_AllocatedBlocks );
  for( void* pBlock : m_FreeBlocks )
  {
    m_pAllocator->Free( static_cast<std::byte*>( pBlock ) - m_Overhead );
  }
}

bool VBalancingAllocator::Configure( size_t i_Total, size_t i_Reserve, size_t i_Guarantee )
{
  boost::lock_guard<boost::mutex> Lock( m_Mutex );
  m_TotalBlocks = i_Total;
  m_Reserve = std::min( i_Reserve, i_Total );
  m_GuaranteedPerClient = i_Guarantee;
  RecomputeLocked();
  TrimLocked();
  m_Grants.set_capacity( i_Total + 1 );   // one more while a grant is being entered
  for( VBalancedClientAllocator* pClient : m_Clients ) UpdateShareLocked( *pClient );
  return m_AllocatedBlocks <= i_Total ? ObtainBlocksLocked() : ReturnSurplusLocked();
}

std::shared_ptr<VBalancedClientAllocator> VBalancingAllocator::MakeClient()
{
  std::shared_ptr<VBalancedClientAllocator> pClient( new VBalancedClientAllocator( shared_from_this() ), &VBalancedClientAllocator::Abandon );
  boost::lock_guard<boost::mutex> Lock( m_Mutex );
  m_Clients.insert( pClient.get() );
  RecomputeLocked();
  TrimLocked();
  UpdateShareLocked( *pClient );
  return pClient;
}

void VBalancingAllocator::EnterGrant( VBalancedClientAllocator& i_rClient )
{
  boost::lock_guard<boost::mutex> Lock( m_Mutex );
  if( i_rClient.m_bReleased || m_Grants.full() ) return;   // full: no budget yet
  m_Grants.push_front( &i_rClient );
  ++i_rClient.m_Wanted;
  if( i_rClient.m_Wanted <= m_GuaranteedPerClient ) --m_Deficit;
  TrimLocked();
  UpdateShareLocked( i_rClient );
}

// Grants that the budget does not cover leave at the back. What is promised to clients that do not ask is not for granting.
void VBalancingAllocator::TrimLocked()
{
  while( !m_Grants.empty() && WithheldLocked() < m_TotalBlocks && m_Grants.size() + WithheldLocked() > m_TotalBlocks ) DropOldestGrantLocked();
  // Where the promises exceed the budget, the list still ends somewhere.
  while( m_Grants.size() > m_TotalBlocks ) DropOldestGrantLocked();
}

size_t VBalancingAllocator::WithheldLocked() const { return m_Deficit + m_Reserve + m_Used; }

void VBalancingAllocator::DropOldestGrantLocked()
{
  VBalancedClientAllocator& rClient = *m_Grants.back();
  m_Grants.pop_back();
  if( rClient.m_Wanted <= m_GuaranteedPerClient ) ++m_Deficit;
  --rClient.m_Wanted;
  UpdateShareLocked( rClient );
}

void VBalancingAllocator::UpdateShareLocked( VBalancedClientAllocator& i_rClient )
{
  i_rClient.m_Share = std::max( { i_rClient.m_Wanted, i_rClient.m_MinimumShare, m_GuaranteedPerClient.load() } );
}

void VBalancingAllocator::RecomputeLocked()
{
  m_Deficit = 0;
  for( const VBalancedClientAllocator* pClient : m_Clients )
  {
    m_Deficit += m_GuaranteedPerClient - std::min( pClient->m_Wanted, m_GuaranteedPerClient.load() );
  }
  CountClaimsLocked();
}

void VBalancingAllocator::CountClaimsLocked()
{
  size_t Claims = 0;
  for( const VBalancedClientAllocator* pClient : m_Clients ) Claims += std::max( pClient->m_Held.load(), m_GuaranteedPerClient.load() );
  m_Claims = Claims;
}

bool VBalancingAllocator::ObtainBlocksLocked()
{
  m_FreeBlocks.reserve( m_TotalBlocks );
  while( m_AllocatedBlocks < m_TotalBlocks )
  {
    void* pRaw = m_pAllocator->Allocate( m_AllocationSize );
    if( !pRaw ) return false;
    m_FreeBlocks.push_back( static_cast<std::byte*>( pRaw ) + m_Overhead );
    ++m_AllocatedBlocks;
  }
  return true;
}

bool VBalancingAllocator::ReturnSurplusLocked()
{
  while( m_AllocatedBlocks > m_TotalBlocks && !m_FreeBlocks.empty() )
  {
    m_pAllocator->Free( static_cast<std::byte*>( m_FreeBlocks.back() ) - m_Overhead );
    m_FreeBlocks.pop_back();
    --m_AllocatedBlocks;
  }
  return m_AllocatedBlocks == m_TotalBlocks;
}

void* VBalancingAllocator::TakeWithinShare( VBalancedClientAllocator& i_rClient )
{
  boost::lock_guard<boost::mutex> Lock( m_Mutex );
  return i_rClient.m_Held < i_rClient.m_Share ? TakeLocked( i_rClient ) : nullptr;
}

void* VBalancingAllocator::TakeAny( VBalancedClientAllocator& i_rClient )
{
  boost::lock_guard<boost::mutex> Lock( m_Mutex );
  return TakeLocked( i_rClient );
}

// Within its guarantee a client takes any block; beyond it, only what the others' guarantees leave.
void* VBalancingAllocator::TakeLocked( VBalancedClientAllocator& i_rClient )
{
  if( i_rClient.m_bReleased ) return nullptr;
  const size_t Kept = i_rClient.m_Held < m_GuaranteedPerClient ? 0 : LackOfOthersLocked( i_rClient );
  if( m_FreeBlocks.size() <= Kept ) return nullptr;
  void* pBlock = m_FreeBlocks.back();
  m_FreeBlocks.pop_back();
  ++i_rClient.m_Held;
  CountClaimsLocked();
  return pBlock;
}

size_t VBalancingAllocator::LackOfOthersLocked( const VBalancedClientAllocator& i_rClient ) const
{
  size_t Lack = 0;
  for( const VBalancedClientAllocator* pOther : m_Clients )
  {
    if( pOther != &i_rClient ) Lack += m_GuaranteedPerClient - std::min( pOther->m_Held.load(), m_GuaranteedPerClient.load() );
  }
  return Lack;
}

bool VBalancingAllocator::GiveBack( VBalancedClientAllocator& i_rClient, void* i_pBlock )
{
  boost::lock_guard<boost::mutex> Lock( m_Mutex );
  m_FreeBlocks.push_back( i_pBlock );
  --i_rClient.m_Held;
  ReturnSurplusLocked();
  if( i_rClient.m_bReleased ) --m_Used;
  else CountClaimsLocked();
  return i_rClient.m_bAbandoned && i_rClient.m_Held == 0;
}

void VBalancingAllocator::SetMinimumShare( VBalancedClientAllocator& i_rClient, size_t i_Blocks )
{
  boost::lock_guard<boost::mutex> Lock( m_Mutex );
  i_rClient.m_MinimumShare = i_Blocks;
  UpdateShareLocked( i_rClient );
}

void VBalancingAllocator::Unregister( VBalancedClientAllocator& i_rClient )
{
  boost::lock_guard<boost::mutex> Lock( m_Mutex );
  if( m_Clients.erase( &i_rClient ) == 0 ) return;
  m_Grants.erase( std::remove( m_Grants.begin(), m_Grants.end(), &i_rClient ), m_Grants.end() );
  i_rClient.m_Wanted = 0;
  i_rClient.m_bReleased = true;
  m_Used += i_rClient.m_Held;
  RecomputeLocked();
  TrimLocked();
}

bool VBalancingAllocator::Abandon( VBalancedClientAllocator& i_rClient )
{
  boost::lock_guard<boost::mutex> Lock( m_Mutex );
  i_rClient.m_bAbandoned = true;
  return i_rClient.m_Held == 0;
}

size_t VBalancingAllocator::Attainable( const VBalancedClientAllocator& i_rClient ) const
{
  const size_t Held = i_rClient.m_Held;
  const size_t Own = std::max( Held, m_GuaranteedPerClient.load() );
  const size_t Claims = m_Claims;
  const size_t Others = m_Used + Claims - std::min( Claims, Own );
  const size_t Total = m_TotalBlocks;
  return std::max( Held, Total - std::min( Total, Others ) );
}

}
