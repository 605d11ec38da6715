#include "StageCoreRuntime/Variant.h"

#include "StageCoreRuntime/DebugServices.h"

#include <array>
#include <charconv>

namespace KVZ
{
using VariantDetail::VReader;
using VariantDetail::VWriter;

namespace
{
const ISchema* StringSchema() { return VSchemaOf<std::string>::Get(); }

// A record of a label and a value. The name makes it unique among the records of an application.
const ISchema* LabelledSchema( const ISchema& i_rValue )
{
  return IO::GetUniqueSchema( "Labelled." + i_rValue.Name(), "A choice of a list.",
    std::vector<ISchema::VField>{ { "Label", StringSchema() }, { "Value", &i_rValue } } );
}

template<class T>
std::string NumberText( T i_Value )
{
  std::array<char, 64> Text{};
  const auto Result = std::to_chars( Text.data(), Text.data() + Text.size(), i_Value );
  return std::string( Text.data(), Result.ptr );
}

template<class T>
std::string ReadNumber( VReader& i_rReader )
{
  T Value{};
  i_rReader( Value );
  return NumberText( Value );
}

std::string ReadBool( VReader& i_rReader )
{
  bool bValue = false;
  i_rReader( bValue );
  return bValue ? "true" : "false";
}

std::string ReadEnumeration( VReader& i_rReader, const ISchema& i_rSchema )
{
  int32_t Value = 0;
  i_rReader( Value );
  const std::string& rName = i_rSchema.NameFromValue( Value );
  return rName.empty() ? NumberText( Value ) : rName;
}

std::string ReadQuoted( VReader& i_rReader )
{
  std::string Value;
  i_rReader( Value );
  std::string Text = "\"";
  for( const char Character : Value )
  {
    if( Character == '"' || Character == '\\' )
    {
      Text += '\\';
    }
    Text += Character;
  }
  return Text + '"';
}

std::string ReadText( VReader& i_rReader, const ISchema& i_rSchema );

std::string ReadRecord( VReader& i_rReader, const ISchema& i_rSchema )
{
  std::string Text = "{";
  for( const ISchema::VField& rField : i_rSchema.Fields() )
  {
    Text += ( Text.size() > 1 ? ", " : "" ) + rField.m_Name + ": " + ReadText( i_rReader, *rField.m_pSchema );
  }
  return Text + "}";
}

std::string ReadList( VReader& i_rReader, const ISchema& i_rSchema )
{
  std::string Text = "[";
  for( uint32_t Left = i_rReader.Count(); Left > 0 && i_rReader.IsGood(); --Left )
  {
    Text += ( Text.size() > 1 ? ", " : "" ) + ReadText( i_rReader, *i_rSchema.Element() );
  }
  return Text + "]";
}

// Reads one value in the form that it has inside a record, and gives its text.
std::string ReadText( VReader& i_rReader, const ISchema& i_rSchema )
{
  switch( i_rSchema.Type() )
  {
    case ISchema::EBool: return ReadBool( i_rReader );
    case ISchema::EInt8: return ReadNumber<int8_t>( i_rReader );
    case ISchema::EInt16: return ReadNumber<int16_t>( i_rReader );
    case ISchema::EInt32: return ReadNumber<int32_t>( i_rReader );
    case ISchema::EInt64: return ReadNumber<int64_t>( i_rReader );
    case ISchema::EUInt8: return ReadNumber<uint8_t>( i_rReader );
    case ISchema::EUInt16: return ReadNumber<uint16_t>( i_rReader );
    case ISchema::EUInt32: return ReadNumber<uint32_t>( i_rReader );
    case ISchema::EUInt64: return ReadNumber<uint64_t>( i_rReader );
    case ISchema::EFloat: return ReadNumber<float>( i_rReader );
    case ISchema::EDouble: return ReadNumber<double>( i_rReader );
    case ISchema::EString: return ReadQuoted( i_rReader );
    case ISchema::EEnumeration: return ReadEnumeration( i_rReader, i_rSchema );
    case ISchema::ERecord: return ReadRecord( i_rReader, i_rSchema );
    case ISchema::EList: return ReadList( i_rReader, i_rSchema );
    case ISchema::ENone: break;
  }
  return "";
}

// A value of any schema, read from the form that it has inside a record.
Variant ReadVariant( VReader& i_rReader, const ISchema& i_rSchema )
{
  if( i_rSchema.Type() == ISchema::EString )
  {
    std::string Text;
    i_rReader( Text );
    return Variant::Make( Text );
  }
  const uint8_t* pBegin = i_rReader.Position();
  ReadText( i_rReader, i_rSchema );
  return Variant( &i_rSchema, Variant::VBytes( pBegin, i_rReader.Position() ) );
}

template<class T>
std::optional<Variant> NumberFromText( std::string_view i_Text )
{
  T Value{};
  const auto Result = std::from_chars( i_Text.data(), i_Text.data() + i_Text.size(), Value );
  if( Result.ec != std::errc() || Result.ptr != i_Text.data() + i_Text.size() )
  {
    return std::nullopt;
  }
  return Variant::Make( Value );
}

std::optional<Variant> BoolFromText( std::string_view i_Text )
{
  if( i_Text == "true" || i_Text == "1" )
  {
    return Variant::Make( true );
  }
  if( i_Text == "false" || i_Text == "0" )
  {
    return Variant::Make( false );
  }
  return std::nullopt;
}

std::optional<Variant> EnumerationFromText( const ISchema& i_rSchema, std::string_view i_Text )
{
  if( const auto Value = i_rSchema.ValueFromName( i_Text ) )
  {
    return Variant::MakeEnumeration( &i_rSchema, *Value );
  }
  return std::nullopt;
}
}

Variant Variant::MakeText( std::string_view i_Text ) { return Variant( StringSchema(), VBytes( i_Text.begin(), i_Text.end() ) ); }

Variant Variant::MakeEnumeration( const ISchema* i_pSchema, int32_t i_Value )
{
  if( !KVZ_ASSERT( i_pSchema && i_pSchema->Type() == ISchema::EEnumeration ) )
  {
    return {};
  }
  VWriter Writer;
  Writer( i_Value );
  return Variant( i_pSchema, std::move( Writer.m_Bytes ) );
}

bool Variant::GetEnumeration( int32_t& o_rValue ) const
{
  if( !m_pSchema || m_pSchema->Type() != ISchema::EEnumeration || m_Bytes.size() != sizeof( int32_t ) )
  {
    return false;
  }
  std::memcpy( &o_rValue, m_Bytes.data(), sizeof( int32_t ) );
  return true;
}

std::string Variant::ToText() const
{
  if( !m_pSchema )
  {
    return "";
  }
  if( m_pSchema->Type() == ISchema::EString )
  {
    return std::string( m_Bytes.begin(), m_Bytes.end() );
  }
  VReader Reader( m_Bytes );
  const std::string Text = ReadText( Reader, *m_pSchema );
  return Reader.IsDone() ? Text : "?";
}

std::optional<Variant> Variant::FromText( const ISchema* i_pSchema, std::string_view i_Text )
{
  switch( i_pSchema ? i_pSchema->Type() : ISchema::ENone )
  {
    case ISchema::EBool: return BoolFromText( i_Text );
    case ISchema::EInt8: return NumberFromText<int8_t>( i_Text );
    case ISchema::EInt16: return NumberFromText<int16_t>( i_Text );
    case ISchema::EInt32: return NumberFromText<int32_t>( i_Text );
    case ISchema::EInt64: return NumberFromText<int64_t>( i_Text );
    case ISchema::EUInt8: return NumberFromText<uint8_t>( i_Text );
    case ISchema::EUInt16: return NumberFromText<uint16_t>( i_Text );
    case ISchema::EUInt32: return NumberFromText<uint32_t>( i_Text );
    case ISchema::EUInt64: return NumberFromText<uint64_t>( i_Text );
    case ISchema::EFloat: return NumberFromText<float>( i_Text );
    case ISchema::EDouble: return NumberFromText<double>( i_Text );
    case ISchema::EString: return Make( i_Text );
    case ISchema::EEnumeration: return EnumerationFromText( *i_pSchema, i_Text );
    case ISchema::ENone:
    case ISchema::ERecord:
    case ISchema::EList: break;
  }
  return std::nullopt;
}

Variant MakeLabelledList( const ISchema* i_pValueSchema, const std::vector<VLabelledVariant>& i_rChoices )
{
  if( !i_pValueSchema )
  {
    return {};
  }
  VWriter Writer;
  Writer.Count( i_rChoices.size() );
  for( const VLabelledVariant& rChoice : i_rChoices )
  {
    const Variant::VBytes& rBytes = rChoice.m_Value.Bytes();
    if( rChoice.m_Value.Schema() != i_pValueSchema )
    {
      return {};
    }
    Writer( rChoice.m_Label );
    if( i_pValueSchema == StringSchema() )
    {
      Writer.Count( rBytes.size() );
    }
    Writer.Raw( rBytes.data(), rBytes.size() );
  }
  return Variant( IO::GetUniqueListSchema( LabelledSchema( *i_pValueSchema ) ), std::move( Writer.m_Bytes ) );
}

bool GetLabelledList( const Variant& i_rList, std::vector<VLabelledVariant>& o_rChoices )
{
  const ISchema* pElement = i_rList.Schema() ? i_rList.Schema()->Element() : nullptr;
  if( !pElement || pElement->Fields().size() != 2 || pElement != LabelledSchema( *pElement->Fields()[1].m_pSchema ) )
  {
    return false;
  }
  std::vector<VLabelledVariant> Choices;
  VReader Reader( i_rList.Bytes() );
  for( uint32_t Left = Reader.Count(); Left > 0 && Reader.IsGood(); --Left )
  {
    VLabelledVariant& rChoice = Choices.emplace_back();
    Reader( rChoice.m_Label );
    rChoice.m_Value = ReadVariant( Reader, *pElement->Fields()[1].m_pSchema );
  }
  if( !Reader.IsDone() )
  {
    return false;
  }
  o_rChoices = std::move( Choices );
  return true;
}
}
