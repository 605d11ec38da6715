// How writes move values between their forms, and which events they give rise to.
#include "StageCoreRuntime/DebugServices.h"
#include "host/DataStore.h"

#include <algorithm>

namespace StageHost
{

namespace
{

constexpr uint32_t RemoveFlagsToo = 1;

unsigned int Bit( EDataEvent i_Event ) { return 1u << static_cast<unsigned int>( i_Event ); }

bool IsConcrete( const VDataPath& i_rPath ) { return !i_rPath.IsEmpty() && !i_rPath.IsWildcard(); }

}

VDataStoreNode& VDataStore::Make( const VDataAddress& i_rAddress )
{
  if( VDataStoreNode* pFound = Find( i_rAddress ) )
  {
    return *pFound;
  }
  VDataStoreNode* pNode = &m_Root;
  for( const std::string& rSegment : i_rAddress.Path().Segments() )
  {
    pNode = &pNode->MakeChild( rSegment );
  }
  return *pNode;
}

bool VDataStore::MayWrite() { return KVZ_ASSERT( m_Lock.HeldByThisThread() == VDataStoreLock::EHeld::Exclusive ); }

IDataNode* VDataStore::GetNode( const VDataAddress& i_rAddress )
{
  if( !MayWrite() )
  {
    return nullptr;
  }
  VDataStoreNode& rNode = Make( i_rAddress );
  rNode.OfferEvents();
  return &rNode;
}

bool VDataStore::SetValue( const VDataAddress& i_rAddress, const KVZ::Variant& i_rValue, EDataForm i_Form )
{
  if( !MayWrite() || !IsConcrete( i_rAddress.Path() ) || i_rValue.IsEmpty() )
  {
    return false;
  }
  VDataStoreNode& rNode = Make( i_rAddress );
  if( !rNode.HasValue() )
  {
    Note( rNode, EDataEvent::Added );
  }
  if( i_Form == EDataForm::Verified )
  {
    Settle( rNode, i_rValue );
  }
  else
  {
    Propose( rNode, i_rValue, i_Form );
  }
  return true;
}

void VDataStore::Propose( VDataStoreNode& i_rNode, const KVZ::Variant& i_rValue, EDataForm i_Form )
{
  const bool bOwned = ( i_rNode.m_Flags & DataFlags::VerifyRequired ) != 0;
  const bool bWaits = bOwned && ( i_Form == EDataForm::Proposed || IsProposalHeard( i_rNode ) );
  const KVZ::Variant Former = i_rNode.Current();
  i_rNode.m_Proposed = i_rValue;
  if( !bOwned || i_Form == EDataForm::Both )
  {
    i_rNode.m_Verified = i_rValue;
  }
  i_rNode.m_bWaiting = bWaits;
  Note( i_rNode, EDataEvent::Proposed );
  if( !bWaits && i_rNode.Current() != Former )
  {
    Note( i_rNode, EDataEvent::Changed );
  }
}

void VDataStore::Settle( VDataStoreNode& i_rNode, const KVZ::Variant& i_rValue )
{
  const bool bChanged = i_rNode.m_bWaiting || i_rNode.Current() != i_rValue;
  i_rNode.m_Verified = i_rValue;
  i_rNode.m_bWaiting = false;
  if( bChanged )
  {
    Note( i_rNode, EDataEvent::Changed );
  }
}

bool VDataStore::RemoveValue( const VDataAddress& i_rAddress, uint32_t i_Options )
{
  VDataStoreNode* pNode = MayWrite() && IsConcrete( i_rAddress.Path() ) ? Find( i_rAddress ) : nullptr;
  if( !pNode )
  {
    return false;
  }
  const bool bFlags = ( i_Options & RemoveFlagsToo ) != 0 && SetFlags( *pNode, 0 );
  return Remove( *pNode ) || bFlags;
}

bool VDataStore::RemoveBranch( const VDataAddress& i_rAddress )
{
  VDataStoreNode* pTop = MayWrite() && !i_rAddress.Path().IsWildcard() ? Find( i_rAddress ) : nullptr;
  return pTop && RemoveBelow( *pTop );
}

bool VDataStore::RemoveBelow( VDataStoreNode& i_rNode )
{
  bool bRemoved = Remove( i_rNode );
  bRemoved = SetFlags( i_rNode, 0 ) || bRemoved;
  for( const auto& [Segment, pChild] : i_rNode.Children() )
  {
    bRemoved = RemoveBelow( *pChild ) || bRemoved;
  }
  return bRemoved;
}

bool VDataStore::Remove( VDataStoreNode& i_rNode )
{
  if( !i_rNode.HasValue() )
  {
    return false;
  }
  i_rNode.m_Proposed = {};
  i_rNode.m_Verified = {};
  i_rNode.m_bWaiting = false;
  Note( i_rNode, EDataEvent::Removed );
  Note( i_rNode, EDataEvent::Changed );
  return true;
}

bool VDataStore::DiscardProposal( const VDataAddress& i_rAddress )
{
  VDataStoreNode* pNode = MayWrite() ? Find( i_rAddress ) : nullptr;
  if( !pNode || !pNode->m_bWaiting || pNode->m_Verified.IsEmpty() )
  {
    return false;
  }
  pNode->m_Proposed = pNode->m_Verified;
  Settle( *pNode, pNode->m_Verified );
  return true;
}

bool VDataStore::SetValueFlags( const VDataAddress& i_rAddress, uint32_t i_Flags )
{
  if( !MayWrite() || !IsConcrete( i_rAddress.Path() ) )
  {
    return false;
  }
  SetFlags( Make( i_rAddress ), i_Flags );
  return true;
}

bool VDataStore::SetFlags( VDataStoreNode& i_rNode, uint32_t i_Flags )
{
  if( i_rNode.m_Flags == i_Flags )
  {
    return false;
  }
  i_rNode.m_Flags = i_Flags;
  Note( i_rNode, EDataEvent::Flags );
  if( i_rNode.m_bWaiting && ( i_Flags & DataFlags::VerifyRequired ) == 0 )
  {
    Settle( i_rNode, KVZ::Variant( i_rNode.m_Proposed ) );
  }
  return true;
}

void VDataStore::CollectPlaces( const VDataStoreNode& i_rNode, std::vector<VPlace>& o_rPlaces )
{
  const std::vector<std::string> Segments = i_rNode.Path().Segments();
  o_rPlaces.push_back( { &m_Root, Segments.empty() } );
  size_t Begin = 0;
  for( const std::string& rSegment : Segments )
  {
    const size_t End = o_rPlaces.size();
    const bool bLast = &rSegment == &Segments.back();
    for( ; Begin < End; ++Begin )
    {
      for( VDataStoreNode* pChild : { o_rPlaces[Begin].m_pNode->Child( rSegment ), o_rPlaces[Begin].m_pNode->Child( "*" ) } )
      {
        if( pChild )
        {
          o_rPlaces.push_back( { pChild, bLast } );
        }
      }
    }
  }
}

bool VDataStore::IsProposalHeard( const VDataStoreNode& i_rNode )
{
  std::vector<VPlace> Places;
  CollectPlaces( i_rNode, Places );
  return std::any_of( Places.begin(), Places.end(),
    []( const VPlace& i_rPlace ) { return i_rPlace.m_bItself && i_rPlace.m_pNode->IsHeard( EDataEvent::Proposed ); } );
}

void VDataStore::Note( VDataStoreNode& i_rNode, EDataEvent i_Event )
{
  std::vector<VPlace> Places;
  CollectPlaces( i_rNode, Places );
  ++m_Stamp;
  for( const VPlace& rPlace : Places )
  {
    rPlace.m_pNode->m_Stamp = m_Stamp;
    if( rPlace.m_bItself )
    {
      Queue( *rPlace.m_pNode, i_Event );
    }
    Queue( *rPlace.m_pNode, EDataEvent::Branch );
  }
}

void VDataStore::Queue( VDataStoreNode& i_rNode, EDataEvent i_Event )
{
  if( ( i_rNode.m_PendingEvents & Bit( i_Event ) ) == 0 && i_rNode.IsHeard( i_Event ) )
  {
    i_rNode.m_PendingEvents |= Bit( i_Event );
    m_Notices.emplace_back( &i_rNode, i_Event );
  }
}

}
