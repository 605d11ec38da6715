// A writer of which single operations fail at will.
#pragma once

#include "StageCoreDataStore/DataVerifyWriter.h"

#include <set>
#include <string>

// "GetFlags", "GetVerified", "GetProposed", "SetFlags", "SetVerified", "SetProposed" or "Remove", and a path behind a blank.
using VFaults = std::set<std::string>;

using VWriterOperations = DataGuards::VVerifyWriteOperations<
  DataGuards::VWriteOperations<DataGuards::VVerifyReadOperations<DataGuards::VReadOperations<IDataVerifyWriter>>>>;

class VFaultyWriter : public DataGuards::VWriteGuard<VWriterOperations>
{
public:
  VFaultyWriter( IDataStore& i_rDataStore, const VFaults& i_rFaults ) : VWriteGuard( i_rDataStore ), m_rFaults( i_rFaults ) {}

  bool GetValueFlags( const VDataAddress& i_rAddress, uint32_t& o_rFlags ) const override
  {
    return Works( "GetFlags ", i_rAddress ) && VWriteGuard::GetValueFlags( i_rAddress, o_rFlags );
  }
  bool GetVerifiedValue( const VDataAddress& i_rAddress, KVZ::Variant& o_rValue ) const override
  {
    return Works( "GetVerified ", i_rAddress ) && VWriteGuard::GetVerifiedValue( i_rAddress, o_rValue );
  }
  bool GetProposedValue( const VDataAddress& i_rAddress, KVZ::Variant& o_rValue ) const override
  {
    return Works( "GetProposed ", i_rAddress ) && VWriteGuard::GetProposedValue( i_rAddress, o_rValue );
  }
  bool SetValueFlags( const VDataAddress& i_rAddress, uint32_t i_Flags ) override
  {
    return Works( "SetFlags ", i_rAddress ) && VWriteGuard::SetValueFlags( i_rAddress, i_Flags );
  }
  bool SetVerifiedValue( const VDataAddress& i_rAddress, const KVZ::Variant& i_rValue ) override
  {
    return Works( "SetVerified ", i_rAddress ) && VWriteGuard::SetVerifiedValue( i_rAddress, i_rValue );
  }
  bool SetProposedValue( const VDataAddress& i_rAddress, const KVZ::Variant& i_rValue ) override
  {
    return Works( "SetProposed ", i_rAddress ) && VWriteGuard::SetProposedValue( i_rAddress, i_rValue );
  }
  bool RemoveValue( const VDataAddress& i_rAddress ) override { return Works( "Remove ", i_rAddress ) && VWriteGuard::RemoveValue( i_rAddress ); }

private:
  bool Works( const std::string& i_rOperation, const VDataAddress& i_rAddress ) const
  {
    return m_rFaults.count( i_rOperation + i_rAddress.Path().ToString() ) == 0;
  }

  const VFaults& m_rFaults;
};
