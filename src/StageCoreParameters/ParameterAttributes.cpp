// What stands beside the value of a parameter.
#include "StageCoreDataStore/DataVerifyWriter.h"
#include "StageCoreParameters/Parameter.h"
#include "StageCoreRuntime/GlobalLog.h"

#include <set>

namespace
{

constexpr const char* AttributeTree = "Attributes";

constexpr const char* AttributeNames[] = { "Category", "Display", "Description", "PresentationHint", "DataConversionHint", "FileAccess", "FileFilter",
  "ValidatorRegEx", "Hidden", "Advanced", "Dynamic", "Default", "Min", "Max", "Enum" };

}

VParameter::VParameter( std::shared_ptr<IDataStore> i_pDataStore, std::shared_ptr<const VParameterChecker> i_pChecker, const VDataPath& i_rParentPath,
  const std::string& i_rName )
  : m_pDataStore( std::move( i_pDataStore ) ),
    m_pChecker( std::move( i_pChecker ) ),
    m_Name( i_rName ),
    m_Value( i_rParentPath + i_rName ),
    m_AttributeRoot( VDataPath{ AttributeTree } + i_rParentPath + i_rName )
{
  static_assert( std::size( AttributeNames ) == AttributeCount );
  m_Attributes.reserve( AttributeCount );
  for( const char* pName : AttributeNames )
  {
    m_Attributes.emplace_back( m_AttributeRoot + std::string_view( pName ) );
  }
}

bool VParameter::HasAttribute( EAttribute i_Attribute ) const { return VDataReader( *m_pDataStore ).Exists( m_Attributes[i_Attribute] ); }

bool VParameter::GetAttribute( EAttribute i_Attribute, KVZ::Variant& o_rValue ) const
{
  return VDataReader( *m_pDataStore ).GetValue( m_Attributes[i_Attribute], o_rValue );
}

template<class T>
T VParameter::GetAttributeOr( EAttribute i_Attribute, T i_Fallback ) const
{
  GetTyped( VDataReader( *m_pDataStore ), m_Attributes[i_Attribute], i_Fallback );
  return i_Fallback;
}

bool VParameter::SetAttribute( EAttribute i_Attribute, const KVZ::Variant& i_rValue )
{
  return VDataWriter( *m_pDataStore ).SetValue( m_Attributes[i_Attribute], i_rValue );
}

// False is never stored.
bool VParameter::SetMark( EAttribute i_Attribute, bool i_bSet )
{
  VDataWriter Writer( *m_pDataStore );
  if( i_bSet )
  {
    return Writer.SetValue( m_Attributes[i_Attribute], KVZ::Variant::Make( true ) );
  }
  return !Writer.Exists( m_Attributes[i_Attribute] ) || Writer.RemoveValue( m_Attributes[i_Attribute] );
}

Parameter::PresentationHint::Enum VParameter::GetPresentationHint() const
{
  return GetAttributeOr( PresentationHint, Parameter::PresentationHint::EDontCare );
}

Parameter::DataConversionHint::Enum VParameter::GetDataConversionHint() const
{
  return GetAttributeOr( DataConversionHint, Parameter::DataConversionHint::ENoConversion );
}

Parameter::FileAccess::Enum VParameter::GetFileAccess() const { return GetAttributeOr( FileAccess, Parameter::FileAccess::ENone ); }

std::string VParameter::GetCategory() const { return GetAttributeOr( Category, std::string() ); }

std::string VParameter::GetDisplay() const { return GetAttributeOr( Display, std::string() ); }

std::string VParameter::GetDescription() const { return GetAttributeOr( Description, std::string() ); }

std::string VParameter::GetFileFilter() const { return GetAttributeOr( FileFilter, std::string() ); }

std::string VParameter::GetValidatorRegEx() const { return GetAttributeOr( ValidatorRegEx, std::string() ); }

bool VParameter::IsHidden() const { return GetAttributeOr( Hidden, false ); }

bool VParameter::IsAdvanced() const { return GetAttributeOr( Advanced, false ); }

bool VParameter::IsDynamic() const { return GetAttributeOr( Dynamic, false ); }

bool VParameter::HasValueDefault() const { return HasAttribute( Default ); }

bool VParameter::GetValueDefault( KVZ::Variant& o_rValue ) const { return GetAttribute( Default, o_rValue ); }

bool VParameter::HasMin() const { return HasAttribute( Min ); }

bool VParameter::GetMin( KVZ::Variant& o_rMin ) const { return GetAttribute( Min, o_rMin ); }

bool VParameter::HasMax() const { return HasAttribute( Max ); }

bool VParameter::GetMax( KVZ::Variant& o_rMax ) const { return GetAttribute( Max, o_rMax ); }

bool VParameter::HasRange() const
{
  const VDataReader Reader( *m_pDataStore );
  return Reader.Exists( m_Attributes[Min] ) && Reader.Exists( m_Attributes[Max] );
}

bool VParameter::GetRange( KVZ::Variant& o_rMin, KVZ::Variant& o_rMax ) const
{
  const VDataReader Reader( *m_pDataStore );
  return Reader.Exists( m_Attributes[Max] ) && Reader.GetValue( m_Attributes[Min], o_rMin ) && Reader.GetValue( m_Attributes[Max], o_rMax );
}

