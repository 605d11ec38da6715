// The one table behind an enumeration: it answers ToName and FromName, and the schemas are made from it.
#pragma once

#include <cstdint>
#include <span>
#include <string>

namespace KVZ
{

struct VEnumRow
{
  int32_t m_Value;
  const char* m_pName;
  const char* m_pDescription = "";
};

struct VEnumTable
{
  const char* m_pSchemaName;
  const char* m_pDescription;
  std::span<const VEnumRow> m_Rows;
};

// Empty for a value outside the table.
std::string FindName( const VEnumTable& i_rTable, int32_t i_Value );

// False, leaving the output alone, for a name outside the table.
bool FindValue( const VEnumTable& i_rTable, const std::string& i_rName, int32_t& o_rValue );

template<class TEnum>
bool FindEnumerator( const VEnumTable& i_rTable, const std::string& i_rName, TEnum& o_rValue )
{
  int32_t Value = 0;
  if( !FindValue( i_rTable, i_rName, Value ) )
  {
    return false;
  }
  o_rValue = static_cast<TEnum>( Value );
  return true;
}

// For messages: the name of any enumerator of this folder, or "Unspecified" for a value without one.
template<class TEnum>
std::string NameOrUnspecified( TEnum i_Value )
{
  const std::string Name = ToName( i_Value );
  return Name.empty() ? "Unspecified" : Name;
}

}
