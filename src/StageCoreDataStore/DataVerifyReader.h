// Reads from the data store under its shared lock, either form of a value by itself.
#pragma once

#include "StageCoreDataStore/DataReader.h"

class IDataVerifyReader : public virtual IDataReader
{
public:
  virtual bool GetProposedValue( const VDataAddress& i_rAddress, KVZ::Variant& o_rValue ) const = 0;
  virtual bool GetVerifiedValue( const VDataAddress& i_rAddress, KVZ::Variant& o_rValue ) const = 0;
};

class VDataVerifyReader final : public DataGuards::VReadGuard<DataGuards::VVerifyReadOperations<DataGuards::VReadOperations<IDataVerifyReader>>>
{
public:
  explicit VDataVerifyReader( IDataStore& i_rDataStore ) : VReadGuard( i_rDataStore ) {}
};
