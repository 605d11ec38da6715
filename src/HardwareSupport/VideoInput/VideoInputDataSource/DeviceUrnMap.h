// A map from device URN to something a device has, in the order of arrival. A second entry under one URN does not replace the first.
//
// No lock.
#pragma once

#include <cstddef>
#include <cstdint>
#include <list>
#include <string>
#include <unordered_map>
#include <utility>

namespace VideoInputHAL
{

// 64-bit FNV-1a over the bytes.
struct VDeviceUrnHash
{
  size_t operator()( const std::string& i_rURN ) const
  {
    uint64_t Hash = 0xCBF29CE484222325u;
    for( const char Byte : i_rURN )
    {
      Hash = ( Hash ^ static_cast<uint8_t>( Byte ) ) * 0x100000001B3u;
    }
    return Hash;
  }
};

template<class T>
class VDeviceUrnMap
{
public:
  using VEntry = std::pair<const std::string, T>;
  using const_iterator = typename std::list<VEntry>::const_iterator;

  VDeviceUrnMap() { m_Index.max_load_factor( 1.0f ); }

  // False, and nothing changes, where the URN is there already.
  bool Insert( const std::string& i_rURN, T i_Value )
  {
    if( m_Index.count( i_rURN ) != 0 )
    {
      return false;
    }
    m_Entries.emplace_back( i_rURN, std::move( i_Value ) );
    m_Index.emplace( i_rURN, std::prev( m_Entries.end() ) );
    return true;
  }

  // A null pointer for an unknown URN.
  const T* Find( const std::string& i_rURN ) const
  {
    const auto Found = m_Index.find( i_rURN );
    return Found == m_Index.end() ? nullptr : &Found->second->second;
  }

  void Clear()
  {
    m_Index.clear();
    m_Entries.clear();
  }

  size_t Size() const { return m_Entries.size(); }
  const_iterator begin() const { return m_Entries.begin(); }
  const_iterator end() const { return m_Entries.end(); }

private:
  std::list<VEntry> m_Entries;
  std::unordered_map<std::string, const_iterator, VDeviceUrnHash> m_Index{ 8 };
};

}
