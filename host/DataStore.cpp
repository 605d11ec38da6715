#include "host/DataStore.h"

#include "StageCoreRuntime/DebugServices.h"

#include <algorithm>
#include <atomic>

namespace StageHost
{

namespace
{

// Above the two words by which a binding says that no store has bound it.
std::atomic<uint64_t> s_NextStoreId{ 2 };

// Calls the function with each concrete node that the path, from this segment on, stands for.
template<class TFunction>
void ForEachMatch( VDataStoreNode& i_rNode, const std::vector<std::string>& i_rSegments, size_t i_Index, const TFunction& i_rFunction )
{
  if( i_Index == i_rSegments.size() )
  {
    i_rFunction( i_rNode );
    return;
  }
  for( const auto& [Segment, pChild] : i_rNode.Children() )
  {
    if( !pChild->IsWildcard() && ( i_rSegments[i_Index] == "*" || i_rSegments[i_Index] == Segment ) )
    {
      ForEachMatch( *pChild, i_rSegments, i_Index + 1, i_rFunction );
    }
  }
}

// Calls the function with the node and each concrete node below it.
template<class TFunction>
void ForEachInBranch( VDataStoreNode& i_rNode, const TFunction& i_rFunction )
{
  i_rFunction( i_rNode );
  for( const auto& [Segment, pChild] : i_rNode.Children() )
  {
    if( !pChild->IsWildcard() )
    {
      ForEachInBranch( *pChild, i_rFunction );
    }
  }
}

// Adds the paths of the nodes that have a value.
auto PathCollector( std::vector<VDataPath>& o_rPaths )
{
  return [&o_rPaths]( const VDataStoreNode& i_rNode )
  {
    if( i_rNode.HasValue() )
    {
      o_rPaths.push_back( i_rNode.Path() );
    }
  };
}

bool HoldsAnything( const VDataStoreNode& i_rNode )
{
  const auto HoldsChild = []( const auto& i_rChild ) { return !i_rChild.second->IsWildcard() && HoldsAnything( *i_rChild.second ); };
  return i_rNode.HasValue() || i_rNode.m_Flags != 0 || std::any_of( i_rNode.Children().begin(), i_rNode.Children().end(), HoldsChild );
}

}

VDataStore::VDataStore() : m_Id( s_NextStoreId++ ), m_Root( nullptr, "" ) {}

void VDataStore::AcquireReadLock( uint32_t& o_rState ) { o_rState = static_cast<uint32_t>( m_Lock.AcquireShared() ); }

void VDataStore::Release()
{
  std::vector<VNotice> Notices;
  const auto TakeNotices = [this, &Notices]
  {
    Notices.swap( m_Notices );
    for( const auto& [pNode, Event] : Notices )
    {
      pNode->m_PendingEvents = 0;
    }
  };
  KVZ_ASSERT( m_Lock.Release( TakeNotices ) != VDataStoreLock::EHeld::None );
  for( const auto& [pNode, Event] : Notices )
  {
    pNode->Fire( Event );
  }
}

VDataStoreNode* VDataStore::Find( const VDataAddress& i_rAddress )
{
  if( i_rAddress.Binding() )
  {
    if( void* pBound = i_rAddress.Binding()->Find( m_Id ) )
    {
      return static_cast<VDataStoreNode*>( pBound );
    }
  }
  VDataStoreNode* pNode = &m_Root;
  for( const std::string& rSegment : i_rAddress.Path().Segments() )
  {
    pNode = pNode->Child( rSegment );
    if( !pNode )
    {
      return nullptr;
    }
  }
  if( i_rAddress.Binding() )
  {
    i_rAddress.Binding()->Bind( m_Id, pNode );
  }
  return pNode;
}

bool VDataStore::GetChildNames( const VDataAddress& i_rAddress, std::vector<std::string>& o_rNames )
{
  o_rNames.clear();
  const VDataStoreNode* pNode = Find( i_rAddress );
  if( !pNode )
  {
    return false;
  }
  for( const auto& [Segment, pChild] : pNode->Children() )
  {
    if( !pChild->IsWildcard() && HoldsAnything( *pChild ) )
    {
      o_rNames.push_back( Segment );
    }
  }
  return !o_rNames.empty();
}

bool VDataStore::GetValuePaths( const VDataAddress& i_rAddress, std::vector<VDataPath>& o_rPaths )
{
  o_rPaths.clear();
  ForEachMatch( m_Root, i_rAddress.Path().Segments(), 0,
    [&o_rPaths]( VDataStoreNode& i_rNode ) { ForEachInBranch( i_rNode, PathCollector( o_rPaths ) ); } );
  return !o_rPaths.empty();
}

bool VDataStore::GetMatches( const VDataAddress& i_rAddress, std::vector<VDataPath>& o_rPaths )
{
  o_rPaths.clear();
  ForEachMatch( m_Root, i_rAddress.Path().Segments(), 0, PathCollector( o_rPaths ) );
  return !o_rPaths.empty();
}

uint64_t VDataStore::GetChangeStamp( const VDataAddress& i_rAddress )
{
  const VDataStoreNode* pNode = Find( i_rAddress );
  return pNode ? pNode->m_Stamp : 0;
}

bool VDataStore::Exists( const VDataAddress& i_rAddress )
{
  const VDataStoreNode* pNode = Find( i_rAddress );
  return pNode && pNode->HasValue();
}

bool VDataStore::GetValue( const VDataAddress& i_rAddress, KVZ::Variant& o_rValue, EDataForm i_Form )
{
  const VDataStoreNode* pNode = Find( i_rAddress );
  if( !pNode )
  {
    return false;
  }
  const KVZ::Variant& rCounting = pNode->Current();
  const KVZ::Variant& rValue = i_Form == EDataForm::Proposed ? pNode->m_Proposed : i_Form == EDataForm::Verified ? pNode->m_Verified : rCounting;
  if( rValue.IsEmpty() )
  {
    return false;
  }
  o_rValue = rValue;
  return true;
}

bool VDataStore::IsSettled( const VDataAddress& i_rAddress )
{
  const VDataStoreNode* pNode = Find( i_rAddress );
  return pNode && pNode->HasValue() && !pNode->m_bWaiting;
}

bool VDataStore::GetValueFlags( const VDataAddress& i_rAddress, uint32_t& o_rFlags )
{
  const VDataStoreNode* pNode = Find( i_rAddress );
  if( !pNode || ( !pNode->HasValue() && pNode->m_Flags == 0 ) )
  {
    return false;
  }
  o_rFlags = pNode->m_Flags;
  return true;
}

void VDataStore::GetSchema( const VDataAddress& i_rAddress, const KVZ::ISchema*& o_rpSchema )
{
  const VDataStoreNode* pNode = Find( i_rAddress );
  o_rpSchema = pNode ? pNode->Current().Schema() : nullptr;
}

void VDataStore::FindNode( const VDataAddress& i_rAddress, IDataNode*& o_rpNode )
{
  VDataStoreNode* pNode = Find( i_rAddress );
  o_rpNode = pNode && pNode->HasEvents() ? pNode : nullptr;
}

size_t VDataStore::CountValues( const VDataAddress& i_rAddress )
{
  size_t Count = 0;
  const auto CountOne = [&Count]( const VDataStoreNode& i_rNode ) { Count += i_rNode.HasValue() ? 1 : 0; };
  ForEachMatch( m_Root, i_rAddress.Path().Segments(), 0, [&CountOne]( VDataStoreNode& i_rNode ) { ForEachInBranch( i_rNode, CountOne ); } );
  return Count;
}

}
