// Values that were saved by a person's hand or by an earlier version may be none that their settings take.
#pragma once

#include "StageCoreDataStoreTypes/DataPath.h"
#include "StageCoreRuntime/ThreadAnnotations.h"
#include "StageCoreRuntime/Variant.h"

#include <boost/thread/mutex.hpp>

#include <map>
#include <memory>
#include <utility>

class IDataStore;
class IParameter;
class IParameterGroup;

namespace StageHost
{

// Any thread may call.
class VRestoredSettings
{
public:
  explicit VRestoredSettings( std::shared_ptr<IDataStore> i_pDataStore ) : m_pDataStore( std::move( i_pDataStore ) ) {}

  // What is in the store now was brought back, and no device has looked at it.
  void TakeAll();

  // Once for each value that was brought back: where a setting of the group would refuse it from its user, its default takes its place, with a line
  // in the log. Read-only settings are their device's own affair. So are enumerations outside the list of the moment: a signal may come back.
  void Check( const IParameterGroup& i_rGroup );

private:
  // An empty value where nothing, or nothing unchecked, was brought back.
  KVZ::Variant TakeRestored( const VDataPath& i_rPath );
  void CheckSetting( IParameter& io_rParameter, const KVZ::Variant& i_rRestored );

  const std::shared_ptr<IDataStore> m_pDataStore;
  boost::mutex m_Mutex;
  std::map<VDataPath, KVZ::Variant> m_Unchecked GUARDED_BY( m_Mutex );
};

}
