// The parameters of a flow node by name. A node derives its own set, declares its values as members and adds a parameter for each:
//
//   struct VParameters : Flow2Utils::VParameterSet
//   {
//     VParameters() { AddParameter( "DeviceURN", &m_DeviceURN, { .m_Description = "...", .m_bRequired = true } ); }
//     std::string m_DeviceURN;
//   };
//
// Nothing is rolled back: what was applied before a failure stays. Used on the node's thread alone, without a lock.
#pragma once

#include "Flow2/Flow2Utils/Parameter.h"

#include <map>
#include <memory>
#include <string>

namespace Flow2Utils
{

struct EParameterFlags
{
  enum Enum : uint32_t
  {
    UnknownIsError = 1,
    BeginUpdate = 2,
    EndUpdate = 4
  };
};

class VParameterSet
{
public:
  VParameterSet() = default;
  VParameterSet( const VParameterSet& ) = delete;
  VParameterSet& operator=( const VParameterSet& ) = delete;
  virtual ~VParameterSet();

  // The attributes of all parameters by their names.
  virtual std::map<std::string, VParameterAttributes> Describe() const;

  // The member outlives the set's use. A name that is there already keeps its parameter. VFlowException for a null pointer.
  template<class T>
  void AddParameter( const std::string& i_rName, T* i_pMember, VParameterOptions<T> i_Options = {} )
  {
    Insert( i_rName, i_pMember ? std::make_unique<VParameterTyped<T>>( i_pMember, std::move( i_Options ) ) : nullptr );
  }

  // EParameterResult: UnknownName, or the parameter's answer.
  uint32_t SetParameter( const std::string& i_rName, const std::string& i_rText );
  // A null pointer for an unknown name.
  const VParameter* Find( const std::string& i_rName ) const;
  void SetTarget( const KVZ::VFlowTarget& i_rTarget );
  // What is addressed so is meant for parameters of this set.
  bool IsAddressed( const KVZ::VFlowTarget& i_rTarget ) const;

  void BeginUpdate();
  // Parameters that the update did not name go back to their defaults. Changed, or Unchanged where the change count did not move.
  uint32_t EndUpdate();
  // Since the update's beginning.
  bool HasChanged() const { return m_ChangeCount != m_CountAtStart; }
  // False with a line for each parameter that is not valid.
  bool Validate( std::string& o_rText ) const;

private:
  void Insert( const std::string& i_rName, std::unique_ptr<VParameter> i_pParameter );

  std::map<std::string, std::unique_ptr<VParameter>> m_Parameters;
  uint64_t m_ChangeCount = 0;
  uint64_t m_CountAtStart = 0;
};

}
