// A bounded number of things that are used again and again.
#pragma once

#include "StageCoreRuntime/ThreadAnnotations.h"

#include <boost/thread/lock_guard.hpp>
#include <boost/thread/mutex.hpp>

#include <memory>
#include <vector>

namespace VirtualCards
{

// Any thread may take and give back. The one given back last is taken first: it is still in the processor's cache, and a client that
// keeps nothing makes only one of them be used at all.
template<class T>
class VRecycler
{
public:
  explicit VRecycler( size_t i_Most ) : m_Most( i_Most ) { m_Idle.reserve( i_Most ); }

  // Makes one if none is idle; null when all are in use.
  T* Take()
  {
    const boost::lock_guard<boost::mutex> Lock( m_Mutex );
    if( m_Idle.empty() )
    {
      if( m_All.size() == m_Most )
      {
        return nullptr;
      }
      m_All.push_back( std::make_unique<T>() );
      return m_All.back().get();
    }
    T* pThing = m_Idle.back();
    m_Idle.pop_back();
    return pThing;
  }

  void Give( T* i_pThing )
  {
    const boost::lock_guard<boost::mutex> Lock( m_Mutex );
    m_Idle.push_back( i_pThing );
  }

private:
  const size_t m_Most;
  boost::mutex m_Mutex;
  std::vector<std::unique_ptr<T>> m_All GUARDED_BY( m_Mutex );
  std::vector<T*> m_Idle GUARDED_BY( m_Mutex );
};

}
