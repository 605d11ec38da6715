#include "StageCoreDataStore/DataStorePersistence.h"

#include "StageCoreRuntime/GlobalLog.h"

namespace DataStorePersistence
{

namespace
{

bool HasFlag( const IDataReader& i_rReader, const VDataPath& i_rPath, uint32_t i_Flag )
{
  uint32_t Flags = 0;
  return i_rReader.GetValueFlags( i_rPath, Flags ) && ( Flags & i_Flag ) != 0;
}

bool IsLeftOut( const VSource& i_rSource, const VTarget& i_rTarget, uint32_t i_Options )
{
  if( ( i_Options & Options::SkipExisting ) != 0 && i_rTarget.m_rDataWriter.Exists( i_rTarget.m_rPath ) )
  {
    KVZ_LOG_DETAIL( "DataStore", "Skipping value '%s' that already exists in i_rDataWriter.", i_rTarget.m_rPath.ToString() );
    return true;
  }
  if( ( i_Options & Options::SkipReadOnly ) != 0 && HasFlag( i_rSource.m_rDataReader, i_rSource.m_rPath, DataFlags::ReadOnly ) )
  {
    KVZ_LOG_DETAIL( "DataStore", "Skipping read only value '%s'.", i_rSource.m_rPath.ToString() );
    return true;
  }
  if( ( i_Options & Options::SkipNotSerialized ) != 0 && HasFlag( i_rSource.m_rDataReader, i_rSource.m_rPath, DataFlags::NotSerialized ) )
  {
    KVZ_LOG_DETAIL( "DataStore", "Skipping not serialized value '%s'.", i_rSource.m_rPath.ToString() );
    return true;
  }
  return false;
}

// A value with both its forms
struct VForms
{
  uint32_t m_Flags = 0;
  KVZ::Variant m_Verified;
  KVZ::Variant m_Proposed;   // with VerifyRequired

