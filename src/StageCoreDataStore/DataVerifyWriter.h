// Reads and writes the data store under its exclusive lock, either form of a value by itself.
#pragma once

#include "StageCoreDataStore/DataVerifyReader.h"
#include "StageCoreDataStore/DataWriter.h"

class IDataVerifyWriter : public IDataVerifyReader, public IDataWriter
{
public:
  bool GetProposedValue( const VDataAddress& i_rAddress, KVZ::Variant& o_rValue ) const override = 0;
  bool GetVerifiedValue( const VDataAddress& i_rAddress, KVZ::Variant& o_rValue ) const override = 0;
  virtual bool SetProposedValue( const VDataAddress& i_rAddress, const KVZ::Variant& i_rValue ) = 0;
  virtual bool SetVerifiedValue( const VDataAddress& i_rAddress, const KVZ::Variant& i_rValue ) = 0;
};

// As VDataWriter.
class VDataVerifyWriter final : public DataGuards::VWriteGuard<DataGuards::VVerifyWriteOperations<
                                  DataGuards::VWriteOperations<DataGuards::VVerifyReadOperations<DataGuards::VReadOperations<IDataVerifyWriter>>>>>
{
public:
  explicit VDataVerifyWriter( IDataStore& i_rDataStore ) : VWriteGuard( i_rDataStore ) {}
};
