// The stand-alone host's settings: a tree in memory.
#pragma once

#include "StageCoreDataStore/IDataStore.h"
#include "host/DataStoreLock.h"
#include "host/DataStoreNode.h"

#include <utility>
#include <vector>

namespace StageHost
{

// See IDataStore for what the operations promise. Any thread, through the guards.
class VDataStore final : public IDataStore
{
public:
  VDataStore();

  void AcquireReadLock( uint32_t& o_rState ) override;
  void ReleaseReadLock() override { Release(); }
  bool AcquireWriteLock() override { return m_Lock.AcquireExclusive(); }
  void ReleaseWriteLock() override { Release(); }

  IDataNode* GetNode( const VDataAddress& i_rAddress ) override;
  bool GetChildNames( const VDataAddress& i_rAddress, std::vector<std::string>& o_rNames ) override;
  bool GetValuePaths( const VDataAddress& i_rAddress, std::vector<VDataPath>& o_rPaths ) override;
  bool GetMatches( const VDataAddress& i_rAddress, std::vector<VDataPath>& o_rPaths ) override;
  uint64_t GetChangeStamp( const VDataAddress& i_rAddress ) override;
  bool Exists( const VDataAddress& i_rAddress ) override;
  bool GetValue( const VDataAddress& i_rAddress, KVZ::Variant& o_rValue, EDataForm i_Form ) override;
  bool IsSettled( const VDataAddress& i_rAddress ) override;
  bool GetValueFlags( const VDataAddress& i_rAddress, uint32_t& o_rFlags ) override;
  void GetSchema( const VDataAddress& i_rAddress, const KVZ::ISchema*& o_rpSchema ) override;
  void FindNode( const VDataAddress& i_rAddress, IDataNode*& o_rpNode ) override;
  size_t CountValues( const VDataAddress& i_rAddress ) override;
  bool SetValue( const VDataAddress& i_rAddress, const KVZ::Variant& i_rValue, EDataForm i_Form ) override;
  bool RemoveValue( const VDataAddress& i_rAddress, uint32_t i_Options ) override;
  bool RemoveBranch( const VDataAddress& i_rAddress ) override;
  bool DiscardProposal( const VDataAddress& i_rAddress ) override;
  bool SetValueFlags( const VDataAddress& i_rAddress, uint32_t i_Flags ) override;

private:
  using VNotice = std::pair<VDataStoreNode*, EDataEvent>;

  // A place whose subscribers hear of what happens at a node
  struct VPlace
  {
    VDataStoreNode* m_pNode;
    bool m_bItself;   // it is the node, or stands for it; otherwise it lies above it
  };

  // Null where there is no such place. For a wildcard path the wildcard's own place, which never holds a value.
  VDataStoreNode* Find( const VDataAddress& i_rAddress );
  void Release();

  // Under the write lock from here on
  bool MayWrite();
  VDataStoreNode& Make( const VDataAddress& i_rAddress );
  void Propose( VDataStoreNode& i_rNode, const KVZ::Variant& i_rValue, EDataForm i_Form );
  void Settle( VDataStoreNode& i_rNode, const KVZ::Variant& i_rValue );
  bool Remove( VDataStoreNode& i_rNode );
  bool RemoveBelow( VDataStoreNode& i_rNode );
  bool SetFlags( VDataStoreNode& i_rNode, uint32_t i_Flags );
  void CollectPlaces( const VDataStoreNode& i_rNode, std::vector<VPlace>& o_rPlaces );
  bool IsProposalHeard( const VDataStoreNode& i_rNode );
  void Note( VDataStoreNode& i_rNode, EDataEvent i_Event );
  void Queue( VDataStoreNode& i_rNode, EDataEvent i_Event );

  const uint64_t m_Id;   // for bindings
  VDataStoreLock m_Lock;
  // Under m_Lock
  VDataStoreNode m_Root;
  uint64_t m_Stamp = 0;
  std::vector<VNotice> m_Notices;   // in order of their first happening under the write lock in force
};

}
