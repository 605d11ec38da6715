#include "Flow2/Flow2Utils/Parameter.h"

#include <algorithm>
#include <charconv>
#include <cmath>
#include <system_error>
#include <type_traits>

namespace Flow2Utils
{

namespace
{

bool Parse( const std::string& i_rText, std::string& o_rValue )
{
  o_rValue = i_rText;
  return true;
}

bool Parse( const std::string& i_rText, bool& o_rValue )
{
  o_rValue = i_rText == "true" || i_rText == "1";
  return o_rValue || i_rText == "false" || i_rText == "0";
}

template<class T>
bool Parse( const std::string& i_rText, T& o_rValue )
{
  const char* const pEnd = i_rText.data() + i_rText.size();
  T Value{};
  const auto Result = std::from_chars( i_rText.data(), pEnd, Value );
  if( Result.ec != std::errc() || Result.ptr != pEnd )
  {
    return false;
  }
  if constexpr( std::is_floating_point_v<T> )
  {
    if( !std::isfinite( Value ) )
    {
      return false;
    }
  }
  o_rValue = Value;
  return true;
}

template<class T>
std::string ToText( const T& i_rValue )
{
  return KVZ::Variant::Make( i_rValue ).ToText();
}

void AddText( VParameterAttributes& o_rAttributes, const char* i_pName, const std::string& i_rText )
{
  if( !i_rText.empty() )
  {
    o_rAttributes[i_pName] = i_rText;
  }
}

template<class T>
void AddValue( VParameterAttributes& o_rAttributes, const char* i_pName, const std::optional<T>& i_rValue )
{
  if( i_rValue )
  {
    o_rAttributes[i_pName] = ToText( *i_rValue );
  }
}

}

VParameter::~VParameter() = default;

void VParameter::MarkChanged()
{
  m_bChanged = true;
  StampChange();
}

void VParameter::StampChange() { m_Stamp = m_pChangeCount ? ++*m_pChangeCount : m_Stamp + 1; }

template<class T>
VParameterTyped<T>::VParameterTyped( T* i_pMember, VParameterOptions<T> i_Options ) : m_Options( std::move( i_Options ) ), m_pValue( i_pMember )
{
  if( m_Options.m_Default )
  {
    *m_pValue = *m_Options.m_Default;
  }
}

template<class T>
VParameterTyped<T>::VParameterTyped( const VParameterTyped& i_rOther )
  : VParameter( i_rOther ),
    m_Options( i_rOther.m_Options ),
    m_Own( *i_rOther.m_pValue ),
    m_pValue( &m_Own ),
    m_bSetBySource( i_rOther.m_bSetBySource )
{
}

template<class T>
VParameterTyped<T>::~VParameterTyped() = default;

template<class T>
uint32_t VParameterTyped<T>::SetValue( const std::string& i_rText )
{
  T Value{};
  const auto& rPermitted = m_Options.m_Permitted;
  const auto Labelled = std::find_if( rPermitted.begin(), rPermitted.end(),
    [&i_rText]( const VPermittedValue<T>& i_rEntry ) { return i_rEntry.m_Label == i_rText; } );
  if( Labelled != rPermitted.end() )
  {
    Value = Labelled->m_Value;
  }
  else if( !Parse( i_rText, Value ) )
  {
    return EParameterResult::BadText;
  }
  m_bTouched = true;
  const bool bSame = HasValue() && *m_pValue == Value;
  m_bSetBySource = true;
  if( bSame )
  {
    return EParameterResult::Unchanged;
  }
  *m_pValue = std::move( Value );
  MarkChanged();
  return EParameterResult::Changed;
}

template<class T>
uint32_t VParameterTyped<T>::GetValue( KVZ::Variant& o_rValue ) const
{
  if( !HasValue() )
  {
    return EParameterResult::NoValue;
  }
  o_rValue = KVZ::Variant::Make( *m_pValue );
  return 0;
}

template<class T>
uint32_t VParameterTyped<T>::Finish()
{
  m_bTouched = true;
  if( !m_bSetBySource )
  {
    return EParameterResult::Unchanged;
  }
  m_bSetBySource = false;
  if( m_Options.m_Default && *m_Options.m_Default == *m_pValue )
  {
    return EParameterResult::Unchanged;
  }
  if( m_Options.m_Default )
  {
    *m_pValue = *m_Options.m_Default;
  }
  MarkChanged();
  return EParameterResult::Changed;
}

template<class T>
bool VParameterTyped<T>::IsPermitted( const T& i_rValue ) const
{
  return m_Options.m_Permitted.empty() ||
    std::any_of( m_Options.m_Permitted.begin(), m_Options.m_Permitted.end(),
      [&i_rValue]( const VPermittedValue<T>& i_rEntry ) { return i_rEntry.m_Value == i_rValue; } );
}

// A null pointer for a valid parameter.
template<class T>
const char* VParameterTyped<T>::WhyInvalid() const
{
  if( !HasValue() )
  {
    return m_Options.m_bRequired ? "Value is not set" : nullptr;
  }
  if( m_Options.m_Minimum && *m_pValue < *m_Options.m_Minimum )
  {
    return "Value is less than permitted minimum";
  }
  if( m_Options.m_Maximum && *m_Options.m_Maximum < *m_pValue )
  {
    return "Value is greater than permitted maximum";
  }
  return IsPermitted( *m_pValue ) ? nullptr : "Value is not one of the permitted values";
}

template<class T>
bool VParameterTyped<T>::Validate( std::string& o_rReason ) const
{
  const char* const pReason = WhyInvalid();
  o_rReason = pReason ? pReason : "";
  return !pReason;
}

template<class T>
bool VParameterTyped<T>::IsValid() const
{
  return !WhyInvalid();
}

template<class T>
uint32_t VParameterTyped<T>::SetTarget( const KVZ::VFlowTarget& i_rTarget )
{
  if( m_Target == i_rTarget )
  {
    return EParameterResult::Unchanged;
  }
  m_Target = i_rTarget;
  StampChange();
  return EParameterResult::Changed;
}

template<class T>
void VParameterTyped<T>::Describe( VParameterAttributes& o_rAttributes ) const
{
  AddText( o_rAttributes, ParameterAttributes::FriendlyName, m_Options.m_FriendlyName );
  AddText( o_rAttributes, ParameterAttributes::Description, m_Options.m_Description );
  AddText( o_rAttributes, ParameterAttributes::Category, m_Options.m_Category );
  AddValue( o_rAttributes, ParameterAttributes::RangeMin, m_Options.m_Minimum );
  AddValue( o_rAttributes, ParameterAttributes::RangeMax, m_Options.m_Maximum );
  AddValue( o_rAttributes, ParameterAttributes::DefaultValue, m_Options.m_Default );
  o_rAttributes[ParameterAttributes::Advanced] = ToText( m_Options.m_bAdvanced );
  o_rAttributes[ParameterAttributes::Hidden] = ToText( m_Options.m_bHidden );
  o_rAttributes[ParameterAttributes::Serialized] = ToText( m_Options.m_bSerialized );
  AddText( o_rAttributes, ParameterAttributes::FileAccess, m_Options.m_FileAccess );
  AddText( o_rAttributes, ParameterAttributes::FileFilter, m_Options.m_FileFilter );
}

template<class T>
std::unique_ptr<VParameter> VParameterTyped<T>::Clone() const
{
  std::unique_ptr<VParameterTyped> pClone( new VParameterTyped( *this ) );
  pClone->Detach();
  return pClone;
}

template<class T>
const KVZ::ISchema* VParameterTyped<T>::Schema() const
{
  return KVZ::Variant::Make( T{} ).Schema();
}

template class VParameterTyped<std::string>;
template class VParameterTyped<bool>;
template class VParameterTyped<int32_t>;
template class VParameterTyped<uint32_t>;
template class VParameterTyped<int64_t>;
template class VParameterTyped<uint64_t>;
template class VParameterTyped<double>;

}
