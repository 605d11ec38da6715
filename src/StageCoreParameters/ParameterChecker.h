// What a parameter's type allows: the schema of its values, and their order.
#pragma once

#include "StageCoreRuntime/Variant.h"

#include <algorithm>
#include <memory>
#include <vector>

// Labels with their values.
using VParameterChoices = std::vector<KVZ::VLabelledVariant>;

// Stateless; any thread. A value of another type fails every check.
class VParameterChecker
{
public:
  virtual const KVZ::ISchema* GetSchema() const = 0;
  // True if the minimum is not above the maximum.
  virtual bool IsValidRange( const KVZ::Variant& i_rMin, const KVZ::Variant& i_rMax ) const = 0;
  virtual bool IsLessOrEqual( const KVZ::Variant& i_rA, const KVZ::Variant& i_rB ) const = 0;
  virtual bool IsAllowed( const VParameterChoices& i_rChoices, const KVZ::Variant& i_rValue ) const = 0;
  // True if all choices are of the type.
  virtual bool IsValidEnum( const VParameterChoices& i_rChoices ) const = 0;
  virtual ~VParameterChecker() = default;
};

template<class T>
class VParameterCheckerTyped : public VParameterChecker
{
public:
  const KVZ::ISchema* GetSchema() const override { return KVZ::VSchemaOf<T>::Get(); }

  bool IsValidRange( const KVZ::Variant& i_rMin, const KVZ::Variant& i_rMax ) const override { return IsLessOrEqual( i_rMin, i_rMax ); }

  bool IsLessOrEqual( const KVZ::Variant& i_rA, const KVZ::Variant& i_rB ) const override
  {
    T A{};
    T B{};
    return i_rA.Get( A ) && i_rB.Get( B ) && A <= B;
  }

  bool IsAllowed( const VParameterChoices& i_rChoices, const KVZ::Variant& i_rValue ) const override
  {
    return std::any_of( i_rChoices.begin(), i_rChoices.end(), [&]( const auto& i_rChoice ) { return IsEqual( i_rChoice.m_Value, i_rValue ); } );
  }

  bool IsValidEnum( const VParameterChoices& i_rChoices ) const override
  {
    return std::all_of( i_rChoices.begin(), i_rChoices.end(),
      [&]( const auto& i_rChoice ) { return IsEqual( i_rChoice.m_Value, i_rChoice.m_Value ); } );
  }

  // Also a type check: a value equals itself unless it is of another type, or no number.
  virtual bool IsEqual( const KVZ::Variant& i_rA, const KVZ::Variant& i_rB ) const
  {
    T A{};
    T B{};
    return i_rA.Get( A ) && i_rB.Get( B ) && A == B;
  }
};

// The one checker of a type.
template<class T>
std::shared_ptr<const VParameterChecker> GetParameterChecker()
{
  static const std::shared_ptr<const VParameterChecker> s_pChecker = std::make_shared<VParameterCheckerTyped<T>>();
  return s_pChecker;
}
