#include "StageCoreRuntime/Schema.h"

#include "StageCoreRuntime/DebugServices.h"
#include "StageCoreRuntime/ThreadAnnotations.h"

#include <boost/thread/lock_guard.hpp>
#include <boost/thread/mutex.hpp>

#include <algorithm>
#include <array>
#include <map>

namespace KVZ
{
namespace
{
// What a schema is made of; two registrations of one name must agree in it.
struct VContent
{
  ISchema::EType m_Type = ISchema::ENone;
  std::string m_Description{};
  std::vector<ISchema::VEntry> m_Entries{};
  std::vector<ISchema::VField> m_Fields{};
  const ISchema* m_pElement = nullptr;
  bool operator==( const VContent& ) const = default;
};

class VSchema final : public ISchema
{
public:
  VSchema( std::string i_Name, VContent i_Content ) : m_Name( std::move( i_Name ) ), m_Content( std::move( i_Content ) ) {}

  bool IsMadeOf( const VContent& i_rContent ) const { return m_Content == i_rContent; }

  EType Type() const override { return m_Content.m_Type; }
  const std::string& Name() const override { return m_Name; }
  const std::string& Description() const override { return m_Content.m_Description; }
  const std::vector<VEntry>& Entries() const override { return m_Content.m_Entries; }
  const std::vector<VField>& Fields() const override { return m_Content.m_Fields; }
  const ISchema* Element() const override { return m_Content.m_pElement; }

  const std::string& NameFromValue( int32_t i_Value ) const override { return Find( i_Value ).m_Name; }

  std::optional<int32_t> ValueFromName( std::string_view i_Name ) const override
  {
    for( const VEntry& rEntry : Entries() )
    {
      if( rEntry.m_Name == i_Name )
      {
        return rEntry.m_Value;
      }
    }
    return std::nullopt;
  }

private:
  const VEntry& Find( int32_t i_Value ) const
  {
    static const VEntry* const s_pUnknown = new VEntry;
    const auto IsIt = [i_Value]( const VEntry& i_rEntry ) { return i_rEntry.m_Value == i_Value; };
    const auto Found = std::find_if( Entries().begin(), Entries().end(), IsIt );
    return Found == Entries().end() ? *s_pUnknown : *Found;
  }

  const std::string m_Name;
  const VContent m_Content;
};

class VRegistry
{
public:
  const ISchema* Find( std::string_view i_Name )
  {
    boost::lock_guard<boost::mutex> Lock( m_Mutex );
    const auto Found = m_Schemas.find( i_Name );
    return Found == m_Schemas.end() ? nullptr : &Found->second;
  }

  const ISchema* FindOrAdd( std::string_view i_Name, const VContent& i_rContent )
  {
    const VSchema& rSchema = FindOrAddLocked( i_Name, i_rContent );
    KVZ_ASSERT( rSchema.IsMadeOf( i_rContent ) );
    return &rSchema;
  }

private:
  const VSchema& FindOrAddLocked( std::string_view i_Name, const VContent& i_rContent )
  {
    boost::lock_guard<boost::mutex> Lock( m_Mutex );
    return m_Schemas.try_emplace( std::string( i_Name ), std::string( i_Name ), i_rContent ).first->second;
  }

  boost::mutex m_Mutex;
  std::map<std::string, VSchema, std::less<>> m_Schemas GUARDED_BY( m_Mutex );   // grows only
};

// Never destroyed: schemas live until the process's very end.
VRegistry& Registry()
{
  static VRegistry* const s_pRegistry = new VRegistry;
  return *s_pRegistry;
}

constexpr std::array PodNames = { "bool", "int8", "int16", "int32", "int64", "uint8", "uint16", "uint32", "uint64", "float", "double", "string" };
static_assert( PodNames.size() == ISchema::EString );
using VPodSchemas = std::array<const ISchema*, PodNames.size()>;

VPodSchemas MakePodSchemas()
{
  VPodSchemas Schemas{};
  for( size_t Index = 0; Index < Schemas.size(); ++Index )
  {
    Schemas[Index] = Registry().FindOrAdd( PodNames[Index], { .m_Type = static_cast<ISchema::EType>( Index + 1 ) } );
  }
  return Schemas;
}
}

namespace IO
{
const ISchema* GetUniquePodSchema( ISchema::EType i_Type )
{
  static const VPodSchemas s_Schemas = MakePodSchemas();
  return i_Type >= ISchema::EBool && i_Type <= ISchema::EString ? s_Schemas[static_cast<size_t>( i_Type - ISchema::EBool )] : nullptr;
}

const ISchema* GetUniqueSchema( std::string_view i_Name ) { return Registry().Find( i_Name ); }

const ISchema* GetUniqueSchema( std::string_view i_Name, std::string_view i_Description, std::vector<ISchema::VEntry> i_Entries )
{
  return Registry().FindOrAdd( i_Name,
    { .m_Type = ISchema::EEnumeration, .m_Description = std::string( i_Description ), .m_Entries = std::move( i_Entries ) } );
}

const ISchema* GetUniqueSchema( std::string_view i_Name, std::string_view i_Description, std::vector<ISchema::VField> i_Fields )
{
  return Registry().FindOrAdd( i_Name,
    { .m_Type = ISchema::ERecord, .m_Description = std::string( i_Description ), .m_Fields = std::move( i_Fields ) } );
}

const ISchema* GetUniqueListSchema( const ISchema* i_pElement )
{
  if( !KVZ_ASSERT( i_pElement != nullptr ) )
  {
    return nullptr;
  }
  return Registry().FindOrAdd( "List." + i_pElement->Name(), { .m_Type = ISchema::EList, .m_pElement = i_pElement } );
}
}
}