  bool IsVerifyRequired() const { return ( m_Flags & DataFlags::VerifyRequired ) != 0; }
};

bool ReadForms( const VSource& i_rSource, VForms& o_rForms )
{
  const std::string Path = i_rSource.m_rPath.ToString();
  if( !i_rSource.m_rDataReader.GetValueFlags( i_rSource.m_rPath, o_rForms.m_Flags ) )
  {
    KVZ_LOG_ERROR( "DataStore", "Could not read '%s' flags.", Path );
    return false;
  }
  if( !i_rSource.m_rDataReader.GetVerifiedValue( i_rSource.m_rPath, o_rForms.m_Verified ) )
  {
    KVZ_LOG_ERROR( "DataStore", "Could not read '%s' verified value.", Path );
    return false;
  }
  if( o_rForms.IsVerifyRequired() && !i_rSource.m_rDataReader.GetProposedValue( i_rSource.m_rPath, o_rForms.m_Proposed ) )
  {
    KVZ_LOG_ERROR( "DataStore", "Could not read '%s' proposed value.", Path );
    return false;
  }
  return true;
}

bool WriteProposed( const VTarget& i_rTarget, const KVZ::Variant& i_rValue )
{
  if( !i_rTarget.m_rDataWriter.SetProposedValue( i_rTarget.m_rPath, i_rValue ) )
  {
    KVZ_LOG_ERROR( "DataStore", "Error writing '%s' proposed value", i_rTarget.m_rPath.ToString() );
    return false;
  }
  return true;
}

bool WriteForms( const VTarget& i_rTarget, const VForms& i_rForms )
{
  if( !i_rTarget.m_rDataWriter.SetValueFlags( i_rTarget.m_rPath, i_rForms.m_Flags ) )
  {
    KVZ_LOG_ERROR( "DataStore", "Error writing '%s' value flags", i_rTarget.m_rPath.ToString() );
    return false;
  }
  if( !i_rTarget.m_rDataWriter.SetVerifiedValue( i_rTarget.m_rPath, i_rForms.m_Verified ) )
  {
    KVZ_LOG_ERROR( "DataStore", "Error writing '%s' verified value", i_rTarget.m_rPath.ToString() );
    return false;
  }
  return !i_rForms.IsVerifyRequired() || WriteProposed( i_rTarget, i_rForms.m_Proposed );
}

// So that the proposal waits for the target's owner.
bool RequireVerification( const VTarget& i_rTarget )
{
  uint32_t Flags = 0;
  i_rTarget.m_rDataWriter.GetValueFlags( i_rTarget.m_rPath, Flags );
  if( ( Flags & DataFlags::VerifyRequired ) != 0 )
  {
    return true;
  }
  const std::string Path = i_rTarget.m_rPath.ToString();
  KVZ_LOG_INFORMATION( "DataStore", "VerifyRequired flag missing in '%s' target value, setting flag.", Path );
  if( !i_rTarget.m_rDataWriter.SetValueFlags( i_rTarget.m_rPath, Flags | DataFlags::VerifyRequired ) )
  {
    KVZ_LOG_ERROR( "DataStore", "Setting VerifyRequired flag '%s' failed.", Path );
    return false;
  }
  return true;
}

// What counts where nobody verifies, else what was asked for: the target's owner decides anew.
bool CopyWish( const VSource& i_rSource, const VTarget& i_rTarget )
{
  const std::string Path = i_rSource.m_rPath.ToString();
  KVZ::Variant Value;
  if( !HasFlag( i_rSource.m_rDataReader, i_rSource.m_rPath, DataFlags::VerifyRequired ) )
  {
    if( !i_rSource.m_rDataReader.GetVerifiedValue( i_rSource.m_rPath, Value ) )
    {
      KVZ_LOG_ERROR( "DataStore", "Could not read '%s' verified value", Path );
      return false;
    }
    return WriteProposed( i_rTarget, Value );
  }
  if( !i_rSource.m_rDataReader.GetProposedValue( i_rSource.m_rPath, Value ) )
  {
    KVZ_LOG_ERROR( "DataStore", "Could not read '%s' proposed value", Path );
    return false;
  }
  return RequireVerification( i_rTarget ) && WriteProposed( i_rTarget, Value );
}

// The place below the target's path that is where the given one is below the source's.
VDataPath Transplant( const VDataPath& i_rPath, const VDataPath& i_rFrom, const VDataPath& i_rTo )
{
  VDataPath Path = i_rTo;
  for( size_t Index = i_rFrom.Size(); Index < i_rPath.Size(); ++Index )
  {
    Path.Add( i_rPath.Segments()[Index] );
  }
  return Path;
}

}

bool CopyValue( const VSource& i_rSource, const VTarget& i_rTarget, uint32_t i_Options )
{
  if( IsLeftOut( i_rSource, i_rTarget, i_Options ) )
  {
    return true;
  }
  if( ( i_Options & Options::CopyForms ) == 0 )
  {
    return CopyWish( i_rSource, i_rTarget );
  }
  VForms Forms;
  return ReadForms( i_rSource, Forms ) && WriteForms( i_rTarget, Forms );
}

bool CopyValues( const VSource& i_rSource, const VTarget& i_rTarget, uint32_t i_Options )
{
  std::vector<VDataPath> Paths;
  i_rSource.m_rDataReader.GetValuePaths( i_rSource.m_rPath, Paths );
  for( const VDataPath& rPath : Paths )
  {
    const VDataPath Place = Transplant( rPath, i_rSource.m_rPath, i_rTarget.m_rPath );
    if( !CopyValue( { i_rSource.m_rDataReader, rPath }, { i_rTarget.m_rDataWriter, Place }, i_Options ) )
    {
      return false;
    }
  }
  return true;
}

bool RemoveParameterValues( IDataWriter& io_rDataWriter, const VDataPath& i_rPath )
{
  std::vector<VDataPath> Paths;
  io_rDataWriter.GetValuePaths( i_rPath, Paths );
  bool bAll = true;
  for( const VDataPath& rPath : Paths )
  {
    if( HasFlag( io_rDataWriter, rPath, DataFlags::ReadOnly ) )
    {
      KVZ_LOG_DETAIL( "DataStore", "skipping read only parameter '%s'", rPath.ToString() );
    }
    else if( HasFlag( io_rDataWriter, rPath, DataFlags::NotSerialized ) )
    {
      KVZ_LOG_DETAIL( "DataStore", "skipping not serialized value '%s'.", rPath.ToString() );
    }
    else if( !io_rDataWriter.RemoveValue( rPath ) )
    {
      KVZ_LOG_ERROR( "DataStore", "Error removing '%s' parameter value", rPath.ToString() );
      bAll = false;
    }
  }
  return bAll;
}

}
