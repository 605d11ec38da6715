// The address of a value in the data store.
#pragma once

#include <atomic>
#include <compare>
#include <cstddef>
#include <cstdint>
#include <initializer_list>
#include <string>
#include <string_view>
#include <vector>

// Segments from the root down. A segment that is exactly "*" is a wildcard and stands for any one segment. Plain value.
class VDataPath
{
public:
  VDataPath();
  VDataPath( std::initializer_list<std::string_view> i_Segments );

  // Reads what ToString wrote, so no segment may hold a "."; empty segments are left out.
  static VDataPath FromString( std::string_view i_Text );

  VDataPath& Add( std::string_view i_Segment );
  VDataPath& Add( const VDataPath& i_rPath );
  VDataPath operator+( std::string_view i_Segment ) const { return VDataPath( *this ).Add( i_Segment ); }
  VDataPath operator+( const VDataPath& i_rPath ) const { return VDataPath( *this ).Add( i_rPath ); }

  const std::vector<std::string>& Segments() const { return m_Segments; }
  size_t Size() const { return m_Segments.size(); }
  bool IsEmpty() const { return m_Segments.empty(); }
  // The last segment; empty for the empty path.
  const std::string& Name() const;
  // All but the last segment.
  VDataPath Parent() const;

  bool IsWildcard() const { return m_bWildcard; }
  // True if the other path's segments are this one's first, compared as they stand. The empty path begins every path.
  bool BeginsWith( const VDataPath& i_rOther ) const;
  // Joined by "."; empty for the empty path.
  std::string ToString() const;

  bool operator==( const VDataPath& i_rOther ) const { return m_Segments == i_rOther.m_Segments; }
  auto operator<=>( const VDataPath& i_rOther ) const { return m_Segments <=> i_rOther.m_Segments; }

private:
  std::vector<std::string> m_Segments;
  bool m_bWildcard = false;
};

// Where a store has found a path: two words that the first store to see them fills in. Any thread, without a lock.
class VDataBinding
{
public:
  // Null unless this store has bound it. i_Store is above 1 and unique for the process.
  void* Find( uint64_t i_Store ) const;
  // Does nothing if a store has bound it already.
  void Bind( uint64_t i_Store, void* i_pNode );

private:
  std::atomic<uint64_t> m_Store{ 0 };
  std::atomic<void*> m_pNode{ nullptr };
};

// A path whose node a store remembers, for whoever uses the same path again and again. A copy begins unbound.
class VDataPathHandle
{
public:
  VDataPathHandle() = default;
  // A wildcard path gives the handle of the empty path.
  explicit VDataPathHandle( VDataPath i_Path );
  VDataPathHandle( const VDataPathHandle& i_rOther ) : m_Path( i_rOther.m_Path ) {}
  VDataPathHandle& operator=( const VDataPathHandle& ) = delete;

  const VDataPath& Path() const { return m_Path; }
  VDataBinding& Binding() const { return m_Binding; }

private:
  const VDataPath m_Path;
  mutable VDataBinding m_Binding;
};

// An argument that may be a path or a handle. Only for the length of a call: it refers to either.
class VDataAddress
{
public:
  VDataAddress( const VDataPath& i_rPath ) : m_rPath( i_rPath ) {}
  VDataAddress( const VDataPathHandle& i_rHandle ) : m_rPath( i_rHandle.Path() ), m_pBinding( &i_rHandle.Binding() ) {}

  const VDataPath& Path() const { return m_rPath; }
  // Null for a plain path.
  VDataBinding* Binding() const { return m_pBinding; }

private:
  const VDataPath& m_rPath;
  VDataBinding* const m_pBinding = nullptr;
};
