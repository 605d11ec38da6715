// The parameters of one thing in the data store, in the order in which they were added.
#pragma once

#include "StageCoreParameters/IParameter.h"
#include "StageCoreRuntime/ThreadAnnotations.h"

#include <boost/thread/mutex.hpp>

#include <functional>
#include <map>
#include <memory>
#include <string>
#include <string_view>
#include <vector>

// A parameter's key is its name, which no other parameter of the group has. Any thread. The order of the operations is binding.
class IParameterGroup
{
public:
  IParameterGroup() = default;
  IParameterGroup( const IParameterGroup& ) = delete;
  IParameterGroup& operator=( const IParameterGroup& ) = delete;

  virtual const VDataPath& GetPath() const = 0;
  virtual const VDataPath& GetAttributePath() const = 0;
  // The last segment of the path.
  virtual const std::string& GetName() const = 0;
  // Empty if there is none.
  virtual std::shared_ptr<IParameter> GetParameter( std::string_view i_Key ) const = 0;
  virtual std::shared_ptr<IParameter> GetParameter( const VDataPathHandle& i_rHandle ) const = 0;
  // Takes it out of the group and leaves its values alone. False if there is none.
  virtual bool RemoveParameter( std::string_view i_Key ) = 0;
  virtual bool RemoveParameter( const VDataPathHandle& i_rHandle ) = 0;
  // False, with the first one kept, for a key that is there already.
  virtual bool AddParameter( std::shared_ptr<IParameter> i_pParameter ) = 0;
  // In the order of addition.
  virtual std::vector<std::shared_ptr<IParameter>> GetParameters() const = 0;
  virtual ~IParameterGroup() = default;
};

class IDataStore;

class VParameterGroup : public IParameterGroup
{
public:
  VParameterGroup( std::shared_ptr<IDataStore> i_pDataStore, VDataPath i_Path, VDataPath i_AttributePath );

  const VDataPath& GetPath() const override { return m_Path; }
  const VDataPath& GetAttributePath() const override { return m_AttributePath; }
  const std::string& GetName() const override { return m_Path.Name(); }
  std::shared_ptr<IParameter> GetParameter( std::string_view i_Key ) const override;
  std::shared_ptr<IParameter> GetParameter( const VDataPathHandle& i_rHandle ) const override;
  bool RemoveParameter( std::string_view i_Key ) override;
  bool RemoveParameter( const VDataPathHandle& i_rHandle ) override;
  bool AddParameter( std::shared_ptr<IParameter> i_pParameter ) override;
  std::vector<std::shared_ptr<IParameter>> GetParameters() const override;

private:
  const std::shared_ptr<IDataStore> m_pDataStore;   // lives as long as its parameters may
  const VDataPath m_Path;
  const VDataPath m_AttributePath;
  mutable boost::mutex m_Mutex;
  std::map<std::string, std::shared_ptr<IParameter>, std::less<>> m_Parameters GUARDED_BY( m_Mutex );
  std::vector<std::string> m_Order GUARDED_BY( m_Mutex );
};
