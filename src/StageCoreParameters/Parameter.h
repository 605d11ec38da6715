// A parameter on the data store. It holds no value itself, so whoever knows the path can read it without knowing this class.
#pragma once

#include "StageCoreParameters/IParameter.h"
#include "StageCoreRuntime/Shared.h"

#include <functional>
#include <memory>
#include <string>
#include <vector>

class IDataReader;
class IDataStore;
class IDataWriter;

// Made through MakeShared. The attributes stand under "Attributes" and repeat the value's path there.
class VParameter : public IParameter, public virtual KVZ::VShared
{
public:
  VParameter( std::shared_ptr<IDataStore> i_pDataStore, std::shared_ptr<const VParameterChecker> i_pChecker, const VDataPath& i_rParentPath,
    const std::string& i_rName );
  ~VParameter() override;

  Parameter::PresentationHint::Enum GetPresentationHint() const override;
  Parameter::DataConversionHint::Enum GetDataConversionHint() const override;
  Parameter::FileAccess::Enum GetFileAccess() const override;
  const std::string& GetName() const override { return m_Name; }
  std::string GetCategory() const override;
  std::string GetDisplay() const override;
  std::string GetDescription() const override;
  const KVZ::ISchema* GetSchema() const override { return m_pChecker->GetSchema(); }
  std::string GetFileFilter() const override;
  std::string GetValidatorRegEx() const override;
  bool IsHidden() const override;
  bool IsReadOnly() const override;
  bool IsAdvanced() const override;
  bool IsDynamic() const override;
  bool IsVerifyRequired() const override;
  bool GetProposedValue( KVZ::Variant& o_rValue ) const override;
  bool GetVerifiedValue( KVZ::Variant& o_rValue ) const override;
  bool GetValue( KVZ::Variant& o_rValue ) const override;
  bool HasValueDefault() const override;
  bool GetValueDefault( KVZ::Variant& o_rValue ) const override;
  bool HasMin() const override;
  bool GetMin( KVZ::Variant& o_rMin ) const override;
  bool HasMax() const override;
  bool GetMax( KVZ::Variant& o_rMax ) const override;
  bool HasRange() const override;
  bool GetRange( KVZ::Variant& o_rMin, KVZ::Variant& o_rMax ) const override;
  bool GetEnum( std::vector<std::string>& o_rLabels ) const override;
  bool GetEnum( VParameterChoices& o_rChoices ) const override;
  bool HasEnum() const override;
  bool SetValue( const KVZ::Variant& i_rValue ) override;
  bool SetVerifiedValue( const KVZ::Variant& i_rValue ) override;
  bool SetValueInternal( const KVZ::Variant& i_rValue ) override;
  bool HasValue() const override;
  bool RemoveAll() override;
  bool RemoveValue() override;
  bool SetHidden( bool i_bHidden ) override;
  bool SetNotSerialized( bool i_bNotSerialized ) override;
  VEvent& GetAttributesChangedCallback() override;
  VEvent& GetThirdNodeCallback() override;
  VEvent& GetProposedValueCallback() override;
  VEvent& GetValueChangedCallback() override;
  VEvent& GetFifthNodeCallback() override;
  VEvent& GetFourthNodeCallback() override;
  VEvent& GetHiddenChangedCallback() override;
  bool IsNotSerialized() const override;
  const VDataPathHandle& GetHandle() const override { return m_Value; }

  bool SetCategory( const std::string& i_rText );
  bool SetDisplay( const std::string& i_rText );
  bool SetDescription( const std::string& i_rText );
  bool SetPresentationHint( Parameter::PresentationHint::Enum i_Hint );
  bool SetDataConversionHint( Parameter::DataConversionHint::Enum i_Hint );
  bool SetFileAccess( Parameter::FileAccess::Enum i_Access );
  bool SetFileFilter( const std::string& i_rText );
  bool SetValidatorRegEx( const std::string& i_rText );
  bool SetAdvanced( bool i_bAdvanced );
  bool SetDynamic( bool i_bDynamic );
  bool SetReadOnly( bool i_bReadOnly );
  // Before SetValueDefault; afterwards it leaves a warning in the log.
  bool SetVerifyRequired( bool i_bRequired );
  // Becomes the value too if there is none yet: a saved value that came in first survives.
  bool SetValueDefault( const KVZ::Variant& i_rValue );
  // A range and a list of choices exclude each other: each takes the other away.
  bool SetMin( const KVZ::Variant& i_rMin );
  bool SetMax( const KVZ::Variant& i_rMax );
  bool SetRange( const KVZ::Variant& i_rMin, const KVZ::Variant& i_rMax );
  // Refused, with the old list kept, for a label that comes twice or a value of another type. A selected value must be in the list and
  // becomes the value by the owner's write; an empty one leaves the value alone.
  bool SetEnum( const VParameterChoices& i_rChoices, const KVZ::Variant& i_rSelected = {} );

  // Subscribe until the parameter is destroyed. Not from two threads at once.
  void SubscribeProposedValue( std::function<void()> i_Function, std::shared_ptr<KVZ::IPostalService> i_pService );
  void SubscribeValueChanged( std::function<void()> i_Function, std::shared_ptr<KVZ::IPostalService> i_pService );

private:
  enum EAttribute : size_t
  {
    Category,
    Display,
    Description,
    PresentationHint,
    DataConversionHint,
    FileAccess,
    FileFilter,
    ValidatorRegEx,
    Hidden,
    Advanced,
    Dynamic,
    Default,
    Min,
    Max,
    Enum,
    AttributeCount
  };

  bool Fits( const KVZ::Variant& i_rValue ) const { return i_rValue.Schema() == m_pChecker->GetSchema(); }
  bool HasFlag( uint32_t i_Flag ) const;
  bool SetFlag( uint32_t i_Flag, bool i_bSet );
  bool IsWithinLimits( const IDataReader& i_rReader, const KVZ::Variant& i_rValue ) const;

  bool HasAttribute( EAttribute i_Attribute ) const;
  bool GetAttribute( EAttribute i_Attribute, KVZ::Variant& o_rValue ) const;
  template<class T>
  T GetAttributeOr( EAttribute i_Attribute, T i_Fallback ) const;
  bool SetAttribute( EAttribute i_Attribute, const KVZ::Variant& i_rValue );
  bool SetMark( EAttribute i_Attribute, bool i_bSet );
  bool SetLimit( EAttribute i_Attribute, const KVZ::Variant& i_rValue );

  IDataNode& Node( const VDataPathHandle& i_rHandle );

  const std::shared_ptr<IDataStore> m_pDataStore;
  const std::shared_ptr<const VParameterChecker> m_pChecker;
  const std::string m_Name;
  const VDataPathHandle m_Value;
  const VDataPath m_AttributeRoot;
  std::vector<VDataPathHandle> m_Attributes;   // by EAttribute
  // Called when the parameter is destroyed: they take its subscriptions back
  std::vector<std::function<void()>> m_ProposedValueEnds;
  std::vector<std::function<void()>> m_ValueChangedEnds;
};
