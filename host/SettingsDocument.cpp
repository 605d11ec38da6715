#include "host/SettingsDocument.h"

#include "Core/VideoInterface/Schemas.h"
#include "StageCoreDataStore/DataVerifyWriter.h"
#include "StageCoreDataStoreTypes/GreyscaleMode.h"

#include <boost/optional.hpp>
#include <nlohmann/json.hpp>

#include <array>

using KVZ::Variant;
using VJson = nlohmann::ordered_json;

namespace StageHost
{

namespace
{

constexpr uint32_t CurrentVersion = 1;
constexpr int DeepestNesting = 100;
constexpr const char* VersionKey = "version";
constexpr const char* SettingsKey = "settings";
constexpr const char* TypeKey = "type";
constexpr const char* ValueKey = "value";
constexpr const char* ProposedKey = "proposed";
constexpr const char* VerifyKey = "verify_required";

// Schemas are made at their first use, and a file is read before the module uses any.
constexpr std::array MakeEnumerations = { &KVZ::VSchemaOf<KVZ::IPixelFormat::Enum>::Get, &KVZ::VSchemaOf<KVZ::IAudioSampleFormat::Enum>::Get,
  &KVZ::VSchemaOf<KVZ::ITimecodeSource::Enum>::Get, &KVZ::VSchemaOf<KVZ::IVideoContainer::Enum>::Get, &KVZ::VSchemaOf<KVZ::IVideoPayload::Enum>::Get,
  &KVZ::VSchemaOf<KVZ::IAudioPayload::Enum>::Get, &KVZ::VSchemaOf<KVZ::IVideoStandard::Enum>::Get, &KVZ::VSchemaOf<KVZ::IGenlockStandard::Enum>::Get,
  &KVZ::VSchemaOf<CoreTarvoTypesUtils::EGreyscaleMode::Enum>::Get };

const KVZ::ISchema* FindType( const std::string& i_rName )
{
  for( const auto pMake : MakeEnumerations )
  {
    pMake();
  }
  KVZ::IO::GetUniquePodSchema( KVZ::ISchema::EBool );
  return KVZ::IO::GetUniqueSchema( i_rName );
}

// A number or boolean stands there as one, all else as text.
VJson ToJson( const Variant& i_rValue )
{
  const std::string Text = i_rValue.ToText();
  const KVZ::ISchema::EType Type = i_rValue.Schema()->Type();
  if( Type >= KVZ::ISchema::EBool && Type <= KVZ::ISchema::EDouble )
  {
    VJson Plain = VJson::parse( Text, nullptr, false );
    if( !Plain.is_discarded() && Plain.dump() == Text )
    {
      return Plain;
    }
  }
  return Text;
}

boost::optional<Variant> FromJson( const KVZ::ISchema* i_pType, const VJson& i_rEntry, const char* i_pKey )
{
  const auto Found = i_rEntry.find( i_pKey );
  if( Found == i_rEntry.end() || Found->is_structured() || Found->is_null() )
  {
    return boost::none;
  }
  const auto Value = Variant::FromText( i_pType, Found->is_string() ? Found->get<std::string>() : Found->dump() );
  return Value ? boost::optional<Variant>( *Value ) : boost::none;
}

std::string TextAt( const VJson& i_rEntry, const char* i_pKey )
{
  const auto Found = i_rEntry.find( i_pKey );
  return Found != i_rEntry.end() && Found->is_string() ? Found->get<std::string>() : std::string();
}

bool IsTrueAt( const VJson& i_rEntry, const char* i_pKey )
{
  const auto Found = i_rEntry.find( i_pKey );
  return Found != i_rEntry.end() && Found->is_boolean() && Found->get<bool>();
}

// Empty, or why this entry cannot be used.
std::string ReadSetting( const VDataPath& i_rPath, const VJson& i_rEntry, IDataVerifyWriter& io_rDataWriter )
{
  if( i_rPath.IsEmpty() || i_rPath.IsWildcard() || i_rPath.Segments().front() == "Attributes" || !i_rEntry.is_object() )
  {
    return "it is no value with a place";
  }
  const std::string Type = TextAt( i_rEntry, TypeKey );
  const KVZ::ISchema* const pType = FindType( Type );
  if( !pType )
  {
    return "its type \"" + Type + "\" is unknown here";
  }
  const auto Value = FromJson( pType, i_rEntry, ValueKey );
  if( !Value )
  {
    return "it has no value of the type \"" + Type + "\"";
  }
  if( !IsTrueAt( i_rEntry, VerifyKey ) )
  {
    return io_rDataWriter.SetValue( i_rPath, *Value ) ? "" : "it is refused";
  }
  const auto Proposed = FromJson( pType, i_rEntry, ProposedKey );
  const bool bWritten = io_rDataWriter.SetValueFlags( i_rPath, DataFlags::VerifyRequired ) && io_rDataWriter.SetVerifiedValue( i_rPath, *Value ) &&
    io_rDataWriter.SetProposedValue( i_rPath, Proposed.value_or( *Value ) );
  return bWritten ? "" : "it is refused";
}

// A document is text: not every value comes back from it.
bool CanBeKept( const Variant& i_rValue )
{
  const auto Back = Variant::FromText( i_rValue.Schema(), i_rValue.ToText() );
  return Back && *Back == i_rValue;
}

bool WriteSetting( const VDataPath& i_rPath, const IDataVerifyReader& i_rDataReader, VJson& io_rEntry )
{
  uint32_t Flags = 0;
  Variant Verified;
  Variant Proposed;
  i_rDataReader.GetValueFlags( i_rPath, Flags );
  if( !i_rDataReader.GetVerifiedValue( i_rPath, Verified ) || !CanBeKept( Verified ) )
  {
    return false;
  }
  io_rEntry[TypeKey] = Verified.Schema()->Name();
  io_rEntry[ValueKey] = ToJson( Verified );
  io_rEntry.erase( ProposedKey );
  io_rEntry.erase( VerifyKey );
  if( ( Flags & DataFlags::VerifyRequired ) != 0 )
  {
    io_rEntry[VerifyKey] = true;
    if( !i_rDataReader.GetProposedValue( i_rPath, Proposed ) || !CanBeKept( Proposed ) )
    {
      return false;
    }
    io_rEntry[ProposedKey] = ToJson( Proposed );
  }
  return true;
}

bool IsLater( const VJson& i_rVersion )
{
  return i_rVersion.is_number_unsigned() ? i_rVersion.get<uint64_t>() > CurrentVersion : i_rVersion.get<int64_t>() > int64_t{ CurrentVersion };
}

VJson ParseText( const std::string& i_rText )
{
  return VJson::parse( i_rText,
    []( int i_Depth, VJson::parse_event_t, VJson& )
    { return i_Depth <= DeepestNesting ? true : throw std::runtime_error( "it is nested too deeply" ); } );
}

}

ESettingsText ParseSettings( const std::string& i_rText, VJson& o_rDocument, std::string& o_rReason )
{
  VJson Document;
  try
  {
    Document = ParseText( i_rText );
  }
  catch( const VJson::parse_error& rError )
  {
    o_rReason = "no JSON at byte " + std::to_string( rError.byte );
    return ESettingsText::Damaged;
  }
  catch( const VJson::out_of_range& )
  {
    o_rReason = "a number in it is too large";
    return ESettingsText::Damaged;
  }
  catch( const std::exception& rError )
  {
    o_rReason = rError.what();
    return ESettingsText::Damaged;
  }
  if( !Document.is_object() || ( Document.contains( SettingsKey ) && !Document[SettingsKey].is_object() ) )
  {
    o_rReason = "it holds no settings";
    return ESettingsText::Damaged;
  }
  if( Document.contains( VersionKey ) && !Document[VersionKey].is_number_integer() )
  {
    o_rReason = "its version is no number";
    return ESettingsText::Damaged;
  }
  if( IsLater( Document.value( VersionKey, VJson( CurrentVersion ) ) ) )
  {
    o_rReason = "it is of version " + Document[VersionKey].dump() + ", and this program knows versions up to " + std::to_string( CurrentVersion );
    return ESettingsText::OfLaterVersion;
  }
  o_rDocument = std::move( Document );
  return ESettingsText::Good;
}

std::vector<std::string> ReadSettings( const VJson& i_rDocument, IDataVerifyWriter& io_rDataWriter )
{
  std::vector<std::string> Refused;
  const auto Settings = i_rDocument.find( SettingsKey );
  if( Settings == i_rDocument.end() )
  {
    return Refused;
  }
  for( const auto& rItem : Settings->items() )
  {
    const VDataPath Path = VDataPath::FromString( rItem.key() );
    const bool bOneOfTwo = Path.ToString() != rItem.key();   // the value may stand there under its proper path too
    const std::string Reason = bOneOfTwo ? "its path is \"" + Path.ToString() + "\"" : ReadSetting( Path, rItem.value(), io_rDataWriter );
    if( !Reason.empty() )
    {
      Refused.push_back( "The saved setting \"" + rItem.key() + "\" cannot be used: " + Reason + "." );
    }
  }
  return Refused;
}

bool WriteSettings( const IDataVerifyReader& i_rDataReader, VJson& io_rDocument, std::string& o_rReason )
{
  std::vector<VDataPath> Paths;
  i_rDataReader.GetValuePaths( VDataPath(), Paths );
  io_rDocument[VersionKey] = CurrentVersion;
  VJson& rSettings = io_rDocument[SettingsKey];
  for( const VDataPath& rPath : Paths )
  {
    VJson& rEntry = rSettings[rPath.ToString()];
    if( !rEntry.is_object() )
    {
      rEntry = VJson::object();
    }
    if( !WriteSetting( rPath, i_rDataReader, rEntry ) )
    {
      o_rReason = "The value of " + rPath.ToString() + " cannot be kept in a file.";
      return false;
    }
  }
  return true;
}

void RemoveSettings( const std::vector<VDataPath>& i_rPaths, VJson& io_rDocument )
{
  if( !io_rDocument.contains( SettingsKey ) )
  {
    return;
  }
  for( const VDataPath& rPath : i_rPaths )
  {
    io_rDocument[SettingsKey].erase( rPath.ToString() );
  }
}

std::vector<VDataPath> GetSettingPaths( const VJson& i_rDocument )
{
  std::vector<VDataPath> Paths;
  const auto Settings = i_rDocument.find( SettingsKey );
  if( Settings != i_rDocument.end() )
  {
    for( const auto& rItem : Settings->items() )
    {
      Paths.push_back( VDataPath::FromString( rItem.key() ) );
    }
  }
  return Paths;
}

}
