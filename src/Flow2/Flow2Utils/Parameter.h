// One parameter of a flow node: turns text into a typed member of the node's parameter set, and knows its default, limits and description.
//
// Belongs to one node and is used on that node's thread alone.
#pragma once

#include "StageCorePluginInterface/FlowItems.h"
#include "StageCoreRuntime/Variant.h"

#include <cstdint>
#include <map>
#include <memory>
#include <optional>
#include <string>
#include <utility>
#include <vector>

namespace Flow2Utils
{

struct EParameterResult
{
  enum Enum : uint32_t
  {
    Changed = 0,
    Unchanged = 1,
    Failed = 0x80000000u,
    NoValue = 0x80000009u,
    UnknownName = 0x80000011u,
    BadText = 0x80000016u
  };
};

using VParameterAttributes = std::map<std::string, std::string>;

// What the attributes of a parameter are called.
namespace ParameterAttributes
{
constexpr const char* FriendlyName = "<FriendlyName>";
constexpr const char* Description = "<Description>";
constexpr const char* Category = "<Category>";
constexpr const char* RangeMin = "<RangeMin>";
constexpr const char* RangeMax = "<RangeMax>";
constexpr const char* DefaultValue = "<DefaultValue>";
constexpr const char* Advanced = "<Advanced>";
constexpr const char* Hidden = "<Hidden>";
constexpr const char* Serialized = "<Serialized>";
constexpr const char* FileAccess = "<FileAccess>";
constexpr const char* FileFilter = "<FileFilter>";
}

class VParameterSet;

class VParameter
{
public:
  virtual ~VParameter();
  // Takes the label of a permitted value, or the text itself. Changed, Unchanged or BadText.
  virtual uint32_t SetValue( const std::string& i_rText ) = 0;
  // NoValue where there is neither a value nor a default.
  virtual uint32_t GetValue( KVZ::Variant& o_rValue ) const = 0;
  // The end of an update in which no source named the parameter: it goes back to its default. Changed or Unchanged.
  virtual uint32_t Finish() = 0;
  // False with the reason.
  virtual bool Validate( std::string& o_rReason ) const = 0;
  virtual bool IsValid() const = 0;
  // Whom the parameter belongs to, for what is addressed. Changed or Unchanged.
  virtual uint32_t SetTarget( const KVZ::VFlowTarget& i_rTarget ) = 0;
  virtual void Describe( VParameterAttributes& o_rAttributes ) const = 0;
  // Of the same kind and state, with a value of its own, in no set.
  virtual std::unique_ptr<VParameter> Clone() const = 0;
  virtual const KVZ::ISchema* Schema() const = 0;

  const KVZ::VFlowTarget& Target() const { return m_Target; }
  bool IsTouched() const { return m_bTouched; }
  bool IsChanged() const { return m_bChanged; }
  // The set's change count at the last change; 0 before the first.
  uint64_t Stamp() const { return m_Stamp; }

protected:
  VParameter() = default;
  VParameter( const VParameter& i_rOther ) = default;

  // The value is another.
  void MarkChanged();
  // Something of the parameter is another: counts as a change of its set.
  void StampChange();
  // Out of its set.
  void Detach() { m_pChangeCount = nullptr; }

  bool m_bTouched = false;   // in this update
  bool m_bChanged = false;   // the value, in this update
  KVZ::VFlowTarget m_Target;

private:
  friend class VParameterSet;

  uint64_t* m_pChangeCount = nullptr;   // the set's
  uint64_t m_Stamp = 0;
};

template<class T>
struct VPermittedValue
{
  std::string m_Label;
  T m_Value;
};

template<class T>
struct VParameterOptions
{
  std::string m_Description{};
  std::string m_FriendlyName{};
  std::string m_Category{};
  std::optional<T> m_Default{};
  std::optional<T> m_Minimum{};
  std::optional<T> m_Maximum{};
  std::vector<VPermittedValue<T>> m_Permitted{};   // empty: any
  bool m_bRequired = false;
  bool m_bAdvanced = false;
  bool m_bHidden = false;
  bool m_bSerialized = true;
  std::string m_FileAccess{};   // "Load", "LoadMultiple", "Save" or "Folder"
  std::string m_FileFilter{};
};

// T is std::string, bool, int32_t, uint32_t, int64_t, uint64_t or double. Numbers are plain decimal text, booleans true, false, 1 or 0.
template<class T>
class VParameterTyped : public VParameter
{
public:
  // Writes the default, where there is one, into the member, which outlives the parameter.
  VParameterTyped( T* i_pMember, VParameterOptions<T> i_Options );
  ~VParameterTyped() override;

  uint32_t SetValue( const std::string& i_rText ) override;
  uint32_t GetValue( KVZ::Variant& o_rValue ) const override;
  uint32_t Finish() override;
  bool Validate( std::string& o_rReason ) const override;
  bool IsValid() const override;
  uint32_t SetTarget( const KVZ::VFlowTarget& i_rTarget ) override;
  void Describe( VParameterAttributes& o_rAttributes ) const override;
  std::unique_ptr<VParameter> Clone() const override;
  const KVZ::ISchema* Schema() const override;

private:
  VParameterTyped( const VParameterTyped& i_rOther );

  bool HasValue() const { return m_bSetBySource || m_Options.m_Default; }
  bool IsPermitted( const T& i_rValue ) const;
  const char* WhyInvalid() const;

  const VParameterOptions<T> m_Options;
  T m_Own{};   // of a clone
  T* m_pValue;
  bool m_bSetBySource = false;
};

extern template class VParameterTyped<std::string>;
extern template class VParameterTyped<bool>;
extern template class VParameterTyped<int32_t>;
extern template class VParameterTyped<uint32_t>;
extern template class VParameterTyped<int64_t>;
extern template class VParameterTyped<uint64_t>;
extern template class VParameterTyped<double>;

}
