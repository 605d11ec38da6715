// A store of which single operations fail at will.
#pragma once

#include "host/DataStore.h"

#include <set>
#include <string>

class VFaultyStore : public IDataStore
{
public:
  // "GetFlags", "GetVerified", "GetProposed", "SetFlags", "SetVerified", "SetProposed" or "Remove", and a path behind a blank.
  std::set<std::string> m_Faults;

  void AcquireReadLock( uint32_t& o_rState ) override { m_Store.AcquireReadLock( o_rState ); }
  void ReleaseReadLock() override { m_Store.ReleaseReadLock(); }
  bool AcquireWriteLock() override { return m_Store.AcquireWriteLock(); }
  void ReleaseWriteLock() override { m_Store.ReleaseWriteLock(); }
  IDataNode* GetNode( const VDataAddress& i_rAddress ) override { return m_Store.GetNode( i_rAddress ); }
  bool GetChildNames( const VDataAddress& i_rAddress, std::vector<std::string>& o_rNames ) override
  {
    return m_Store.GetChildNames( i_rAddress, o_rNames );
  }
  bool GetValuePaths( const VDataAddress& i_rAddress, std::vector<VDataPath>& o_rPaths ) override
  {
    return m_Store.GetValuePaths( i_rAddress, o_rPaths );
  }
  bool GetMatches( const VDataAddress& i_rAddress, std::vector<VDataPath>& o_rPaths ) override { return m_Store.GetMatches( i_rAddress, o_rPaths ); }
  uint64_t GetChangeStamp( const VDataAddress& i_rAddress ) override { return m_Store.GetChangeStamp( i_rAddress ); }
  bool Exists( const VDataAddress& i_rAddress ) override { return m_Store.Exists( i_rAddress ); }
  bool GetValue( const VDataAddress& i_rAddress, KVZ::Variant& o_rValue, EDataForm i_Form ) override
  {
    return Works( i_Form == EDataForm::Verified ? "GetVerified" : "GetProposed", i_rAddress ) && m_Store.GetValue( i_rAddress, o_rValue, i_Form );
  }
  bool IsSettled( const VDataAddress& i_rAddress ) override { return m_Store.IsSettled( i_rAddress ); }
  bool GetValueFlags( const VDataAddress& i_rAddress, uint32_t& o_rFlags ) override
  {
    return Works( "GetFlags", i_rAddress ) && m_Store.GetValueFlags( i_rAddress, o_rFlags );
  }
  void GetSchema( const VDataAddress& i_rAddress, const KVZ::ISchema*& o_rpSchema ) override { m_Store.GetSchema( i_rAddress, o_rpSchema ); }
  void FindNode( const VDataAddress& i_rAddress, IDataNode*& o_rpNode ) override { m_Store.FindNode( i_rAddress, o_rpNode ); }
  size_t CountValues( const VDataAddress& i_rAddress ) override { return m_Store.CountValues( i_rAddress ); }
  bool SetValue( const VDataAddress& i_rAddress, const KVZ::Variant& i_rValue, EDataForm i_Form ) override
  {
    return Works( i_Form == EDataForm::Verified ? "SetVerified" : "SetProposed", i_rAddress ) && m_Store.SetValue( i_rAddress, i_rValue, i_Form );
  }
  bool RemoveValue( const VDataAddress& i_rAddress, uint32_t i_Options ) override
  {
    return Works( "Remove", i_rAddress ) && m_Store.RemoveValue( i_rAddress, i_Options );
  }
  bool RemoveBranch( const VDataAddress& i_rAddress ) override { return m_Store.RemoveBranch( i_rAddress ); }
  bool DiscardProposal( const VDataAddress& i_rAddress ) override { return m_Store.DiscardProposal( i_rAddress ); }
  bool SetValueFlags( const VDataAddress& i_rAddress, uint32_t i_Flags ) override
  {
    return Works( "SetFlags", i_rAddress ) && m_Store.SetValueFlags( i_rAddress, i_Flags );
  }

private:
  bool Works( const char* i_pOperation, const VDataAddress& i_rAddress ) const
  {
    return m_Faults.count( std::string( i_pOperation ) + " " + i_rAddress.Path().ToString() ) == 0;
  }

  StageHost::VDataStore m_Store;
};
