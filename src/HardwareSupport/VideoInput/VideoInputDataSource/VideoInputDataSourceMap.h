// The data sources of all devices by URN, in the order of arrival: filled on the engine's thread, looked up by flow nodes on theirs.
//
// Any thread.
#pragma once

#include "HardwareSupport/VideoInput/VideoInputDataSource/DeviceUrnMap.h"
#include "StageCoreRuntime/ThreadAnnotations.h"

#include <boost/thread/lock_guard.hpp>
#include <boost/thread/mutex.hpp>

#include <memory>
#include <string>
#include <utility>
#include <vector>

namespace VideoInputHAL
{

class VVideoInputDataSource;

class VVideoInputDataSourceMap
{
public:
  using VSourcePtr = std::shared_ptr<VVideoInputDataSource>;

  // False, and nothing changes, where the URN is there already.
  bool Insert( const std::string& i_rURN, VSourcePtr i_pSource )
  {
    boost::lock_guard<boost::mutex> Lock( m_Mutex );
    return m_Sources.Insert( i_rURN, std::move( i_pSource ) );
  }
  // An empty pointer for an unknown URN.
  VSourcePtr Find( const std::string& i_rURN ) const
  {
    boost::lock_guard<boost::mutex> Lock( m_Mutex );
    const VSourcePtr* const pFound = m_Sources.Find( i_rURN );
    return pFound ? *pFound : nullptr;
  }
  std::vector<VSourcePtr> GetAll() const
  {
    std::vector<VSourcePtr> Sources;
    boost::lock_guard<boost::mutex> Lock( m_Mutex );
    for( const auto& rEntry : m_Sources )
    {
      Sources.push_back( rEntry.second );
    }
    return Sources;
  }
  // The caller has the sources still, so that none of them ends under the lock.
  void Clear()
  {
    boost::lock_guard<boost::mutex> Lock( m_Mutex );
    m_Sources.Clear();
  }

private:
  mutable boost::mutex m_Mutex;
  VDeviceUrnMap<VSourcePtr> m_Sources GUARDED_BY( m_Mutex );
};

}
