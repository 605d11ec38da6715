// Reads from the data store under its shared lock.
#pragma once

#include "StageCoreDataStore/DataGuardOperations.h"

// What a reader offers. Absence is told by false or by an empty Variant, never by an exception. For the meaning of each operation see
// IDataStore.
class IDataReader
{
public:
  virtual ~IDataReader() = default;
  // Asserts that the guard has not been moved from.
  virtual const IDataStore* GetDataStore() const = 0;
  virtual bool GetChildNames( const VDataAddress& i_rAddress, std::vector<std::string>& o_rNames ) const = 0;
  virtual bool GetValuePaths( const VDataAddress& i_rAddress, std::vector<VDataPath>& o_rPaths ) const = 0;
  virtual bool GetMatches( const VDataAddress& i_rAddress, std::vector<VDataPath>& o_rPaths ) const = 0;
  virtual uint64_t GetChangeStamp( const VDataAddress& i_rAddress ) const = 0;
  virtual bool Exists( const VDataAddress& i_rAddress ) const = 0;
  // The form that counts.
  virtual bool GetValue( const VDataAddress& i_rAddress, KVZ::Variant& o_rValue ) const = 0;
  virtual KVZ::Variant GetValue( const VDataAddress& i_rAddress ) const = 0;
  virtual bool IsSettled( const VDataAddress& i_rAddress ) const = 0;
  virtual bool GetValueFlags( const VDataAddress& i_rAddress, uint32_t& o_rFlags ) const = 0;
  virtual const KVZ::ISchema* GetSchema( const VDataAddress& i_rAddress ) const = 0;
  virtual IDataNode* FindNode( const VDataAddress& i_rAddress ) const = 0;
  virtual size_t CountValues( const VDataAddress& i_rAddress ) const = 0;

protected:
  IDataReader() = default;
  IDataReader( IDataReader&& ) noexcept {}
};

// False, with the output left alone, where there is no value of this type.
template<class T>
bool GetTyped( const IDataReader& i_rReader, const VDataAddress& i_rAddress, T& o_rValue )
{
  return i_rReader.GetValue( i_rAddress ).Get( o_rValue );
}

class VDataReader final : public DataGuards::VReadGuard<DataGuards::VReadOperations<IDataReader>>
{
public:
  explicit VDataReader( IDataStore& i_rDataStore ) : VReadGuard( i_rDataStore ) {}
};