bool VParameter::HasEnum() const { return HasAttribute( Enum ); }

bool VParameter::GetEnum( VParameterChoices& o_rChoices ) const
{
  KVZ::Variant List;
  return GetAttribute( Enum, List ) && KVZ::GetLabelledList( List, o_rChoices );
}

bool VParameter::GetEnum( std::vector<std::string>& o_rLabels ) const
{
  VParameterChoices Choices;
  if( !GetEnum( Choices ) )
  {
    return false;
  }
  o_rLabels.clear();
  for( const KVZ::VLabelledVariant& rChoice : Choices )
  {
    o_rLabels.push_back( rChoice.m_Label );
  }
  return true;
}

bool VParameter::SetCategory( const std::string& i_rText ) { return SetAttribute( Category, KVZ::Variant::Make( i_rText ) ); }

bool VParameter::SetDisplay( const std::string& i_rText ) { return SetAttribute( Display, KVZ::Variant::Make( i_rText ) ); }

bool VParameter::SetDescription( const std::string& i_rText ) { return SetAttribute( Description, KVZ::Variant::Make( i_rText ) ); }

bool VParameter::SetPresentationHint( Parameter::PresentationHint::Enum i_Hint )
{
  return SetAttribute( PresentationHint, KVZ::Variant::Make( i_Hint ) );
}

bool VParameter::SetDataConversionHint( Parameter::DataConversionHint::Enum i_Hint )
{
  return SetAttribute( DataConversionHint, KVZ::Variant::Make( i_Hint ) );
}

bool VParameter::SetFileAccess( Parameter::FileAccess::Enum i_Access ) { return SetAttribute( FileAccess, KVZ::Variant::Make( i_Access ) ); }

bool VParameter::SetFileFilter( const std::string& i_rText ) { return SetAttribute( FileFilter, KVZ::Variant::Make( i_rText ) ); }

bool VParameter::SetValidatorRegEx( const std::string& i_rText ) { return SetAttribute( ValidatorRegEx, KVZ::Variant::Make( i_rText ) ); }

bool VParameter::SetHidden( bool i_bHidden ) { return SetMark( Hidden, i_bHidden ); }

bool VParameter::SetAdvanced( bool i_bAdvanced ) { return SetMark( Advanced, i_bAdvanced ); }

bool VParameter::SetDynamic( bool i_bDynamic ) { return SetMark( Dynamic, i_bDynamic ); }

bool VParameter::SetVerifyRequired( bool i_bRequired )
{
  VDataWriter Writer( *m_pDataStore );
  if( Writer.Exists( m_Attributes[Default] ) )
  {
    KVZ_LOG_WARNING( "VParameter",
      "VParameter::SetVerifyRequired called after VParameter::SetValueDefault for Parameter \"%1%\", parameters previously imported from other "
      "Tarvo applications may be lost.",
      m_Name );
  }
  return SetFlag( DataFlags::VerifyRequired, i_bRequired );
}

bool VParameter::SetValueDefault( const KVZ::Variant& i_rValue )
{
  if( !Fits( i_rValue ) )
  {
    return false;
  }
  VDataWriter Writer( *m_pDataStore );
  const bool bHasValue = Writer.GetSchema( m_Value ) == GetSchema();   // a value of another type counts as none
  return Writer.SetValue( m_Attributes[Default], i_rValue ) && ( bHasValue || Writer.SetValue( m_Value, i_rValue ) );
}

bool VParameter::SetLimit( EAttribute i_Attribute, const KVZ::Variant& i_rValue )
{
  if( !Fits( i_rValue ) )
  {
    return false;
  }
  VDataWriter Writer( *m_pDataStore );
  Writer.RemoveValue( m_Attributes[Enum] );
  return Writer.SetValue( m_Attributes[i_Attribute], i_rValue );
}

bool VParameter::SetMin( const KVZ::Variant& i_rMin ) { return SetLimit( Min, i_rMin ); }

bool VParameter::SetMax( const KVZ::Variant& i_rMax ) { return SetLimit( Max, i_rMax ); }

bool VParameter::SetRange( const KVZ::Variant& i_rMin, const KVZ::Variant& i_rMax )
{
  VDataWriter Writer( *m_pDataStore );
  return m_pChecker->IsValidRange( i_rMin, i_rMax ) && SetMin( i_rMin ) && SetMax( i_rMax );
}

bool VParameter::SetEnum( const VParameterChoices& i_rChoices, const KVZ::Variant& i_rSelected )
{
  std::set<std::string> Labels;
  for( const KVZ::VLabelledVariant& rChoice : i_rChoices )
  {
    if( !Labels.insert( rChoice.m_Label ).second )
    {
      return false;
    }
  }
  if( !m_pChecker->IsValidEnum( i_rChoices ) || ( !i_rSelected.IsEmpty() && !m_pChecker->IsAllowed( i_rChoices, i_rSelected ) ) )
  {
    return false;
  }
  VDataWriter Writer( *m_pDataStore );
  Writer.RemoveValue( m_Attributes[Min] );
  Writer.RemoveValue( m_Attributes[Max] );
  return Writer.SetValue( m_Attributes[Enum], KVZ::MakeLabelledList( GetSchema(), i_rChoices ) ) &&
    ( i_rSelected.IsEmpty() || Writer.SetValue( m_Value, i_rSelected ) );
}
