#include "Utils/UtilsMemory/StandardBufferAllocator.h"

#include "StageCoreRuntime/GlobalLog.h"
#include "StageCoreRuntime/ThreadAnnotations.h"

#include <boost/thread/lock_guard.hpp>
#include <boost/thread/mutex.hpp>
#include <boost/thread/tss.hpp>

#include <algorithm>
#include <iterator>
#include <new>
#include <stdexcept>
#include <vector>

namespace KVZ
{

namespace
{

using VOwned = std::unique_ptr<IStandardBuffer>;

}

// A free list for each thread, used without a lock, and a shared one through which threads that only take get the buffers of threads that
// only give back. The lists own nothing but their buffers, so a list that a thread leaves behind holds no pool.
class IStandardBufferAllocator::VPool
{
public:
  VOwned Take()
  {
    VList& rList = ThreadList();
    if( rList.empty() )
    {
      Refill( rList );
    }
    VOwned pBuffer = std::move( rList.back() );
    rList.pop_back();
    return pBuffer;
  }

  // Runs in the deleter of a shared pointer, so nothing may leave it.
  void GiveBack( VOwned i_pBuffer ) noexcept
  try
  {
    VList& rList = ThreadList();
    if( rList.size() == ThreadRoom )
    {
      Share( rList );
    }
    rList.push_back( std::move( i_pBuffer ) );
  }
  catch( const std::exception& )
  {
    // No memory for a list: the buffer goes to the heap.
  }

private:
  using VList = std::vector<VOwned>;

  static constexpr size_t ThreadRoom = 32;
  static constexpr size_t MovedAtOnce = 16;
  static constexpr size_t SharedRoom = 64;   // the rest is what a burst left behind

  VList& ThreadList()
  {
    if( !m_pThreadList.get() )
    {
      auto pList = std::make_unique<VList>();
      pList->reserve( ThreadRoom );
      m_pThreadList.reset( pList.release() );
    }
    return *m_pThreadList;
  }

  void Refill( VList& o_rList )
  {
    {
      boost::lock_guard<boost::mutex> Lock( m_Mutex );
      if( m_Shared.size() >= MovedAtOnce )
      {
        std::move( m_Shared.end() - MovedAtOnce, m_Shared.end(), std::back_inserter( o_rList ) );
        m_Shared.resize( m_Shared.size() - MovedAtOnce );
        return;
      }
    }
    while( o_rList.size() < MovedAtOnce )
    {
      o_rList.push_back( std::make_unique<IStandardBuffer>() );
    }
  }

  // Those that have lain there longest.
  void Share( VList& io_rList )
  {
    VList Surplus( std::make_move_iterator( io_rList.begin() ), std::make_move_iterator( io_rList.begin() + MovedAtOnce ) );
    io_rList.erase( io_rList.begin(), io_rList.begin() + MovedAtOnce );
    boost::lock_guard<boost::mutex> Lock( m_Mutex );
    if( m_Shared.size() + MovedAtOnce <= SharedRoom )
    {
      std::move( Surplus.begin(), Surplus.end(), std::back_inserter( m_Shared ) );
      Surplus.clear();
    }
  }

  boost::thread_specific_ptr<VList> m_pThreadList;
  boost::mutex m_Mutex;
  VList m_Shared GUARDED_BY( m_Mutex );
};

IStandardBufferAllocator::IStandardBufferAllocator( std::string i_Name, std::string i_LogCategory )
  : m_Name( std::move( i_Name ) ), m_LogCategory( std::move( i_LogCategory ) ), m_pPool( std::make_shared<VPool>() )
{
}

// No memory, or a size that no vector can have.
std::shared_ptr<IStandardBuffer> IStandardBufferAllocator::Allocate( size_t i_Size )
try
{
  VOwned pBuffer = m_pPool->Take();
  pBuffer->Bytes().resize( i_Size );
  return std::shared_ptr<IStandardBuffer>( pBuffer.release(),
    [pPool = m_pPool]( IStandardBuffer* i_pBuffer ) { pPool->GiveBack( VOwned( i_pBuffer ) ); } );
}
catch( const std::exception& )
{
  KVZ_LOG_ERROR( m_LogCategory, "Could not create buffer of size %d bytes.", i_Size );
  return nullptr;
}

}
