#include "Core/VideoInterface/EnumTable.h"

namespace KVZ
{

std::string FindName( const VEnumTable& i_rTable, int32_t i_Value )
{
  for( const VEnumRow& rRow : i_rTable.m_Rows )
  {
    if( rRow.m_Value == i_Value )
    {
      return rRow.m_pName;
    }
  }
  return {};
}

bool FindValue( const VEnumTable& i_rTable, const std::string& i_rName, int32_t& o_rValue )
{
  for( const VEnumRow& rRow : i_rTable.m_Rows )
  {
    if( i_rName == rRow.m_pName )
    {
      o_rValue = rRow.m_Value;
      return true;
    }
  }
  return false;
}

}
