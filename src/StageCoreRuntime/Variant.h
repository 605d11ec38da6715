// A value with its type: a schema pointer and the value's bytes. A plain value type, copied freely.
//
// Which schema a C++ type has is said by VSchemaOf. An enumeration specialises it in its own header:
//   template<> struct VSchemaOf<KVZ::IPixelFormat::Enum> { static const ISchema* Get(); };
// A record adds a visitor of its fields, in the schema's order:
//   template<> struct VSchemaOf<KVZ::VMaskGrid>
//   {
//     static const ISchema* Get();
//     template<class TRecord, class TVisitor>
//     static void Visit( TRecord& i_rRecord, TVisitor& i_rVisitor ) { i_rVisitor( i_rRecord.m_DeviceURN ); i_rVisitor( i_rRecord.m_TileSizeX ); }
//   };
//
// Bytes: numbers in the machine's order, bool one byte, an enumeration an int32. A text is its characters; inside a record or list
// a uint32 byte count stands before it. A list is a uint32 element count and its elements, a record its fields in order.
#pragma once

#include "StageCoreRuntime/Schema.h"

#include <cstddef>
#include <cstring>
#include <limits>
#include <type_traits>
#include <utility>

namespace KVZ
{
template<class T>
struct VSchemaOf;

class Variant
{
public:
  using VBytes = std::vector<uint8_t>;

  // Empty: no schema, no bytes. It stands for an absent value.
  Variant() = default;
  Variant( const ISchema* i_pSchema, VBytes i_Bytes ) : m_pSchema( i_pSchema ), m_Bytes( std::move( i_Bytes ) ) {}

  template<class T>
  static Variant Make( const T& i_rValue );

  // Also for texts given as literals.
  static Variant Make( const char* i_pText ) { return MakeText( i_pText ); }
  static Variant Make( std::string_view i_Text ) { return MakeText( i_Text ); }

  // A value of an enumeration that is known by its schema alone.
  static Variant MakeEnumeration( const ISchema* i_pSchema, int32_t i_Value );

  // False, with the output left alone, if this value is of another schema or its bytes do not make up a T exactly.
  template<class T>
  bool Get( T& o_rValue ) const;

  // The number of an enumeration of any schema; false for any other type.
  bool GetEnumeration( int32_t& o_rValue ) const;

  const ISchema* Schema() const { return m_pSchema; }
  const VBytes& Bytes() const { return m_Bytes; }
  bool IsEmpty() const { return m_pSchema == nullptr; }

  bool operator==( const Variant& ) const = default;

  // For people: true, 25, -1.5, the text itself, an enumerator's name (its number if it has none), [1, 2] for lists and
  // {Name: "value", Count: 3} for records. Empty for an empty value; "?" where the bytes do not fit the schema.
  std::string ToText() const;

  // Reads what ToText wrote for a plain value or an enumeration, with nothing before or behind it; booleans also as 1 and 0.
  // Nothing for any other text or schema.
  static std::optional<Variant> FromText( const ISchema* i_pSchema, std::string_view i_Text );

private:
  static Variant MakeText( std::string_view i_Text );

  const ISchema* m_pSchema = nullptr;
  VBytes m_Bytes;
};

// One choice of a list of labels and values.
struct VLabelledVariant
{
  std::string m_Label;
  Variant m_Value;
  bool operator==( const VLabelledVariant& ) const = default;
};

// The list as one value: a list of records of label and value. Empty if a choice's value is not of the given schema.
Variant MakeLabelledList( const ISchema* i_pValueSchema, const std::vector<VLabelledVariant>& i_rChoices );

// False, with the output left alone, if the value is no list of labels and values.
bool GetLabelledList( const Variant& i_rList, std::vector<VLabelledVariant>& o_rChoices );
}

#include "StageCoreRuntime/VariantCodec.h"
