// A typed, named value in the data store with its attributes beside it.
//
// Any thread may call any operation. Each opens a guard of the store for its own length: "Is", "Has" and the Get operations of attributes
// and values a reader, all others, those that give out an event included, a writer, so whoever holds a reader closes it first. A write that
// is refused returns false and changes nothing.
#pragma once

#include "StageCoreDataStore/DataNode.h"
#include "StageCoreDataStoreTypes/DataPath.h"
#include "StageCoreParameters/ParameterChecker.h"
#include "StageCoreParameters/ParameterHints.h"

#include <string>
#include <vector>

// The order of the operations is binding.
class IParameter
{
public:
  using VEvent = IDataNode::VEvent;

  IParameter() = default;
  IParameter( const IParameter& ) = delete;
  IParameter& operator=( const IParameter& ) = delete;

  // Attributes. An absent one reads as false, as the empty text, or as the first of its hints.

  virtual Parameter::PresentationHint::Enum GetPresentationHint() const = 0;
  virtual Parameter::DataConversionHint::Enum GetDataConversionHint() const = 0;
  virtual Parameter::FileAccess::Enum GetFileAccess() const = 0;
  virtual const std::string& GetName() const = 0;
  virtual std::string GetCategory() const = 0;
  virtual std::string GetDisplay() const = 0;
  virtual std::string GetDescription() const = 0;
  virtual const KVZ::ISchema* GetSchema() const = 0;
  virtual std::string GetFileFilter() const = 0;
  virtual std::string GetValidatorRegEx() const = 0;
  virtual bool IsHidden() const = 0;
  virtual bool IsReadOnly() const = 0;
  virtual bool IsAdvanced() const = 0;
  virtual bool IsDynamic() const = 0;
  virtual bool IsVerifyRequired() const = 0;

  // Values. False, with the output left alone, where there is none.

  virtual bool GetProposedValue( KVZ::Variant& o_rValue ) const = 0;
  virtual bool GetVerifiedValue( KVZ::Variant& o_rValue ) const = 0;
  // The form that counts.
  virtual bool GetValue( KVZ::Variant& o_rValue ) const = 0;
  virtual bool HasValueDefault() const = 0;
  virtual bool GetValueDefault( KVZ::Variant& o_rValue ) const = 0;
  virtual bool HasMin() const = 0;
  virtual bool GetMin( KVZ::Variant& o_rMin ) const = 0;
  virtual bool HasMax() const = 0;
  virtual bool GetMax( KVZ::Variant& o_rMax ) const = 0;
  // Both ends.
  virtual bool HasRange() const = 0;
  virtual bool GetRange( KVZ::Variant& o_rMin, KVZ::Variant& o_rMax ) const = 0;
  virtual bool GetEnum( std::vector<std::string>& o_rLabels ) const = 0;
  virtual bool GetEnum( VParameterChoices& o_rChoices ) const = 0;
  virtual bool HasEnum() const = 0;

  // The user's write: refused for another type, a read-only parameter, and a value outside range or choices.
  virtual bool SetValue( const KVZ::Variant& i_rValue ) = 0;
  // The owner's answer to a proposed value.
  virtual bool SetVerifiedValue( const KVZ::Variant& i_rValue ) = 0;
  // The owner's write: refused for another type only.
  virtual bool SetValueInternal( const KVZ::Variant& i_rValue ) = 0;
  virtual bool HasValue() const = 0;

  // The value, all attributes and the value's flags.
  virtual bool RemoveAll() = 0;
  virtual bool RemoveValue() = 0;

  virtual bool SetHidden( bool i_bHidden ) = 0;
  // Left out of what is saved.
  virtual bool SetNotSerialized( bool i_bNotSerialized ) = 0;

  // Events; see IDataNode for when they fire. Valid while the store lives.

  virtual VEvent& GetAttributesChangedCallback() = 0;
  virtual VEvent& GetThirdNodeCallback() = 0;       // a value where none was
  virtual VEvent& GetProposedValueCallback() = 0;   // what a verifying owner answers
  virtual VEvent& GetValueChangedCallback() = 0;
  virtual VEvent& GetFifthNodeCallback() = 0;    // flags changed
  virtual VEvent& GetFourthNodeCallback() = 0;   // value removed
  virtual VEvent& GetHiddenChangedCallback() = 0;
  virtual ~IParameter() = default;
  virtual bool IsNotSerialized() const = 0;

  // Where the value lies.
  virtual const VDataPathHandle& GetHandle() const = 0;
};
