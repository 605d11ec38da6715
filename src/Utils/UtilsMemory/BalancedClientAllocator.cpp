#include "Utils/UtilsMemory/BalancingAllocator.h"

namespace UtilsMemory
{

namespace
{

constexpr double BytesPerMiB = 1048576.0;

}

VBalancedClientAllocator::VBalancedClientAllocator( std::shared_ptr<VBalancingAllocator> i_pBalancing ) : m_pBalancing( std::move( i_pBalancing ) ) {}

size_t VBalancedClientAllocator::MaxAllocation() const { return m_pBalancing->GetBlockSize(); }

void* VBalancedClientAllocator::Allocate( size_t i_Size )
{
  if( i_Size > MaxAllocation() ) return nullptr;
  m_pBalancing->EnterGrant( *this );
  void* pBlock = nullptr;
  do {
    pBlock = m_pBalancing->TakeWithinShare( *this );
  } while( !pBlock && Recover() );

  if( !pBlock ) pBlock = m_pBalancing->TakeAny( *this );
  if( pBlock ) Own( pBlock );
  else TellRecoveryFinished();
  return pBlock;
}

void VBalancedClientAllocator::FreeOwned( void* i_pMemory )
{
  // The pool outlives its use here even where the last block takes the client along.
  const std::shared_ptr<VBalancingAllocator> pBalancing = m_pBalancing;
  if( pBalancing->GiveBack( *this, i_pMemory ) ) delete this;
}

void VBalancedClientAllocator::Release()
{
  SetRecovery( nullptr );
  SetRecoveryFinished( nullptr );
  m_pBalancing->Unregister( *this );
}

void VBalancedClientAllocator::Abandon( VBalancedClientAllocator* i_pClient )
{
  const std::shared_ptr<VBalancingAllocator> pBalancing = i_pClient->m_pBalancing;
  i_pClient->Release();
  if( pBalancing->Abandon( *i_pClient ) ) delete i_pClient;
}

void VBalancedClientAllocator::SetShare( size_t i_Blocks ) { m_pBalancing->SetMinimumShare( *this, i_Blocks ); }

void VBalancedClientAllocator::SetRecovery( std::function<bool()> i_Recovery )
{
  auto pRecovery = i_Recovery ? std::make_shared<const std::function<bool()>>( std::move( i_Recovery ) ) : nullptr;
  boost::lock_guard<boost::mutex> Lock( m_RecoveryMutex );
  m_pRecovery.swap( pRecovery );
}

void VBalancedClientAllocator::SetRecoveryFinished( std::function<void()> i_Finished )
{
  auto pFinished = i_Finished ? std::make_shared<const std::function<void()>>( std::move( i_Finished ) ) : nullptr;
  boost::lock_guard<boost::mutex> Lock( m_RecoveryMutex );
  m_pRecoveryFinished.swap( pFinished );
}

bool VBalancedClientAllocator::Recover()
{
  std::shared_ptr<const std::function<bool()>> pRecovery;
  {
    boost::lock_guard<boost::mutex> Lock( m_RecoveryMutex );
    pRecovery = m_pRecovery;
  }
  return pRecovery && ( *pRecovery )();
}

void VBalancedClientAllocator::TellRecoveryFinished()
{
  std::shared_ptr<const std::function<void()>> pFinished;
  {
    boost::lock_guard<boost::mutex> Lock( m_RecoveryMutex );
    pFinished = m_pRecoveryFinished;
  }
  if( pFinished ) ( *pFinished )();
}

void VBalancedClientAllocator::GetMemoryStats( double& o_rTotalMiB, double& o_rUsedMiB ) const
{
  const double BlockMiB = static_cast<double>( m_pBalancing->GetBlockSize() ) / BytesPerMiB;
  o_rTotalMiB = static_cast<double>( m_pBalancing->Attainable( *this ) ) * BlockMiB;
  o_rUsedMiB = static_cast<double>( m_Held.load() ) * BlockMiB;
}

}
