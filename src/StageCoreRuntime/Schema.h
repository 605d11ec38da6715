// Schemas: what the bytes of a Variant mean. A schema is unique by its name for the whole process and lives until its end, so two
// values are of one type exactly when their schema pointers are equal. Schemas never change; any thread may read them.
#pragma once

#include <cstdint>
#include <optional>
#include <string>
#include <string_view>
#include <vector>

namespace KVZ
{
class ISchema
{
public:
  enum EType : int32_t
  {
    ENone = 0,
    EBool = 1,
    EInt8 = 2,
    EInt16 = 3,
    EInt32 = 4,
    EInt64 = 5,
    EUInt8 = 6,
    EUInt16 = 7,
    EUInt32 = 8,
    EUInt64 = 9,
    EFloat = 10,
    EDouble = 11,
    EString = 12,
    EEnumeration = 13,
    ERecord = 14,
    EList = 15,
  };

  // One enumerator
  struct VEntry
  {
    int32_t m_Value = 0;
    std::string m_Name{};
    std::string m_Description{};
    bool operator==( const VEntry& ) const = default;
  };

  // One field of a record
  struct VField
  {
    std::string m_Name{};
    const ISchema* m_pSchema = nullptr;
    bool operator==( const VField& ) const = default;
  };

  ISchema() = default;
  ISchema( const ISchema& ) = delete;
  ISchema& operator=( const ISchema& ) = delete;

  virtual EType Type() const = 0;
  virtual const std::string& Name() const = 0;
  virtual const std::string& Description() const = 0;

  // The enumerators in their order; empty for any other type.
  virtual const std::vector<VEntry>& Entries() const = 0;
  // The fields in their order; empty for any other type than a record.
  virtual const std::vector<VField>& Fields() const = 0;
  // A list's element; null for any other type.
  virtual const ISchema* Element() const = 0;

  // The empty string for a value that is not in the table.
  virtual const std::string& NameFromValue( int32_t i_Value ) const = 0;
  virtual std::optional<int32_t> ValueFromName( std::string_view i_Name ) const = 0;

protected:
  ~ISchema() = default;
};

namespace IO
{
// The schema of a plain value, bool to string. Null for any other type.
const ISchema* GetUniquePodSchema( ISchema::EType i_Type );

// The schema of this name; null if there is none yet.
const ISchema* GetUniqueSchema( std::string_view i_Name );

// Registers an enumeration or a record, or finds the one of that name. A second registration with another content is an
// assertion and gets the first one.
const ISchema* GetUniqueSchema( std::string_view i_Name, std::string_view i_Description, std::vector<ISchema::VEntry> i_Entries );
const ISchema* GetUniqueSchema( std::string_view i_Name, std::string_view i_Description, std::vector<ISchema::VField> i_Fields );

// The schema of a list with this element.
const ISchema* GetUniqueListSchema( const ISchema* i_pElement );
}
}
