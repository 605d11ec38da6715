#include "host/RestoredSettings.h"

#include "StageCoreDataStore/DataVerifyWriter.h"
#include "StageCoreParameters/ParameterGroup.h"
#include "StageCoreRuntime/GlobalLog.h"
#include "host/DeviceSettings.h"

#include <boost/lexical_cast/try_lexical_convert.hpp>
#include <boost/thread/lock_guard.hpp>

#include <algorithm>

using KVZ::Variant;

namespace StageHost
{

namespace
{

// True where the end of the range is no number.
bool IsOrdered( const Variant& i_rLess, const Variant& i_rMore )
{
  double Less = 0.0;
  double More = 0.0;
  using boost::conversion::try_lexical_convert;
  return !try_lexical_convert( i_rLess.ToText(), Less ) || !try_lexical_convert( i_rMore.ToText(), More ) || Less <= More;
}

bool IsTaken( const IParameter& i_rParameter, const Variant& i_rValue )
{
  VParameterChoices Choices;
  Variant Limit;
  if( i_rValue.Schema() != i_rParameter.GetSchema() )
  {
    return false;
  }
  int32_t Number = 0;
  if( i_rValue.GetEnumeration( Number ) )
  {
    const auto& rEntries = i_rValue.Schema()->Entries();
    return std::any_of( rEntries.begin(), rEntries.end(), [&]( const KVZ::ISchema::VEntry& i_rEntry ) { return i_rEntry.m_Value == Number; } );
  }
  if( i_rParameter.GetEnum( Choices ) && !Choices.empty() )
  {
    return std::any_of( Choices.begin(), Choices.end(), [&]( const KVZ::VLabelledVariant& i_rChoice ) { return i_rChoice.m_Value == i_rValue; } );
  }
  return ( !i_rParameter.GetMin( Limit ) || IsOrdered( Limit, i_rValue ) ) && ( !i_rParameter.GetMax( Limit ) || IsOrdered( i_rValue, Limit ) );
}

}

void VRestoredSettings::TakeAll()
{
  std::map<VDataPath, Variant> Values;
  {
    const VDataReader Reader( *m_pDataStore );
    std::vector<VDataPath> Paths;
    Reader.GetValuePaths( VDataPath(), Paths );
    for( const VDataPath& rPath : Paths )
    {
      Values[rPath] = Reader.GetValue( rPath );
    }
  }
  boost::lock_guard<boost::mutex> Lock( m_Mutex );
  m_Unchecked.swap( Values );
}

Variant VRestoredSettings::TakeRestored( const VDataPath& i_rPath )
{
  boost::lock_guard<boost::mutex> Lock( m_Mutex );
  const auto Found = m_Unchecked.extract( i_rPath );
  return Found.empty() ? Variant() : Found.mapped();
}

void VRestoredSettings::Check( const IParameterGroup& i_rGroup )
{
  for( const std::shared_ptr<IParameter>& pParameter : i_rGroup.GetParameters() )
  {
    const Variant Restored = TakeRestored( pParameter->GetHandle().Path() );
    if( !Restored.IsEmpty() && !pParameter->IsReadOnly() )
    {
      CheckSetting( *pParameter, Restored );
    }
  }
}

// The device may have put its default in the place of a value of another type by now.
void VRestoredSettings::CheckSetting( IParameter& io_rParameter, const Variant& i_rRestored )
{
  VDataWriter Writer( *m_pDataStore );   // devices hear of the end alone
  Variant Value;
  Variant Proposed;
  const bool bIsTaken = !io_rParameter.GetValue( Value ) || IsTaken( io_rParameter, Value );
  const bool bMayBeAsked = !io_rParameter.GetProposedValue( Proposed ) || IsTaken( io_rParameter, Proposed );
  const bool bOfItsType = i_rRestored.Schema() == io_rParameter.GetSchema();
  if( bOfItsType && bIsTaken && bMayBeAsked )
  {
    return;
  }
  const std::string Text = ( bIsTaken && !bMayBeAsked ? Proposed : i_rRestored ).ToText();
  const std::string Reason = bOfItsType ? "it is \"" + Text + "\", and " + WhatIsAccepted( io_rParameter )
                                        : "it is of the type " + i_rRestored.Schema()->Name() + ", not " + io_rParameter.GetSchema()->Name();
  KVZ_LOG_WARNING( "DataStore", "The saved setting \"%1%\" cannot be used: %2%.", io_rParameter.GetHandle().Path().ToString(), Reason );
  if( !bIsTaken || !bMayBeAsked )
  {
    io_rParameter.RemoveValue();
    SetDefault( io_rParameter );
  }
}

}
