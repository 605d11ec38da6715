#include "Utils/UtilsMemory/PooledBufferAllocator.h"

#include "StageCoreRuntime/GlobalLog.h"
#include "StageCoreRuntime/ThreadAnnotations.h"

#include <boost/thread/lock_guard.hpp>
#include <boost/thread/mutex.hpp>

#include <map>
#include <new>
#include <stdexcept>
#include <vector>

namespace UtilsMemory
{

using VOwned = std::unique_ptr<KVZ::IStandardBuffer>;

class VPooledBufferAllocator::VPool
{
public:
  // An empty pointer if no free buffer has room.
  VOwned Take( size_t i_Size )
  {
    boost::lock_guard<boost::mutex> Lock( m_Mutex );
    const auto Found = m_Free.lower_bound( i_Size );
    if( Found == m_Free.end() )
    {
      return {};
    }
    VOwned pBuffer = std::move( Found->second );
    m_Free.erase( Found );
    return pBuffer;
  }

  // Runs in the deleter of a shared pointer, so nothing may leave it.
  void GiveBack( VOwned i_pBuffer ) noexcept
  try
  {
    const size_t Room = i_pBuffer->Bytes().capacity();
    VOwned pSurplus;
    boost::lock_guard<boost::mutex> Lock( m_Mutex );
    m_Free.emplace( Room, std::move( i_pBuffer ) );
    if( m_Free.size() > MaxFree )
    {
      pSurplus = std::move( m_Free.begin()->second );
      m_Free.erase( m_Free.begin() );
    }
  }
  catch( const std::exception& )
  {
    // No memory for the entry: the buffer goes to the heap.
  }

private:
  // A frame in flight needs a handful; the rest is what a burst left behind.
  static constexpr size_t MaxFree = 16;

  boost::mutex m_Mutex;
  std::multimap<size_t, VOwned> m_Free GUARDED_BY( m_Mutex );   // by capacity
};

VPooledBufferAllocator::VPooledBufferAllocator( std::string i_Name ) : m_Name( std::move( i_Name ) ), m_pPool( std::make_shared<VPool>() ) {}

std::shared_ptr<KVZ::IBuffer> VPooledBufferAllocator::AllocateBuffer( size_t i_Size )
try
{
  VOwned pBuffer = m_pPool->Take( i_Size );
  if( !pBuffer )
  {
    pBuffer = std::make_unique<KVZ::IStandardBuffer>();
  }
  pBuffer->Bytes().resize( i_Size );
  return std::shared_ptr<KVZ::IBuffer>( pBuffer.release(),
    [pPool = m_pPool]( KVZ::IBuffer* i_pBuffer ) { pPool->GiveBack( VOwned( static_cast<KVZ::IStandardBuffer*>( i_pBuffer ) ) ); } );
}
catch( const std::length_error& )
{
  KVZ_LOG_ERROR( "UtilsMemory", "Could not create buffer of size %d bytes.", i_Size );
  throw std::bad_alloc();
}
catch( const std::bad_alloc& )
{
  KVZ_LOG_ERROR( "UtilsMemory", "Could not create buffer of size %d bytes.", i_Size );
  throw;
}

}
