#include "StageCoreDataStore/DataStoreIntrospectionUtils.h"

#include "StageCoreRuntime/GlobalLog.h"

#include <algorithm>

namespace DataStoreIntrospectionUtils
{

using DataStorePersistence::VSource;
using DataStorePersistence::VTarget;
namespace Options = DataStorePersistence::Options;

namespace
{

// The values of an item that are there, as paths below its own
struct VValues
{
  std::vector<VDataPath> m_Paths;
  bool m_bComplete = true;
};

void Collect( const IDataReader& i_rReader, const VDataPath& i_rItem, const VDataPath& i_rBelow, const KVZ::ISchema& i_rSchema, VValues& o_rValues )
{
  for( const KVZ::ISchema::VField& rField : i_rSchema.Fields() )
  {
    const VDataPath Below = i_rBelow + rField.m_Name;
    if( i_rReader.GetSchema( i_rItem + Below ) == rField.m_pSchema )
    {
      o_rValues.m_Paths.push_back( Below );
    }
    else if( rField.m_pSchema->Type() == KVZ::ISchema::ERecord )
    {
      Collect( i_rReader, i_rItem, Below, *rField.m_pSchema, o_rValues );
    }
    else
    {
      o_rValues.m_bComplete = false;
    }
  }
}

VValues ValuesOf( const IDataReader& i_rReader, const VDataPath& i_rItem, const KVZ::ISchema& i_rSchema )
{
  VValues Values;
  Collect( i_rReader, i_rItem, VDataPath(), i_rSchema, Values );
  return Values;
}

}

bool CopyItem( const VSource& i_rSource, const VTarget& i_rTarget, const KVZ::ISchema& i_rSchema, uint32_t i_Options )
{
  const VValues Values = ValuesOf( i_rSource.m_rDataReader, i_rSource.m_rPath, i_rSchema );
  if( !Values.m_bComplete && ( i_Options & Options::CopyIncomplete ) == 0 )
  {
    KVZ_LOG_WARNING( "DataStore", "Not persisting incomplete item '%s'.", i_rSource.m_rPath.ToString() );
    return true;
  }
  if( ( i_Options & Options::SkipExisting ) != 0 && !ValuesOf( i_rTarget.m_rDataWriter, i_rTarget.m_rPath, i_rSchema ).m_Paths.empty() )
  {
    KVZ_LOG_DETAIL( "DataStore", "Skipping copy of already present item '%s'.", i_rTarget.m_rPath.ToString() );
    return true;
  }
  return std::all_of( Values.m_Paths.begin(), Values.m_Paths.end(),
    [&]( const VDataPath& i_rBelow )
    {
      const VDataPath From = i_rSource.m_rPath + i_rBelow;
      const VDataPath To = i_rTarget.m_rPath + i_rBelow;
      return DataStorePersistence::CopyValue( { i_rSource.m_rDataReader, From }, { i_rTarget.m_rDataWriter, To }, i_Options );
    } );
}

}
