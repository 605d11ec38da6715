// Reads and writes the data store under its exclusive lock.
#pragma once

#include "StageCoreDataStore/DataReader.h"

class IDataWriter : public virtual IDataReader
{
public:
  using IDataReader::GetDataStore;
  // Asserts that the guard has not been moved from.
  virtual IDataStore* GetDataStore() = 0;
  // The place of a path, made if it is missing; null from a guard without a store.
  virtual IDataNode* GetNode( const VDataPathHandle& i_rHandle ) = 0;
  virtual IDataNode* GetNode( const VDataPath& i_rPath ) = 0;
  // Both forms.
  virtual bool SetValue( const VDataAddress& i_rAddress, const KVZ::Variant& i_rValue ) = 0;
  // The flags stay.
  virtual bool RemoveValue( const VDataAddress& i_rAddress ) = 0;
  virtual bool RemoveBranch( const VDataAddress& i_rAddress ) = 0;
  virtual bool DiscardProposal( const VDataAddress& i_rAddress ) = 0;
  virtual bool SetValueFlags( const VDataAddress& i_rAddress, uint32_t i_Flags ) = 0;
};

// A thread that holds a reader may not construct one: that is an assertion, and the guard then stores nothing.
class VDataWriter final : public DataGuards::VWriteGuard<DataGuards::VWriteOperations<DataGuards::VReadOperations<IDataWriter>>>
{
public:
  explicit VDataWriter( IDataStore& i_rDataStore ) : VWriteGuard( i_rDataStore ) {}
};
