#include "StageCoreDataStoreTypes/DataPath.h"

#include <algorithm>

namespace
{

constexpr size_t UsualDepth = 10;
constexpr std::string_view Wildcard = "*";
constexpr char Separator = '.';

// A store that is about to fill in the node.
constexpr uint64_t Claimed = 1;

}

VDataPath::VDataPath() { m_Segments.reserve( UsualDepth ); }

VDataPath::VDataPath( std::initializer_list<std::string_view> i_Segments ) : VDataPath()
{
  for( const std::string_view Segment : i_Segments )
  {
    Add( Segment );
  }
}

VDataPath VDataPath::FromString( std::string_view i_Text )
{
  VDataPath Path;
  while( !i_Text.empty() )
  {
    const size_t End = std::min( i_Text.find( Separator ), i_Text.size() );
    if( End > 0 )
    {
      Path.Add( i_Text.substr( 0, End ) );
    }
    i_Text.remove_prefix( std::min( End + 1, i_Text.size() ) );
  }
  return Path;
}

VDataPath& VDataPath::Add( std::string_view i_Segment )
{
  m_Segments.emplace_back( i_Segment );
  m_bWildcard = m_bWildcard || i_Segment == Wildcard;
  return *this;
}

VDataPath& VDataPath::Add( const VDataPath& i_rPath )
{
  const size_t Count = i_rPath.m_Segments.size();   // the path may be this one
  for( size_t Index = 0; Index < Count; ++Index )
  {
    m_Segments.push_back( std::string( i_rPath.m_Segments[Index] ) );
  }
  m_bWildcard = m_bWildcard || i_rPath.m_bWildcard;
  return *this;
}

const std::string& VDataPath::Name() const
{
  static const std::string s_None;
  return m_Segments.empty() ? s_None : m_Segments.back();
}

VDataPath VDataPath::Parent() const
{
  VDataPath Path;
  for( size_t Index = 0; Index + 1 < m_Segments.size(); ++Index )
  {
    Path.Add( m_Segments[Index] );
  }
  return Path;
}

bool VDataPath::BeginsWith( const VDataPath& i_rOther ) const
{
  return i_rOther.Size() <= Size() && std::equal( i_rOther.m_Segments.begin(), i_rOther.m_Segments.end(), m_Segments.begin() );
}

std::string VDataPath::ToString() const
{
  std::string Text;
  for( const std::string& rSegment : m_Segments )
  {
    if( &rSegment != &m_Segments.front() )
    {
      Text += Separator;
    }
    Text += rSegment;
  }
  return Text;
}

void* VDataBinding::Find( uint64_t i_Store ) const
{
  return m_Store.load( std::memory_order_acquire ) == i_Store ? m_pNode.load( std::memory_order_relaxed ) : nullptr;
}

void VDataBinding::Bind( uint64_t i_Store, void* i_pNode )
{
  uint64_t Unbound = 0;
  if( m_Store.compare_exchange_strong( Unbound, Claimed, std::memory_order_relaxed ) )
  {
    m_pNode.store( i_pNode, std::memory_order_relaxed );
    m_Store.store( i_Store, std::memory_order_release );
  }
}

VDataPathHandle::VDataPathHandle( VDataPath i_Path ) : m_Path( i_Path.IsWildcard() ? VDataPath() : std::move( i_Path ) ) {}
