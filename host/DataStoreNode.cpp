#include "host/DataStoreNode.h"

#include "StageCoreRuntime/GlobalLog.h"

#include <vector>

namespace StageHost
{

VDataStoreNode::VDataStoreNode( VDataStoreNode* i_pParent, std::string_view i_Segment )
  : m_pParent( i_pParent ), m_Segment( i_Segment ), m_bWildcard( i_Segment == "*" )
{
}

VDataStoreNode* VDataStoreNode::Child( std::string_view i_Segment ) const
{
  const auto Found = m_Children.find( i_Segment );
  return Found == m_Children.end() ? nullptr : Found->second.get();
}

VDataStoreNode& VDataStoreNode::MakeChild( std::string_view i_Segment )
{
  std::unique_ptr<VDataStoreNode>& rpChild = m_Children[std::string( i_Segment )];
  if( !rpChild )
  {
    rpChild = std::make_unique<VDataStoreNode>( this, i_Segment );
  }
  return *rpChild;
}

VDataPath VDataStoreNode::Path() const
{
  std::vector<const VDataStoreNode*> Line;
  for( const VDataStoreNode* pNode = this; pNode->m_pParent; pNode = pNode->m_pParent )
  {
    Line.push_back( pNode );
  }
  VDataPath Path;
  for( auto Node = Line.rbegin(); Node != Line.rend(); ++Node )
  {
    Path.Add( ( *Node )->m_Segment );
  }
  return Path;
}

void VDataStoreNode::OfferEvents()
{
  if( !m_pEvents )
  {
    m_pEvents = std::make_unique<std::array<VEventImpl, DataEventCount>>();
  }
}

bool VDataStoreNode::IsHeard( EDataEvent i_Event ) const { return m_pEvents && Event( i_Event ).Count() > 0; }

void VDataStoreNode::Fire( EDataEvent i_Event )
{
  try
  {
    Event( i_Event )();
  }
  catch( const std::exception& rException )
  {
    KVZ_LOG_ERROR( "DataStore", "A subscriber to \"%1%\" failed: %2%", Path().ToString(), rException.what() );
  }
}

}
